#include "quo_base/geo_grid.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "support/diagnostics.h"
#include "support/fields.h"

namespace {

using testing::ElementsAre, testing::IsEmpty;

constexpr const char* kSection = "GroundCornersPoints";
constexpr const char* kPoints[] = {"NorthWest", "NorthEast", "SouthWest", "SouthEast", "Center"};

std::vector<geopoint*> points_of(geoCoords_Obj& grid) {
    return {&grid.NorthWest, &grid.NorthEast, &grid.SouthWest, &grid.SouthEast, &grid.Center};
}

double value(std::size_t point, int i) { return 17.3 + 8.25 * static_cast<double>(point) + i; }

void fill(geoCoords_Obj& grid) {
    grid.EastingGridSize = 12.5;
    grid.NorthingGridSize = 17.75;
    std::size_t number = 0;
    for (geopoint* point : points_of(grid)) {
        point->Latitude = value(number, 0);
        point->Longitude = value(number, 1);
        point->Height = value(number, 2);
        point->IncidenceAngle = value(number, 3);
        point->LookAngle = value(number++, 4);
    }
}

/** Compares every value of two grids. */
void expect_same(geoCoords_Obj& a, geoCoords_Obj& b) {
    EXPECT_THAT(test::differing_fields(a, b), IsEmpty());
    for (std::size_t i = 0; i < 5; ++i) {
        SCOPED_TRACE(kPoints[i]);
        const geopoint &left = *points_of(a)[i], &right = *points_of(b)[i];
        EXPECT_EQ(left.Latitude, right.Latitude);
        EXPECT_EQ(left.Longitude, right.Longitude);
        EXPECT_EQ(left.Height, right.Height);
        EXPECT_EQ(left.IncidenceAngle, right.IncidenceAngle);
        EXPECT_EQ(left.LookAngle, right.LookAngle);
    }
}

class GeoGrid : public testing::Test {
protected:
    const test::Report report_;
    const std::string file_ = report_.file("header.xml");
};

TEST_F(GeoGrid, ComesBackAndStandsInTheFileOnce) {
    geoCoords_Obj source, target;
    fill(source);
    ASSERT_EQ(source.writehdr(file_.c_str()), 0);
    const std::string once = test::read_text(file_);
    ASSERT_EQ(source.writehdr(file_.c_str()), 0);
    const std::string text = test::read_text(file_);
    EXPECT_EQ(text, once);
    EXPECT_EQ(text.find("<GroundCornersPoints>"), text.rfind("<GroundCornersPoints>"));
    EXPECT_THAT(test::child_names(text, kSection), ElementsAre("EastingGridSize", "NorthingGridSize", "NorthWest",
                                                               "NorthEast", "SouthWest", "SouthEast", "Center"));
    ASSERT_EQ(target.readhdr(file_.c_str()), 0);
    expect_same(source, target);
}

TEST_F(GeoGrid, KeepsAPointThatIsMissing) {
    geoCoords_Obj source, target;
    fill(source);
    ASSERT_EQ(source.writehdr(file_.c_str()), 0);
    test::write_text(file_, test::without_element(test::read_text(file_), "SouthWest"));
    EXPECT_EQ(target.readhdr(file_.c_str()), 0);
    EXPECT_EQ(target.SouthWest.Latitude, -999.0);
    source.SouthWest.clone(&target.SouthWest);
    expect_same(source, target);
}

TEST_F(GeoGrid, NeedsBothSpacings) {
    geoCoords_Obj source;
    fill(source);
    ASSERT_EQ(source.writehdr(file_.c_str()), 0);
    const std::string text = test::read_text(file_);
    for (const char* name : {"EastingGridSize", "NorthingGridSize"}) {
        geoCoords_Obj target;
        const std::string file = report_.file(std::string{name} + ".xml");
        test::write_text(file, test::without_element(text, name));
        EXPECT_EQ(target.readhdr(file.c_str()), 1);
        EXPECT_EQ(target.NorthWest.Latitude, -999.0);
    }
}

TEST_F(GeoGrid, FallsBackToTheParameterFile) {
    geoCoords_Obj source, target, half;
    fill(source);
    std::string text = "[GeoGridSize]\nEastingGridSize = 12.5\nNorthingGridSize = 17.75\n[Coordinates]\n";
    for (std::size_t point = 0; point < 5; ++point) {
        text += std::string{kPoints[point]} + " = {";
        for (int i = 0; i < 5; ++i) text += (i ? " " : "") + test::digits(value(point, i));
        text += "}\n";
    }
    test::write_text(file_, text);
    ASSERT_EQ(target.readhdr(file_.c_str()), 0);
    expect_same(source, target);

    const std::string other = report_.file("half.par");
    test::write_text(other, "[GeoGridSize]\nEastingGridSize = 12.5\n");
    EXPECT_EQ(half.readhdr(other.c_str()), 1);
}

TEST_F(GeoGrid, LeavesTheFileWhenItCannotBeWritten) {
    geoCoords_Obj grid;
    fill(grid);
    EXPECT_EQ(grid.writehdr(report_.file("no_such_folder/header.xml").c_str()), 1);
    EXPECT_GE(report_.entries("ERROR_CALL_TREE").size(), 1U);
}

TEST_F(GeoGrid, Clones) {
    geoCoords_Obj source, target;
    fill(source);
    EXPECT_EQ(source.clone(&target), 0);
    expect_same(source, target);
}

TEST_F(GeoGrid, KeepsTheRegionOfInterestInItsSection) {
    GSRoi_Obj source, target, copy;
    test::fill_fields(source.Roi);
    EXPECT_EQ(source.writehdr(file_.c_str()), 0);
    EXPECT_THAT(test::child_names(test::read_text(file_), "ROI"), test::field_names(source.Roi));
    EXPECT_EQ(target.readhdr(file_.c_str()), 0);
    EXPECT_THAT(test::differing_fields(source.Roi, target.Roi), IsEmpty());
    EXPECT_EQ(source.clone(&copy), 0);
    EXPECT_THAT(test::differing_fields(source.Roi, copy.Roi), IsEmpty());
    EXPECT_EQ(target.readhdr(report_.file("missing.xml").c_str()), 1);
}

TEST_F(GeoGrid, KeepsTheRasterInItsSideFile) {
    const std::string header = report_.file("scene.xml"), raster = report_.file("scene");
    GSDataFile_Obj source, target, copy;
    test::fill_fields(source.File);
    source.File.setFilename("of another name");
    source.File.HeaderOffset = 803457;
    source.File.CellType = INT16;
    EXPECT_EQ(source.writehdr(header.c_str()), 0);
    EXPECT_STREQ(source.File.FileName, "of another name");
    EXPECT_FALSE(std::filesystem::exists(header));
    EXPECT_NE(test::element_text(test::read_text(raster + ".hdr"), "RasterInfo"), "");

    EXPECT_EQ(target.readhdr(header.c_str()), 0);
    EXPECT_EQ(target.File.FileName, raster);
    EXPECT_THAT(test::differing_fields(source.File, target.File), IsEmpty());
    EXPECT_EQ(target.clone(&copy), 0);
    EXPECT_EQ(copy.File.FileName, raster);
    EXPECT_EQ(copy.File.HeaderOffset, 803457);
    EXPECT_EQ(copy.File.CellType, INT16);
    EXPECT_EQ(copy.File.NrOfPixelsPerLine, source.File.NrOfPixelsPerLine);
}

TEST_F(GeoGrid, AlwaysHasARaster) {
    GSDataFile_Obj object;
    for (const char* name : {"", ".hdr", "abc", static_cast<const char*>(nullptr)}) {
        EXPECT_EQ(object.readhdr(name), 0);
        EXPECT_EQ(object.writehdr(name), 0);
    }
    EXPECT_STREQ(object.File.FileName, "");
    EXPECT_FALSE(std::filesystem::exists(".hdr"));
    EXPECT_EQ(object.readhdr(report_.file("missing.xml").c_str()), 0);
    EXPECT_EQ(object.writehdr(report_.file("no_such_folder/scene.xml").c_str()), 0);
}

}  // namespace
