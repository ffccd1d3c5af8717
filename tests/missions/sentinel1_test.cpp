// SPDX-License-Identifier: Apache-2.0
#include "missions/sentinel1.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cmath>
#include <cstring>
#include <filesystem>
#include <regex>
#include <string>
#include <vector>

#include "missions/mission_xml.h"
#include "quo_base/derived_raster.h"
#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"
#include "quo_base/mission_import.h"
#include "quo_base/product.h"
#include "support/diagnostics.h"
#include "support/sentinel1.h"

namespace {

namespace fs = std::filesystem;
using test::kDetected;
using test::kGrd;
using test::kPlain;
using test::kSlc;
using test::Layout;
using test::part_of;
using test::Safe;
using test::write_tiff;

constexpr const char* kOrbit =
    QUO_TEST_DATA "/sentinel1/S1A_OPER_AUX_RESORB_OPOD_20230823T174849_V20230823T141024_20230823T172754.EOF";

int import_safe(const std::string& source, const std::string& raster, quo_import_result& result,
                const char* orbit = nullptr, bool link = false) {
    quo_import_request request{};
    request.source = source.c_str();
    request.raster = raster.c_str();
    request.orbit_file = orbit;
    request.link = link ? 1 : 0;
    return quo_import_sentinel1(&request, &result);
}

std::unique_ptr<quo::MissionProduct> described(const Safe& safe, const std::string& orbit = "") {
    auto made = std::make_unique<quo::MissionProduct>();
    quo::describe_sentinel1({safe.annotation().string(), "", ""}, orbit, *made);
    return made;
}

/** An orbit file of the annotation's own vectors, so many metres off in x. */
std::string orbit_beside(const Safe& safe, const test::TemporaryFolder& folder, double off_m) {
    std::string list;
    const quo::MissionXml xml{safe.annotation().string()};
    for (const auto& orbit : xml.root().list("generalAnnotation/orbitList", "orbit")) {
        list += "<OSV><UTC>UTC=" + orbit.text("time") + "</UTC>";
        for (const char* const axis : {"x", "y", "z"}) {
            const std::string name{static_cast<char>(axis[0] - 'x' + 'X')}, lower{axis};
            const double at_m = orbit.number("position/" + lower) + (lower == "x" ? off_m : 0.0);
            list.append("<").append(name).append(">").append(std::to_string(at_m));
            list.append("</").append(name).append("><V").append(name).append(">");
            list.append(orbit.text("velocity/" + lower)).append("</V").append(name).append(">");
        }
        list += "</OSV>";
    }
    test::write_text(folder.file("own.EOF"),
                     "<E><Earth_Explorer_Header><Fixed_Header><Mission>Sentinel-1A</Mission></Fixed_Header>"
                     "<Variable_Header><Ref_Frame>EARTH_FIXED</Ref_Frame></Variable_Header>"
                     "</Earth_Explorer_Header><Data_Block><List_of_OSVs>" +
                         list + "</List_of_OSVs></Data_Block></E>");
    return folder.file("own.EOF");
}

// --- Times and tie points ---------------------------------------------------------------------------------------

TEST(Sentinel1, TakesTimesToTheMicrosecond) {
    constexpr struct {
        const char* text;
        double whole_s, fraction_s;
    } kTimes[] = {{"2022-01-04T17:05:58.268589", 1167930358.0, 0.268589},
                  {"UTC=1985-01-01T00:00:00", 0.0, 0.0},
                  {"2000-02-29T23:59:59.5Z", 478483199.0, 0.5}};
    for (const auto& [text, whole_s, fraction_s] : kTimes) {
        const auto time = quo::split_time(text);
        ASSERT_TRUE(time) << text;
        EXPECT_EQ(time->whole_s, whole_s);
        EXPECT_EQ(time->fraction_s, fraction_s);
    }
    for (const char* text :
         {"", "2022-02-29T00:00:00", "2022-01-04 17:05:58", "2022-01-04T24:00:00", "2022-01-04T17:05",
          "2022-01-04T17:05:58.2x", "-022-01-04T17:05:58", "2022-01-04T17:05:58,5"})
        EXPECT_FALSE(quo::split_time(text)) << text;
}

struct Truth {
    const char* safe;
    bool grd;
    int ties;
    double most_line, most_sample, most_ground_m;
};
class Sentinel1Products : public testing::TestWithParam<Truth> {};

TEST_P(Sentinel1Products, AgreeWithTheirTiePointsBothWays) {
    const test::Report report;
    const test::TemporaryFolder folder;
    const Truth truth = GetParam();
    const Safe safe{folder, truth.safe};
    const std::string header = folder.file("scene.hdr");
    {
        // Without the measurement, whose zeros would fill gigabytes.
        const auto made = described(safe);
        EXPECT_EQ(made->ties.count, truth.ties);
        EXPECT_LT(made->ties.most_line, truth.most_line);
        EXPECT_LT(made->ties.most_sample, truth.most_sample);
        EXPECT_LT(made->ties.most_ground_m, truth.most_ground_m);
        quo::write_mission_header(*made, header);
    }

    // Once more from the header alone, point by point.
    GeneralSAR product;
    ImageGrid_Obj grid;
    ASSERT_EQ(product.GSread(header.c_str()), 0);
    ASSERT_EQ(grid.readhdr(header.c_str()), 0);
    const quo::MissionXml xml{safe.annotation().string()};
    double line_off = 0.0, sample_off = 0.0, ground_off_m = 0.0;
    for (const auto& tie : xml.root().list("geolocationGrid/geolocationGridPointList", "geolocationGridPoint")) {
        double xyz[3], found[3], azimuth_s = 0.0, range_s = 0.0, line[2], sample = 0.0;
        const double stated_line = tie.number("line"), stated_sample = tie.number("pixel");
        quo::store(quo::from_geodetic({tie.number("latitude"), tie.number("longitude"), tie.number("height")}),
                   xyz);
        ASSERT_EQ(product.orbit.earth2sat(xyz, &azimuth_s, &range_s), 0);
        ASSERT_EQ(grid.timePixels({1, &azimuth_s, &range_s}, {&line[0], &line[1], &sample}), 0);
        line_off = std::max(line_off, std::fmin(std::abs(line[0] - stated_line), std::abs(line[1] - stated_line)));
        sample_off = std::max(sample_off, std::abs(sample - stated_sample));
        ASSERT_EQ(grid.pixelTimes({1, &stated_line, &stated_sample}, {&azimuth_s, &range_s}), 0);
        GrPtGeometry at{};
        ASSERT_EQ(product.orbit.SVGetGeometry(azimuth_s, range_s, 0.0, tie.number("height"), &at), 0);
        for (int i = 0; i < 3; ++i) found[i] = at.point_m[i] - xyz[i];
        ground_off_m = std::max(ground_off_m, std::hypot(found[0], found[1], found[2]));
    }
    // Tie points at the image's corners, on the ellipsoid: of the first line near, of the last one far.
    const geoCoords_Obj& corners = product.geoCoords;
    const struct {
        const geopoint& found;
        double latitude_deg, longitude_deg;
    } kCorners[] = {
        {truth.grd ? corners.NorthEast : corners.SouthWest, truth.grd ? 42.37675280764677 : 40.94730650708858,
         truth.grd ? 15.32209672548896 : 11.09455829575940},
        {truth.grd ? corners.SouthWest : corners.SouthEast, truth.grd ? 41.28078026909404 : 41.10414993861531,
         truth.grd ? 11.86800305333565 : 12.20787230443543}};
    for (const auto& [found, latitude_deg, longitude_deg] : kCorners) {
        EXPECT_NEAR(found.Latitude, latitude_deg, 1e-6);
        EXPECT_NEAR(found.Longitude, longitude_deg, 1e-6);
    }
    EXPECT_LT(line_off, truth.most_line);
    EXPECT_LT(sample_off, truth.most_sample);
    EXPECT_LT(ground_off_m, truth.most_ground_m);
}
INSTANTIATE_TEST_SUITE_P(Real, Sentinel1Products,
                         testing::Values(Truth{kSlc, false, 15, 0.001, 0.001, 0.05},
                                         Truth{kGrd, true, 20, 0.001, 0.012, 0.15}),
                         [](const auto& test) { return std::string{test.param.grd ? "Grd" : "Slc"}; });

// The line after the last one is a place for tie points, too, and in no burst: one of them used to cost the
// others.
TEST(Sentinel1, DoesWithoutTiePointsInNoBurst) {
    const test::Report report;
    const test::TemporaryFolder folder;
    Safe safe{folder, kSlc};
    safe.change("<line>3002<", "<line>4503<");
    const auto made = described(safe);
    EXPECT_EQ(made->ties.count, 10);
    EXPECT_LT(made->ties.most_line, 0.001);
}

// One wrong tie point of 15 used to move the whole image by its share.
TEST(Sentinel1, TakesTheDelayFromTheMostTiePoints) {
    const test::Report report;
    const test::TemporaryFolder folder;
    Safe safe{folder, kSlc};
    const auto whole = described(safe);
    std::string text = test::read_text(safe.annotation());
    text.replace(text.find("<latitude>", text.find("<geolocationGridPoint>")) + 10, 6, "4.0957");  // a kilometre
    test::write_text(safe.annotation(), text);
    const auto made = described(safe);
    EXPECT_TRUE(made->ties.count == 14 && made->ties.stated == 15);
    EXPECT_NEAR(made->grid.DelayReference_s, whole->grid.DelayReference_s, 2e-6);
}

// Times that contradict each other would place the image somewhere else.
TEST(Sentinel1, RefusesBurstsThatContradictTheImage) {
    const test::Report report;
    constexpr struct {
        const char *from, *to, *message;
    } kChanges[] = {
        {"azimuthTime>2022-01-04T17:06:01.027146", "azimuthTime>2022-01-04T17:05:51.027146", "not in order"},
        {"azimuthTime>2022-01-04T17:06:03.785702", "azimuthTime>2022-01-04T17:07:03.785702",
         "first and last line"},
        {"<productLastLineUtcTime>2022-01-04T17:06:06", "<productLastLineUtcTime>2022-01-04T17:06:15",
         "last line"},
        {"azimuthTime>2022-01-04T17:06:01.027146", "azimuthTime>2022-01-04T17:06:01.127146",
         "of 15 tie points are"},
        {"<polarisation>VV", "<polarisation>XX", "the polarization XX is none"},
        {"<pass>Ascending", "<pass>Descending", "the pass DESCENDING is not that of the state vectors"},
        {"<missionId>S1A", "<missionId>S1Z", "the mission S1Z is not Sentinel-1"},
    };
    for (const auto& [from, to, message] : kChanges) {
        const test::TemporaryFolder folder;
        Safe safe{folder, kSlc};
        safe.change(from, to);
        try {
            (void)described(safe);
            ADD_FAILURE() << from;
        } catch (const quo::MissionRefusal& refusal) {
            EXPECT_NE(std::string{refusal.what()}.find(message), std::string::npos) << refusal.what();
        }
    }
}

// The tie points are of the annotation's own orbit: another one must not change what they tell of the delay.
TEST(Sentinel1, KeepsTheDelayUnderAnotherOrbit) {
    const test::Report report;
    const test::TemporaryFolder folder;
    const Safe safe{folder, kSlc};
    const auto own = described(safe), other = described(safe, orbit_beside(safe, folder, 90.0));
    EXPECT_EQ(own->grid.DelayShare, 0.5);
    EXPECT_EQ(own->grid.DelayReference_s, other->grid.DelayReference_s);
    EXPECT_NE(own->header.orbit.pSV_m[0], other->header.orbit.pSV_m[0]);
}

TEST(Sentinel1, TakesFmRatesInTheirOlderForm) {
    const test::Report report;
    const test::TemporaryFolder folder;
    const Safe safe{folder, kSlc};
    const auto newer = described(safe);
    const std::regex list{"<azimuthFmRatePolynomial[^>]*>(\\S+) (\\S+) (\\S+)</azimuthFmRatePolynomial>"};
    test::write_text(safe.annotation(), std::regex_replace(test::read_text(safe.annotation()), list,
                                                           "<c0>$1</c0><c1>$2</c1><c2>$3</c2>"));
    const auto older = described(safe);
    const polySAR &now = newer->header.polynomials, &then = older->header.polynomials;
    ASSERT_EQ(now.nfr, then.nfr);
    ASSERT_EQ(test::read_text(safe.annotation()).find("azimuthFmRatePolynomial"), std::string::npos);
    EXPECT_LT(now.FR[0].pol[0], -2000.0);
    for (int i = 0; i < now.nfr; ++i) EXPECT_TRUE(std::ranges::equal(now.FR[i].pol, then.FR[i].pol)) << i;
}

// --- Modes ------------------------------------------------------------------------------------------------------

struct Mode {
    const char *name, *safe, *mode, *swath, *file;
    bool bursts;
    const char* acquisition;
    int order;
};
class Modes : public testing::TestWithParam<Mode> {};

// The real annotations, brought to what other modes have: no bursts and an annotation for every vignette or beam,
// or five swaths. The lines of bursts lie 1342 apart, so that an image of their time without bursts has them
// there.
TEST_P(Modes, AreTakenOverByWhatTheAnnotationHas) {
    const test::Report report;
    const test::TemporaryFolder folder;
    const Mode mode = GetParam();
    const bool grd = mode.safe == kGrd;
    Safe safe{folder, mode.safe};
    safe.change("<mode>IW<", "<mode>" + std::string{mode.mode} + "<");
    safe.change("<swath>IW", "<swath>" + std::string{mode.swath});
    safe.rename("iw", mode.file);
    safe.change(grd ? "<numberOfSamples>26102<" : "<numberOfSamples>22694<", "<numberOfSamples>30<");
    if (!grd && !mode.bursts) {
        const std::string text = test::read_text(safe.annotation());
        const auto bursts = text.find("<burstList"), rest = text.find("</burstList>");
        test::write_text(safe.annotation(), text.substr(0, bursts) + "<burstList count=\"0\"/>" +
                                                text.substr(rest + std::strlen("</burstList>")));
        safe.change("<linesPerBurst>1501<", "<linesPerBurst>0<");
        safe.change("<numberOfLines>4503<", "<numberOfLines>4185<");
        safe.change("<line>1501<", "<line>1342<");
        safe.change("<line>3002<", "<line>2684<");
    }
    if (grd) {
        const std::string text = test::read_text(safe.annotation());
        const auto first = text.find("<swathProcParams>"), next = text.find("<swathProcParams>", first + 1);
        safe.change("</swathProcParamsList>", text.substr(first, next - first) + text.substr(first, next - first) +
                                                  "</swathProcParamsList>");
    }
    const std::uint32_t lines = grd ? 16705 : mode.bursts ? 4503 : 4185;
    write_tiff(safe.measurement(), grd ? kDetected : kPlain, lines, 30, true);
    quo_import_result result{};
    ASSERT_EQ(import_safe(safe.path(), folder.file("scene"), result), 0) << result.message;
    EXPECT_EQ(result.ties.count, grd ? 20 : 15);
    EXPECT_LT(result.ties.most_line, 0.001);
    EXPECT_LT(result.ties.most_ground_m, 0.15);

    GeneralSAR product;
    ASSERT_EQ(product.GSread((folder.file("scene") + ".hdr").c_str()), 0);
    EXPECT_STREQ(product.dataSetInfo.AcquisitionMode, mode.acquisition);
    EXPECT_EQ(product.swathInfo.Bursts, mode.bursts ? 3 : 0);
    EXPECT_EQ(product.swathInfo.Order, mode.order);
    EXPECT_EQ(product.roi.Roi.Lines, grd ? 16705 : 4185);
    EXPECT_EQ(product.dataSetInfo.RangeBandwidth[4] > 0.0, grd);

    // A second annotation like it, such as the next vignette's, can only be told by its name.
    fs::copy(safe.annotation(),
             safe.annotation().parent_path() / test::replaced(safe.annotation().filename().string(), "00", "09"));
    EXPECT_EQ(import_safe(safe.path(), folder.file("scene"), result), 1);
    EXPECT_NE(std::string{result.message}.find("2 annotations of this swath and polarization; name one of them"),
              std::string::npos)
        << result.message;
    EXPECT_EQ(import_safe(safe.annotation().string(), folder.file("scene"), result), 0) << result.message;
}
INSTANTIATE_TEST_SUITE_P(Sentinel1, Modes,
                         testing::Values(Mode{"Stripmap", kSlc, "SM", "S", "s", false, "STRIPMAP", 1},
                                         Mode{"Vignette", kSlc, "WV", "WV", "wv", false, "STRIPMAP", 1},
                                         Mode{"ExtraWide", kSlc, "EW", "EW", "ew", true, "SCANSAR", 1},
                                         Mode{"ExtraWideDetected", kGrd, "EW", "EW", "ew", false, "SCANSAR",
                                              -999}),
                         [](const auto& test) { return std::string{test.param.name}; });

// --- Fields -----------------------------------------------------------------------------------------------------

TEST(Sentinel1, FillsTheHeadersFields) {
    const test::Report report;
    const test::TemporaryFolder folder;
    Safe safe{folder, kSlc};
    safe.shrink(false);
    write_tiff(safe.measurement(), kPlain, 40, 30, true);
    quo_import_result result{};
    const std::string header = folder.file("scene") + ".hdr";
    ASSERT_EQ(import_safe(safe.path() + "/manifest.safe", folder.file("scene"), result), 0) << result.message;
    quo_product* product = nullptr;
    ASSERT_EQ(quo_product_open(header.c_str(), nullptr, &product), 0);
    constexpr struct {
        const char* field;
        double value;
    } kNumbers[] = {
        {"SamplingConstants/fc_hz", 5.405000454334350e9},
        {"SamplingConstants/Baz_hz", 327.0},
        {"SamplingConstants/pri_s", 5.823674372819869e-4},
        {"Pulse/PulseLength", 5.240481033595628e-5},
        {"Pulse/PulseKRate", 1.078230321255894e12},
        {"SpectralWindows/RgMatchedFilterCoef", 0.75},
        {"SwathInfo/Rank", 9.0},
        {"SwathInfo/Swst_changes", 1.0},
        {"DataSetInfo/SceneHeading", -13.67718277152630},
        {"DataSetInfo/RO_REF", 8e5},
        {"StateVectorData/t0SV_s", 1167930296.781409},
        {"ROI/FastStartTime", 5.336535882737799e-3},
        {"ROI/SlowStartTime", 1167930358.268589},
        {"PolySAR/nfr", 4.0},
        {"PolySAR/DopplerRate-0/trg0_s", 5.336535882737799e-3},
        {"RasterInfo/CellType", SHORT_COMPLEX},
    };
    for (const auto& [field, value] : kNumbers) {
        double number = 0.0;
        EXPECT_EQ(quo_product_number(product, field, &number), 0) << field;
        EXPECT_NEAR(number, value, 1e-15 * std::abs(value)) << field;
    }
    constexpr struct {
        const char *field, *value;
    } kTexts[] = {{"DataSetInfo/OrbitNumber", "41314"},
                  {"DataSetInfo/Track", "117"},
                  {"DataSetInfo/SenseDate", "04-JAN-2022 17:05:58.268589"},
                  {"DataSetInfo/ProcessingSoftware", "Sentinel-1 IPF 003.40"},
                  {"DataSetInfo/Polarization", "V/V"},
                  {"DataSetInfo/Swath", "IW1"},
                  {"DataSetInfo/SensorName", "SENTINEL-1A"},
                  {"DataSetInfo/ImageType", "AZIMUTH FOCUSED"},
                  {"DataSetInfo/OrbitConfiguration", "ASCENDING"},
                  {"SpectralWindows/AzMatchedFilterType", "Hamming"}};
    for (const auto& [field, value] : kTexts) {
        char text[QUO_PRODUCT_TEXT_ROOM] = "";
        EXPECT_EQ(quo_product_text(product, field, text, sizeof text), 0) << field;
        EXPECT_STREQ(text, value) << field;
    }
    quo_product_close(product);

    AntennaPattern_Obj pattern;
    ASSERT_EQ(pattern.readhdr((folder.file("scene") + ".antenna.hdr").c_str()), 0);
    std::vector<float> samples(static_cast<std::size_t>(pattern.PatternSamples));
    ASSERT_EQ(pattern.getPatternArray(samples.data()), 0);
    EXPECT_EQ(samples.size(), 45U);
    EXPECT_NEAR(pattern.StartAngle, 27.16393, 1e-12);
    EXPECT_NEAR(samples[0], std::hypot(1.244056e+14, -1.123778e+14), 2e7);
}

// --- Measurements -----------------------------------------------------------------------------------------------

class Measurements : public testing::TestWithParam<Layout> {};

TEST_P(Measurements, GiveTheirSamplesWhateverTheLayout) {
    const test::Report report;
    const test::TemporaryFolder folder;
    const Layout layout = GetParam();
    const bool grd = layout.bits == 16;
    Safe safe{folder, grd ? kGrd : kSlc};
    safe.shrink(grd);
    write_tiff(safe.measurement(), layout, 40, 30, true);
    const bool plain = layout.compression == COMPRESSION_NONE && !layout.tiled;
    for (const bool link : {false, true}) {
        quo_import_result result{};
        const std::string raster = folder.file(link ? "linked" : "copied");
        ASSERT_EQ(import_safe(safe.annotation().string(), raster, result, nullptr, link),
                  link && (!plain || grd) ? 1 : 0)
            << result.message;
        EXPECT_EQ(fs::is_symlink(raster), link && plain && !grd);
        if (!fs::exists(raster)) {
            EXPECT_FALSE(fs::exists(raster + ".hdr"));
            EXPECT_FALSE(fs::exists(raster + ".antenna"));
            continue;
        }
        DataFile file;
        ASSERT_EQ(file.read_hdr(raster.c_str()), 0);
        std::vector<dcomplex> complex(40 * 30);
        std::vector<double> real(40 * 30);
        BufferIO block{&file, 0, 30, 0, 40, grd ? FLOAT64 : DOUBLE_COMPLEX};
        ASSERT_EQ(block.readbuffer(
                      grd ? reinterpret_cast<char*>(real.data()) : reinterpret_cast<char*>(complex.data()), 30),
                  0);
        for (std::uint32_t i = 0; i < 40 * 30; ++i) {
            const std::int16_t parts[] = {part_of(i / 30, i % 30, 0), part_of(i / 30, i % 30, 1)};
            if (grd)
                ASSERT_EQ(real[i], static_cast<std::uint16_t>(parts[0])) << i;
            else if (layout.bits == 64)
                ASSERT_EQ(complex[i], dcomplex(parts[0] + 0.5, parts[1] - 0.25)) << i;
            else
                ASSERT_EQ(complex[i], dcomplex(parts[0], parts[1])) << i;
        }
    }
}
INSTANTIATE_TEST_SUITE_P(
    Tiff, Measurements,
    testing::Values(kPlain, Layout{"Strips", 32, SAMPLEFORMAT_COMPLEXINT, COMPRESSION_NONE, false, false, 7},
                    Layout{"BigEndian", 32, SAMPLEFORMAT_COMPLEXINT, COMPRESSION_NONE, false, true, 1},
                    Layout{"Lzw", 32, SAMPLEFORMAT_COMPLEXINT, COMPRESSION_LZW, false, false, 16},
                    Layout{"TiledFloats", 64, SAMPLEFORMAT_COMPLEXIEEEFP, COMPRESSION_ADOBE_DEFLATE, true, false,
                           0},
                    Layout{"TiledBigEndianFloats", 64, SAMPLEFORMAT_COMPLEXIEEEFP, COMPRESSION_LZW, true, true, 0},
                    Layout{"DetectedStrips", 16, SAMPLEFORMAT_UINT, COMPRESSION_NONE, false, false, 1},
                    Layout{"DetectedTiles", 16, SAMPLEFORMAT_UINT, COMPRESSION_LZW, true, true, 0}),
    [](const auto& test) { return std::string{test.param.name}; });

// A strip of the whole image was unpacked at once, and its samples widened beside it.
TEST(Sentinel1, TakesLongStripsInParts) {
    const test::Report report;
    for (const bool packed : {false, true})
        for (const bool big_endian : {false, true}) {
            const test::TemporaryFolder folder;
            Safe safe{folder, kGrd};
            safe.change("<numberOfLines>16705<", "<numberOfLines>43<");
            write_tiff(
                safe.measurement(),
                {"", 16, SAMPLEFORMAT_UINT,
                 static_cast<std::uint16_t>(packed ? COMPRESSION_LZW : COMPRESSION_NONE), false, big_endian, 43},
                43, 26102, true);
            const std::string source = safe.path(), raster = folder.file("scene");
            int told = 0;
            quo_import_request request{};
            request.source = source.c_str();
            request.raster = raster.c_str();
            request.context = &told;
            request.progress = [](void* context, std::int64_t, std::int64_t) {
                ++*static_cast<int*>(context);
                return 0;
            };
            quo_import_result result{};
            ASSERT_EQ(quo_import_sentinel1(&request, &result), 0) << result.message;
            EXPECT_GE(told, 4);
            const std::string bytes = test::read_text(raster);
            std::vector<std::int32_t> values(std::size_t{43} * 26102);
            ASSERT_EQ(bytes.size(), values.size() * sizeof values[0]);
            std::memcpy(values.data(), bytes.data(), bytes.size());
            for (std::uint32_t i = 0; i < values.size(); ++i)
                ASSERT_EQ(values[i], static_cast<std::uint16_t>(part_of(i / 26102, i % 26102, 0))) << i;
        }
}

// --- Cuts and other samplings -----------------------------------------------------------------------------------

struct Cut {
    const char *name, *safe;
    int lines, samples;  // of the whole
    RasterDerivation how;
    int cut_lines, cut_samples, bursts;
};
class Cuts : public testing::TestWithParam<Cut> {};

TEST_P(Cuts, KeepTheTimesOfTheirPixels) {
    const test::Report report;
    const test::TemporaryFolder folder;
    const Cut cut = GetParam();
    const bool grd = cut.safe == kGrd;
    Safe safe{folder, cut.safe};
    safe.change(grd ? "<numberOfLines>16705<" : "<numberOfLines>4503<",
                "<numberOfLines>" + std::to_string(cut.lines) + "<");
    if (!grd) {
        safe.change("<numberOfSamples>22694<", "<numberOfSamples>" + std::to_string(cut.samples) + "<");
        safe.change("<linesPerBurst>1501<", "<linesPerBurst>4<");  // bursts of four lines, seconds apart
        safe.change_element("productLastLineUtcTime", "2022-01-04T17:06:03.791869");
    }
    Layout layout = kPlain;
    if (grd) layout = kDetected;
    write_tiff(safe.measurement(), layout, static_cast<std::uint32_t>(cut.lines),
               static_cast<std::uint32_t>(cut.samples), true);
    quo_import_result result{};
    const std::string whole = folder.file("whole.hdr"), part = folder.file("part");
    ASSERT_EQ(import_safe(safe.path(), folder.file("whole"), result), 0) << result.message;
    BufferFile raster{part.c_str()};
    raster.setLines(cut.cut_lines);
    raster.setSamples(cut.cut_samples);
    raster.setType(INT16);
    ASSERT_EQ(raster.create(), 0);
    const std::vector<short> zeros(static_cast<std::size_t>(cut.cut_lines * cut.cut_samples));
    raster.writebuffer(zeros.data(), 0, cut.cut_lines, 0, 0);
    ASSERT_EQ(commit_derived(raster, whole.c_str(), cut.how), 0);

    GeneralSAR product;
    ImageGrid_Obj of_whole, of_part;
    ASSERT_EQ(of_whole.readhdr(whole.c_str()), 0);
    ASSERT_EQ(of_part.readhdr((part + ".hdr").c_str()), 0);
    ASSERT_EQ(product.GSread((part + ".hdr").c_str()), 0);
    EXPECT_STREQ(product.dataSetInfo.SceneID, safe.annotation().stem().c_str());
    const ROI_Obj& region = product.roi.Roi;
    EXPECT_EQ(of_part.Bursts, cut.bursts);
    EXPECT_EQ(product.swathInfo.Bursts, cut.bursts);
    EXPECT_EQ(product.swathInfo.Lines_per_burst, cut.bursts > 0 ? 4 : 0);
    EXPECT_EQ(product.swathInfo.Acquisition_Start_Time, region.SlowStartTime);
    EXPECT_LE(product.spectralWindows.RgLookBandwidth, product.samplingConstants.frg_hz);
    EXPECT_LE(product.dataSetInfo.RangeBandwidth[0], product.samplingConstants.frg_hz);
    for (const double line : {0.0, cut.cut_lines - 1.0})
        for (const double sample : {0.0, cut.cut_samples - 1.0}) {
            const double there_line = cut.how.first_line + line * cut.how.line_step,
                         there_sample = cut.how.first_sample + sample * cut.how.sample_step;
            double here[2], there[2];
            ASSERT_EQ(of_part.pixelTimes({1, &line, &sample}, {&here[0], &here[1]}), 0);
            ASSERT_EQ(of_whole.pixelTimes({1, &there_line, &there_sample}, {&there[0], &there[1]}), 0);
            EXPECT_NEAR(here[0], there[0], 1e-9);
            EXPECT_NEAR(here[1], there[1], 1e-15);
            EXPECT_NEAR(region.FastStartTime + sample * region.FastTimeDelta, here[1], 1e-9);
            const double delay = of_part.DelayShare * (here[1] - of_part.DelayReference_s);
            if (line == 0.0)
                EXPECT_NEAR(region.SlowStartTime, here[0] - delay, 3e-7);
            else
                EXPECT_NEAR(region.SlowStartTime + (region.Lines - 1) * region.SlowTimeDelta, here[0] - delay,
                            2e-3);
        }
}
INSTANTIATE_TEST_SUITE_P(
    Sentinel1, Cuts,
    testing::Values(Cut{"Bursts", kSlc, 12, 300, {5.0, 100.0, 1.0, 1.0}, 6, 150, 2},
                    Cut{"WithinABurst", kSlc, 12, 300, {5.0, 0.0, 1.0, 1.0}, 2, 300, 0},
                    Cut{"FinerSamples", kSlc, 12, 300, {0.0, 0.0, 1.0, 0.5}, 12, 600, 3},
                    Cut{"CoarserSamples", kSlc, 12, 300, {0.0, 0.0, 1.0, 2.0}, 12, 150, 3},
                    Cut{"GroundRange", kGrd, 4, 26102, {1.0, 13000.0, 1.0, 1.0}, 2, 1000, 0},
                    Cut{"CoarserGround", kGrd, 4, 26102, {0.0, 6000.0, 2.0, 4.0}, 2, 5000, 0}),
    [](const auto& test) { return std::string{test.param.name}; });

TEST(CommitDerived, RefusesAndLeavesNothing) {
    const test::Report report;
    const test::TemporaryFolder folder;
    Safe safe{folder, kSlc};
    safe.change("<numberOfLines>4503<", "<numberOfLines>12<");
    safe.change("<numberOfSamples>22694<", "<numberOfSamples>30<");
    safe.change("<linesPerBurst>1501<", "<linesPerBurst>4<");
    safe.change_element("productLastLineUtcTime", "2022-01-04T17:06:03.791869");
    write_tiff(safe.measurement(), kPlain, 12, 30, true);
    quo_import_result result{};
    ASSERT_EQ(import_safe(safe.path(), folder.file("whole"), result), 0) << result.message;
    for (const RasterDerivation& how :
         {RasterDerivation{0.0, 0.0, 2.0, 1.0}, RasterDerivation{0.0, 0.0, 1.0, 0.0}}) {
        BufferFile raster{folder.file("part").c_str()};
        raster.setLines(1);
        raster.setSamples(1);
        raster.setType(INT16);
        ASSERT_EQ(raster.create(), 0);
        const short zero = 0;
        raster.writebuffer(&zero, 0, 1, 0, 0);
        EXPECT_EQ(commit_derived(raster, folder.file("whole.hdr").c_str(), how), 1);
        EXPECT_FALSE(fs::exists(folder.file("part")));
        EXPECT_FALSE(fs::exists(folder.file("part.hdr")));
    }
}

// --- What is refused --------------------------------------------------------------------------------------------

TEST(Sentinel1, RefusesWhatDoesNotFitAndLeavesNothing) {
    const test::Report report;
    constexpr struct {
        const char *from, *to, *message;
    } kChanges[] = {
        {"<productType>SLC<", "<productType>OCN<", "the product type OCN is neither SLC nor GRD"},
        {"<missionId>S1A<", "<missionId>ASA<", "the mission ASA is not Sentinel-1"},
        {"<rangeSamplingRate>", "<rangeSamplingTate>", "is no XML file that can be read"},
        {"rangeSamplingRate>", "rangeSamplingTate>", "no element productInformation/rangeSamplingRate"},
        {"<prf>", "<prf>", nullptr},
        {"<azimuthTimeInterval>2.", "<azimuthTimeInterval>-2.", "line and sample times make no image"},
        {"<numberOfLines>40<", "<numberOfLines>41<", "has 40 lines of 30 samples, the annotation says 41 of 30"},
        {"<slantRangeTime>5.3", "<slantRangeTime>5.x", "not a number"},
        {"<time>2022-01-04T17:04:56", "<time>2022-01-04T17:64:56", "not a time"},
        {"<orbit>", "<!DOCTYPE x><orbit>", "is no XML file that can be read"},
        {"<frame>Earth Fixed</frame>", "", nullptr},
        {"orbit>", "arc>", "its state vectors make no orbit"},
        {"azimuthFmRatePolynomial count=\"3\">", "azimuthFmRatePolynomial count=\"3\">1 2 3 ",
         "a polynomial with more terms than are known"},
        {"<slantRangeTime>5.3", "<slantRangeTime>0.3", ".xml: line 2: the orbit does not see the image's corners"},
    };
    for (const auto& [from, to, message] : kChanges) {
        const test::TemporaryFolder folder;
        Safe safe{folder, kSlc};
        safe.shrink(false);
        write_tiff(safe.measurement(), kPlain, 40, 30, true);
        if (std::string{from} != to) safe.change(from, to);
        quo_import_result result{};
        const int status = import_safe(safe.path(), folder.file("scene"), result);
        EXPECT_EQ(status == 0, message == nullptr) << from << ": " << result.message;
        if (message == nullptr) continue;
        EXPECT_NE(std::string{result.message}.find(message), std::string::npos) << result.message;
        EXPECT_EQ(std::string{result.message}.find('\n'), std::string::npos);
        EXPECT_EQ(std::distance(fs::directory_iterator{folder.path()}, {}), 1) << from;
    }
}

TEST(Sentinel1, NamesTheFileThatIsDamaged) {
    const test::Report report;
    const test::TemporaryFolder folder, other;
    Safe slc{folder, kSlc}, grd{other, kGrd};
    slc.shrink(false);
    write_tiff(slc.measurement(), {"", 32, SAMPLEFORMAT_COMPLEXINT, COMPRESSION_LZW, false, false, 16}, 40, 30,
               true);
    test::write_text(slc.measurement(), test::read_text(slc.measurement()).replace(8, 64, 64, '\xff'));
    quo_import_result result{};
    EXPECT_EQ(import_safe(slc.path(), folder.file("scene"), result), 4);
    fs::rename(slc.measurement(), folder.file("kept"));
    ASSERT_EQ(mkfifo(slc.measurement().c_str(), 0600), 0);  // nobody ever writes into it
    quo_import_result waiting{};
    EXPECT_EQ(import_safe(slc.path(), folder.file("scene"), waiting), 1);
    EXPECT_EQ(waiting.message, slc.measurement() + ": is no regular file");
    EXPECT_EQ(result.message, slc.measurement() + ": is cut short or damaged at line 0");
    // The system's cause, of the name that was asked for; libtiff's complaint, which names the file itself.
    fs::remove(slc.measurement());
    fs::rename(folder.file("kept"), slc.measurement());
    EXPECT_EQ(import_safe(slc.path(), folder.file("none/scene"), result), 9);
    EXPECT_EQ(result.message, folder.file("none/scene") + ": cannot be written: No such file or directory");
    test::write_text(slc.measurement(), "none");
    EXPECT_EQ(import_safe(slc.path(), folder.file("scene"), result), 1);
    EXPECT_EQ(std::string{result.message}.rfind(slc.measurement()), 0U) << result.message;
    grd.change("<numberOfSamples>26102<", "<numberOfSamples>1<");
    try {
        (void)described(grd);
        ADD_FAILURE() << "a conversion of one sample";
    } catch (const quo::MissionRefusal& refusal) {
        EXPECT_EQ(refusal.what(), grd.annotation().string() +
                                      ": line 2: the conversion between slant and ground range has no fit");
    }
}

TEST(Sentinel1, LeavesNothingOfAnOlderImportAndTellsItsBytes) {
    const test::Report report;
    const test::TemporaryFolder folder, other;
    Safe slc{folder, kSlc}, grd{other, kGrd};
    slc.shrink(false);
    grd.shrink(true);
    write_tiff(slc.measurement(), kPlain, 40, 30, true);
    write_tiff(grd.measurement(), kDetected, 40, 30, true);
    const std::string raster = folder.file("scene"), pattern = raster + ".antenna", source = grd.path();
    quo_import_result result{};
    ASSERT_EQ(import_safe(slc.path(), raster, result), 0) << result.message;
    EXPECT_TRUE(fs::exists(pattern) && fs::exists(pattern + ".hdr"));
    std::vector<std::int64_t> told;
    quo_import_request request{};
    request.source = source.c_str();
    request.raster = raster.c_str();
    request.context = &told;
    request.progress = [](void* context, std::int64_t done, std::int64_t all) {
        EXPECT_EQ(all, 40 * 30 * 4);
        static_cast<std::vector<std::int64_t>*>(context)->push_back(done);
        return 0;
    };
    ASSERT_EQ(quo_import_sentinel1(&request, &result), 0) << result.message;
    EXPECT_EQ(told, (std::vector<std::int64_t>{0, 40 * 30 * 4}));
    EXPECT_FALSE(fs::exists(pattern) || fs::exists(pattern + ".hdr"));
    test::write_text(pattern + ".hdr", "notes");  // somebody's own
    EXPECT_EQ(import_safe(grd.path(), raster, result), 0) << result.message;
    EXPECT_EQ(test::read_text(pattern + ".hdr"), "notes");
}

TEST(Sentinel1, NeverReplacesTheProductsOwnFiles) {
    const test::Report report;
    const test::TemporaryFolder folder;
    Safe safe{folder, kSlc};
    safe.shrink(false);
    write_tiff(safe.measurement(), kPlain, 40, 30, true);
    const std::string before = test::read_text(safe.measurement()), raster = folder.file("scene");
    quo_import_result result{};
    ASSERT_EQ(import_safe(safe.path(), raster, result, nullptr, true), 0) << result.message;
    EXPECT_EQ(import_safe(safe.path(), raster, result), 1);  // through the link that the first one left
    Safe other{folder, kGrd};
    other.shrink(true);
    write_tiff(other.measurement(), kDetected, 40, 30, true);
    EXPECT_EQ(import_safe(other.path(), raster, result), 1);  // nor another product
    fs::create_directory(folder.file("taken"));
    EXPECT_EQ(import_safe(safe.path(), folder.file("taken"), result, nullptr, true), 5);
    EXPECT_TRUE(fs::is_directory(folder.file("taken")));
    EXPECT_EQ(import_safe(safe.path(), safe.measurement(), result, nullptr, true), 1);
    EXPECT_EQ(import_safe(safe.path(), safe.measurement(), result), 1);
    EXPECT_EQ(import_safe(safe.path(), raster, result, nullptr, true), 0) << result.message;  // a link for a link
    EXPECT_EQ(test::read_text(safe.measurement()), before);
    EXPECT_EQ(import_safe(folder.file("scene.hdr"), raster, result), 1);  // no product
    fs::resize_file(safe.measurement(), before.size() - 700);
    EXPECT_NE(import_safe(safe.path(), folder.file("other"), result, nullptr, true), 0);
    EXPECT_FALSE(fs::exists(folder.file("other.hdr")));
}

TEST(Sentinel1, TakesAnOrbitFileThatFits) {
    const test::Report report;
    const test::TemporaryFolder folder, folder_of_own;
    Safe safe{folder, kSlc};
    safe.shrink(false);
    write_tiff(safe.measurement(), kPlain, 40, 30, true);
    quo_import_result result{};
    EXPECT_EQ(import_safe(safe.path(), folder.file("scene"), result, kOrbit), 1);
    EXPECT_NE(std::string{result.message}.find("does not cover the product"), std::string::npos) << result.message;
    // The day of the orbit file's vectors.
    safe.change("2022-01-04T17:0", "2023-08-23T14:1");
    for (const char* element : {"FirstLine", "LastLine"})
        safe.change_element(std::string{"product"} + element + "UtcTime", "2023-08-23T14:12:00.268589");
    ASSERT_EQ(import_safe(safe.path(), folder.file("scene"), result, kOrbit), 0) << result.message;
    GeneralSAROrbit orbit;
    ASSERT_EQ(orbit.readhdr((folder.file("scene") + ".hdr").c_str()), 0);
    EXPECT_EQ(orbit.nSV_n, 8);  // from 40 s before the image to 40 s after it
    EXPECT_EQ(orbit.t0SV_s, 1219414283.657814);
    EXPECT_EQ(orbit.dtSV_s, 10.0);
    // The annotation's own orbit, moved.
    Safe own{folder_of_own, kSlc};
    own.shrink(false);
    write_tiff(own.measurement(), kPlain, 40, 30, true);
    for (const auto& [off_m, status] : {std::pair{110.0, 1}, {90.0, 0}})
        EXPECT_EQ(
            import_safe(own.path(), folder.file("scene"), result, orbit_beside(own, folder_of_own, off_m).c_str()),
            status)
            << result.message;
    const test::TemporaryFolder other;
    const Safe grd{other, kGrd};
    write_tiff(grd.measurement(), {"", 16, SAMPLEFORMAT_UINT, COMPRESSION_LZW, true, false, 0}, 16705, 26102,
               false);
    EXPECT_EQ(import_safe(grd.path(), folder.file("other"), result, kOrbit), 1);
    EXPECT_NE(std::string{result.message}.find("is an orbit of Sentinel-1A, the product is of S1B"),
              std::string::npos)
        << result.message;
}

}  // namespace
