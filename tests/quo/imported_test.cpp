// What the tool makes of products of a mission, and of one with the lines of a map in it.
#include <gtest/gtest.h>

#include <cmath>
#include <complex>
#include <cstdlib>
#include <functional>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "quo_base/api.h"
#include "support/sentinel1.h"
#include "tool.h"

namespace {

using nlohmann::json;

struct Mission {
    const char *name, *safe, *wide;
    std::uint32_t lines;
    test::Layout layout;
};
const Mission kMissions[] = {{"Slc", test::kSlc, "<numberOfSamples>22694<", 4503, test::kPlain},
                             {"Grd",
                              test::kGrd,
                              "<numberOfSamples>26102<",
                              16705,
                              {"", 16, SAMPLEFORMAT_UINT, COMPRESSION_NONE, false, false, 16705}}};

/** A product that the tool imported: all lines, of which 30 samples. */
class Imported : public testing::TestWithParam<Mission> {
protected:
    void SetUp() override {
        const Mission& mission = GetParam();
        test::Safe safe{folder_, mission.safe};
        safe.change(mission.wide, "<numberOfSamples>30<");
        test::write_tiff(safe.measurement(), mission.layout, mission.lines, 30, true);
        const auto made = test::quo({"import", safe.path(), raster()});
        ASSERT_EQ(made.exit_status, 0) << made.err;
    }
    [[nodiscard]] std::string raster() const { return folder_.file("scene"); }
    [[nodiscard]] std::string header() const { return raster() + ".hdr"; }

