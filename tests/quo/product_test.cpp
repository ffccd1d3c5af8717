// The verbs on product headers.
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "quo_base/generalSAR.h"
#include "tool.h"

namespace {

using testing::HasSubstr;
using testing::Not;

class ProductVerbs : public testing::Test {
protected:
    // A copy of a bundled scene that the test may change.
    std::string copy_of_scene(const char* name = "scene.xml") {
        const std::string copy = folder_.file(name);
        test::write_text(copy, test::read_text(test::scene_file(test::scenes().front())));
        return copy;
    }
    static void expect_finding(const std::string& header, int exit_status, const std::string& finding) {
        const test::Finished finished = test::quo({"validate", header});
        EXPECT_EQ(finished.exit_status, exit_status) << finished.out;
        EXPECT_THAT(finished.out, HasSubstr(finding));
    }
    static void set(const std::string& header, const std::string& field, const std::string& value) {
        ASSERT_EQ(test::quo({"set", header, field, value}).exit_status, 0);
    }
    // Puts a text into a field, whatever the tool thinks of it.
    static void put(const std::string& header, const std::string& field, const std::string& value) {
        const auto slash = field.find('/');
        const std::string name = field.substr(slash + 1);
        std::string text = test::read_text(header);
        const std::size_t section = text.find('<' + field.substr(0, slash) + '>');
        const std::size_t first = text.find('<' + name + '>', section) + name.size() + 2;
        const std::size_t last = text.find('/' + name + '>', first) - 1;
        ASSERT_LT(last, text.size()) << field;
        test::write_text(header, text.replace(first, last - first, value));
    }
    test::TemporaryFolder folder_;
};

TEST_F(ProductVerbs, InfoKnowsEveryBundledScene) {
    for (const std::string& name : test::scenes()) {
        const std::string scene = test::scene_file(name);
        const test::Finished text = test::quo({"info", scene}), json = test::quo({"info", scene, "--json"});
        ASSERT_EQ(text.exit_status, 0) << text.err;
        for (const char* fact : {"orbit direction", "look side", "PRF", "wavelength", "corners", "objects"}) {
            EXPECT_THAT(text.out, HasSubstr(fact)) << scene;
        }
        const auto facts = nlohmann::json::parse(json.out);
        EXPECT_EQ(facts["corners"].size(), 4U);
        EXPECT_GT(facts["prf_hz"].get<double>(), 1.0);
        EXPECT_EQ(facts["look_side"], scene.find("left") != std::string::npos ? "left" : "right");
    }
}

// The corners used to be those of one line and one sample more than there are.
TEST_F(ProductVerbs, InfoShowsTheCornersOfTheLastLine) {
    const std::string scene = test::scene_file(test::scenes().front());
    const auto facts = nlohmann::json::parse(test::quo({"info", scene, "--json"}).out);
    const double azimuth_s = facts["last_line"]["seconds"];
    constexpr double kNear_s = 0.005336535882737799, kDelta_s = 1.554116558005821e-08;  // of the scene
    const double range_s = kNear_s + kDelta_s * (facts["region"]["samples"].get<int>() - 1);
    const std::string table =
        "azimuth_time_s,range_time_s\n" + test::text_of(azimuth_s) + "," + test::text_of(range_s) + "\n";
    const test::Csv ground{test::quo({"geolocate", scene, "--to", "ground"}, table).out};
    EXPECT_NEAR(facts["corners"][2]["latitude_deg"], ground.number(0, "latitude_deg"), 1e-9);
    EXPECT_NEAR(facts["corners"][2]["longitude_deg"], ground.number(0, "longitude_deg"), 1e-9);
}

TEST_F(ProductVerbs, ValidateHasNoErrorInTheBundledScenes) {
    for (const std::string& name : test::scenes()) {
        const test::Finished finished = test::quo({"validate", test::scene_file(name)});
        EXPECT_EQ(finished.exit_status, 0) << finished.out;
        EXPECT_THAT(finished.out, HasSubstr("0 errors"));
    }
}

// One thing spoilt at a time. What is wrong by the field's own rules is also what `set` must not write: it used to
// take any number, and nothing looked at texts, dates and counts at all.
TEST_F(ProductVerbs, ValidateFindsWhatDoesNotFit) {
    constexpr bool kRefused = true, kSet = false;
    struct Spoil {
        const char *field, *value;
        bool refused;  // by `set`
        const char* finding;
        int exit_status = 1;
    };
    const Spoil rows[] = {
        {"SamplingConstants/lambda_m", "0.06", kSet, "error  SamplingConstants/lambda_m  times fc_hz is"},
        {"SamplingConstants/prf_hz", "-5", kRefused, "error  SamplingConstants/prf_hz  -5 is not above 0"},
        {"SamplingConstants/prf_hz", "inf", kRefused, "error  SamplingConstants/prf_hz  \"inf\" is not finite"},
        {"SamplingConstants/frg_hz", "nan", kRefused, "error  SamplingConstants/frg_hz  \"nan\" is not finite"},
        {"SamplingConstants/brf_hz", "fast", kRefused, "error  SamplingConstants/brf_hz  \"fast\" is no number"},
        {"DataSetInfo/RangeLooks", "5000", kRefused, "error  DataSetInfo/RangeLooks  5000 lies above 1000"},
        {"DataSetInfo/RangeLooks", "2.5", kRefused, "error  DataSetInfo/RangeLooks  \"2.5\" is no whole number"},
        {"DataSetInfo/LookDirection", "7", kRefused, "error  DataSetInfo/LookDirection  7 lies above 1"},
        {"DataSetInfo/Polarization", "XX", kRefused,
         "error  DataSetInfo/Polarization  \"XX\" is none of H/H, V/V"},
        {"DataSetInfo/SenseDate", "99-XXX-2022", kRefused,
         "error  DataSetInfo/SenseDate  \"99-XXX-2022\" is no date"},
        {"DataSetInfo/Projection", "SLANT", kRefused, "error  DataSetInfo/Projection  \"SLANT\" is none of"},
        {"DataSetInfo/ImageType", "SLC", kRefused, "error  DataSetInfo/ImageType  \"SLC\" is none of"},
        {"DataSetInfo/RefSystem", "MOON", kRefused, "error  DataSetInfo/RefSystem  \"MOON\" is none of"},
        {"DataSetInfo/SensorName", "", kRefused, "error  DataSetInfo/SensorName  is empty"},
        {"DataSetInfo/OrbitConfiguration", "DESCENDING", kSet, "DESCENDING, but the state vectors are ASCENDING"},
        {"DataSetInfo/Projection", "GROUND RANGE", kSet, "warning  DataSetInfo/Projection  GROUND RANGE, but", 0},
        {"ROI/Lines", "17", kSet, "error  ROI/SlowTimeLength"},
        {"ROI/FastTimeDelta", "0", kSet, "error  ROI/FastTimeLength"},
        {"ROI/SlowStartTime", "5", kSet, "error  StateVectorData/t0SV_s  the scene reaches"},
        {"StateVectorData/t0SV_s", "17", kSet, "the scene reaches"},
        {"StateVectorData/dtSV_s", "0", kSet, "error  StateVectorData/"},
        {"StateVectorData/nSV_n", "4", kSet, "4 state vectors, at least 5 are needed"},
    };
    for (const Spoil& row : rows) {
        SCOPED_TRACE(std::string{row.field} + " " + row.value);
        const std::string header = copy_of_scene(), before = test::read_text(header);
        EXPECT_EQ(test::quo({"set", header, row.field, row.value}).exit_status, row.refused ? 2 : 0);
        EXPECT_EQ(test::read_text(header) == before, row.refused);
        test::write_text(header, before);
        put(header, row.field, row.value);
        expect_finding(header, row.exit_status, row.finding);
    }
}

// Of a field with one value three are no better than none, and reading takes whichever it finds first.
TEST_F(ProductVerbs, CountsTheValuesOfAField) {
    const std::string three = "error  SamplingConstants/prf_hz  has 3 values, not 1";
    for (const char* values : {"<val N=\"1\">1</val><val N=\"2\">2</val><val N=\"3\">3</val>",
                               "1</prf_hz><prf_hz>2</prf_hz><prf_hz>3"}) {
        const std::string header = copy_of_scene();
        put(header, "SamplingConstants/prf_hz", values);
        expect_finding(header, 1, three);
    }
    const std::string header = copy_of_scene(), before = test::read_text(header);
    EXPECT_EQ(test::quo({"set", header, "SamplingConstants/prf_hz", "1", "2", "3"}).exit_status, 2);
    EXPECT_EQ(test::quo({"set", header, "DataSetInfo/RangeBandwidth", "1", "2"}).exit_status, 2);
    EXPECT_EQ(test::read_text(header), before);
    EXPECT_EQ(test::quo({"set", header, "SamplingConstants/Brg_hz", "-999"}).exit_status, 0) << "unknown again";
}

// What only the document tells: a field that is gone, a value too few, a section that stands twice.
TEST_F(ProductVerbs, ValidateLooksAtTheDocument) {
    struct Edit {
        const char *from, *to;
        int exit_status;
        const char* finding;
    };
    const Edit rows[] = {
        {"<Lines>12236</Lines>", "", 1, "error  ROI/Lines  is missing"},
        {"<val N=\"1\">5636962.746301</val>", "", 1, "error  StateVectorData/pSV_m  has 47 values, not 48"},
        {"<val N=\"1\">5636962.746301</val>", "<val N=\"1\">far</val>", 1, "\"far\" is no number"},
        {"<ROI>", "<ROI/><ROI>", 0, "warning  ROI/-  stands 2 times"},
        {"<Channel Number=\"1\">", "<Channel Number=\"2\">", 1, "holds no object"},
    };
    for (const Edit& row : rows) {
        SCOPED_TRACE(row.finding);
        const std::string header = copy_of_scene();
        std::string text = test::read_text(header);
        const std::size_t at = text.find(row.from);
        ASSERT_NE(at, std::string::npos);
        test::write_text(header, text.replace(at, std::string_view{row.from}.size(), row.to));
        const test::Finished finished = test::quo({"validate", header});
        EXPECT_EQ(finished.exit_status, row.exit_status);
        EXPECT_THAT(finished.out + finished.err, HasSubstr(row.finding));
    }
}

TEST_F(ProductVerbs, ValidateMeasuresTheRaster) {
    const std::string header = copy_of_scene("image.raw.hdr");
    BufferFile raster;
    raster.NrOfLinesPerImage = 12236;
    raster.NrOfPixelsPerLine = 22694;
    raster.CellType = SHORT_COMPLEX;
    ASSERT_EQ(raster.writehdr(header.c_str()), 0);
    expect_finding(header, 1, "error  RasterInfo/-");
    test::write_text(folder_.file("image.raw"), "");
    std::filesystem::resize_file(folder_.file("image.raw"), static_cast<std::uintmax_t>(raster.rasterSize()));
    expect_finding(header, 0, "0 errors");
    std::filesystem::resize_file(folder_.file("image.raw"), 5);
    expect_finding(header, 1, "has 5 bytes");
}

TEST_F(ProductVerbs, GetAndSetTouchOneFieldOnly) {
    const std::string header = copy_of_scene(), before = test::read_text(header);
    EXPECT_EQ(test::quo({"get", header, "SamplingConstants/lambda_m"}).out, "0.05546576\n");
    set(header, "SamplingConstants/lambda_m", "0.25");
    std::string expected = before;
    expected.replace(expected.find("0.05546576"), 10, "0.25");
    EXPECT_EQ(test::read_text(header), expected);

    const test::Finished vectors = test::quo({"get", header, "StateVectorData/t0SV_s", "--json"});
    EXPECT_EQ(nlohmann::json::parse(vectors.out)["value"], 1167930296.781409);
    ASSERT_EQ(test::quo({"set", header, "SamplingConstants/list", "1", "2.5", "-3", "--create"}).exit_status, 0);
    EXPECT_EQ(test::quo({"get", header, "SamplingConstants/list"}).out, "1\n2.5\n-3\n");
    ASSERT_EQ(test::quo({"set", header, "SamplingConstants/list", "7", "8"}).exit_status, 0);
    EXPECT_EQ(test::quo({"get", header, "SamplingConstants/list"}).out, "7\n8\n");
    EXPECT_EQ(test::quo({"get", header, "StateVectorData/pSV_m"}).messages().size(), 0U);
}

TEST_F(ProductVerbs, GetAndSetRefuseWhatIsNotThere) {
    const std::string header = copy_of_scene(), before = test::read_text(header);
    EXPECT_EQ(test::quo({"set", header, "SamplingConstants/unknown", "1"}).exit_status, 1);
    EXPECT_EQ(test::quo({"get", header, "SamplingConstants/unknown"}).exit_status, 1);
    EXPECT_EQ(test::quo({"get", header, "SamplingConstants"}).exit_status, 2) << "a section is no field";
    EXPECT_EQ(test::quo({"set", header, "SamplingConstants/prf_hz", "fast"}).exit_status, 2) << "no number";
    EXPECT_EQ(test::read_text(header), before);
    EXPECT_EQ(test::quo({"set", folder_.file("none.xml"), "A/b", "1"}).exit_status, 1);
    EXPECT_FALSE(std::filesystem::exists(folder_.file("none.xml")));
    test::write_text(folder_.file("other.xml"), "<other/>");
    EXPECT_EQ(test::quo({"set", folder_.file("other.xml"), "A/b", "1", "--create"}).exit_status, 1);
    EXPECT_EQ(test::read_text(folder_.file("other.xml")), "<other/>");
}

nlohmann::json geometry_of(const std::string& header) {
    const test::Finished finished = test::quo({"footprint", header});
    EXPECT_EQ(finished.exit_status, 0) << finished.err;
    return nlohmann::json::parse(finished.out)["geometry"];
}

// A closed ring, counter-clockwise, within the longitudes that GeoJSON knows.
void expect_ring(const nlohmann::json& ring) {
    ASSERT_GE(ring.size(), 4U);
    EXPECT_EQ(ring.front(), ring.back());
    double twice_area = 0.0;
    for (std::size_t i = 0; i + 1 < ring.size(); ++i) {
        EXPECT_LE(std::abs(ring[i][0].get<double>()), 180.0);
        EXPECT_LE(std::abs(ring[i][1].get<double>()), 90.0);
        twice_area += ring[i][0].get<double>() * ring[i + 1][1].get<double>() -
                      ring[i + 1][0].get<double>() * ring[i][1].get<double>();
    }
    EXPECT_GT(twice_area, 0.0);
}

TEST_F(ProductVerbs, FootprintIsAClosedRing) {
    for (const std::string& name : test::scenes()) {
        const auto geometry = geometry_of(test::scene_file(name));
        EXPECT_EQ(geometry["type"], "Polygon");
        expect_ring(geometry["coordinates"][0]);
    }
}

TEST_F(ProductVerbs, FootprintIsCutAtTheAntimeridian) {
    GeneralSAR product;
    struct Point {
        geopoint* point;
        double latitude, longitude;
    };
    for (const Point& at : {Point{&product.geoCoords.NorthWest, 11.0, 179.5},
                            {&product.geoCoords.NorthEast, 11.5, -179.2},
                            {&product.geoCoords.SouthEast, 10.2, -179.3},
                            {&product.geoCoords.SouthWest, 10.0, 179.4},
                            {&product.geoCoords.Center, 10.6, -179.9}}) {
        at.point->Latitude = at.latitude;
        at.point->Longitude = at.longitude;
    }
    product.GSenable(gsGeoCoords);
    const std::string header = folder_.file("antimeridian.xml");
    product.GSwrite(header.c_str());
    const auto geometry = geometry_of(header);
    ASSERT_EQ(geometry["type"], "MultiPolygon");
    ASSERT_EQ(geometry["coordinates"].size(), 2U);
    for (const auto& part : geometry["coordinates"]) expect_ring(part[0]);
}

TEST_F(ProductVerbs, FailuresNameTheFile) {
    test::write_text(folder_.file("text.txt"), "no product");
    for (const char* verb : {"info", "validate", "footprint"}) {
        for (const std::string& header :
             {folder_.file("none.xml"), folder_.file("text.txt"), folder_.path().string()}) {
            const test::Finished finished = test::quo({verb, header});
            EXPECT_EQ(finished.exit_status, 1) << verb;
            EXPECT_EQ(finished.messages().size(), 1U) << finished.err;
            EXPECT_THAT(finished.err, HasSubstr(header));
        }
    }
}

}  // namespace
