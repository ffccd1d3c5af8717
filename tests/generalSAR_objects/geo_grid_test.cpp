#include "quo_base/geo_grid.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>
#include <vector>

#include "quo_base/acquisition.h"
#include "support/diagnostics.h"
#include "support/fields.h"

namespace {

using testing::ElementsAre, testing::IsEmpty;

constexpr const char* kPoints[] = {"NorthWest", "NorthEast", "SouthWest", "SouthEast", "Center"};

std::vector<geopoint*> points_of(geoCoords_Obj& grid) {
    return {&grid.NorthWest, &grid.NorthEast, &grid.SouthWest, &grid.SouthEast, &grid.Center};
}
/** Every value of a grid: the spacings, and five of each point. */
std::vector<double*> values_of(geoCoords_Obj& grid) {
    std::vector<double*> values{&grid.EastingGridSize, &grid.NorthingGridSize};
    for (geopoint* p : points_of(grid))
        values.insert(values.end(), {&p->Latitude, &p->Longitude, &p->Height, &p->IncidenceAngle, &p->LookAngle});
    return values;
}
void fill(geoCoords_Obj& grid) {
    double next = 12.5;
    for (double* value : values_of(grid)) *value = next += 5.25;
}
void expect_same(geoCoords_Obj& a, geoCoords_Obj& b) {
    for (std::size_t i = 0; i < 27; ++i) EXPECT_EQ(*values_of(a)[i], *values_of(b)[i]) << i;
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
    EXPECT_THAT(test::child_names(text, "GroundCornersPoints"),
                ElementsAre("EastingGridSize", "NorthingGridSize", "NorthWest", "NorthEast", "SouthWest",
                            "SouthEast", "Center"));
    ASSERT_EQ(target.readhdr(file_.c_str()), 0);
    expect_same(source, target);
}

TEST_F(GeoGrid, KeepsAPointThatIsMissingButNeedsBothSpacings) {
    geoCoords_Obj source, target;
    fill(source);
    ASSERT_EQ(source.writehdr(file_.c_str()), 0);
    const std::string text = test::read_text(file_);
    for (const char* name : {"EastingGridSize", "NorthingGridSize"}) {
        const std::string file = report_.file(std::string{name} + ".xml");
        test::write_text(file, test::without_element(text, name));
        EXPECT_EQ(target.readhdr(file.c_str()), 1);
        EXPECT_EQ(target.NorthWest.Latitude, -999.0);
    }
    test::write_text(file_, test::without_element(text, "SouthWest"));
    EXPECT_EQ(target.readhdr(file_.c_str()), 0);
    EXPECT_EQ(target.SouthWest.Latitude, -999.0);
    source.SouthWest.clone(&target.SouthWest);
    expect_same(source, target);
}

TEST_F(GeoGrid, FallsBackToTheParameterFile) {
    geoCoords_Obj source, target, half;
    fill(source);
    const std::vector<double*> values = values_of(source);
    std::string text = "[GeoGridSize]\nEastingGridSize = " + test::digits(*values[0]) + "\n", all = text;
    all += "NorthingGridSize = " + test::digits(*values[1]) + "\n[Coordinates]\n";
    for (std::size_t point = 0; point < 5; ++point) {
        all += std::string{kPoints[point]} + " = {";
        for (std::size_t i = 0; i < 5; ++i)
            all += test::digits(*values[2 + 5 * point + i]) + (i < 4 ? " " : "}\n");
    }
    test::write_text(file_, all);
    ASSERT_EQ(target.readhdr(file_.c_str()), 0);
    expect_same(source, target);
    test::write_text(report_.file("half.par"), text);
    EXPECT_EQ(half.readhdr(report_.file("half.par").c_str()), 1);
}

TEST_F(GeoGrid, ClonesAndLeavesTheFileWhenItCannotBeWritten) {
    geoCoords_Obj grid, copy;
    fill(grid);
    EXPECT_EQ(grid.clone(&copy), 0);
    expect_same(grid, copy);
    EXPECT_EQ(grid.writehdr(report_.file("no_such_folder/header.xml").c_str()), 1);
    EXPECT_GE(report_.entries("ERROR_CALL_TREE").size(), 1U);
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

// --- one ground point -------------------------------------------------------------------------------------------

/** The named members in the order in which they travel. */
std::vector<double> members(const geopoint& p) {
    return {p.Latitude, p.Longitude, p.Height, p.IncidenceAngle, p.LookAngle};
}

void make(geopoint& p) {
    p.Latitude = 45.37;
    p.Longitude = 7.25;
    p.Height = 317.3;
    p.IncidenceAngle = 23.1;
    p.LookAngle = 20.7;
}

// Of the five points of a grid, tests are with the grid.
TEST(Geopoint, TravelsAsOneArrayOfFive) {
    constexpr test::FieldRow kRows[] = {test::real("Point", -999.0, 5)};
    const test::TemporaryFolder folder;
    const std::string file = folder.file("points.xml");
    geopoint source, back, copy;
    test::expect_fields(source, kRows);
    EXPECT_THAT(members(source), testing::Each(-999.0));
    make(source);
    ASSERT_EQ(source.writehdr(file.c_str(), "NorthWest"), 0);
    EXPECT_THAT(test::child_names(test::read_text(file), "NorthWest"), ElementsAre("Point"));
    ASSERT_EQ(back.readhdr(file.c_str(), "NorthWest"), 0);
    ASSERT_EQ(back.clone(&copy), 0);
    for (const geopoint* point : {&back, &copy}) {
        EXPECT_THAT(members(*point), ElementsAre(45.37, 7.25, 317.3, 23.1, 20.7));
        EXPECT_THAT(point->Point, ElementsAre(45.37, 7.25, 317.3, 23.1, 20.7));
    }
    for (const char* name : {"", "North West", "<x>"}) EXPECT_EQ(source.writehdr(file.c_str(), name), 1) << name;
}

// Kept as callers know it: the named members follow the array even where nothing, or not enough, was read.
TEST(Geopoint, TakesItsArrayWhateverTheFileHas) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("points.par");
    test::write_text(file, "[Coordinates]\nSouthEast = {44.21 8.03}\n");
    for (const char* name : {"Center", "", "no/such point", static_cast<const char*>(nullptr)}) {
        geopoint point;
        make(point);
        EXPECT_EQ(point.readhdr(file.c_str(), name), 0);
        EXPECT_THAT(members(point), testing::Each(-999.0));
    }
    geopoint point;
    EXPECT_EQ(point.readhdr(file.c_str(), "SouthEast"), 0);
    EXPECT_THAT(members(point), ElementsAre(44.21, 8.03, -999.0, -999.0, -999.0));
}

}  // namespace
