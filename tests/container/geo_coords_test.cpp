#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "quo_base/generalSARorbit.h"
#include "quo_base/geo_grid.h"
#include "support/diagnostics.h"
#include "support/scenes.h"

namespace {

using testing::ElementsAreArray;

class GeoCoords : public testing::TestWithParam<test::Scene> {
protected:
    void SetUp() override {
        test::load_orbit(GetParam(), orbit_);
        extent_ = test::extent_of(test::load_tie_points(GetParam()));
        roi_.Roi.SlowStartTime = extent_.first_s;
        roi_.Roi.SlowTimeLength = extent_.last_s - extent_.first_s;
        roi_.Roi.FastStartTime = extent_.near_s;
        roi_.Roi.FastTimeLength = extent_.far_s - extent_.near_s;
    }
    /** The five values at a place of the region, from the orbit's own short forms. */
    std::vector<double> sample(double along, double across) {
        const double t = roi_.Roi.SlowStartTime + along * roi_.Roi.SlowTimeLength;
        const double range = roi_.Roi.FastStartTime + across * roi_.Roi.FastTimeLength;
        return {orbit_.SVGetLat(t, range), orbit_.SVGetLon(t, range), 0.0, orbit_.SVGetAnglesIncidence(t, range),
                orbit_.SVGetAnglesLook(t, range)};
    }
    static void expect(const geopoint& point, const std::vector<double>& values) {
        EXPECT_THAT(point.Point, ElementsAreArray(values));
        const double named[] = {point.Latitude, point.Longitude, point.Height, point.IncidenceAngle,
                                point.LookAngle};
        EXPECT_THAT(named, ElementsAreArray(values));
    }

    GeneralSAROrbit orbit_;
    GSRoi_Obj roi_;
    geoCoords_Obj grid_;
    test::Extent extent_;
};

TEST_P(GeoCoords, AreTheRegionsCornersByOrbitDirection) {
    grid_.EastingGridSize = 17.3;
    ASSERT_EQ(orbit_.SVGetGeoCoords(&grid_, &roi_), 0);
    const auto p1 = sample(0, 0), p2 = sample(0, 1), p3 = sample(1, 0), p4 = sample(1, 1);
    const bool up = orbit_.isAscending();
    expect(grid_.NorthWest, up ? p3 : p2);
    expect(grid_.NorthEast, up ? p4 : p1);
    expect(grid_.SouthWest, up ? p1 : p4);
    expect(grid_.SouthEast, up ? p2 : p3);
    expect(grid_.Center, sample(0.5, 0.5));
    EXPECT_EQ(grid_.EastingGridSize, 17.3);
    if (orbit_.getLookSign() < 0) return;  // the names are right for a platform that looks to the right
    EXPECT_GT(grid_.NorthWest.Latitude, grid_.SouthWest.Latitude);
    EXPECT_GT(grid_.NorthEast.Latitude, grid_.SouthEast.Latitude);
    EXPECT_LT(grid_.NorthWest.Longitude, grid_.NorthEast.Longitude);
    EXPECT_LT(grid_.SouthWest.Longitude, grid_.SouthEast.Longitude);
}

// The far range fails at once: the near corner before it is filled, the others are as they were.
TEST_P(GeoCoords, KeepThePointsBeforeAFailure) {
    const test::Report report;
    roi_.Roi.FastTimeLength = 1000.0;
    EXPECT_NE(orbit_.SVGetGeoCoords(&grid_, &roi_), 0);
    expect(orbit_.isAscending() ? grid_.SouthWest : grid_.NorthEast, sample(0, 0));
    expect(grid_.Center, std::vector<double>(5, -999.0));
    EXPECT_GE(report.entries("ERROR_CALL_TREE").size(), 1U);
}
INSTANTIATE_TEST_SUITE_P(Scenes, GeoCoords, testing::ValuesIn(test::kScenes),
                         [](const auto& row) { return row.param.name; });
TEST(GeoCoordsWithoutOrbit, AreRefused) {
    const test::Report report;
    GeneralSAROrbit orbit;
    geoCoords_Obj grid;
    GSRoi_Obj roi;
    for (const int status : {orbit.SVGetGeoCoords(&grid, &roi), orbit.SVGetGeoCoords(nullptr, &roi),
                             orbit.SVGetGeoCoords(&grid, nullptr)})
        EXPECT_EQ(status, 1);
    EXPECT_EQ(grid.Center.Latitude, -999.0);
}

}  // namespace
