// SPDX-License-Identifier: Apache-2.0

// What the tool makes of products of a mission, and of one with the lines of a map in it.
#include <gtest/gtest.h>

#include <array>
#include <cmath>
#include <complex>
#include <cstdlib>
#include <functional>
#include <nlohmann/json.hpp>
#include <sstream>
#include <string>
#include <vector>

#include "quo_base/image_grid.h"
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
                             {"Grd", test::kGrd, "<numberOfSamples>26102<", 16705, test::kDetected}};

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

// A linked raster is the delivered file itself.
TEST_P(Imported, NeverWritesIntoAMeasurement) {
    const std::string file = folder_.file("delivered"), link = folder_.file("link");
    test::write_text(file, test::read_text(raster()));
    std::filesystem::create_symlink(file, link);
    test::write_text(link + ".hdr", test::read_text(header()));
    for (const char* verb : {"convert", "resample"}) {
        const auto refused = test::quo({verb, link, link, "--lines", "50"});
        EXPECT_NE(refused.exit_status, 0);
        EXPECT_NE(test::quo({verb, raster(), link, "--lines", "50"}).exit_status, 0);
    }
    EXPECT_EQ(test::quo({"convert", link, link, "--lines", "0:50"}).exit_status, 1);
    EXPECT_EQ(test::read_text(file), test::read_text(raster()));
}

