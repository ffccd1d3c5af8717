#include "quo_base/geo_grid.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "objects/records.h"
#include "support/diagnostics.h"

namespace {

using testing::ElementsAre;

TEST(GeoGrid, KeepsAPointThatIsMissing) {
    const test::Report report;
    const std::string file = report.file("header.xml");
    geoCoords_Obj source, target;
    test::fill(source);
    ASSERT_EQ(source.writehdr(file.c_str()), 0);
    EXPECT_EQ(source.writehdr(report.file("no_such_folder/header.xml").c_str()), 1);
    EXPECT_GE(report.entries("ERROR_CALL_TREE").size(), 1U);
    test::write_text(file, test::without_element(test::read_text(file), "SouthWest"));
    EXPECT_EQ(target.readhdr(file.c_str()), 0);
    EXPECT_THAT(test::differences(source, target), ElementsAre("SouthWest.Point", "SouthWest.members"));
    EXPECT_EQ(target.SouthWest.Latitude, -999.0);
}

TEST(GeoGrid, KeepsTheRasterInItsSideFile) {
    const test::Report report;
    const std::string header = report.file("scene.xml"), raster = report.file("scene");
    GSDataFile_Obj source, target, copy;
    test::fill(source);
    source.File.setFilename("of another name");
    EXPECT_EQ(source.writehdr(header.c_str()), 0);
    EXPECT_STREQ(source.File.FileName, "of another name");
    EXPECT_FALSE(std::filesystem::exists(header));
    EXPECT_TRUE(std::filesystem::exists(raster + ".hdr"));
    EXPECT_EQ(target.readhdr(header.c_str()) + target.clone(&copy), 0);
    EXPECT_EQ(copy.File.FileName, raster);
    GSDataFile_Obj none;
    for (const char* name : {".hdr", "abc"}) EXPECT_EQ(none.readhdr(name) + none.writehdr(name), 0);
    EXPECT_STREQ(none.File.FileName, "");
    EXPECT_FALSE(std::filesystem::exists(".hdr"));
}

/** The named members in the order in which they travel. */
std::vector<double> members(const geopoint& p) {
    return {p.Latitude, p.Longitude, p.Height, p.IncidenceAngle, p.LookAngle};
}

// Kept as callers know it: the named members follow the array even where nothing, or not enough, was read.
TEST(Geopoint, TakesItsArrayWhateverTheFileHas) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("points.par");
    test::write_text(file, "[Coordinates]\nSouthEast = {44.21 8.03}\n");
    for (const char* name : {"Center", "", "no/such point", static_cast<const char*>(nullptr)}) {
        geopoint point;
        point.Latitude = 45.37;
        EXPECT_EQ(point.readhdr(file.c_str(), name), 0);
        EXPECT_THAT(members(point), testing::Each(-999.0));
    }
    geopoint point;
    EXPECT_EQ(point.readhdr(file.c_str(), "SouthEast"), 0);
    EXPECT_THAT(members(point), ElementsAre(44.21, 8.03, -999.0, -999.0, -999.0));
    for (const char* name : {"", "North West", "<x>"}) EXPECT_EQ(point.writehdr(file.c_str(), name), 1) << name;
}

}  // namespace
