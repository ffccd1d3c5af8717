#include <gmock/gmock.h>

#include <nlohmann/json.hpp>

#include "tool.h"

namespace {

using test::Csv;
using test::quo;
using test::scene_file;

class Orbit : public testing::Test {
protected:
    test::Finished show(const test::MadeHeader& about, std::vector<std::string> options = {}) {
        return show_file(header_of(orbit_, about), std::move(options));
    }
    test::Finished show_file(const std::string& header, std::vector<std::string> options = {}) {
        test::write_text(header_, header);
        options.insert(options.begin(), {"orbit", header_});
        return quo(options);
    }

    test::CircularOrbit orbit_{41.3, 12.8, -12.7};
    test::TemporaryFolder folder_;
    std::string header_ = folder_.file("header.xml");
};

TEST_F(Orbit, SumsUpAHeader) {
    const auto shown = show({.look_direction = "-1"});
    EXPECT_EQ(shown.exit_status, 0) << shown.err;
    for (const char* line :
         {"state vectors  9, 10 s apart\n", "first          1167930296.25 s  04-JAN-2022 17:04:56.250000\n",
          "last           1167930376.25 s  04-JAN-2022 17:06:16.250000\n", "direction      ascending\n",
          "wavelength     0.0555 m\n", "look side      left\n", "findings       none\n"})
        EXPECT_THAT(shown.out, testing::HasSubstr(line));
}

TEST_F(Orbit, ShowsThePlatformWhereItIs) {
    const auto shown = show({}, {"--at", "1167930333.5", "--at", "04-JAN-2022 17:06:16.25"});
    EXPECT_EQ(shown.exit_status, 0) << shown.err;
    const Csv table{shown.out};
    ASSERT_EQ(table.size(), 2U);
    const double offsets_s[] = {37.25, 80.0};
    for (std::size_t i = 0; i < 2; ++i) {
        const test::Platform platform = orbit_.earth_fixed(offsets_s[i]);
        EXPECT_LT(norm(table.vector(i, "x_m", "y_m", "z_m") - platform.position), 1e-4);
        EXPECT_LT(norm(table.vector(i, "vx_m_s", "vy_m_s", "vz_m_s") - platform.velocity), 1e-3);
        EXPECT_EQ(table.text(i, "direction"), "ascending");
    }
    EXPECT_EQ(table.text(1, "date"), "04-JAN-2022 17:06:16.250000");
}

TEST_F(Orbit, StepsFromTheFirstVectorToTheLast) {
    const Csv table{show({}, {"--every", "0.1"}).out};
    ASSERT_EQ(table.size(), 801U);
    EXPECT_NEAR(table.number(800, "azimuth_time_s"), 1167930376.25, 1e-6);
    EXPECT_EQ(Csv{show({}, {"--every", "30"}).out}.size(), 3U);
}

TEST_F(Orbit, JsonSaysTheSame) {
    const auto shown = show({}, {"--json", "--at", "1167930333.5"});
    const auto facts = nlohmann::json::parse(shown.out);
    EXPECT_EQ(facts.at("state_vectors"), 9);
    EXPECT_EQ(facts.at("last").at("seconds").get<double>(), 1167930376.25);
    EXPECT_EQ(facts.at("look_side"), "right");
    EXPECT_EQ(facts.at("direction"), "ascending");
    EXPECT_TRUE(facts.at("findings").empty());
    EXPECT_LT(facts.at("model_error_m").get<double>(), 1e-4);
    const Csv table{show({}, {"--at", "1167930333.5"}).out};
    for (std::size_t axis = 0; axis < 3; ++axis) {
        const char* const names[] = {"x_m", "y_m", "z_m"};
        EXPECT_EQ(facts.at("at").at(0).at("position_m").at(axis).get<double>(), table.number(0, names[axis]));
    }
}

TEST_F(Orbit, TellsTheErrorOfACoarseModel) {
    const auto facts = nlohmann::json::parse(show({.spacing_s = 60.0}, {"--json"}).out);
    EXPECT_GT(facts.at("model_error_m").get<double>(), 0.05);
    EXPECT_LT(facts.at("model_error_m").get<double>(), 1.0);
}

TEST_F(Orbit, RefusesToExtrapolate) {
    const auto shown = show({}, {"--at", "1167930296", "--at", "1167930300"});
    EXPECT_EQ(shown.exit_status, 1);
    EXPECT_THAT(shown.err, testing::HasSubstr("1167930296 lies outside the state vectors"));
    EXPECT_EQ(Csv{shown.out}.size(), 1U);
}

TEST_F(Orbit, FindsAVectorThatIsOffTheCurve) {
    std::string header = header_of(orbit_, {});
    const std::string z = test::text_of(orbit_.earth_fixed(40.0).position[2]);
    header.replace(header.find(z), z.size(), test::text_of(orbit_.earth_fixed(40.0).position[2] + 3.5));
    const auto shown = show_file(header);
    EXPECT_EQ(shown.exit_status, 1);
    EXPECT_THAT(shown.out, testing::ContainsRegex("finding +[^\n]*4"));
}

// Nothing can be computed from such a header; the reason lies in one vector, and the message tells which.
TEST_F(Orbit, NamesTheVectorThatIsNoNumber) {
    std::string header = header_of(orbit_, {});
    const std::string z = test::text_of(orbit_.earth_fixed(40.0).position[2]);
    header.replace(header.find(z), z.size(), "nan");
    const auto shown = show_file(header);
    EXPECT_EQ(shown.exit_status, 1);
    EXPECT_EQ(shown.out, "");
    EXPECT_THAT(shown.err, testing::ContainsRegex("header.xml: .*4"));
}

TEST_F(Orbit, DescendingScenesDescend) {
    EXPECT_THAT(quo({"orbit", scene_file("s1a_iw_grd_20201127_desc_sea")}).out,
                testing::HasSubstr("direction      descending\n"));
}

/** The header without one of its state vectors, as a file from which a line was lost. */
std::string without_vector(std::string header, std::size_t vector, int vectors_left) {
    for (const char* array : {"<pSV_m>", "<vSV_mOs>"}) {
        std::size_t at = header.find(array);
        for (std::size_t i = 0; i <= 3 * vector; ++i) at = header.find("<val>", at + 1);
        std::size_t end = at;
        for (int i = 0; i < 3; ++i) end = header.find("</val>", end) + 6;
        header.erase(at, end - at);
    }
    const std::size_t count = header.find("<nSV_n>") + 7;
    return header.replace(count, header.find('<', count) - count, std::to_string(vectors_left));
}

// Every time behind the gap was wrong by 10 s, 41 km on the ground, with exit status 0.
TEST_F(Orbit, WithAGapIsShownAndNotWorkedWith) {
    const std::string header = without_vector(header_of(orbit_, {.vectors = 16}), 8, 15);
    const auto shown = show_file(header);
    EXPECT_EQ(shown.exit_status, 1);
    EXPECT_THAT(shown.out, testing::HasSubstr("finding        state vector 8: comes after a gap of 1 missing"));
    for (const std::vector<std::string>& job : std::vector<std::vector<std::string>>{
             {"geolocate", header_, "--to", "radar"},
             {"geolocate", header_, "--to", "ground", "--resample", "5"},
             {"tiepoints", header_},
             {"derive", header_, "--region", "0.0055", "1e-4", "1167930300", "1"}}) {
        const auto refused = quo(job, "azimuth_time_s,range_time_s\n1167930310.25,0.0056\n");
        EXPECT_EQ(refused.exit_status, 1) << job[0];
        EXPECT_EQ(refused.out, "");
        EXPECT_EQ(refused.err, "quo: " + header_ + ": state vector 8: comes after a gap of 1 missing vectors\n");
    }
}

// Each of these said no more than the option's name and value.
TEST_F(Orbit, SaysWhatIsWrongWithAStep) {
    test::write_text(header_, header_of(orbit_, {}));
    const struct {
        std::vector<std::string> job;
        const char* cause;
    } rows[] = {
        {{"orbit", header_, "--every", "inf"}, "--every inf: the step must be a number of seconds above 0"},
        {{"orbit", header_, "--every", "0"}, "--every 0: the step must be a number of seconds above 0"},
        {{"orbit", header_, "--every", "1e-9"}, "--every 1e-09: that makes 8e+10 steps, at most 1e+07 are shown"},
        {{"geolocate", header_, "--to", "radar", "--resample", "nan"},
         "--resample nan: the spacing must be a number of seconds above 0"},
        {{"geolocate", header_, "--to", "radar", "--resample", "1e-6"},
         "--resample 1e-06: that makes 8e+07 state vectors, at most 1000000 are made"},
    };
    for (const auto& [job, cause] : rows) {
        const auto refused = quo(job);
        EXPECT_EQ(refused.exit_status, 2);
        EXPECT_THAT(refused.err, testing::StartsWith(std::string{"quo: "} + cause));
    }
}

}  // namespace
