#include <gmock/gmock.h>
#include <sys/stat.h>

#include <csignal>
#include <fstream>
#include <nlohmann/json.hpp>

#include "tool.h"

namespace {

using test::Csv;
using test::quo;
using test::scene_file;
using test::TemporaryFolder;
using test::Vec3;

const std::string kSea = "s1a_iw_grd_20201127_desc_sea";
const std::string kCoast = "s1a_iw1_slc_20220104_asc";
const std::string kFlight = "uavsar_winnipeg_20120717_left";

Csv tie_points(const std::string& scene) { return Csv{test::read_text(scene_file(scene, "_tie_points.csv"))}; }

Vec3 ground_of(const Csv& table, std::size_t row) {
    return test::geodetic_point(table.number(row, "latitude_deg"), table.number(row, "longitude_deg"),
                                table.number(row, "height_m"));
}

// The truth comes from outside: a real product's own grid of points at sea level. Its times are stored to 1e-6 s,
// which is 7 mm along the track.
TEST(Geolocate, BringsARealSceneToTheGround) {
    const Csv truth = tie_points(kSea);
    const std::vector<std::string> job{"geolocate", scene_file(kSea), "--to", "ground"};
    const std::string table = test::read_text(scene_file(kSea, "_tie_points.csv"));
    // A height in the row stood beside a point at height 0.
    const auto refused = quo(job, table);
    EXPECT_EQ(refused.exit_status, 1);
    EXPECT_EQ(refused.out, "");
    EXPECT_EQ(refused.err,
              "quo: standard input: --to ground finds points at height 0 and takes no column height_m\n");

    const std::string height = ",height_m,";
    const auto run = quo(job, std::string{table}.replace(table.find(height), height.size(), ",at_sea_level,"));
    ASSERT_EQ(run.exit_status, 0) << run.err;
    EXPECT_EQ(run.err, "");
    const Csv ground{run.out};
    ASSERT_EQ(ground.size(), truth.size());
    for (std::size_t i = 0; i < truth.size(); ++i) {
        EXPECT_LT(norm(ground.vector(i, "x_m", "y_m", "z_m") - ground_of(truth, i)), 0.02) << i;
        EXPECT_NEAR(ground.number(i, "computed_latitude_deg"), truth.number(i, "latitude_deg"), 2e-7) << i;
        EXPECT_NEAR(ground.number(i, "computed_longitude_deg"), truth.number(i, "longitude_deg"), 2e-7) << i;
        EXPECT_NEAR(ground.number(i, "computed_look_deg"), truth.number(i, "look_deg"), 1e-6) << i;
        // The mission states the incidence against the geocentric radius, up to 0.04 degrees from the normal.
        EXPECT_NEAR(ground.number(i, "computed_incidence_deg"), truth.number(i, "incidence_deg"), 0.04) << i;
        EXPECT_EQ(ground.number(i, "status"), 0);
    }
}

class RadarTimes : public testing::TestWithParam<std::string> {};

TEST_P(RadarTimes, MeetTheTiePointsWithEitherFirstGuess) {
    const Csv truth = tie_points(GetParam());
    std::string table = "height_m,latitude_deg,longitude_deg\n";  // in another order than the tool would list them
    for (std::size_t i = 0; i < truth.size(); ++i)
        table += truth.text(i, "height_m") + "," + truth.text(i, "latitude_deg") + "," +
                 truth.text(i, "longitude_deg") + "\n";
    for (const bool precise : {false, true}) {
        std::vector<std::string> arguments{"geolocate", scene_file(GetParam()), "--to", "radar"};
        if (precise) arguments.emplace_back("--precise");
        const auto run = quo(arguments, table);
        ASSERT_EQ(run.exit_status, 0) << run.err;
        const Csv times{run.out};
        ASSERT_EQ(times.size(), truth.size());
        for (std::size_t i = 0; i < truth.size(); ++i) {
            EXPECT_NEAR(times.number(i, "azimuth_time_s"), truth.number(i, "azimuth_time_s"), 2.2e-6) << i;
            EXPECT_NEAR(times.number(i, "range_time_s") * test::kLightSpeed / 2,
                        truth.number(i, "range_time_s") * test::kLightSpeed / 2, 1e-5)
                << i;
        }
    }
}
INSTANTIATE_TEST_SUITE_P(Scenes, RadarTimes, testing::ValuesIn(test::scenes()),
                         [](const auto& scene) { return scene.param; });

// Forth and back through texts: a number written with too few digits, a Doppler of the wrong sign, a wrong side
// show.
TEST(Geolocate, ReturnsToTheSampleItCameFrom) {
    struct Case {
        std::string scene;
        double time_s, range_s, doppler_hz;
    };
    for (const Case& c :
         {Case{kCoast, 1167930370.123457, 0.0055123, 2713.7}, Case{kCoast, 1167930361.7, 0.0057, -1901.3},
          Case{kSea, 1133090050.333333, 0.0058123, -873.1}, Case{kFlight, 869150333.77, 1.1e-4, 311.3}}) {
        const auto forth = quo({"geolocate", scene_file(c.scene), "--to", "ground"},
                               "doppler_hz,range_time_s,azimuth_time_s\n" + test::text_of(c.doppler_hz) + "," +
                                   test::text_of(c.range_s) + "," + test::text_of(c.time_s) + "\n");
        ASSERT_EQ(forth.exit_status, 0) << forth.err;
        const Csv ground{forth.out};
        const Vec3 by_angles =
            test::geodetic_point(ground.number(0, "latitude_deg"), ground.number(0, "longitude_deg"));
        EXPECT_LT(norm(ground.vector(0, "x_m", "y_m", "z_m") - by_angles), 1e-6);
        const auto back =
            quo({"geolocate", scene_file(c.scene), "--to", "radar"},
                "latitude_deg,longitude_deg,height_m,doppler_hz\n" + ground.text(0, "latitude_deg") + "," +
                    ground.text(0, "longitude_deg") + ",0," + test::text_of(c.doppler_hz) + "\n");
        ASSERT_EQ(back.exit_status, 0) << back.err;
        const Csv times{back.out};
        EXPECT_NEAR(times.number(0, "azimuth_time_s"), c.time_s, 5e-7);  // two steps of a double
        EXPECT_NEAR(times.number(0, "range_time_s"), c.range_s, 1e-13);  // 15 um
    }
}

// The product's own FM rates, printed with 13 digits but fitted as quadratics.
TEST(Geolocate, FmRateIsThatOfTheProduct) {
    const auto facts = nlohmann::json::parse(test::read_text(scene_file(kCoast, "_facts.json")));
    std::string table = "azimuth_time_s,range_time_s,expected\n";
    for (const auto& rate : facts.at("fm_rate")) {
        for (const double offset_s : {0.0, 1.7e-4, 3.5e-4}) {
            const auto& c = rate.at("coeffs");
            const double expected =
                c[0].get<double>() + offset_s * (c[1].get<double>() + offset_s * c[2].get<double>());
            table += test::text_of(rate.at("t")) + "," + test::text_of(rate.at("t0").get<double>() + offset_s) +
                     "," + test::text_of(expected) + "\n";
        }
    }
    const Csv ground{quo({"geolocate", scene_file(kCoast), "--to", "ground"}, table).out};
    ASSERT_EQ(ground.size(), 3 * facts.at("fm_rate").size());
    for (std::size_t i = 0; i < ground.size(); ++i)
        EXPECT_NEAR(ground.number(i, "fm_rate_hz_s") / ground.number(i, "expected"), 1.0, 1e-4) << i;
}

TEST(Geolocate, OptionsTakePrecedenceOverTheHeader) {
    const std::string table = "azimuth_time_s,range_time_s\n1167930370.5,0.0056\n";
    const auto ground = [&](std::vector<std::string> options) {
        options.insert(options.begin(), {"geolocate", scene_file(kCoast), "--to", "ground"});
        return Csv{quo(options, table).out};
    };
    const Csv plain = ground({});
    const Csv doubled = ground({"--wavelength", "0.11093152"});
    EXPECT_NEAR(doubled.number(0, "fm_rate_hz_s") / plain.number(0, "fm_rate_hz_s"), 0.5, 1e-12);
    EXPECT_EQ(doubled.text(0, "x_m"), plain.text(0, "x_m"));  // zero Doppler is zero Doppler at any wavelength

    const Csv right = ground({"--look", "right"});
    EXPECT_EQ(right.text(0, "x_m"), plain.text(0, "x_m"));
    const Csv left = ground({"--look", "left"});
    // The ascending platform flies to the north: what it sees on its left lies in the west.
    EXPECT_LT(left.number(0, "longitude_deg"), plain.number(0, "longitude_deg") - 5.0);
    EXPECT_NEAR(left.number(0, "look_deg"), plain.number(0, "look_deg"), 0.5);
}

// On an orbit known at every time: vectors a minute apart leave decimetres, which the tool must tell, and which
// re-sampling must take away.
TEST(Geolocate, WarnsOfACoarseOrbitAndResamplesIt) {
    const test::CircularOrbit orbit{41.3, 12.8, -12.7};
    const TemporaryFolder folder;
    const std::string header = folder.file("header.xml");
    test::write_text(header, header_of(orbit, {.spacing_s = 60.0}));
    const double offset_s = 217.3;
    const double range_s = 0.0057;
    const std::string table =
        "azimuth_time_s,range_time_s\n" + test::text_of(1167930296.25 + offset_s) + ",0.0057\n";
    const auto defects = [&](const std::string& out) {
        const test::Platform platform = orbit.earth_fixed(offset_s);
        const Vec3 line = Csv{out}.vector(0, "x_m", "y_m", "z_m") - platform.position;
        return std::max(std::abs(norm(line) - range_s * test::kLightSpeed / 2),
                        std::abs(dot(line, unit(platform.velocity))));
    };
    const auto coarse = quo({"geolocate", header, "--to", "ground"}, table);
    EXPECT_EQ(coarse.exit_status, 0);
    EXPECT_THAT(coarse.err, testing::HasSubstr("--resample"));
    EXPECT_GT(defects(coarse.out), 0.01);
    const auto fine = quo({"geolocate", header, "--to", "ground", "--resample", "10"}, table);
    EXPECT_EQ(fine.exit_status, 0);
    EXPECT_EQ(fine.err, "");
    EXPECT_LT(defects(fine.out), 0.003);  // 0.24 us of the absolute time are 1.8 mm along the track
}

TEST(Geolocate, ReadsTheTableInWhateverClothesItComes) {
    const auto result = [](const std::string& table) {
        return quo({"geolocate", scene_file(kCoast), "--to", "ground"}, table);
    };
    const auto plain = result("azimuth_time_s,range_time_s\n1167930370.5,0.0056\n");
    const std::string computed = plain.out.substr(plain.out.rfind("0.0056,"));
    const std::string heading =
        plain.out.substr(plain.out.find("x_m"), plain.out.find('\n') - plain.out.find("x_m"));

    const auto crlf = result(
        "\xEF\xBB\xBF# made elsewhere\r\n\r\nname, azimuth_time_s ,\"range_time_s\"\r\n"
        "\"port, \"\"old\"\"\",+1167930370.5, 0.0056\r\n# not a row\r\n\r\n");
    EXPECT_EQ(crlf.err, "");
    EXPECT_EQ(crlf.out, "name, azimuth_time_s ,\"range_time_s\"," + heading +
                            "\n\"port, \"\"old\"\"\",+1167930370.5, " + computed);
    const auto no_last_feed = result("azimuth_time_s,range_time_s,doppler_hz\n1167930370.5,5.6e-3,0");
    EXPECT_THAT(no_last_feed.out, testing::EndsWith("5.6e-3,0" + computed.substr(6)));
    EXPECT_EQ(result("azimuth_time_s,range_time_s\n").out, "azimuth_time_s,range_time_s," + heading + "\n");
}

struct BadRow {
    const char *name, *row, *status, *cause;
};
void PrintTo(const BadRow& row, std::ostream* stream) { *stream << row.name; }
constexpr BadRow kBadRows[] = {
    {"BeyondTheHorizon", "1167930370.5,0.03,0", "10", "status 10"},
    {"AboveTheGround", "1167930370.5,0.001,0", "10", "status 10"},
    {"NegativeRange", "1167930370.5,-0.0056,0", "1", "status 1"},
    {"DopplerBeyondTheVelocity", "1167930370.5,0.0056,1e6", "10", "status 10"},
    {"BeforeTheOrbit", "1167930290.5,0.0056,0", "12", "status 12"},
    {"AfterTheOrbit", "1167930446.9,0.0056,0", "12", "status 12"},
    {"Word", "1167930370.5,far,0", "1", "range_time_s is \"far\""},
    {"NumberAndMore", "1167930370.5,0.0056s,0", "1", "range_time_s is \"0.0056s\""},
    {"Empty", "1167930370.5,,0", "1", "range_time_s is \"\""},
    {"EmptyDoppler", "1167930370.5,0.0056,", "1", "doppler_hz is \"\""},
    {"Infinite", "inf,0.0056,0", "1", "azimuth_time_s is \"inf\""},
    {"NotANumber", "1167930370.5,nan,0", "1", "range_time_s is \"nan\""},
    {"TooLarge", "1e999,0.0056,0", "1", "azimuth_time_s is \"1e999\""},
    {"TwoSigns", "+-1,0.0056,0", "1", "azimuth_time_s is \"+-1\""},
    {"TooFewValues", "1167930370.5,0.0056", "1", "2 values for 3 columns"},
    {"TooManyValues", "1167930370.5,0.0056,0,7", "1", "4 values for 3 columns"},
    {"OpenQuote", "\"1167930370.5,0.0056,0", "1", "a quote is not closed"},
    {"TextBehindAQuote", "\"1167930370.5\"x,0.0056,0", "1", "a quote is not closed"},
};

class RowWithoutSolution : public testing::TestWithParam<BadRow> {};

TEST_P(RowWithoutSolution, IsMarkedAndTheOthersAreSolved) {
    const BadRow& bad = GetParam();
    const std::string good = "1167930370.5,0.0056,17.3\n";
    const auto run = quo({"geolocate", scene_file(kCoast), "--to", "ground"},
                         "azimuth_time_s,range_time_s,doppler_hz\n" + good + bad.row + "\n" + good);
    EXPECT_EQ(run.exit_status, 1);
    ASSERT_EQ(run.messages().size(), 2U) << run.err;
    EXPECT_THAT(run.messages()[0], testing::StartsWith("quo: standard input: line 3: "));
    EXPECT_THAT(run.messages()[0], testing::HasSubstr(bad.cause));
    EXPECT_EQ(run.messages()[1], "quo: standard input: 1 of 3 rows without a solution");

    const Csv ground{run.out};  // refuses rows that do not fit the columns
    ASSERT_EQ(ground.size(), 3U);
    EXPECT_EQ(ground.text(1, "status"), bad.status);
    for (const char* column : {"x_m", "latitude_deg", "incidence_deg", "fm_rate_hz_s", "speed_m_s"}) {
        EXPECT_EQ(ground.text(1, column), "");
        EXPECT_NE(ground.text(0, column), "");
        EXPECT_EQ(ground.text(0, column), ground.text(2, column));
    }
}
INSTANTIATE_TEST_SUITE_P(Geolocate, RowWithoutSolution, testing::ValuesIn(kBadRows),
                         [](const auto& row) { return row.param.name; });

TEST(Geolocate, MarksPointsThatAreNotSeen) {
    const auto run =
        quo({"geolocate", scene_file(kCoast), "--to", "radar"},
            "latitude_deg,longitude_deg,height_m\n91,11,0\n41,361,0\n-41,11,0\n41.1,11.9,0\n-41.1,-168.1,0\n");
    EXPECT_EQ(run.exit_status, 1);
    const Csv times{run.out};
    EXPECT_EQ(times.text(0, "status"), "1");
    EXPECT_EQ(times.text(1, "status"), "1");
    EXPECT_EQ(times.text(2, "status"), "12");
    EXPECT_EQ(times.text(2, "azimuth_time_s"), "");
    EXPECT_EQ(times.text(3, "status"), "0");
    EXPECT_EQ(times.text(4, "status"), "12");  // the antipode of the one before, abeam but behind the Earth
    EXPECT_THAT(run.messages()[0], testing::HasSubstr("latitude_deg is \"91\", outside -90 to 90"));
}

TEST(Geolocate, ManyBadRowsAreCountedNotListed) {
    std::string table = "azimuth_time_s,range_time_s\n";
    for (int i = 0; i < 1000; ++i) table += "x,y\n";
    const auto run = quo({"geolocate", scene_file(kCoast), "--to", "ground"}, table);
    EXPECT_EQ(run.messages().size(), 11U);
    EXPECT_EQ(run.messages().back(), "quo: standard input: 1000 of 1000 rows without a solution");
}

// What one direction writes, the other can read, and no column is lost where names collide.
TEST(Geolocate, ReadsItsOwnOutput) {
    const auto radar = quo({"geolocate", scene_file(kSea), "--to", "radar"},
                           "latitude_deg,longitude_deg,height_m\n13.1,-80.2,0\n");
    ASSERT_EQ(radar.exit_status, 0) << radar.err;
    const std::string ellipsoid = std::string{radar.out}.replace(radar.out.find("height_m"), 8, "no_height");
    const Csv ground{quo({"geolocate", scene_file(kSea), "--to", "ground"}, ellipsoid).out};
    EXPECT_EQ(ground.text(0, "latitude_deg"), "13.1");
    EXPECT_NEAR(ground.number(0, "computed_latitude_deg"), 13.1, 1e-7);
    EXPECT_NEAR(ground.number(0, "computed_longitude_deg"), -80.2, 1e-7);
    EXPECT_EQ(ground.text(0, "computed_status"), "0");
}

class OutputFile : public testing::Test {
protected:
    [[nodiscard]] test::Finished geolocate(const std::string& table) const {
        return quo({"geolocate", scene_file(kCoast), "--to", "ground", "--output", result_}, table);
    }
    [[nodiscard]] std::size_t files() const {
        return static_cast<std::size_t>(std::distance(std::filesystem::directory_iterator{folder_.path()},
                                                      std::filesystem::directory_iterator{}));
    }

