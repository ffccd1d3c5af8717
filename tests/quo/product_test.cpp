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

TEST_F(ProductVerbs, ValidateHasNoErrorInTheBundledScenes) {
    for (const std::string& name : test::scenes()) {
        const test::Finished finished = test::quo({"validate", test::scene_file(name)});
        EXPECT_EQ(finished.exit_status, 0) << finished.out;
        EXPECT_THAT(finished.out, HasSubstr("0 errors"));
    }
}

// One thing spoilt at a time.
TEST_F(ProductVerbs, ValidateFindsWhatDoesNotFit) {
    struct Spoil {
        const char *field, *value;
        int exit_status;
        const char* finding;
    };
    const Spoil rows[] = {
        {"SamplingConstants/lambda_m", "0.06", 1, "error  SamplingConstants/lambda_m"},
        {"SamplingConstants/prf_hz", "-5", 1, "error  SamplingConstants/prf_hz"},
        {"SamplingConstants/frg_hz", "nan", 1, "error  SamplingConstants/frg_hz  \"nan\" is no finite number"},
        {"DataSetInfo/RangeLooks", "5000", 1, "error  DataSetInfo/RangeLooks  5000 lies outside 1 to 1000"},
        {"ROI/Lines", "17", 1, "error  ROI/SlowTimeLength"},
        {"ROI/FastTimeDelta", "0", 1, "error  ROI/FastTimeLength"},
        {"ROI/SlowStartTime", "5", 1, "error  StateVectorData/t0SV_s  the scene reaches"},
        {"StateVectorData/t0SV_s", "17", 1, "the scene reaches"},
        {"StateVectorData/dtSV_s", "0", 1, "error  StateVectorData/"},
        {"StateVectorData/nSV_n", "4", 1, "4 state vectors, at least 5 are needed"},
    };
    for (const Spoil& row : rows) {
        SCOPED_TRACE(row.field);
        const std::string header = copy_of_scene();
        set(header, row.field, row.value);
        expect_finding(header, row.exit_status, row.finding);
    }
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
        {"<val N=\"1\">5636962.746301</val>", "<val N=\"1\">far</val>", 1, "\"far\" is no finite number"},
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
