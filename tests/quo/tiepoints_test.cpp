#include <gmock/gmock.h>

#include <nlohmann/json.hpp>

#include "tool.h"

namespace {

using test::quo;
using test::scene_file;

const std::string kSea = "s1a_iw_grd_20201127_desc_sea";

/** What the geometry reaches on a scene: the limits come from the resolution of its stored times, 1e-6 s in
 * azimuth, which is 7 mm on the ground from orbit and 0.2 mm from an aircraft, and of its angles. */
struct Limits {
    std::string scene;
    double azimuth_us, range_m, ground_m, incidence_deg;
    const char* against;
    std::int64_t points;
};
void PrintTo(const Limits& row, std::ostream* stream) { *stream << row.scene; }
const Limits kLimits[] = {
    {"s1a_iw1_slc_20220104_asc", 2.0, 1e-5, 0.02, 1e-6, "geocentric radius", 210},
    {"s1a_iw_grd_20201127_desc_sea", 2.0, 1e-5, 0.02, 1e-6, "geocentric radius", 210},
    {"uavsar_winnipeg_20120717_left", 0.5, 1e-6, 1e-3, 1e-4, "ellipsoid normal", 625},
};

class TiePoints : public testing::TestWithParam<Limits> {};

TEST_P(TiePoints, OfARealSceneAreMet) {
    const Limits& limits = GetParam();
    const auto run = quo({"tiepoints", "--json", scene_file(limits.scene)});
    ASSERT_EQ(run.exit_status, 0) << run.err;
    const auto agreement = nlohmann::json::parse(run.out).at(0);
    EXPECT_EQ(agreement.at("points"), limits.points);
    EXPECT_EQ(agreement.at("without_solution"), 0);
    EXPECT_EQ(agreement.at("solved"), limits.points);
    EXPECT_EQ(agreement.at("incidence_against"), limits.against);
    const auto largest = [&](const char* quantity) { return agreement.at(quantity).at("largest").get<double>(); };
    EXPECT_LT(largest("azimuth_time_us"), limits.azimuth_us);
    EXPECT_LT(largest("slant_range_m"), limits.range_m);
    EXPECT_LT(largest("ground_position_m"), limits.ground_m);
    EXPECT_LT(largest("incidence_deg"), limits.incidence_deg);
    for (const char* quantity : {"azimuth_time_us", "slant_range_m", "ground_position_m", "incidence_deg"}) {
        EXPECT_GT(largest(quantity), 0.0);
        EXPECT_LE(agreement.at(quantity).at("rms"), agreement.at(quantity).at("largest"));
    }
}
INSTANTIATE_TEST_SUITE_P(Scenes, TiePoints, testing::ValuesIn(kLimits),
                         [](const auto& row) { return row.param.scene; });

TEST(TiePoints, TableHasOneRowPerScene) {
    std::vector<std::string> arguments{"tiepoints"};
    for (const std::string& scene : test::scenes()) arguments.push_back(scene_file(scene));
    const auto run = quo(arguments);
    EXPECT_EQ(run.exit_status, 0);
    for (const std::string& scene : test::scenes()) EXPECT_THAT(run.out, testing::HasSubstr("\n" + scene + " "));
}

// The comparison can fail: a header that looks to the wrong side, and angles against the wrong vertical, show at
// once.
TEST(TiePoints, WrongGeometryShows) {
    const test::TemporaryFolder folder;
    std::string header = test::read_text(scene_file(kSea));
    const std::string right = "<LookDirection>1<";
    header.replace(header.find(right), right.size(), "<LookDirection>-1<");
    const std::string name = "mirrored\u202E";  // came back escaped twice
    test::write_text(folder.file(name + ".xml"), header);
    const auto mirrored = nlohmann::json::parse(
        quo({"tiepoints", "--json", folder.file(name + ".xml"), "--points", scene_file(kSea, "_tie_points.csv")})
            .out);
    EXPECT_EQ(mirrored[0].at("scene"), name);
    EXPECT_GT(mirrored[0].at("ground_position_m").at("largest").get<double>(), 1e5);

    const auto normal =
        nlohmann::json::parse(quo({"tiepoints", "--json", scene_file(kSea), "--incidence", "normal"}).out);
    EXPECT_GT(normal[0].at("incidence_deg").at("largest").get<double>(), 0.01);
}

TEST(TiePoints, NeedTheirTruthComplete) {
    const test::TemporaryFolder folder;
    std::string points = test::read_text(scene_file(kSea, "_tie_points.csv"));
    points.erase(points.rfind(",-"), 5);
    test::write_text(folder.file("points.csv"), points);
    const auto run = quo({"tiepoints", scene_file(kSea), "--points", folder.file("points.csv")});
    EXPECT_EQ(run.exit_status, 1);
    EXPECT_EQ(run.out, "");
    EXPECT_THAT(run.err, testing::HasSubstr("points.csv: line "));
}

TEST(TiePoints, PointsThatAreNotSeenAreCounted) {
    const test::TemporaryFolder folder;
    test::write_text(folder.file("points.csv"),
                     "azimuth_time_s,range_time_s,latitude_deg,longitude_deg,height_m,incidence_deg\n"
                     "1133090037.5,0.0053,63.7,79.7,0,30\n");
    const auto run = quo({"tiepoints", "--json", scene_file(kSea), "--points", folder.file("points.csv")});
    EXPECT_EQ(run.exit_status, 1);
    const auto agreement = nlohmann::json::parse(run.out)[0];
    EXPECT_EQ(agreement.at("without_solution"), 1);
    // Residuals of no point used to be 0, as if they agreed.
    EXPECT_EQ(agreement.at("solved"), 0);
    EXPECT_TRUE(agreement.at("azimuth_time_us").at("rms").is_null());
    EXPECT_TRUE(agreement.at("incidence_deg").at("largest").is_null());
    EXPECT_THAT(quo({"tiepoints", scene_file(kSea), "--points", folder.file("points.csv")}).out,
                testing::ContainsRegex("\n" + kSea + " +1 +0( +-)+\n"));
}

}  // namespace
