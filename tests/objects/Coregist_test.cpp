#include "quo_base/Coregist.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <string>

#include "support/diagnostics.h"
#include "support/fields.h"

namespace {

struct Mapping {
    const char* name;
    double range[4], azimuth[4];
};
// Range times near 5.4 ms over 0.2 ms, azimuth times over some seconds.
constexpr Mapping kMappings[] = {
    {"Identity", {0.0, 1.0, 0.0, 5.37e-3}, {0.0, 0.0, 1.0, 803457.3}},
    {"Quadratic", {0.31, 1.0003, 1.1e-9, 5.371e-3}, {2.7, -3.1e-2, 0.9998, 17.25}},
    {"TinyQuadratic", {1e-14, 0.9997, 2e-9, 5.36e-3}, {0.0, 1e-3, 1.0001, 17.25}},
    {"NegativeSlopes", {-0.4, -1.0003, 1e-9, 5.371e-3}, {1.3, 0.02, -0.9998, 17.25}},
    {"OneNegative", {0.4, 1.0003, -1e-9, 5.371e-3}, {1.3, 0.02, -0.9998, 17.25}},
};
class Mappings : public testing::TestWithParam<Mapping> {
protected:
    Mappings() {
        std::ranges::copy(GetParam().range, fit_.RgFit);
        std::ranges::copy(GetParam().azimuth, fit_.AzFit);
        fit_.trg0 = 5.37e-3;
        fit_.taz0 = 803457.3;
        fit_.init();
    }
    Coregist fit_;
};

TEST_P(Mappings, AreInvertedByMasterTimes) {
    for (double dr = -1e-4; dr <= 1e-4; dr += 1.7e-5) {
        for (double da = -9.0; da <= 9.0; da += 1.9) {
            double range = 0.0, azimuth = 0.0, back_range = 0.0, back_azimuth = 0.0;
            EXPECT_EQ(fit_.evaluateSLtime(fit_.trg0 + dr, fit_.taz0 + da, &range, &azimuth), 0);
            EXPECT_EQ(range, fit_.evaluateSLtimeRange(fit_.trg0 + dr, fit_.taz0 + da));
            EXPECT_EQ(azimuth, fit_.evaluateSLtimeAzimuth(fit_.trg0 + dr, fit_.taz0 + da));
            ASSERT_EQ(fit_.evaluateMAtime(range, azimuth, &back_range, &back_azimuth), 0);
            EXPECT_NEAR(back_range, fit_.trg0 + dr, 1e-15);
            EXPECT_NEAR(back_azimuth, fit_.taz0 + da, 5e-10);
            EXPECT_EQ(back_range, fit_.evaluateMAtimeRange(range, azimuth));
            EXPECT_EQ(back_azimuth, fit_.evaluateMAtimeAzimuth(range, azimuth));
        }
    }
}

// The two forms say the same: samples to times, times by the time form, times to samples.
TEST_P(Mappings, HaveASampleFormThatSaysTheSame) {
    ROI_Obj master, slave;
    master.SetFastAxe(5.351e-3, 1.57e-8, 9000);
    master.SetSlowAxe(803450.1, 2.05e-3, 7000);
    slave.SetFastAxe(5.349e-3, 1.91e-8, 8000);
    slave.SetSlowAxe(11.5, 1.93e-3, 7500);
    ASSERT_EQ(fit_.Time2Samples(&master, &slave), 0);
    const auto expect_agreement = [&] {
        for (double sample = 0.0; sample < 9000.0; sample += 871.3) {
            for (double line = 0.0; line < 7000.0; line += 791.7) {
                const double ds = sample - fit_.Rg_Samples_Origin, dl = line - fit_.Az_Samples_Origin;
                const auto mapped = [&](const double* c) { return c[0] * ds * ds + c[1] * ds + c[2] * dl + c[3]; };
                double range = 0.0, azimuth = 0.0;
                fit_.evaluateSLtime(master.FastStartTime + sample * master.FastTimeDelta,
                                    master.SlowStartTime + line * master.SlowTimeDelta, &range, &azimuth);
                EXPECT_NEAR(mapped(fit_.Rg_Fit_Coeff), (range - slave.FastStartTime) / slave.FastTimeDelta, 1e-5);
                const double expected = (azimuth - slave.SlowStartTime) / slave.SlowTimeDelta;
                EXPECT_NEAR(mapped(fit_.Az_Fit_Coeff), expected, 1e-5 + 1e-9 * std::abs(expected));
            }
        }
    };
    expect_agreement();
    ASSERT_EQ(fit_.ConvertPolys(&master, &slave), 0);
    expect_agreement();
}
INSTANTIATE_TEST_SUITE_P(All, Mappings, testing::ValuesIn(kMappings),
                         [](const auto& row) { return row.param.name; });

TEST(Coregist, SixNumbersMeanCommonIntervals) {
    ROI_Obj master, slave;
    master.SetFastAxe(5.351e-3, 1.57e-8, 9000);
    master.SetSlowAxe(80.1, 2.05e-3, 7000);
    slave.SetFastAxe(5.349e-3, 1.57e-8, 8000);
    slave.SetSlowAxe(11.5, 2.05e-3, 7500);
    Coregist a, b;
    test::fill_fields(a);
    test::fill_fields(b);
    a.trg0 = b.trg0 = 5.4e-3;
    a.taz0 = b.taz0 = 83.3;
    ASSERT_EQ(a.Time2Samples(&master, &slave), 0);
    ASSERT_EQ(b.Time2Samples(5.351e-3, 80.1, 5.349e-3, 11.5, 1.57e-8, 2.05e-3), 0);
    EXPECT_THAT(test::differing_fields(a, b), testing::IsEmpty());
}

TEST(Coregist, RefusesWhatHasNoInverse) {
    const test::Report report;
    const test::CapturedStderr silent;
    Coregist fit;  // all zero
    double range = 5.0, azimuth = 6.0;
    EXPECT_EQ(fit.evaluateMAtime(1.0, 1.0, &range, &azimuth), 10);
    fit.RgFit[0] = -1.0;  // a parabola that never reaches the time
    fit.RgFit[1] = 0.1;
    fit.AzFit[2] = 1.0;
    fit.init();
    EXPECT_EQ(fit.evaluateMAtime(1.0, 1.0, &range, &azimuth), 10);
    EXPECT_EQ(range, 5.0);
    EXPECT_EQ(azimuth, 6.0);
    EXPECT_TRUE(std::isnan(fit.evaluateMAtimeRange(1.0, 1.0)));
    EXPECT_THAT(report.messages("ERROR"), testing::Each("The mapping has no inverse there"));
    ROI_Obj empty;
    EXPECT_EQ(fit.Time2Samples(&empty, &empty), 1);
    EXPECT_EQ(fit.ConvertPolys(&empty, &empty), 1);
    EXPECT_EQ(fit.Time2Samples(nullptr, &empty), 1);
    EXPECT_EQ(fit.ConvertPolys(&empty, nullptr), 1);
    EXPECT_EQ(fit.RgFit[0], -1.0);
}

TEST(Coregist, ReadingPreparesTheInverseOrSaysWhatFailed) {
    const test::Report report;
    const std::string file = report.file("REGIST.xml");
    Coregist written, read;
    written.RgFit[1] = 2.0;
    written.AzFit[2] = 4.0;
    ASSERT_EQ(written.writepar(file.c_str()) + read.readpar(file.c_str()), 0);
    EXPECT_EQ(read.evaluateMAtimeRange(17.0, 12.0), 8.5);
    EXPECT_EQ(read.readpar(report.file("missing.xml").c_str()), 1);
    EXPECT_THAT(report.messages("ERROR"), testing::ElementsAre("Fit polynomials read error"));
}

}  // namespace