    const std::string good_ = "azimuth_time_s,range_time_s\n1167930370.5,0.0056\n";
    TemporaryFolder folder_;
    std::string result_ = folder_.file("result.csv");
};

TEST_F(OutputFile, HoldsWhatStandardOutputWouldShow) {
    EXPECT_EQ(geolocate(good_).exit_status, 0);
    EXPECT_EQ(test::read_text(result_), quo({"geolocate", scene_file(kCoast), "--to", "ground"}, good_).out);
    EXPECT_EQ(files(), 1U);
}

TEST_F(OutputFile, StaysWholeWhenTheJobFails) {
    test::write_text(result_, "old");
    EXPECT_EQ(geolocate(good_ + std::string(2'000'000, '7')).exit_status, 1);
    EXPECT_EQ(test::read_text(result_), "old");
    EXPECT_EQ(files(), 1U);
}

TEST_F(OutputFile, KeepsItsPermissionsAndItsLink) {
    const std::string target = folder_.file("target.csv");
    test::write_text(target, "old");
    chmod(target.c_str(), 0640);
    std::filesystem::create_symlink(target, result_);
    EXPECT_EQ(geolocate(good_).exit_status, 0);
    EXPECT_TRUE(std::filesystem::is_symlink(result_));
    EXPECT_THAT(test::read_text(target), testing::StartsWith("azimuth_time_s"));
    struct stat about {};
    ASSERT_EQ(stat(target.c_str(), &about), 0);
    EXPECT_EQ(about.st_mode & 07777, 0640U);
}

TEST_F(OutputFile, MayBeTheInput) {
    test::write_text(result_, good_);
    EXPECT_EQ(quo({"geolocate", scene_file(kCoast), "--to", "ground", "--input", result_, "--output", result_})
                  .exit_status,
              0);
    EXPECT_EQ(Csv{test::read_text(result_)}.text(0, "status"), "0");
}

TEST_F(OutputFile, FullDiskIsAFailure) {
    const auto run = quo({"geolocate", scene_file(kCoast), "--to", "ground", "--output", "/dev/full"}, good_);
    EXPECT_EQ(run.exit_status, 1);
    EXPECT_EQ(run.err, "quo: /dev/full: No space left on device\n");
}

// The job waits for input that never comes and is asked to stop: the signal ends it, and neither a half result nor
// the unfinished file beside it is left.
TEST_F(OutputFile, IsNotLeftHalfWritten) {
    const std::string pipe = folder_.file("pipe");
    ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
    test::Child child{QUO_TOOL,
                      {"geolocate", scene_file(kCoast), "--to", "ground", "--input", pipe, "--output", result_}};
    {
        std::ofstream rows{pipe};
        rows << good_ << std::flush;
        while (files() < 2) usleep(1000);  // the pipe and the unfinished file
        kill(child.id(), SIGTERM);
        EXPECT_EQ(child.wait().signal, SIGTERM);
    }
    EXPECT_EQ(files(), 1U);
}

}  // namespace