    test::TemporaryFolder folder_;
};

// Of bursts, whose lines are more than the region's, no less than of an image without. What was cut out of one is
// as right; headers and rasters that are none of each other's are not.
TEST_P(Imported, IsRightUntilHeaderAndRasterPart) {
    EXPECT_EQ(test::quo({"validate", raster()}).out, "0 errors, 0 warnings\n");
    const std::string part = folder_.file("part");
    EXPECT_EQ(test::quo({"convert", raster(), part, "--lines", "1400:1600", "--samples", "7:20"}).exit_status, 0);
    EXPECT_EQ(test::quo({"validate", part}).out, "0 errors, 0 warnings\n");

    const bool bursts = GetParam().safe == test::kSlc;
    const struct {
        const char *from, *to, *finding;
    } kSpoilt[] = {
        {"<NrOfLinesPerImage>200<", "<NrOfLinesPerImage>199<", "warning  ROI/Lines  "},
        {"<FirstLine>1400<", "<FirstLine>1300<", "warning  ROI/SlowStartTime  "},
        {"<FirstSample>7<", "<FirstSample>9<", "warning  ROI/FastStartTime  "},
        {"<LineStep_s>", "<LineStep_s>x", "error  ImageGrid/-  makes no pixel grid"},
        {"<LinesPerBurst>1501<", "<LinesPerBurst>501<", "error  ImageGrid/BurstStart_s  places no raster of 200 "},
        {"<LinesPerBurst>1501<", "<LinesPerBurst>1502<", "warning  SwathInfo/Lines_per_burst  1501, but "},
    };
    const std::string whole = test::read_text(part + ".hdr");
    for (const auto& [from, to, finding] : kSpoilt) {
        const std::string spoilt = test::replaced(whole, from, to);
        if (!bursts && spoilt == whole) continue;  // there are none of its lines
        test::write_text(part + ".hdr", spoilt);
        EXPECT_NE(test::quo({"validate", part}).out.find(finding), std::string::npos) << from;
    }
}

// ---- Items of a catalogue

bool is_time(const json& value) {
    const std::string text = value.is_string() ? value.get<std::string>() : "";
    return text.size() > 20 && text[4] == '-' && text[10] == 'T' && text.ends_with('Z');
}
bool above_zero(const json& value) { return value.is_number() && value.get<double>() > 0.0; }
bool is_count(const json& value) { return value.is_number_integer() && value.get<int>() > 0; }
bool is_angle(const json& value) { return value.is_number() && value >= 0.0 && value <= 90.0; }
bool is_name(const json& value) { return value.is_string() && !value.get<std::string>().empty(); }
auto one_of(const json& values) {
    return [values](const json& value) { return std::ranges::find(values, value) != values.end(); };
}
auto equals(const json& expected) {
    return [expected](const json& value) { return value == expected; };
}
auto list_of(const std::function<bool(const json&)>& fits, std::size_t least, std::size_t most) {
    return [=](const json& value) {
        return value.is_array() && value.size() >= least && value.size() <= most &&
               std::ranges::all_of(value, fits);
    };
}
bool is_number(const json& value) { return value.is_number(); }

// What the published schemas of the item and its four extensions require, and the types and words of what they
// leave free.
TEST_P(Imported, MakesAnItemThatItsSchemasAllow) {
    const bool grd = GetParam().safe == test::kGrd;
    const std::string url = "https://stac-extensions.github.io/";
    const struct {
        const char* path;
        std::function<bool(const json&)> fits;
    } kRules[] = {
        {"/stac_version", equals("1.0.0")},
        {"/type", equals("Feature")},
        {"/id", is_name},
        {"/stac_extensions", equals({url + "sar/v1.0.0/schema.json", url + "sat/v1.0.0/schema.json",
                                     url + "projection/v1.1.0/schema.json", url + "view/v1.0.0/schema.json"})},
        {"/geometry/type", equals("Polygon")},
        {"/geometry/coordinates/0", list_of(list_of(is_number, 2, 2), 5, 5)},
        {"/bbox", list_of(is_number, 4, 4)},
        {"/links", list_of([](const json&) { return true; }, 0, 0)},
        {"/assets/header/href", equals("./scene.hdr")},
        {"/assets/raster/href", equals("./scene")},
        {"/assets/raster/roles", equals({"data"})},
        {"/properties/datetime", is_time},
        {"/properties/start_datetime", is_time},
        {"/properties/end_datetime", is_time},
        {"/properties/platform", equals(grd ? "sentinel-1b" : "sentinel-1a")},
        {"/properties/sar:instrument_mode", equals("IW")},
        {"/properties/sar:frequency_band", equals("C")},
        {"/properties/sar:center_frequency", [](const json& f) { return f > 5.4 && f < 5.41; }},
        {"/properties/sar:polarizations", list_of(one_of({"HH", "VV", "HV", "VH"}), 1, 1)},
        {"/properties/sar:product_type", equals(grd ? "GRD" : "SLC")},
        {"/properties/sar:observation_direction", equals("right")},
        {"/properties/sar:looks_range", is_count},
        {"/properties/sar:pixel_spacing_range", above_zero},
        {"/properties/sar:pixel_spacing_azimuth", above_zero},
        {"/properties/sat:orbit_state", equals(grd ? "descending" : "ascending")},
        {"/properties/sat:absolute_orbit", equals(grd ? 30148 : 41314)},
        {"/properties/sat:relative_orbit", is_count},
        {"/properties/view:incidence_angle", is_angle},
        {"/properties/view:off_nadir", is_angle},
        {"/properties/proj:epsg", equals(nullptr)},
        {"/properties/proj:shape", equals({GetParam().lines, 30})},
        {"/properties/proj:centroid/lat", is_number},
        {"/properties/proj:centroid/lon", is_number},
    };
    const auto made = test::quo({"stac", raster()});
    ASSERT_EQ(made.exit_status, 0) << made.err;
    const json item = json::parse(made.out);
    for (const auto& [path, fits] : kRules) {
        const json::json_pointer place{path};
        ASSERT_TRUE(item.contains(place)) << path;
        EXPECT_TRUE(fits(item[place])) << path << ": " << item[place];
    }
    const auto& centre = item["properties"]["proj:centroid"];
    const auto& box = item["bbox"];
    EXPECT_TRUE(box[0] < centre["lon"] && centre["lon"] < box[2]) << box;
    EXPECT_TRUE(box[1] < centre["lat"] && centre["lat"] < box[3]) << box;

    constexpr struct {
        const char *field, *value, *missing;
    } kUntold[] = {{"DataSetInfo/ImageType", "NOT SET", "no image type"},
                   {"DataSetInfo/Polarization", "NOT_AVAILABLE", "no polarization"},
                   {"SamplingConstants/fc_hz", "7e8", "no frequency of a radar band"}};
    for (const auto& [field, value, missing] : kUntold) {
        const std::string before = test::read_text(header());
        const std::string name = std::string{field}.substr(std::string{field}.find('/') + 1);
        const auto from = before.find("<" + name + ">") + name.size() + 2;
        test::write_text(header(), std::string{before}.replace(from, before.find('<', from) - from, value));
        const auto refused = test::quo({"stac", raster()});
        EXPECT_EQ(refused.exit_status, 1) << field;
        EXPECT_EQ(refused.out, "");
        EXPECT_NE(refused.err.find(missing), std::string::npos) << refused.err;
        test::write_text(header(), before);
    }
}
INSTANTIATE_TEST_SUITE_P(Sentinel1, Imported, testing::ValuesIn(kMissions),
                         [](const auto& test) { return std::string{test.param.name}; });

}  // namespace
