#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "quo_base/acquisition.h"
#include "support/diagnostics.h"
#include "support/fields.h"

namespace {

using testing::ElementsAre;

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
