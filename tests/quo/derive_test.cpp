#include <gmock/gmock.h>

#include <nlohmann/json.hpp>

#include "quo_base/Coregist.h"
#include "quo_base/SARpolynomials.h"
#include "tool.h"

namespace {

using nlohmann::json;
using test::quo;
using test::scene_file;
using testing::HasSubstr;

const std::string kSlc = "s1a_iw1_slc_20220104_asc";
const std::string kAircraft = "uavsar_winnipeg_20120717_left";

/** A scene's header as a file that a test may change. */
class ChangedScene {
public:
    explicit ChangedScene(const std::string& scene) {
        test::write_text(header(), test::read_text(scene_file(scene)));
    }
    [[nodiscard]] std::string header() const { return folder_.file("scene.xml"); }
    [[nodiscard]] std::string text() const { return test::read_text(header()); }
    [[nodiscard]] std::string file(const char* name) const { return folder_.file(name); }
    /** Replaces the first occurrence of a text. */
    void replace(const std::string& old_text, const std::string& new_text) const {
        std::string all = text();
        const auto at = all.find(old_text);
        if (at == std::string::npos) throw std::runtime_error("no " + old_text);
        test::write_text(header(), all.replace(at, old_text.size(), new_text));
    }
    /** A field's values as the tool prints them, one to a line. */
    [[nodiscard]] std::vector<double> field(const std::string& name) const {
        std::vector<double> values;
        std::istringstream lines{quo({"get", header(), name}).out};
        for (double value = 0.0; lines >> value;) values.push_back(value);
        return values;
    }

private:
    test::TemporaryFolder folder_;
};

/** A document without one of its sections. */
std::string without_section(std::string text, const std::string& name) {
    const std::string end = "</" + name + ">";
    const auto first = text.rfind('\n', text.find("<" + name + ">")), last = text.find(end);
    return last == std::string::npos ? text : text.erase(first, last + end.size() - first);
}

// --- derive
// -------------------------------------------------------------------------------------------------------

class Derive : public testing::TestWithParam<bool> {};
INSTANTIATE_TEST_SUITE_P(Forms, Derive, testing::Bool(),
                         [](const auto& row) { return row.param ? "Grid" : "Parabola"; });

// The header then holds what was printed, to the last digit, and everything that it held before.
TEST_P(Derive, AddsWhatIsMissingAndNothingElse) {
    const ChangedScene scene{kSlc};
    const std::string before = scene.text();
    std::vector<std::string> arguments{"derive", scene.header(), "--json"};
    if (GetParam()) arguments.emplace_back("--grid");
    const auto run = quo(arguments);
    ASSERT_EQ(run.exit_status, 0) << run.err;
    const json result = json::parse(run.out);
    ASSERT_EQ(result.at("derived").size(), 5U);
    // Over the whole region: the parabolas have no azimuth terms.
    const double bounds[2][5] = {{0.5, 400.0, 60.0, 0.04, 0.04}, {0.5, 5.0, 0.7, 0.0006, 0.0006}};
    for (std::size_t q = 0; q < 5; ++q) {
        const json& row = result.at("derived").at(q);
        const std::string name = row.at("quantity");
        SCOPED_TRACE(name);
        EXPECT_LT(row.at("largest_residual").get<double>(), bounds[GetParam() ? 1 : 0][q]);
        EXPECT_GT(row.at("largest_residual").get<double>(), 0.0);
        EXPECT_EQ(scene.field("PolySAR/" + name + "-0/pol"), row.at("pol").get<std::vector<double>>());
        EXPECT_EQ(scene.field("PolySAR/" + name + "-0/trg0_s").at(0), row.at("trg0_s").get<double>());
        EXPECT_EQ(scene.field("PolySAR/" + name + "-0/taz0_s").at(0), row.at("taz0_s").get<double>());
    }
    EXPECT_EQ(without_section(scene.text(), "PolySAR"), before);
}

TEST(Derive, KeepsWhatIsThereUnlessToldOtherwise) {
    const ChangedScene scene{kSlc};
    ASSERT_EQ(quo({"derive", scene.header(), "--what", "fr"}).exit_status, 0);
    const auto rate = scene.field("PolySAR/DopplerRate-0/pol");
    ASSERT_EQ(
        quo({"set", scene.header(), "PolySAR/DopplerRate-0/pol", "1", "2", "3", "4", "5", "6", "7"}).exit_status,
        0);

    const auto refused = quo({"derive", scene.header(), "--what", "fr"});
    EXPECT_EQ(refused.exit_status, 1);
    EXPECT_THAT(refused.err, HasSubstr("--replace"));
    const json rest = json::parse(quo({"derive", scene.header(), "--json"}).out);
    EXPECT_EQ(rest.at("kept"), json::array({"DopplerRate"}));
    EXPECT_EQ(rest.at("derived").size(), 4U);
    EXPECT_EQ(scene.field("PolySAR/DopplerRate-0/pol").at(6), 7.0);
    EXPECT_EQ(scene.field("PolySAR/nsl2phi").at(0), 1.0);

    ASSERT_EQ(quo({"derive", scene.header(), "--what", "fr", "--replace"}).exit_status, 0);
    EXPECT_EQ(scene.field("PolySAR/DopplerRate-0/pol"), rate);
    EXPECT_EQ(scene.field("PolySAR/nsl2phi").at(0), 1.0);
}

// Off broadside by an angle the rate shrinks with the square of its cosine.
TEST(Derive, LooksWithTheHeadersDoppler) {
    const ChangedScene broadside{kSlc}, squinted{kSlc};
    const std::string counts =
        "<PolySAR><ndc>1</ndc><nfr>0</nfr><nsl2gr>0</nsl2gr><ngr2sl>0</ngr2sl><nsl2theta>0</nsl2theta>"
        "<nsl2phi>0</nsl2phi><DopplerCentroid-0><pol><val>3000</val><val>0</val><val>0</val><val>0</val><val>0</"
        "val>"
        "<val>0</val><val>0</val></pol><trg0_s>0.0053</trg0_s><taz0_s>1167930360</taz0_s></DopplerCentroid-0>"
        "</PolySAR>";
    squinted.replace("<ROI>", counts + "<ROI>");
    const json a = json::parse(quo({"derive", broadside.header(), "--what", "fr", "--json"}).out);
    const json b = json::parse(quo({"derive", squinted.header(), "--what", "fr", "--json"}).out);
    const auto rate = [](const json& result) { return result.at("derived").at(0).at("pol").at(0).get<double>(); };
    const double speed_m_s = 7590.0, sine = 3000.0 * 0.05546576 / 2.0 / speed_m_s;
    EXPECT_NEAR(rate(b) / rate(a), 1.0 - sine * sine, 0.3 * sine * sine);
    EXPECT_EQ(squinted.field("PolySAR/DopplerCentroid-0/pol").at(0), 3000.0);
}

TEST(Derive, TakesARegionFromTheCommandLine) {
    const ChangedScene scene{kAircraft};
    const auto run =
        quo({"derive", scene.header(), "--what", "fr", "--json", "--region", "8.8e-5", "2e-6", "869150208", "3"});
    ASSERT_EQ(run.exit_status, 0) << run.err;
    EXPECT_EQ(json::parse(run.out).at("derived").at(0).at("trg0_s"), 8.8e-5);
    EXPECT_LT(json::parse(run.out).at("derived").at(0).at("largest_residual").get<double>(), 1e-3);
}

TEST(Derive, RefusesWithoutTouchingTheHeader) {
    struct Case {
        const char *old_text, *new_text;
        std::vector<std::string> options;
        int exit_status;
        const char* message;
    };
    const Case cases[] = {
        {"<ROI>", "<Region>", {}, 1, "is no XML, line 173"},  // where the element ends by its old name
        {"<Samples>22694", "<Samples>0", {}, 1, "no region"},
        {"<LookDirection>1", "<Look>1", {}, 1, ""},
        {"", "", {"--region", "1", "0", "1", "1"}, 2, "lengths above 0"},
        {"", "", {"--region", "0.0053", "0.0003", "1167930358", "1e6"}, 1, "outside the state vectors"},
        {"", "", {"--region", "0.0043", "0.0001", "1167930358", "5"}, 1, "status 10"},
        {"", "", {"--what", "nonsense"}, 2, "nonsense"},
    };
    for (const Case& row : cases) {
        SCOPED_TRACE(row.message);
        const ChangedScene scene{kSlc};
        scene.replace(row.old_text, row.new_text);
        const std::string before = scene.text();
        std::vector<std::string> arguments{"derive", scene.header()};
        arguments.insert(arguments.end(), row.options.begin(), row.options.end());
        const auto run = quo(arguments);
        EXPECT_EQ(run.exit_status, row.exit_status);
        EXPECT_EQ(run.out, "");
        EXPECT_NE(run.err, "");
        EXPECT_THAT(run.err, HasSubstr(row.message));
        EXPECT_EQ(scene.text(), before);
    }
}

// --- fit
// ----------------------------------------------------------------------------------------------------------

// Points of a cubic far from x = 0: the coefficients come back, those of u exactly as the shift says.
TEST(Fit, FindsAPolynomial) {
    std::string table = "time,other,value\n";
    const auto cubic = [](double x) { return 7.5 - 2.25 * x + 0.5 * x * x - 0.125 * x * x * x; };
    for (int i = 0; i <= 40; ++i) {
        const double x = 3.0 + 0.25 * i;
        table += test::text_of(x) + ",17," + test::text_of(cubic(x)) + "\n";
    }
    const auto run = quo({"fit", "--degree", "3", "--y", "value", "--json"}, table);
    ASSERT_EQ(run.exit_status, 0) << run.err;
    const json fit = json::parse(run.out);
    const double expected[] = {7.5, -2.25, 0.5, -0.125};
    for (std::size_t k = 0; k < 4; ++k)
        EXPECT_NEAR(fit.at("coefficients_of_x").at(k).get<double>(), expected[k], 1e-11);
    EXPECT_EQ(fit.at("centre"), 8.0);
    EXPECT_EQ(fit.at("scale"), 5.0);
    EXPECT_NEAR(fit.at("coefficients_of_u").at(0).get<double>(), cubic(8.0), 1e-12);
    EXPECT_NEAR(fit.at("coefficients_of_u").at(3).get<double>(), -0.125 * 125.0, 1e-12);
    EXPECT_EQ(fit.at("rank"), 4);
    EXPECT_LT(fit.at("condition").get<double>(), 20.0);
    EXPECT_LT(fit.at("residual_norm").get<double>(), 1e-12);
}

// Times since 1985 would leave nothing of a fit in plain powers.
TEST(Fit, StandsTimesSince1985) {
    std::string table = "x,y\n";
    for (int i = 0; i < 30; ++i) {
        const double s = i - 11.0;
        table += test::text_of(1167930300.0 + i) + "," + test::text_of(2.0 + 3.0 * s + 0.5 * s * s) + "\n";
    }
    const json fit = json::parse(quo({"fit", "--degree", "2", "--json"}, table).out);
    EXPECT_EQ(fit.at("centre"), 1167930314.5);
    EXPECT_LT(fit.at("residual_largest").get<double>(), 1e-11);
}

TEST(Fit, ReportsResidualsOfNoisyPoints) {
    const json fit = json::parse(quo({"fit", "--degree", "0", "--json"}, "x,y\n0,1\n1,2\n2,6\n").out);
    EXPECT_NEAR(fit.at("coefficients_of_u").at(0).get<double>(), 3.0, 1e-14);
    EXPECT_NEAR(fit.at("residual_norm").get<double>(), std::sqrt(14.0), 1e-14);
    EXPECT_NEAR(fit.at("residual_rms").get<double>(), std::sqrt(14.0 / 3.0), 1e-14);
    EXPECT_NEAR(fit.at("residual_largest").get<double>(), 3.0, 1e-14);
}

TEST(Fit, SaysWhatItCannotDo) {
    struct Case {
        const char *table, *degree, *message;
        int exit_status;
    };
    const Case cases[] = {
        {"x,y\n1,2\n2,3\n", "2", "2 points do not determine degree 2", 1},
        {"x,y\n1,2\n1,3\n1,4\n", "1", "only 1 of 2", 1},
        {"x,y\n1,2\n2,oops\n", "1", "line 3", 1},
        {"x,y\n1,2\n2\n", "1", "line 3", 1},
        {"x\n1\n", "0", "two columns", 1},
        {"", "0", "", 1},
        {"x,y\n1,2\n", "21", "", 2},
        {"x,y\n1,2\n", "-1", "", 2},
    };
    for (const Case& row : cases) {
        SCOPED_TRACE(row.table);
        const auto run = quo({"fit", "--degree", row.degree}, row.table);
        EXPECT_EQ(run.exit_status, row.exit_status);
        EXPECT_THAT(run.err, HasSubstr(row.message));
        EXPECT_NE(run.err, "");
    }
}

// --- coregister
// ---------------------------------------------------------------------------------------------------

/** The header of a circular orbit with a region that its middle sees. */
std::string image(const test::CircularOrbit& orbit, double first_s, double slow_start_s, int lines = 9000) {
    std::string text = test::header_of(orbit, {.first_s = first_s});
    const std::string region = "<ROI><SlowStartTime>" + test::text_of(slow_start_s) +
                               "</SlowStartTime><SlowTimeLength>" + test::text_of(2e-3 * lines) +
                               "</SlowTimeLength><SlowTimeDelta>0.002</SlowTimeDelta>" +
                               "<FastStartTime>0.0056</FastStartTime><FastTimeLength>0.0003</FastTimeLength>"
                               "<FastTimeDelta>1.5e-8</FastTimeDelta><Lines>" +
                               std::to_string(lines) + "</Lines><Samples>20000</Samples></ROI>";
    return text.replace(text.find("</Channel>"), 0, region);
}

class Coregister : public testing::Test {
protected:
    Coregister() {
        test::write_text(master_, image(orbit_, 5000.0, 5031.0));
        test::write_text(slave_, image(beside_, 905000.0, 905031.4));
    }
    test::TemporaryFolder folder_;
    test::CircularOrbit orbit_{41.3, 12.8, -12.7}, beside_{41.3, 12.802, -12.7};
    std::string master_ = folder_.file("master.xml"), slave_ = folder_.file("slave.xml"),
                output_ = folder_.file("REGIST.xml");
};

// Judged by geolocation of single points with the tool itself: ground in the master, times in the slave.
TEST_F(Coregister, MapsPointsToWhereTheSlaveSeesThem) {
    const auto run = quo({"coregister", master_, slave_, "-o", output_, "--json"});
    ASSERT_EQ(run.exit_status, 0) << run.err;
    const json result = json::parse(run.out);
    EXPECT_GT(result.at("points"), 900);
    for (const json& row : result.at("residuals")) EXPECT_LT(row.at("largest").get<double>(), 0.05) << row;

    Coregist mapping;
    ASSERT_EQ(mapping.readpar(output_.c_str()), 0);
    EXPECT_EQ(json(mapping.AzFit), result.at("AzFit"));
    const std::string samples = "azimuth_time_s,range_time_s\n5033.25,0.00565\n5045.5,0.00585\n";
    const test::Csv ground{quo({"geolocate", master_, "--to", "ground"}, samples).out};
    std::string points = "latitude_deg,longitude_deg,height_m\n";
    for (std::size_t i = 0; i < ground.size(); ++i)
        points += ground.text(i, "latitude_deg") + "," + ground.text(i, "longitude_deg") + ",0\n";
    const test::Csv seen{quo({"geolocate", slave_, "--to", "radar"}, points).out};
    ASSERT_EQ(seen.size(), 2U);
    for (std::size_t i = 0; i < seen.size(); ++i) {
        double range_s = 0.0, azimuth_s = 0.0;
        mapping.evaluateSLtime(ground.number(i, "range_time_s"), ground.number(i, "azimuth_time_s"), &range_s,
                               &azimuth_s);
        EXPECT_NEAR(range_s, seen.number(i, "range_time_s"), 0.05 * 1.5e-8);
        EXPECT_NEAR(azimuth_s, seen.number(i, "azimuth_time_s"), 0.05 * 0.002);
    }
}

TEST_F(Coregister, KeepsTheRestOfTheDocument) {
    test::write_text(output_, test::read_text(scene_file(kSlc)));
    ASSERT_EQ(quo({"coregister", master_, slave_, "-o", output_}).exit_status, 0);
    const std::string text = test::read_text(output_);
    EXPECT_THAT(text, HasSubstr("<REGIST>"));
    EXPECT_EQ(without_section(text, "REGIST"), test::read_text(scene_file(kSlc)));
}

TEST_F(Coregister, RefusesWhatItCannotMap) {
    test::write_text(slave_, image(test::CircularOrbit{41.3, 19.8, -12.7}, 905000.0, 905031.4));
    const auto apart = quo({"coregister", master_, slave_, "-o", output_});
    EXPECT_EQ(apart.exit_status, 1);
    EXPECT_THAT(apart.err, HasSubstr("shares 0 of 1000 points"));
    EXPECT_EQ(test::read_text(output_), "");

    test::write_text(output_, "[REGIST]\n");
    const auto foreign = quo({"coregister", master_, master_, "-o", output_});
    EXPECT_EQ(foreign.exit_status, 1);
    EXPECT_EQ(test::read_text(output_), "[REGIST]\n");
    EXPECT_EQ(quo({"coregister", master_, folder_.file("none.xml"), "-o", output_ + "x"}).exit_status, 1);
    EXPECT_EQ(quo({"coregister", master_, slave_}).exit_status, 2);
    EXPECT_EQ(quo({"coregister", master_, master_, "-o", folder_.file("no/such.xml")}).exit_status, 1);
}

}  // namespace
