// SPDX-License-Identifier: Apache-2.0
#include "quo_base/geo_grid.h"

#include "objects/records.h"
#include "support/diagnostics.h"
#include "support/scenes.h"

namespace {

using testing::Each, testing::ElementsAre;

TEST(GeoGrid, KeepsTheRasterInItsSideFile) {
    const test::TemporaryFolder folder;
    const std::string header = folder.file("scene.xml"), raster = folder.file("scene");
    GSDataFile_Obj source, target, copy, none;
    test::fill(source);
    source.File.setFilename("of another name");
    EXPECT_EQ(source.writehdr(header.c_str()), 0);
    EXPECT_STREQ(source.File.FileName, "of another name");
    EXPECT_TRUE(std::filesystem::exists(raster + ".hdr") && !std::filesystem::exists(header));
    EXPECT_EQ(target.readhdr(header.c_str()) + target.clone(&copy), 0);
    EXPECT_EQ(copy.File.FileName, raster);
    for (const char* name : {".hdr", "abc"}) EXPECT_EQ(none.readhdr(name) + none.writehdr(name), 0);
    EXPECT_STREQ(none.File.FileName, "");
    EXPECT_FALSE(std::filesystem::exists(".hdr"));
}

/** The named members in the order in which they travel. */
std::vector<double> members(const geopoint& p) {
    return {p.Latitude, p.Longitude, p.Height, p.IncidenceAngle, p.LookAngle};
}

// --- the corners of a region, as an orbit sees them -----------------------------------------------------------

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
        EXPECT_THAT(point.Point, testing::ElementsAreArray(values));
        EXPECT_THAT(members(point), testing::ElementsAreArray(values));
    }
    GeneralSAROrbit orbit_;
    GSRoi_Obj roi_;
    geoCoords_Obj grid_;
};
INSTANTIATE_TEST_SUITE_P(Scenes, GeoCoords, testing::ValuesIn(test::kScenes),
                         [](const auto& row) { return row.param.name; });

TEST_P(GeoCoords, AreTheRegionsCornersByOrbitDirection) {
    ASSERT_EQ(orbit_.SVGetGeoCoords(&grid_, &roi_), 0);
    const double up = orbit_.isAscending() ? 1.0 : 0.0, down = 1.0 - up;
    expect(grid_.NorthWest, up, down);
    expect(grid_.NorthEast, up, up);
    expect(grid_.SouthWest, down, down);
    expect(grid_.SouthEast, down, up);
    expect(grid_.Center, 0.5, 0.5);
    if (orbit_.getLookSign() < 0) return;  // the names are right for a platform that looks to the right
    EXPECT_GT(grid_.NorthWest.Latitude, grid_.SouthWest.Latitude);
    EXPECT_LT(grid_.NorthWest.Longitude, grid_.NorthEast.Longitude);
}

// The far range fails at once: the near corner before it is filled, the others are as they were.
TEST_P(GeoCoords, KeepThePointsBeforeAFailure) {
    roi_.Roi.FastTimeLength = 1000.0;
    EXPECT_NE(orbit_.SVGetGeoCoords(&grid_, &roi_), 0);
    expect(orbit_.isAscending() ? grid_.SouthWest : grid_.NorthEast, 0.0, 0.0);
    EXPECT_THAT(grid_.Center.Point, Each(-999.0));
    EXPECT_EQ(GeneralSAROrbit{}.SVGetGeoCoords(&grid_, &roi_), 1);
    EXPECT_EQ(orbit_.SVGetGeoCoords(nullptr, &roi_) + orbit_.SVGetGeoCoords(&grid_, nullptr), 2);
}

}  // namespace
