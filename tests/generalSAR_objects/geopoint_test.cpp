#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <string>

#include "quo_base/acquisition.h"
#include "support/diagnostics.h"
#include "support/fields.h"

namespace {

using testing::ElementsAre;

void set(geopoint& point, double latitude, double longitude, double height, double incidence, double look) {
    point.Latitude = latitude;
    point.Longitude = longitude;
    point.Height = height;
    point.IncidenceAngle = incidence;
    point.LookAngle = look;
}

auto holds(double latitude, double longitude, double height, double incidence, double look) {
    using testing::AllOf, testing::Field;
    return AllOf(Field("latitude", &geopoint::Latitude, latitude),
                 Field("longitude", &geopoint::Longitude, longitude), Field("height", &geopoint::Height, height),
                 Field("incidence", &geopoint::IncidenceAngle, incidence),
                 Field("look", &geopoint::LookAngle, look),
                 Field("array", &geopoint::Point, ElementsAre(latitude, longitude, height, incidence, look)));
}

TEST(Geopoint, RegistersOneArrayOfFive) {
    constexpr test::FieldRow kRows[] = {test::real("Point", -999.0, 5)};
    const geopoint point;
    test::expect_fields(point, kRows);
    EXPECT_THAT(point, holds(-999.0, -999.0, -999.0, -999.0, -999.0));
}

TEST(Geopoint, ComesBackFromTheSectionOfItsName) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("points.xml");
    geopoint west, east, read;
    set(west, 45.37, 7.25, 317.3, 23.1, 20.7);
    set(east, 45.61, 8.57, 211.9, 27.3, 24.2);
    ASSERT_EQ(west.writehdr(file.c_str(), "NorthWest"), 0);
    ASSERT_EQ(east.writehdr(file.c_str(), "NorthEast"), 0);
    ASSERT_EQ(east.writehdr(file.c_str(), "NorthEast"), 0);

    EXPECT_EQ(read.readhdr(file.c_str(), "NorthWest"), 0);
    EXPECT_THAT(read, holds(45.37, 7.25, 317.3, 23.1, 20.7));
    EXPECT_EQ(read.readhdr(file.c_str(), "NorthEast"), 0);
    EXPECT_THAT(read, holds(45.61, 8.57, 211.9, 27.3, 24.2));
    const std::string text = test::read_text(file);
    EXPECT_THAT(test::child_names(text, "GroundCornersPoints"), ElementsAre("NorthWest", "NorthEast"));
    EXPECT_THAT(test::child_names(text, "NorthEast"), ElementsAre("Point"));
}

TEST(Geopoint, FallsBackToTheCoordinatesOfAParameterFile) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("points.par");
    test::write_text(file, "[Coordinates]\nSouthEast = {44.21 8.03 17.3 26.9 23.8}\nCenter = {44.87 7.9}\n");
    geopoint point;
    EXPECT_EQ(point.readhdr(file.c_str(), "SouthEast"), 0);
    EXPECT_THAT(point, holds(44.21, 8.03, 17.3, 26.9, 23.8));
    EXPECT_EQ(point.readhdr(file.c_str(), "Center"), 0);
    EXPECT_THAT(point, holds(44.87, 7.9, 17.3, 26.9, 23.8)) << "what a short list does not give stays";
}

// Kept as callers know it: the named members follow the array even where nothing was read.
TEST(Geopoint, TakesItsArrayWhereTheFileHasNoPoint) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("empty.par");
    test::write_text(file, "[Coordinates]\n");
    for (const char* name : {"Center", "", "no/such point", static_cast<const char*>(nullptr)}) {
        geopoint point;
        set(point, 45.37, 7.25, 317.3, 23.1, 20.7);
        EXPECT_EQ(point.readhdr(file.c_str(), name), 0);
        EXPECT_THAT(point, holds(-999.0, -999.0, -999.0, -999.0, -999.0));
    }
}

TEST(Geopoint, RefusesANameThatIsNoElement) {
    const test::TemporaryFolder folder;
    geopoint point;
    for (const char* name : {"", "North West", "<x>"})
        EXPECT_EQ(point.writehdr(folder.file("points.xml").c_str(), name), 1) << name;
}

TEST(Geopoint, ClonesMembersAndArray) {
    const double values[] = {45.37, 7.25, 317.3, 23.1, 20.7};
    geopoint source, target;
    set(source, 45.37, 7.25, 317.3, 23.1, 20.7);
    std::ranges::copy(values, source.Point);
    EXPECT_EQ(source.clone(&target), 0);
    EXPECT_THAT(target, holds(45.37, 7.25, 317.3, 23.1, 20.7));
}

}  // namespace
