// SPDX-License-Identifier: Apache-2.0
#include "quo_base/image_grid.h"

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <vector>

#include "quo_base/geometry.h"
#include "quo_base/roi.h"
#include "support/diagnostics.h"

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

/** Three bursts of 100 lines that overlap by 20 lines. */
void make_bursts(ImageGrid_Obj& grid) {
    grid.Epoch_s = 1167930358.0;
    grid.FirstLine_s = 0.268589;
    grid.LineStep_s = 0.002055556299999998;
    grid.FirstSample_s = 0.005336535882737799;
    grid.SampleStep_s = 1.0 / 6.434523812571428e7;
    grid.DelayShare = 0.5;
    grid.DelayReference_s = 0.00585202;
    grid.LinesPerBurst = 100;
    grid.Bursts = 3;
    ASSERT_EQ(grid.createBuffers(), 0);
    for (int burst = 0; burst < 3; ++burst)
        grid.BurstStart_s[static_cast<std::size_t>(burst)] = grid.FirstLine_s + burst * 80 * grid.LineStep_s;
}

/** Ground range with two lists, whose slant ranges are 800 km + 0.5 g + 5e-7 g^2, the later 30 m longer. */
void make_ground(ImageGrid_Obj& grid) {
    grid.LineStep_s = 0.0015;
    grid.FirstSample_s = 0.00533;
    grid.GroundStep_m = 10.0;
    grid.GroundLists = 2;
    ASSERT_EQ(grid.createBuffers(), 0);
    grid.GroundTime_s = {0.0, 1.0};
    for (std::size_t list = 0; list < 2; ++list) {
        double* const terms = grid.GroundToSlant.data() + list * ImageGrid_Obj::kTerms;
        terms[0] = 800000.0 + 30.0 * static_cast<double>(list);
        terms[1] = 0.5;
        terms[2] = 5e-7;
    }
}

struct Found {
    double line = 0.0, second = 0.0, sample = 0.0;
    std::int32_t status = -1;
};
Found find(const ImageGrid_Obj& grid, double line, double sample, std::int32_t* status = nullptr) {
    double azimuth_s = 0.0, range_s = 0.0;
    Found found;
    EXPECT_EQ(grid.pixelTimes({1, &line, &sample}, {&azimuth_s, &range_s, status}), 0);
    EXPECT_EQ(
        grid.timePixels({1, &azimuth_s, &range_s}, {&found.line, &found.second, &found.sample, &found.status}), 0);
    return found;
}

TEST(ImageGrid, FindsAPixelAgainFromItsTimes) {
    ImageGrid_Obj bursts, ground;
    make_bursts(bursts);
    make_ground(ground);
    for (const double sample : {-0.4, 0.0, 17.3, 22693.0}) {
        for (const double line : {-0.4, 3.25, 79.0, 99.4})
            EXPECT_NEAR(find(bursts, line, sample).line, line, 2e-4);
        EXPECT_NEAR(find(bursts, 99.4, sample).second, 119.4, 2e-4);  // seen by the next burst too
        EXPECT_TRUE(std::isnan(find(bursts, 3.25, sample).second));
        EXPECT_NEAR(find(bursts, 110.0, sample).second, 110.0, 2e-4);
        EXPECT_NEAR(find(bursts, 250.0, sample).sample, sample, 1e-6);
        for (const double line : {0.0, 333.0, 334.0, 2000.0}) {  // nearest list changes at line 333.3
            EXPECT_NEAR(find(ground, line, sample).sample, sample, 1e-7);
            EXPECT_NEAR(find(ground, line, sample).line, line, 1e-3);
        }
    }
}

TEST(ImageGrid, TellsTimesByTheDefinition) {
    ImageGrid_Obj bursts, ground;
    make_bursts(bursts);
    make_ground(ground);
    const double lines[] = {120.0, 333.0, 334.0}, samples[] = {1000.0, 1000.0, 1000.0};
    double azimuth_s[3], range_s[3];
    ASSERT_EQ(bursts.pixelTimes({1, lines, samples}, {azimuth_s, range_s}), 0);
    const double range = bursts.FirstSample_s + 1000.0 * bursts.SampleStep_s;
    EXPECT_NEAR(range_s[0], range, 1e-17);
    EXPECT_NEAR(azimuth_s[0] - bursts.Epoch_s,
                0.268589 + 100 * bursts.LineStep_s + 0.5 * (range - bursts.DelayReference_s), 2e-7);
    ASSERT_EQ(ground.pixelTimes({3, lines, samples}, {azimuth_s, range_s}), 0);
    EXPECT_NEAR(range_s[1] * 0.5 * quo::kLightSpeed, 800000.0 + 5000.0 + 50.0, 1e-8);
    EXPECT_NEAR(range_s[2] * 0.5 * quo::kLightSpeed, 800030.0 + 5000.0 + 50.0, 1e-8);
}