// Of bursts, whose lines are more than the region's, no less than of an image without. What was cut out of one is
// as right; headers and rasters that are none of each other's are not.
TEST_P(Imported, IsRightUntilHeaderAndRasterPart) {
    EXPECT_EQ(test::quo({"validate", raster()}).out, "0 errors, 0 warnings\n");
    const std::string part = folder_.file("part");
    EXPECT_EQ(test::quo({"convert", raster(), part, "--lines", "1400:1600", "--samples", "7:20"}).exit_status, 0);
    EXPECT_EQ(test::quo({"validate", part}).out, "0 errors, 0 warnings\n");

    const bool bursts = GetParam().safe == test::kSlc;
    // Lines 1400 to 1599 are the last of a burst and the first of the next, which begins 159 lines before its end.
    EXPECT_EQ(test::quo({"get", part + ".hdr", "ROI/Lines"}).out, bursts ? "159\n" : "200\n");
    EXPECT_EQ(test::quo({"convert", part, folder_.file("few"), "--lines", "90:110"}).exit_status, 0);
    EXPECT_EQ(test::quo({"validate", folder_.file("few")}).out, "0 errors, 0 warnings\n");
    // Lines of one burst are an image's; a band is no wider than its sampling; one sample has the step of its
    // neighbours.
    const std::string one = folder_.file("one");
    for (const auto& [verb, from, option, value] :
         {std::array<std::string, 4>{"convert", raster(), "--samples", "7:8"},
          {"convert", raster(), "--lines", "1000:1400"},
          {"resample", one, "--lines", "100"},
          {"resample", one, "--samples", "10"}}) {
        EXPECT_EQ(test::quo({verb, from, one, option, value}).exit_status, 0) << verb << option;
        EXPECT_EQ(test::quo({"validate", one}).out, "0 errors, 0 warnings\n") << verb << option;
    }
    // Without an orbit corner points stay as long as they are the raster's.
    test::write_text(one + ".hdr", test::replaced(test::read_text(one + ".hdr"), "StateVectorData", "Others"));
    for (const auto& [lines, kept] : {std::pair{":", true}, {"0:50", false}}) {
        EXPECT_EQ(test::quo({"convert", one, one, "--lines", lines}).exit_status, 0);
        EXPECT_EQ(test::read_text(one + ".hdr").find("GroundCornersPoints") != std::string::npos, kept);
    }
    const struct {
        const char *from, *to, *finding;
    } kSpoilt[] = {
        {"<NrOfLinesPerImage>200<", "<NrOfLinesPerImage>99<", "warning  ROI/Lines  "},
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
    // Its fields are known as those of any other section.
    for (const char* value : {"word", "-1"})
        EXPECT_EQ(test::quo({"set", part + ".hdr", "ImageGrid/LineStep_s", value}).exit_status, 2);
    // All but the geometry is told of a product whose pixel grid is damaged.
    test::write_text(part + ".hdr", test::replaced(whole, "<LineStep_s>", "<LineStep_s>x"));
    const auto info = test::quo({"info", part}), vrt = test::quo({"vrt", part});
    EXPECT_EQ(info.exit_status + vrt.exit_status, 2);
    EXPECT_NE(info.out.find("objects  "), std::string::npos);
    EXPECT_EQ(test::read_text(part + ".vrt").find("<GCPList"), std::string::npos);
    for (const std::string& line : {info.err, vrt.err}) {
        EXPECT_NE(line.find("part.hdr: section ImageGrid: "), std::string::npos) << line;
        EXPECT_EQ(std::ranges::count(line, '\n'), 1) << line;
    }
}

// What GDAL makes of the control points with its own spline. Bursts see the same ground twice, and a spline
// through the points of both left its way by 169 pixels; pairs of points where the conversion to ground range
// changes (here by up to 14 samples) cost 35. Lines of bursts are 1342 apart, and one below the other in the
// raster 1501.
TEST_P(Imported, HasControlPointsByWhichGdalFindsItsPixels) {
    if (std::system("gdaltransform --version > /dev/null 2>&1") != 0) GTEST_SKIP() << "GDAL is not installed";
    const bool bursts = GetParam().safe == test::kSlc;
    const std::uint32_t samples = bursts ? 22694 : 26102;
    test::write_text(header(), test::replaced(test::read_text(header()), "<NrOfPixelsPerLine>30<",
                                              "<NrOfPixelsPerLine>" + std::to_string(samples) + "<"));
    std::filesystem::resize_file(raster(),
                                 std::uintmax_t{samples} * GetParam().lines * 4);  // a hole, for the most
    ASSERT_EQ(test::quo({"vrt", raster()}).exit_status, 0);
    const std::string table = folder_.file("pixels.csv"), ground = folder_.file("ground.csv");
    test::write_text(table, "line,sample,azimuth_time_s\n700,5000,1\n2301,11000,1\n3702,22000,1\n");
    const double lines[] = {700.0, bursts ? 2142.0 : 2301.0, bursts ? 3384.0 : 3702.0},
                 columns[] = {5000.0, 11000.0, 22000.0};
    ASSERT_EQ(
        test::quo({"geolocate", header(), "--to", "ground", "--input", table, "--output", ground}).exit_status, 0);
    const std::string found =
        test::Child("/bin/sh",
                    {"-c", "tail -n +2 '" + ground + "' | awk -F, '{print $8, $7, 0}' | gdaltransform -i -tps '" +
                               raster() + ".vrt'"})
            .wait()
            .out;
    std::istringstream numbers{found};
    for (int i = 0; i < 3; ++i) {
        double sample = 0.0, line = 0.0, height = 0.0;
        ASSERT_TRUE(numbers >> sample >> line >> height) << found;
        EXPECT_LT(std::hypot(line - 0.5 - lines[i], sample - 0.5 - columns[i]), bursts ? 0.4 : 7.0) << found;
    }
}

// The same image with every second of its samples: twice the step, in slant range or on the ground.
TEST_P(Imported, CoregistersWithEverySecondSample) {
    const std::string half = folder_.file("half.hdr"), whole = test::read_text(header()),
                      narrow = "<NrOfPixelsPerLine>30<";
    test::write_text(header(), test::replaced(whole, narrow, "<NrOfPixelsPerLine>20000<"));
    test::write_text(half, test::replaced(whole, narrow, "<NrOfPixelsPerLine>10000<"));
    ImageGrid_Obj grid;
    ASSERT_EQ(grid.readhdr(half.c_str()), 0);
    ASSERT_EQ(grid.cut(0.0, 0.0, 1.0, 2.0), 0);
    ASSERT_EQ(grid.writehdr(half.c_str()), 0);
    const auto run = test::quo({"coregister", header(), half, "-o", folder_.file("REGIST.xml"), "--json"});
    ASSERT_EQ(run.exit_status, 0) << run.err;
    const json found = json::parse(run.out);
    EXPECT_GT(found["points"], 900);
    const double sample = found["Rg_Samples_Origin"], line = found["Az_Samples_Origin"];
    for (const auto& [form, expected] : {std::pair{"Rg_Fit_Coeff", std::array{0.0, 0.5, 0.0, 0.5 * sample}},
                                         std::pair{"Az_Fit_Coeff", std::array{0.0, 0.0, 1.0, line}}}) {
        constexpr double kFar[] = {1e8, 1e4, 1e4, 1.0};  // what the coefficients are multiplied with there
        for (std::size_t i = 0; i < expected.size(); ++i)
            EXPECT_NEAR(found[form][i].get<double>() * kFar[i], expected[i] * kFar[i], 2e-3) << form << i;
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
    EXPECT_EQ(json::parse(test::quo({"stac", raster(), "--id", "mine"}).out)["id"], "mine");
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

// ---- On the map

/** A raster that lies on the map: north up, squares of `step_deg`. */
struct MapImage {
    static constexpr double kWest_deg = 11.372, kNorth_deg = 41.812, kStep_deg = 0.00004;
    static constexpr int kColumns = 800, kRows = 1175;  // to 11.404 east and 41.765 north, all of it in the image
    std::vector<std::complex<float>> samples = std::vector<std::complex<float>>(kColumns * kRows);

    [[nodiscard]] bool bright(double longitude_deg, double latitude_deg) const {
        const auto column = static_cast<int>((longitude_deg - kWest_deg) / kStep_deg);
        const auto row = static_cast<int>((kNorth_deg - latitude_deg) / kStep_deg);
        return std::abs(samples[static_cast<std::size_t>(row * kColumns + column)]) > 1000.0F;
    }
};

/** How far the middle of what is bright lies off 0, over 0.002 degrees to either side and all of `along`. */
double offset(const std::function<bool(double along_deg, double across_deg)>& bright) {
    double sum = 0.0;
    int count = 0;
    for (double along_deg = 0.00202; along_deg < 0.008; along_deg += MapImage::kStep_deg)
        for (double across_deg = -0.00198; across_deg < 0.002; across_deg += MapImage::kStep_deg)  // centres
            if (bright(along_deg, across_deg)) {
                sum += across_deg;
                ++count;
            }
    EXPECT_GT(count, 500);
    return sum / count;
}

// The example's image is bright where the map has a line every 0.01 degrees; GDAL knows of the image's geometry
// what the control points tell it. Their corner for their centre would be half a pixel off.
TEST(Vrt, PutsTheLinesOfTheMapInTheirPlaces) {
    if (std::system("gdalwarp --version > /dev/null 2>&1") != 0) GTEST_SKIP() << "GDAL is not installed";
    const test::TemporaryFolder folder;
    const std::string raster = folder.file("map.slc"), out = folder.file("map.bin");
    ASSERT_EQ(test::Child(QUO_COMPLETE_PRODUCT, {test::scene_file("s1a_iw1_slc_20220104_asc.xml"), raster})
                  .wait()
                  .exit_status,
              0);
    ASSERT_EQ(test::quo({"vrt", raster}).exit_status, 0);
    const std::string warp = "gdalwarp -q -tps -t_srs EPSG:4326 -te 11.372 41.765 11.404 41.812 -tr 4e-5 4e-5 " +
                             std::string{"-ot CFloat32 -of ENVI '"} + raster + ".vrt' '" + out + "' 2>&1";
    ASSERT_EQ(std::system(warp.c_str()), 0);
    // Without a word about the way it takes a polynomial of order 2, which two lines of points do not make.
    EXPECT_EQ(std::system(
                  ("gdalwarp -q -t_srs EPSG:4326 -ts 50 50 '" + raster + ".vrt' '" + out + ".tif' 2>&1").c_str()),
              0);
    MapImage map;
    const std::string bytes = test::read_text(out);
    ASSERT_EQ(bytes.size(), map.samples.size() * sizeof map.samples[0]);
    std::memcpy(map.samples.data(), bytes.data(), bytes.size());

    constexpr double kLine_deg = 1.26e-4, kSample_deg = 5.0e-5;  // 14.0 m to the north, 4.2 m to the east
    constexpr double kTolerated = 0.4;                           // pixels
    for (const double latitude_deg : {41.77, 41.78, 41.79, 41.80})
        for (const double longitude_deg : {11.38, 11.39}) {
            const double to_north_deg = offset([&](double along_deg, double across_deg) {
                return map.bright(longitude_deg + along_deg, latitude_deg + across_deg);
            });
            const double to_east_deg = offset([&](double along_deg, double across_deg) {
                return map.bright(longitude_deg + across_deg, latitude_deg + along_deg);
            });
            EXPECT_LT(std::abs(to_north_deg), kTolerated * kLine_deg) << latitude_deg << " " << longitude_deg;
            EXPECT_LT(std::abs(to_east_deg), kTolerated * kSample_deg) << latitude_deg << " " << longitude_deg;
        }

    const auto told = test::Child("/bin/sh", {"-c", "gdalinfo '" + raster + ".vrt'"}).wait();
    for (const char* line : {"ID[\"EPSG\",4979]", "MISSION_ID=SENTINEL-1A", "ORBIT_DIRECTION=ASCENDING",
                             "ACQUISITION_START_TIME=2022-01-04T17:06:10.601927", "Description = VV"})
        EXPECT_NE(told.out.find(line), std::string::npos) << line;
}

}  // namespace
