#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <vector>

#include "quo_base/generalSARorbit.h"
#include "quo_base/geo_grid.h"
#include "support/diagnostics.h"
#include "support/scenes.h"

namespace {

class GeoCoords : public testing::TestWithParam<test::Scene> {
protected:
    void SetUp() override {
        test::load_orbit(GetParam(), orbit_);
        const test::Extent extent = test::extent_of(test::load_tie_points(GetParam()));
        roi_.Roi.SlowStartTime = extent.first_s;
        roi_.Roi.SlowTimeLength = extent.last_s - extent.first_s;
        roi_.Roi.FastStartTime = extent.near_s;
        roi_.Roi.FastTimeLength = extent.far_s - extent.near_s;
    }
    /** The five values at a place of the region, from the orbit's own short forms. */
    void expect(const geopoint& point, double along, double across) {
        const double t = roi_.Roi.SlowStartTime + along * roi_.Roi.SlowTimeLength;
        const double range = roi_.Roi.FastStartTime + across * roi_.Roi.FastTimeLength;
        const double values[] = {orbit_.SVGetLat(t, range), orbit_.SVGetLon(t, range), 0.0,
                                 orbit_.SVGetAnglesIncidence(t, range), orbit_.SVGetAnglesLook(t, range)};
        const double named[] = {point.Latitude, point.Longitude, point.Height, point.IncidenceAngle,
                                point.LookAngle};
        EXPECT_THAT(point.Point, testing::ElementsAreArray(values));
        EXPECT_THAT(named, testing::ElementsAreArray(values));
    }

    const test::Report report_;
    GeneralSAROrbit orbit_;
    GSRoi_Obj roi_;
    geoCoords_Obj grid_;
};

TEST_P(GeoCoords, AreTheRegionsCornersByOrbitDirection) {
    grid_.EastingGridSize = 17.3;
    ASSERT_EQ(orbit_.SVGetGeoCoords(&grid_, &roi_), 0);
    const double up = orbit_.isAscending() ? 1.0 : 0.0, down = 1.0 - up;
    expect(grid_.NorthWest, up, down);
    expect(grid_.NorthEast, up, up);
    expect(grid_.SouthWest, down, down);
    expect(grid_.SouthEast, down, up);
    expect(grid_.Center, 0.5, 0.5);
    EXPECT_EQ(grid_.EastingGridSize, 17.3);
    if (orbit_.getLookSign() < 0) return;  // the names are right for a platform that looks to the right
    EXPECT_GT(grid_.NorthWest.Latitude, grid_.SouthWest.Latitude);
    EXPECT_LT(grid_.NorthWest.Longitude, grid_.NorthEast.Longitude);
}

// The far range fails at once: the near corner before it is filled, the others are as they were.
TEST_P(GeoCoords, KeepThePointsBeforeAFailure) {
    roi_.Roi.FastTimeLength = 1000.0;
    EXPECT_NE(orbit_.SVGetGeoCoords(&grid_, &roi_), 0);
    expect(orbit_.isAscending() ? grid_.SouthWest : grid_.NorthEast, 0.0, 0.0);
    EXPECT_THAT(grid_.Center.Point, testing::Each(-999.0));
    EXPECT_GE(report_.entries("ERROR_CALL_TREE").size(), 1U);
    GeneralSAROrbit none;
    for (const int status : {none.SVGetGeoCoords(&grid_, &roi_), none.SVGetGeoCoords(nullptr, &roi_),
                             none.SVGetGeoCoords(&grid_, nullptr)})
        EXPECT_EQ(status, 1);
}
INSTANTIATE_TEST_SUITE_P(Scenes, GeoCoords, testing::ValuesIn(test::kScenes),
                         [](const auto& row) { return row.param.name; });

}  // namespace
