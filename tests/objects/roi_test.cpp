#include "quo_base/roi.h"

#include <gtest/gtest.h>

#include <limits>
#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include "support/diagnostics.h"

namespace {

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

// Binary fractions, so that every time on the grid is exact.
constexpr double kFastStart = 0.005371093750, kFastDelta = 1.0 / (1 << 24);
constexpr double kSlowStart = 803457.375, kSlowDelta = 1.0 / 1024;

struct Grid {
    double first_sample, samples, first_line, lines;
};
/** The part of the common grid that starts at a sample and line, `step` of whose intervals make one of the region.
 */
struct Region : ROI_Obj {
    explicit Region(const Grid& grid, int step = 1) {
        EXPECT_EQ(SetFastAxe(kFastStart + grid.first_sample * kFastDelta, step * kFastDelta,
                             static_cast<int>(grid.samples) / step) +
                      SetSlowAxe(kSlowStart + grid.first_line * kSlowDelta, step * kSlowDelta,
                                 static_cast<int>(grid.lines) / step),
                  0);
    }
};
/** Every member against the part of the grid that a region should be; its lengths need not be those of a count. */
void expect(const ROI_Obj& roi, const Grid& grid, int step = 1) {
    const bool null = grid.samples <= 0 || grid.lines <= 0;
    EXPECT_EQ(roi.FastStartTime, kFastStart + grid.first_sample * kFastDelta);
    EXPECT_EQ(roi.SlowStartTime, kSlowStart + grid.first_line * kSlowDelta);
    EXPECT_EQ(roi.FastTimeDelta, step * kFastDelta);
    EXPECT_EQ(roi.SlowTimeDelta, step * kSlowDelta);
    EXPECT_EQ(roi.FastTimeLength, grid.samples * kFastDelta);
    EXPECT_EQ(roi.SlowTimeLength, grid.lines * kSlowDelta);
    EXPECT_EQ(roi.Samples, null ? 0 : static_cast<int>(grid.samples) / step);
    EXPECT_EQ(roi.Lines, null ? 0 : static_cast<int>(grid.lines) / step);
    EXPECT_EQ(roi.isNULL() != 0, null);
}

TEST(Roi, IsNullWithoutSamplesOrWithoutLines) {
    for (const auto& [samples, lines] :
         {std::pair{17.0, 0.0}, {0.0, 13.0}, {-3.0, 13.0}, {17.0, -1.0}, {1.0, 1.0}}) {
        Region roi{{0, samples, 0, lines}};
        EXPECT_EQ(roi.isNULL() != 0, samples * lines != 1) << samples << " x " << lines;
        EXPECT_EQ(roi.ResetROI(), 0);
        EXPECT_TRUE(roi.isNULL() && roi.FastStartTime == kFastStart) << "only the counts go";
    }
}

TEST(Roi, GivesTheNearestIndexWithHalvesAwayFromZero) {
    for (const auto& row : test::read_table("objects/indices.csv")) {
        const double start = std::stod(row[0]), delta = std::stod(row[1]), length = std::stod(row[2]) * delta;
        ROI_Obj roi;
        roi.SetFastAxe(start, delta, 17);
        roi.SetSlowAxe(start + 17.0, delta, 13);
        for (const int index : {roi.GetFastIndex(start + length), roi.GetSlowIndex(start + 17.0 + length),
                                roi.GetFastRange(length), roi.GetSlowRange(length)})
            EXPECT_EQ(index, std::stoi(row[3])) << row[2] << " of " << row[1];
    }
}

// Up and down lie along range, left and right along azimuth.
TEST(Roi, HasCornersDownTheFastAxisAndRightTheSlowAxis) {
    ROI_Obj roi;
    roi.SetFastAxe(0.25, 0.5, 7);    // to 3.75
    roi.SetSlowAxe(100.5, 0.25, 6);  // to 102.0
    std::vector<std::pair<double, double>> corners;
    for (const ROI_Time& corner :
         {roi.GetUpLeft(), roi.GetUpRight(), roi.GetDownLeft(), roi.GetDownRight(), roi.GetCenter()})
        corners.emplace_back(corner.FastTime, corner.SlowTime);
    EXPECT_EQ(corners, (std::vector<std::pair<double, double>>{
                           {0.25, 100.5}, {0.25, 102.0}, {3.75, 100.5}, {3.75, 102.0}, {2.0, 101.25}}));
}

TEST(RoiIntersection, IsWhatBothShareInTheIntervalsOfTheFirst) {
    for (const std::vector<std::string>& row : test::read_table("objects/regions.csv")) {
        SCOPED_TRACE(row[0]);
        std::vector<double> n;
        for (std::size_t i = 1; i < row.size(); ++i) n.push_back(std::stod(row[i]));
        const int step_a = static_cast<int>(n[12]), step_b = static_cast<int>(n[13]);
        for (const bool swapped : {false, true}) {
            if (swapped && step_a != step_b) continue;
            const Grid first{n[0], n[1], n[2], n[3]}, second{n[4], n[5], n[6], n[7]};
            Region a{swapped ? second : first, step_a}, b{swapped ? first : second, step_b};
            ROI_Obj out;
            // The result may take the place of either region.
            for (ROI_Obj* result : std::initializer_list<ROI_Obj*>{&out, swapped ? &a : &b}) {
                ASSERT_EQ(ROI_Obj::IntersectROI(&a, &b, result), 0);
                expect(*result, {n[8], n[9], n[10], n[11]}, step_a);
            }
        }
    }
}

TEST(RoiIntersection, MakesNothingOfIntervalsThatAreNone) {
    Region a{{0, 100, 0, 90}};
    ROI_Obj out;
    for (const double delta : {0.0, kNaN, kInfinity}) {
        a.FastTimeDelta = delta;
        EXPECT_EQ(ROI_Obj::IntersectROI(&a, &a, &out), 0);
        EXPECT_NE(out.isNULL(), 0) << delta;
    }
    a.SetFastAxe(-1e300, 1e-300, 5);
    a.FastTimeLength = 1e300 * 2;
    EXPECT_EQ(ROI_Obj::IntersectROI(&a, &a, &out), 0);
    EXPECT_EQ(out.Samples, std::numeric_limits<int>::max());
    EXPECT_EQ(ROI_Obj::IntersectROI(nullptr, &a, &out) + ROI_Obj::IntersectROI(&a, nullptr, &out) +
                  ROI_Obj::IntersectROI(&a, &a, nullptr),
              3);
}

TEST(RoiCoords, BecomeTimesOnTheGridOfTheImage) {
    ROI_Obj out;
    const Region image{{7, 1000, 9, 2000}};
    ROI_Coords coords;
    std::tie(coords.FirstSample, coords.FirstLine, coords.Samples, coords.Lines) = std::tuple{110, 204, 31, 47};
    ASSERT_EQ(coords.GetROI(&image, &out), 0);
    expect(out, {117, 31, 213, 47});
    EXPECT_EQ(coords.GetROI(nullptr, &out) + coords.GetROI(&image, nullptr), 2);
}

TEST(FileRoi, ReadsTheRegionThatItsFileHoldsAndNeverCutsAName) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("regions.xml"), longest(511, 'a'), too_long(512, 'b');
    for (const auto& [name, samples] : {std::pair{"First", 1000.0}, {"Second", 17.0}})
        ASSERT_EQ((Region{{7, samples, 9, 2000}}.write_roi(file.c_str(), name)), 0);
    FileROI_Obj roi{file.c_str(), "Second"};
    for (const int samples : {17, 1000}) {
        EXPECT_EQ(roi.read_roi(), 0);
        EXPECT_EQ(roi.Samples, samples);
        EXPECT_EQ(roi.SetFile(file.c_str(), "First"), 0);
    }
    EXPECT_EQ(FileROI_Obj{}.read_roi(), 1);
    EXPECT_EQ(roi.SetFile(longest.c_str(), "ROI"), 0);
    EXPECT_EQ(roi.SetFile(too_long.c_str(), "ROI") + roi.SetFile("b", too_long.c_str()), 2);
    EXPECT_EQ(roi.FileName + std::string{roi.SectionName}, longest + "ROI");
}

}  // namespace