TEST(ImageGrid, CutKeepsTheBitsOfEveryTime) {
    const test::Report report;
    ImageGrid_Obj whole, cut;
    make_bursts(whole);
    ASSERT_EQ(whole.writehdr(report.file("grid.hdr").c_str()), 0);
    ASSERT_EQ(cut.readhdr(report.file("grid.hdr").c_str()), 0);
    ASSERT_EQ(cut.cut(37.0, 111.0, 1.0, 1.0), 0);
    // In a cut from the second burst on, its first lines are the only ones of what the first burst saw too.
    ImageGrid_Obj later;
    ASSERT_EQ(whole.clone(&later) + later.cut(100.0, 0.0, 1.0, 1.0), 0);
    EXPECT_NEAR(find(later, 10.0, 5.0).line, 10.0, 2e-4);
    EXPECT_TRUE(std::isnan(find(later, 10.0, 5.0).second));
    EXPECT_EQ(cut.cut(0.0, 0.0, 2.0, 1.0), 1);  // lines of bursts
    EXPECT_EQ(cut.cut(0.0, 0.0, 1.0, 0.0), 1);
    for (const double line : {0.0, 42.0, 150.0}) {
        const double sample = 5.0, other_line = line + 37.0, other_sample = sample + 111.0;
        double of_cut[2], of_whole[2];
        ASSERT_EQ(cut.pixelTimes({1, &line, &sample}, {&of_cut[0], &of_cut[1]}), 0);
        ASSERT_EQ(whole.pixelTimes({1, &other_line, &other_sample}, {&of_whole[0], &of_whole[1]}), 0);
        EXPECT_NEAR(of_cut[0], of_whole[0], 1e-9);
        EXPECT_NEAR(of_cut[1], of_whole[1], 1e-17);
        EXPECT_NEAR(find(cut, line, sample).line, line, 2e-4);
    }
}

TEST(ImageGrid, AnotherSamplingKeepsThePlaces) {
    ImageGrid_Obj ground;
    make_ground(ground);
    ASSERT_EQ(ground.cut(6.0, 9.0, 0.75, 1.5), 0);
    ImageGrid_Obj whole;
    make_ground(whole);
    for (const double at : {0.0, 4.0, 20.0}) {
        const double line = 6.0 + 0.75 * at, sample = 9.0 + 1.5 * at;
        double of_cut[2], of_whole[2];
        ASSERT_EQ(ground.pixelTimes({1, &at, &at}, {&of_cut[0], &of_cut[1]}), 0);
        ASSERT_EQ(whole.pixelTimes({1, &line, &sample}, {&of_whole[0], &of_whole[1]}), 0);
        EXPECT_NEAR(of_cut[0], of_whole[0], 1e-12);
        EXPECT_NEAR(of_cut[1], of_whole[1], 1e-17);
    }
}

TEST(ImageGrid, RefusesWhatMakesNoImage) {
    const test::Report report;
    ImageGrid_Obj grid;
    const double number = 1.0;
    double out = 7.0;
    EXPECT_EQ(grid.pixelTimes({1, &number, &number}, {&out}), 1);  // nothing in it yet
    ROI_Obj region;
    EXPECT_EQ(grid.setRegion(region), 1);
    region.SetSlowAxe(1e9 + 0.25, 0.001, 10);
    region.SetFastAxe(0.005, 1e-8, 10);
    ASSERT_EQ(grid.setRegion(region), 0);
    EXPECT_EQ(grid.Epoch_s, 1e9);
    EXPECT_EQ(grid.FirstLine_s, 0.25);
    EXPECT_EQ(grid.pixelTimes({1, nullptr, &number}, {&out}), 1);
    EXPECT_EQ(grid.timePixels({1, &number, nullptr}, {&out}), 1);
    double both[] = {0.0, 1.0, 7.0};
    EXPECT_EQ(grid.pixelTimes({2, both, both}, {both + 1}), 1);
    EXPECT_EQ(grid.pixelTimes({2, both, both}, {nullptr, both}), 0);  // an input's very array may be one
    EXPECT_EQ(out, 7.0);
    EXPECT_EQ(grid.pixelTimes({0, nullptr, nullptr}, {}), 0);
    std::int32_t status = 0;
    ASSERT_EQ(grid.pixelTimes({1, &kNaN, &number}, {&out, nullptr, &status}), 0);
    EXPECT_EQ(status, 1);
    EXPECT_TRUE(std::isnan(out));

    ImageGrid_Obj bursts;
    make_bursts(bursts);
    const double beyond = 300.0, between = bursts.Epoch_s + 99.0;
    ASSERT_EQ(bursts.pixelTimes({1, &beyond, &number}, {&out, nullptr, &status}), 0);
    EXPECT_EQ(status, 1);
    ASSERT_EQ(bursts.timePixels({1, &between, &bursts.FirstSample_s}, {&out, nullptr, nullptr, &status}), 0);
    EXPECT_EQ(status, 1);
    bursts.BurstStart_s.pop_back();
    EXPECT_FALSE(bursts.isComplete());

    ImageGrid_Obj ground;  // a polynomial that turns back before the slant range is reached
    make_ground(ground);
    ground.GroundToSlant[2] = ground.GroundToSlant[ImageGrid_Obj::kTerms + 2] = -5e-6;
    const double far_s = 0.006, time = 0.2;
    ASSERT_EQ(ground.timePixels({1, &time, &far_s}, {nullptr, nullptr, &out, &status}), 0);
    EXPECT_EQ(status, 1);
}

}  // namespace
