// SPDX-License-Identifier: Apache-2.0
#include "quo_base/Coregist.h"

#include "support/diagnostics.h"

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
    /** As a file brings it: reading prepares the inverse. */
    void SetUp() override {
        const test::TemporaryFolder folder;
        Coregist written;
        std::ranges::copy(GetParam().range, written.RgFit);
        std::ranges::copy(GetParam().azimuth, written.AzFit);
        written.trg0 = 5.37e-3;
        written.taz0 = 803457.3;
        const std::string file = folder.file("REGIST.xml");
        ASSERT_EQ(written.writepar(file.c_str()) + fit_.readpar(file.c_str()), 0);
    }
    Coregist fit_;
};
INSTANTIATE_TEST_SUITE_P(All, Mappings, testing::ValuesIn(kMappings),
                         [](const auto& row) { return row.param.name; });

TEST_P(Mappings, AreInvertedByMasterTimes) {
    for (double dr = -1e-4; dr <= 1e-4; dr += 1.7e-5) {
        for (double da = -9.0; da <= 9.0; da += 1.9) {
            double range = 0.0, azimuth = 0.0;
            EXPECT_EQ(fit_.evaluateSLtime(fit_.trg0 + dr, fit_.taz0 + da, &range, &azimuth), 0);
            EXPECT_NEAR(fit_.evaluateMAtimeRange(range, azimuth), fit_.trg0 + dr, 1e-15);
            EXPECT_NEAR(fit_.evaluateMAtimeAzimuth(range, azimuth), fit_.taz0 + da, 5e-10);
        }
    }
}

// The two forms say the same: samples to times, times by the time form, times to samples. Six numbers mean
// intervals that both images have.
TEST_P(Mappings, HaveASampleFormThatSaysTheSame) {
    ROI_Obj master, slave;
    master.SetFastAxe(5.351e-3, 1.57e-8, 9000);
    master.SetSlowAxe(803450.1, 2.05e-3, 7000);
    slave.SetFastAxe(5.349e-3, 1.91e-8, 8000);
    slave.SetSlowAxe(11.5, 1.93e-3, 7500);
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
    ASSERT_EQ(fit_.Time2Samples(&master, &slave), 0);
    expect_agreement();
    ASSERT_EQ(fit_.ConvertPolys(&master, &slave), 0);
    expect_agreement();
    slave.FastTimeDelta = master.FastTimeDelta;
    slave.SlowTimeDelta = master.SlowTimeDelta;
    ASSERT_EQ(fit_.Time2Samples(5.351e-3, 803450.1, 5.349e-3, 11.5, 1.57e-8, 2.05e-3), 0);
    expect_agreement();
}

}  // namespace
