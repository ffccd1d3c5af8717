// SPDX-License-Identifier: Apache-2.0

// The verbs whose geometry has a truth from outside.
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "quo_base/Coregist.h"
#include "support/geometry.h"
#include "tool.h"

namespace {

using test::quo;
using test::Vec3;

// The truth comes from outside: a real product's own grid of points at their heights. Its times are stored to 1e-6
// s, which is 7 mm along the track. The mission states the incidence against the geocentric radius, up to 0.04
// degrees from the normal.
TEST(Geolocate, BringsARealSceneToTheGround) {
    const std::string scene = test::scene_file("s1a_iw1_slc_20220104_asc");
    const std::string table = test::read_text(scene + "_tie_points.csv");
    const auto truth = test::numbers_in(table);
    const auto run = quo({"geolocate", scene + ".xml", "--to", "ground"}, table);
    ASSERT_EQ(run.exit_status, 0) << run.err;
    EXPECT_EQ(run.err, "");
    const auto ground = test::numbers_in(run.out);
    ASSERT_EQ(ground.size(), 210U);
    for (std::size_t i = 0; i < truth.size(); ++i) {
        ASSERT_EQ(ground[i].size(), 17U);
        const auto *known = &truth[i][2], *found = &ground[i][7];  // from latitude, from x
        const Vec3 difference =
            Vec3{found[0], found[1], found[2]} - test::geodetic_point(known[0], known[1], known[2]);
        EXPECT_LT(norm(difference), 0.02) << i;
        EXPECT_NEAR(found[3], known[0], 2e-7) << i;
        EXPECT_NEAR(found[4], known[1], 2e-7) << i;
        EXPECT_NEAR(found[5], known[3], 0.04) << i;  // incidence
        EXPECT_NEAR(found[6], known[4], 1e-6) << i;  // look
        EXPECT_EQ(found[9], 0.0) << i;
    }
}

// Judged by geolocation of single points with the tool itself: ground in the master, times in the slave.
TEST(Coregister, MapsPointsToWhereTheSlaveSeesThem) {
    const test::TemporaryFolder folder;
    const std::string data = QUO_TEST_DATA "/quo/", output = folder.file("REGIST.xml");
    const auto run = quo({"coregister", data + "master.xml", data + "slave.xml", "-o", output, "--json"});
    ASSERT_EQ(run.exit_status, 0) << run.err;
    Coregist mapping;
    ASSERT_EQ(mapping.readpar(output.c_str()), 0);
    EXPECT_EQ(nlohmann::json(mapping.AzFit), nlohmann::json::parse(run.out).at("AzFit"));

    const std::string samples = "azimuth_time_s,range_time_s\n5033.25,0.00565\n5045.5,0.00585\n";
    const auto ground = test::numbers_in(quo({"geolocate", data + "master.xml", "--to", "ground"}, samples).out);
    ASSERT_EQ(ground.size(), 2U);
    std::ostringstream table;
    table.precision(17);
    table << "latitude_deg,longitude_deg,height_m\n";
    for (const auto& row : ground) table << row.at(5) << ',' << row.at(6) << ",0\n";
    const auto times = test::numbers_in(quo({"geolocate", data + "slave.xml", "--to", "radar"}, table.str()).out);
    ASSERT_EQ(times.size(), 2U);
    for (std::size_t i = 0; i < times.size(); ++i) {
        double range_s = 0.0, azimuth_s = 0.0;
        mapping.evaluateSLtime(ground[i][1], ground[i][0], &range_s, &azimuth_s);
        EXPECT_NEAR(azimuth_s, times[i].at(3), 0.05 * 0.002);  // of a line
        EXPECT_NEAR(range_s, times[i].at(4), 0.05 * 1.5e-8);   // of a sample
    }
}

}  // namespace
