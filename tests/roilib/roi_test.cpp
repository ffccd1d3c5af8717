#include "quo_base/roi.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <limits>

#include "support/diagnostics.h"

namespace {

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr int kMax = std::numeric_limits<int>::max(), kMin = std::numeric_limits<int>::min();

// Binary fractions, so that every time on the grid is exact.
constexpr double kFastStart = 0.005371093750, kFastDelta = 1.0 / (1 << 24);
constexpr double kSlowStart = 803457.375, kSlowDelta = 1.0 / 1024;

struct Grid {
    double first_sample, samples, first_line, lines;
};
/** The part of the common grid that starts at a sample and line. */
void place(ROI_Obj& roi, const Grid& grid, double fast_delta = kFastDelta, double slow_delta = kSlowDelta) {
    roi.SetFastAxe(kFastStart + grid.first_sample * kFastDelta, fast_delta, static_cast<int>(grid.samples));
    roi.SetSlowAxe(kSlowStart + grid.first_line * kSlowDelta, slow_delta, static_cast<int>(grid.lines));
}

TEST(RoiAxis, KeepsItsArgumentsAndDerivesItsLength) {
    ROI_Obj roi;
    EXPECT_EQ(roi.SetFastAxe(0.0053, 5.2e-8, 5167), 0);
    EXPECT_EQ(roi.SetSlowAxe(803457.3, 6.05e-4, 26411), 0);
    EXPECT_EQ(roi.FastStartTime, 0.0053);
    EXPECT_EQ(roi.FastTimeDelta, 5.2e-8);
    EXPECT_EQ(roi.Samples, 5167);
    EXPECT_DOUBLE_EQ(roi.FastTimeLength, 2.68684e-4);
    EXPECT_EQ(roi.SlowStartTime, 803457.3);
    EXPECT_EQ(roi.SlowTimeDelta, 6.05e-4);
    EXPECT_EQ(roi.Lines, 26411);
    EXPECT_DOUBLE_EQ(roi.SlowTimeLength, 15.978655);
}

TEST(RoiNull, HoldsWithoutSamplesOrWithoutLines) {
    const struct {
        int samples, lines;
        bool null;
    } rows[] = {{0, 0, true},   {17, 0, true}, {0, 13, true},  {-3, 13, true},
                {17, -1, true}, {1, 1, false}, {17, 13, false}};
    for (const auto& row : rows) {
        ROI_Obj roi;
        place(roi, {0, static_cast<double>(row.samples), 0, static_cast<double>(row.lines)});
        EXPECT_EQ(roi.isNULL() != 0, row.null) << row.samples << " x " << row.lines;
        EXPECT_EQ(roi.ResetROI(), 0);
        EXPECT_NE(roi.isNULL(), 0);
        EXPECT_EQ(roi.FastStartTime, kFastStart) << "only the counts go";
    }
}

TEST(RoiIndex, IsTheNearestWithHalvesAwayFromZero) {
    ROI_Obj roi;
    place(roi, {0, 17, 0, 13});
    const struct {
        double intervals;
        int index;
    } rows[] = {{0, 0},     {0.5, 1},   {-0.5, -1},     {0.4375, 0}, {-0.4375, 0},
                {12.5, 13}, {-7.5, -8}, {1e6, 1000000}, {-2.25, -2}, {16.75, 17}};
    for (const auto& row : rows) {
        EXPECT_EQ(roi.GetFastIndex(kFastStart + row.intervals * kFastDelta), row.index) << row.intervals;
        EXPECT_EQ(roi.GetSlowIndex(kSlowStart + row.intervals * kSlowDelta), row.index) << row.intervals;
        EXPECT_EQ(roi.GetFastRange(row.intervals * kFastDelta), row.index) << row.intervals;
        EXPECT_EQ(roi.GetSlowRange(row.intervals * kSlowDelta), row.index) << row.intervals;
    }
}

// A plain conversion of such quotients to int is undefined.
TEST(RoiIndex, StopsAtTheBoundsOfAnInt) {
    const struct {
        double time, delta;
        int index;
    } rows[] = {{1e9, 1e-9, kMax},     {-1e9, 1e-9, kMin}, {kInfinity, 1e-3, kMax}, {-kInfinity, 1e-3, kMin},
                {1e300, 1e-300, kMax}, {17.3, 0.0, 0},     {-17.3, 0.0, 0},         {0.0, 0.0, 0},
                {kNaN, 1e-3, 0},       {17.3, kNaN, 0},    {17.3, kInfinity, 0},    {kInfinity, kInfinity, 0},
                {17.3, -1e-10, kMin}};
    for (const auto& row : rows) {
        ROI_Obj roi;
        roi.SetFastAxe(0.0, row.delta, 17);
        roi.SetSlowAxe(0.0, row.delta, 13);
        EXPECT_EQ(roi.GetFastIndex(row.time), row.index) << row.time << " / " << row.delta;
        EXPECT_EQ(roi.GetSlowIndex(row.time), row.index) << row.time << " / " << row.delta;
        EXPECT_EQ(roi.GetFastRange(row.time), row.index) << row.time << " / " << row.delta;
        EXPECT_EQ(roi.GetSlowRange(row.time), row.index) << row.time << " / " << row.delta;
    }
}

// Up and down lie along range, left and right along azimuth.
TEST(RoiCorners, GoDownTheFastAxisAndRightTheSlowAxis) {
    ROI_Obj roi;
    roi.SetFastAxe(0.25, 0.5, 7);    // to 3.75
    roi.SetSlowAxe(100.5, 0.25, 6);  // to 102.0
    const struct {
        const char* name;
        ROI_Time is, expected;
    } rows[] = {{"up left", roi.GetUpLeft(), {0.25, 100.5}},
                {"up right", roi.GetUpRight(), {0.25, 102.0}},
                {"down left", roi.GetDownLeft(), {3.75, 100.5}},
                {"down right", roi.GetDownRight(), {3.75, 102.0}},
                {"center", roi.GetCenter(), {2.0, 101.25}}};
    for (const auto& row : rows) {
        EXPECT_EQ(row.is.FastTime, row.expected.FastTime) << row.name;
        EXPECT_EQ(row.is.SlowTime, row.expected.SlowTime) << row.name;
    }
}

struct Meeting {
    const char* name;
    Grid a, b, shared;
};
constexpr Meeting kMeetings[] = {
    {"BInsideA", {0, 170, 0, 130}, {17, 23, 29, 31}, {17, 23, 29, 31}},
    {"Same", {3, 17, 5, 13}, {3, 17, 5, 13}, {3, 17, 5, 13}},
    {"Corner", {0, 100, 0, 90}, {61, 100, 73, 100}, {61, 39, 73, 17}},
    {"OtherCorner", {0, 100, 50, 90}, {61, 100, 7, 60}, {61, 39, 50, 17}},
    {"HalfASampleIsDropped", {0, 100, 0, 90}, {60.5, 100, 72.25, 100}, {60.5, 39, 72.25, 17}},
};
class RoiIntersection : public testing::TestWithParam<Meeting> {};

TEST_P(RoiIntersection, IsWhatBothShare) {
    const Meeting& row = GetParam();
    for (const bool swapped : {false, true}) {
        ROI_Obj a, b, expected, out;
        place(a, swapped ? row.b : row.a);
        place(b, swapped ? row.a : row.b);
        place(expected, row.shared);
        ASSERT_EQ(ROI_Obj::IntersectROI(&a, &b, &out), 0);
        EXPECT_EQ(out.Samples, expected.Samples);
        EXPECT_EQ(out.Lines, expected.Lines);
        EXPECT_EQ(out.FastStartTime, expected.FastStartTime);
        EXPECT_EQ(out.SlowStartTime, expected.SlowStartTime);
        EXPECT_EQ(out.FastTimeLength, expected.Samples * kFastDelta);
        EXPECT_EQ(out.SlowTimeLength, expected.Lines * kSlowDelta);
        EXPECT_EQ(out.FastTimeDelta, kFastDelta);
        EXPECT_EQ(out.SlowTimeDelta, kSlowDelta);
        // The result may take the place of either region.
        ASSERT_EQ(ROI_Obj::IntersectROI(&a, &b, swapped ? &a : &b), 0);
        EXPECT_EQ((swapped ? a : b).Samples, expected.Samples);
        EXPECT_EQ((swapped ? a : b).SlowStartTime, expected.SlowStartTime);
    }
}
INSTANTIATE_TEST_SUITE_P(Meetings, RoiIntersection, testing::ValuesIn(kMeetings),
                         [](const auto& row) { return row.param.name; });

TEST(RoiIntersect, CountsInTheIntervalsOfTheFirst) {
    ROI_Obj fine, coarse, out;
    place(fine, {0, 96, 0, 60});
    place(coarse, {8, 22, 16, 11}, 4 * kFastDelta, 4 * kSlowDelta);  // 88 fine samples, 44 fine lines
    ROI_Obj::IntersectROI(&fine, &coarse, &out);
    EXPECT_EQ(out.Samples, 88);
    EXPECT_EQ(out.Lines, 44);
    EXPECT_EQ(out.FastTimeDelta, kFastDelta);
    ROI_Obj::IntersectROI(&coarse, &fine, &out);
    EXPECT_EQ(out.Samples, 22);
    EXPECT_EQ(out.Lines, 11);
    EXPECT_EQ(out.SlowTimeDelta, 4 * kSlowDelta);
}

TEST(RoiIntersect, IsEmptyWhereNothingIsShared) {
    const struct {
        Grid b;
        double samples, lines;  // what the lengths still tell
    } rows[] = {{{120, 10, 0, 90}, -20, 90},
                {{0, 100, 95, 10}, 100, -5},
                {{100, 10, 0, 90}, 0, 90},
                {{200, 5, 300, 5}, -100, -210}};
    for (const auto& row : rows) {
        ROI_Obj a, b, out;
        place(a, {0, 100, 0, 90});
        place(b, row.b);
        EXPECT_EQ(ROI_Obj::IntersectROI(&a, &b, &out), 0);
        EXPECT_NE(out.isNULL(), 0);
        EXPECT_EQ(out.Samples, 0);
        EXPECT_EQ(out.Lines, 0);
        EXPECT_EQ(out.FastStartTime, b.FastStartTime);
        EXPECT_EQ(out.FastTimeLength, row.samples * kFastDelta);
        EXPECT_EQ(out.SlowTimeLength, row.lines * kSlowDelta);
    }
}

TEST(RoiIntersect, MakesNothingOfIntervalsThatAreNone) {
    for (const double delta : {0.0, kNaN, kInfinity}) {
        ROI_Obj a, out;
        place(a, {0, 100, 0, 90});
        a.FastTimeDelta = delta;
        EXPECT_EQ(ROI_Obj::IntersectROI(&a, &a, &out), 0);
        EXPECT_NE(out.isNULL(), 0) << delta;
    }
    ROI_Obj endless, out;
    endless.SetFastAxe(-1e300, 1e-300, 5);
    endless.FastTimeLength = 1e300 * 2;
    endless.SetSlowAxe(0.0, 0.5, 5);
    EXPECT_EQ(ROI_Obj::IntersectROI(&endless, &endless, &out), 0);
    EXPECT_EQ(out.Samples, kMax);
}

TEST(RoiIntersect, RefusesAMissingRegion) {
    const test::Report report;
    ROI_Obj a, b;
    EXPECT_EQ(ROI_Obj::IntersectROI(nullptr, &b, &a), 1);
    EXPECT_EQ(ROI_Obj::IntersectROI(&a, nullptr, &b), 1);
    EXPECT_EQ(ROI_Obj::IntersectROI(&a, &b, nullptr), 1);
    EXPECT_EQ(report.entries("ERROR").size(), 3U);
}

TEST(RoiCoords, BecomeTimesOnTheGridOfTheImage) {
    ROI_Obj image, out;
    place(image, {0, 1000, 0, 2000});
    ROI_Coords coords;
    coords.FirstSample = 117;
    coords.FirstLine = 213;
    coords.Samples = 31;
    coords.Lines = 47;
    ASSERT_EQ(coords.GetROI(&image, &out), 0);
    EXPECT_EQ(image.GetFastIndex(out.FastStartTime), 117);
    EXPECT_EQ(image.GetSlowIndex(out.SlowStartTime), 213);
    EXPECT_EQ(out.Samples, 31);
    EXPECT_EQ(out.Lines, 47);
    EXPECT_EQ(out.FastTimeLength, 31 * kFastDelta);
    EXPECT_EQ(out.SlowTimeLength, 47 * kSlowDelta);
    EXPECT_EQ(coords.GetROI(nullptr, &out), 1);
    EXPECT_EQ(coords.GetROI(&image, nullptr), 1);
}

}  // namespace
