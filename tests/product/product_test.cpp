// SPDX-License-Identifier: Apache-2.0
#include "quo_base/product.h"

#include "objects/records.h"
#include "quo_base/image_grid.h"
#include "support/diagnostics.h"
#include "support/raster.h"
#include "support/scenes.h"

namespace {

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr test::Scene kScene = test::kScenes[2];  // looks left, at a wavelength that is not the default

struct Close {
    void operator()(quo_product* product) const { EXPECT_EQ(quo_product_close(product), 0); }
};
using Product = std::unique_ptr<quo_product, Close>;
Product open_product(const std::string& header, const char* raster = nullptr) {
    quo_product* product = nullptr;
    EXPECT_EQ(quo_product_open(header.c_str(), raster, &product), 0);
    return Product{product};
}

// ---- values

/** Compares a field with the container's element. */
void expect_same(const quo_product* product, const std::string& field, parElement element) {
    const auto expected = test::values_of(element);
    const bool is_text = element.type == parElement::typeString;
    double numbers[400], number = kNaN;
    char text[QUO_PRODUCT_TEXT_ROOM];
    std::size_t length = 0;
    EXPECT_EQ(quo_product_length(product, field.c_str(), &length), 0);
    EXPECT_EQ(length, expected.size());
    EXPECT_EQ(quo_product_numbers(product, field.c_str(), numbers, 400), is_text ? 1 : 0);
    EXPECT_EQ(quo_product_text(product, field.c_str(), text, sizeof text), is_text ? 0 : 1);
    element.pointer = is_text ? static_cast<void*>(text) : numbers;
    if (!is_text) element.type = parElement::typeDouble;
    EXPECT_EQ(test::values_of(element), expected) << field;
    EXPECT_EQ(quo_product_number(product, field.c_str(), &number), is_text || length != 1 ? 1 : 0);
    EXPECT_TRUE(std::isnan(number) || number == numbers[0]) << field;
}

TEST(Product, TellsEveryValueOfEveryObject) {
    const test::Report report;
    const test::CapturedStderr refusals;
    const std::string header = report.file("whole.hdr");
    GeneralSAR whole, read;
    test::fill_product(whole);
    ASSERT_EQ(whole.GSwrite(header.c_str()), 0);
    ASSERT_EQ(read.GSread(header.c_str()), 0);
    ImageGrid_Obj grid;
    grid.LineStep_s = 0.0017;
    grid.FirstSample_s = 0.0053;
    grid.SampleStep_s = 1.7e-8;
    grid.LinesPerBurst = 7;
    grid.Bursts = 3;
    ASSERT_EQ(grid.createBuffers(), 0);
    grid.BurstStart_s = {0.25, 0.375, 0.625};
    ASSERT_EQ(grid.writehdr(header.c_str()), 0);
    const Product product = open_product(header);
    int fields = 0;
    const auto expect_all = [&](const GeneralSAR_BaseXML& object, const std::string& within = "") {
        for (int i = 0; i < object.elementCount(); ++i, ++fields)
            expect_same(product.get(), object.element(i)->section + ("/" + within) + object.element(i)->name,
                        *object.element(i));
    };
    for (int object = gsRoi; object < GeneralSAR::kObjects; ++object)
        expect_all(*read.GSelements(static_cast<GSObject>(object)));
    expect_all(grid);
    EXPECT_GT(fields, 90);
    for (int i = 0; i < 2; ++i) {
        expect_all(read.polynomials.DC[static_cast<std::size_t>(i)], "DopplerCentroid-" + std::to_string(i) + "/");
        expect_all(read.polynomials.SL2PHI[static_cast<std::size_t>(i)], "SlantToPhi-" + std::to_string(i) + "/");
    }
    double number = 2.5;
    for (const char* none :
         {"", "/", "Pulse", "Pulse/", "Pulse/PulseLengt", "PulsePulseLength", "pulse/PulseLength", "PolySAR/pol",
          "PolySAR/DopplerCentroid-2/trg0_s", "PolySAR/DopplerCentroid-00/trg0_s", "PolySAR/DopplerCentroid-0",
          "PolySAR/DopplerCentroid/trg0_s", "PolySAR/DopplerCentroid--1/trg0_s", "PolySAR//trg0_s"})
        EXPECT_EQ(quo_product_number(product.get(), none, &number), 1) << none;
    EXPECT_EQ(number, 2.5);
}

// ---- geolocation

constexpr std::size_t kCount = 17;
using Rows = double[10][kCount];

TEST(Product, GeolocatesAsItsOrbitDoes) {
    GeneralSAR read;
    ASSERT_EQ(read.GSread(kScene.path(".xml").c_str()), 0);
    const Product product = open_product(kScene.path(".xml"));
    double t[kCount], range[kCount], doppler[kCount], height[kCount];
    for (std::size_t i = 0; i < kCount; ++i) {
        const auto step = static_cast<double>(i);
        t[i] = read.orbit.t0SV_s + read.orbit.dtSV_s * (2.0 + 0.37 * step);
        range[i] = i == 5 ? kNaN : 9.3e-5 + 1.7e-6 * step;
        doppler[i] = 3.3 * step - 17.3;
        height[i] = 240.5 + 11.3 * step;
    }
    Rows e, f;
    std::int32_t expected[kCount], found[kCount];
    ASSERT_EQ(read.orbit.sat2earth({kCount, t, range, doppler, height},
                                   {e[0], e[1], e[2], e[3], e[4], e[5], e[6], e[7], e[8], e[9], expected}),
              0);
    ASSERT_EQ(quo_product_to_ground(product.get(), kCount, t, range, doppler, height, f[0], f[1], f[2], f[3], f[4],
                                    f[5], f[6], f[7], f[8], f[9], found),
              0);
    EXPECT_EQ(std::memcmp(e, f, sizeof e), 0);
    EXPECT_EQ(std::to_array(found), std::to_array(expected));
    // Back, in both forms, and over the arrays that the points come from.
    ASSERT_EQ(quo_product_to_radar(product.get(), kCount, f[0], f[1], f[2], nullptr, nullptr, nullptr, doppler,
                                   f[1], f[2], nullptr),
              0);
    ASSERT_EQ(quo_product_to_radar(product.get(), kCount, nullptr, nullptr, nullptr, f[3], f[4], f[5], doppler,
                                   f[3], f[4], found),
              0);
    for (std::size_t i = 0; i < kCount; ++i) {
        EXPECT_EQ(found[i], i == 5 ? 1 : 0);
        for (const int form : {1, 3})
            EXPECT_TRUE(i == 5 ? std::isnan(f[form][i]) && std::isnan(f[form + 1][i])
                               : std::abs(f[form][i] - t[i]) < 1e-6 && std::abs(f[form + 1][i] - range[i]) < 1e-14)
                << i;
    }
}

/** Bursts that overlap by half in the place of the scene's region; what is asked of pixels is told of them, too.
 */
std::string header_of_bursts(const test::Report& report, const GeneralSAR& scene, ImageGrid_Obj& grid) {
    EXPECT_EQ(grid.setRegion(scene.roi.Roi), 0);
    grid.LinesPerBurst = 40;
    grid.Bursts = 3;
    EXPECT_EQ(grid.createBuffers(), 0);
    for (std::size_t i = 0; i < 3; ++i)
        grid.BurstStart_s[i] = grid.FirstLine_s + 20.0 * static_cast<double>(i) * grid.LineStep_s;
    const std::string header = report.file("bursts.xml");
    test::write_text(header, test::read_text(kScene.path(".xml")));
    grid.setExactNumbers(true);
    EXPECT_EQ(grid.writehdr(header.c_str()), 0);
    return header;
}

TEST(Product, PlacesPixelsAsGridAndOrbitDo) {
    const test::Report report;
    GeneralSAR scene;
    ImageGrid_Obj grid;
    ASSERT_EQ(scene.GSread(kScene.path(".xml").c_str()), 0);
    const Product product = open_product(header_of_bursts(report, scene, grid));
    // In the first burst alone, in both, in no burst, and no number.
    constexpr double kPlaces[4][2] = {{17.3, 5.5}, {27.25, 311.7}, {1000.0, 5.5}, {3.0, kNaN}};
    double line[4], sample[4], t[4], range[4], height[4], places[8][4], later[4], expected[2];
    std::int32_t status[4];
    for (std::size_t i = 0; i < 4; ++i) {
        line[i] = kPlaces[i][0];
        sample[i] = kPlaces[i][1];
        height[i] = 240.5 + 11.3 * static_cast<double>(i);
    }
    ASSERT_EQ(quo_product_pixels_to_times(product.get(), 4, line, sample, t, range, status), 0);
    EXPECT_EQ(std::to_array(status), (std::array{0, 0, 1, 1}));
    ASSERT_EQ(quo_product_pixels_to_ground(product.get(), 4, line, sample, height, places[0], places[1], places[2],
                                           places[3], places[4], places[5], places[6], places[7], status),
              0);
    EXPECT_EQ(std::to_array(status), (std::array{0, 0, 1, 1}));
    for (std::size_t i = 0; i < 2; ++i) {
        ASSERT_EQ(grid.pixelTimes({1, &line[i], &sample[i]}, {&expected[0], &expected[1]}), 0);
        EXPECT_EQ(t[i], expected[0]);
        EXPECT_EQ(range[i], expected[1]);
        GrPtGeometry seen{};
        ASSERT_EQ(scene.orbit.SVGetGeometry(t[i], range[i], 0.0, height[i], &seen), 0);
        const double values[] = {seen.latitude_deg, seen.longitude_deg, height[i],          seen.point_m[0],
                                 seen.point_m[1],   seen.point_m[2],    seen.incidence_deg, seen.look_deg};
        for (std::size_t k = 0; k < 8; ++k) EXPECT_NEAR(places[k][i], values[k], 1e-9 * std::abs(values[k]));
        EXPECT_TRUE(std::isnan(places[i][2]) && std::isnan(t[i + 2]));
    }
    // Back, over the arrays of the inputs: from times, and from the ground.
    const auto expect_back = [&](const double* found_line, const double* found_sample) {
        EXPECT_NEAR(found_line[0], 17.3, 1e-3);
        EXPECT_TRUE(std::isnan(later[0]));
        EXPECT_NEAR(found_line[1], 27.25, 1e-3);
        EXPECT_NEAR(later[1], 7.25 + 40.0, 1e-3);
        EXPECT_NEAR(found_sample[1], 311.7, 1e-3);
        EXPECT_TRUE(std::isnan(found_line[2]) && std::isnan(found_sample[3]));
        EXPECT_EQ(std::to_array(status), (std::array{0, 0, 1, 1}));
    };
    ASSERT_EQ(quo_product_times_to_pixels(product.get(), 4, t, range, t, later, range, status), 0);
    expect_back(t, range);
    ASSERT_EQ(quo_product_ground_to_pixels(product.get(), 4, nullptr, nullptr, nullptr, places[3], places[4],
                                           places[5], places[3], later, places[5], status),
              0);
    expect_back(places[3], places[5]);
    // On the other side of the Earth, and of the ground that the image shows.
    const double latitude[] = {0.0, 48.0}, longitude[] = {80.0, -97.4};
    ASSERT_EQ(quo_product_ground_to_pixels(product.get(), 2, latitude, longitude, nullptr, nullptr, nullptr,
                                           nullptr, line, nullptr, nullptr, status),
              0);
    EXPECT_EQ(status[0], 12);
    EXPECT_TRUE(std::isnan(line[0]) && std::isnan(line[1]));
}

// ---- the raster

constexpr int kLines = 6, kSamples = 9;

/** Writes a raster of part_value() with its side file. */
void write_raster(const std::string& name, int cell_type) {
    DataFile raster;
    raster.setFilename(name.c_str());
    raster.NrOfLinesPerImage = kLines;
    raster.NrOfPixelsPerLine = kSamples;
    raster.HeaderOffset = 7;
    raster.RowPrefix = 3;
    raster.ByteOrder = cell_type % 3 == 0 ? 1 : 0;
    raster.CellType = cell_type;
    test::write_text(name, test::raster_bytes(raster));
    EXPECT_EQ(raster.write_hdr(), 0);
}

TEST(Product, ReadsBlocksOfEveryTypeAsEveryOther) {
    const test::Report report;
    const test::CapturedStderr refusals;
    const std::string name = report.file("raster.raw");
    for (int file_type = 0; file_type < CELL_NOT_SET; ++file_type) {
        write_raster(name, file_type);
        const Product product = open_product(kScene.path(".xml"), name.c_str());
        for (int memory_type = 0; memory_type < CELL_NOT_SET; ++memory_type) {
            const bool into_complex = memory_type % 2 == 0, from_complex = file_type % 2 == 0;
            std::string expected = "x";  // the block begins at an odd address
            for (int line = 1; line < 5; ++line)
                for (int part = 0; part < (into_complex ? 10 : 5); ++part) {
                    const int sample = 2 + (into_complex ? part / 2 : part), second = into_complex ? part % 2 : 0;
                    const double value = second && !from_complex ? 0.0 : test::part_value(line, sample, second);
                    test::append_part(expected, memory_type, value, false);
                }
            std::string block(expected.size(), 'x');
            const bool offered = into_complex || !from_complex;
            EXPECT_EQ(quo_product_read(product.get(), 1, 4, 2, 5, memory_type, block.data() + 1, block.size() - 1),
                      offered ? 0 : 1);
            EXPECT_EQ(block, offered ? expected : std::string(expected.size(), 'x'))
                << file_type << " as " << memory_type;
        }
    }
}

TEST(Product, RoundsAndHoldsWhatIntegersCannotKeep) {
    const test::Report report;
    const std::string name = report.file("raster.raw");
    write_raster(name, FLOAT64);
    std::string bytes(7 + 3, ' ');  // the values stand in the first line
    for (const double value : {2.5, -2.5, 300.7, -1e300, kNaN, HUGE_VAL})
        test::append_part(bytes, FLOAT64, value, FLOAT64 % 3 == 0);
    test::write_text(name, bytes);
    std::array<std::int8_t, 6> block{};
    EXPECT_EQ(quo_product_read(open_product(kScene.path(".xml"), name.c_str()).get(), 0, 1, 0, 6, INT8, &block, 6),
              0);
    EXPECT_EQ(block, (std::array<std::int8_t, 6>{3, -3, 127, -128, 0, 127}));
}

// In the header itself, in a side file, or nowhere.
TEST(Product, FindsTheRasterThatItsHeaderDescribes) {
    const test::Report report;
    const test::CapturedStderr refusals;
    write_raster(report.file("scene"), INT16);
    for (const std::string name : {"scene.hdr", "scene.xml", "alone.xml"}) {
        if (name.ends_with("xml")) test::write_text(report.file(name), test::read_text(kScene.path(".xml")));
        const Product product = open_product(report.file(name));
        const bool there = name.starts_with("scene");
        std::int32_t lines = -1, samples = -1, type = -1;
        std::int8_t sample = 99;
        EXPECT_EQ(quo_product_raster(product.get(), &lines, &samples, &type), 0);
        EXPECT_EQ(std::tuple(lines, samples, type),
                  there ? std::tuple(kLines, kSamples, int{INT16}) : std::tuple(0, 0, int{CELL_NOT_SET}));
        EXPECT_EQ(quo_product_read(product.get(), 2, 1, 3, 1, INT8, &sample, 1), there ? 0 : 1);
        EXPECT_EQ(sample, there ? test::part_value(2, 3, 0) : 99) << name;
    }
}

// ---- refusals

constexpr const char *kNumber = "SamplingConstants/prf_hz", *kText = "DataSetInfo/SensorName",
                     *kArray = "StateVectorData/pSV_m";
constexpr double kOnes[8] = {1.0, 1.0, 1.0, 1.0, 1.0, 1.0, 1.0, 1.0};

/** What calls write to. */
struct Outputs {
    double numbers[40];
    char text[QUO_PRODUCT_TEXT_ROOM];
    std::int32_t lines;
    std::size_t length;
    quo_product* handle;
};
using P = const quo_product*;
using O = Outputs&;

int ground(P p, std::size_t count, const double* t, double* latitude, double* rate = nullptr) {
    return quo_product_to_ground(p, count, t, kOnes, nullptr, nullptr, latitude, nullptr, nullptr, nullptr,
                                 nullptr, nullptr, nullptr, nullptr, rate, nullptr, nullptr);
}
int radar(P p, const double* longitude, const double* doppler, double* t) {
    return quo_product_to_radar(p, 8, kOnes, longitude, nullptr, nullptr, nullptr, nullptr, doppler, t, nullptr,
                                nullptr);
}
int read(P p, int line, int lines, int sample, int samples, void* to, std::size_t room = 320) {
    return quo_product_read(p, line, lines, sample, samples, FLOAT64, to, room);
}

int pixels(P p, std::size_t count, const double* line, double* t) {
    return quo_product_pixels_to_times(p, count, line, kOnes, t, nullptr, nullptr);
}
int pixels_of(P p, const double* t, double* line) {
    return quo_product_times_to_pixels(p, 8, t, kOnes, line, nullptr, nullptr, nullptr);
}
int ground_of(P p, const double* line, double* latitude, double* longitude) {
    return quo_product_pixels_to_ground(p, 8, line, kOnes, nullptr, latitude, longitude, nullptr, nullptr, nullptr,
                                        nullptr, nullptr, nullptr, nullptr);
}
int pixels_seeing(P p, const double* longitude, double* line, double* sample) {
    return quo_product_ground_to_pixels(p, 8, kOnes, longitude, nullptr, nullptr, nullptr, nullptr, line, nullptr,
                                        sample, nullptr);
}

/** A call of each function that a product with a raster answers. */
constexpr int (*kCalls[])(P p, O o) = {
    [](auto p, O o) { return quo_product_length(p, kArray, &o.length); },
    [](auto p, O o) { return quo_product_number(p, kNumber, o.numbers); },
    [](auto p, O o) { return quo_product_numbers(p, kNumber, o.numbers, 1); },
    [](auto p, O o) { return quo_product_text(p, kText, o.text, std::strlen("UAVSAR") + 1); },
    [](auto p, O o) { return ground(p, 8, kOnes, o.numbers, o.numbers + 8); },
    [](auto p, O o) { return radar(p, kOnes, kOnes, o.numbers); },
    [](auto p, O o) { return pixels(p, 8, kOnes, o.numbers); },
    [](auto p, O o) { return pixels_of(p, kOnes, o.numbers); },
    [](auto p, O o) { return ground_of(p, kOnes, o.numbers, o.numbers + 8); },
    [](auto p, O o) { return pixels_seeing(p, kOnes, o.numbers, o.numbers + 8); },
    [](auto p, O o) { return quo_product_raster(p, &o.lines, nullptr, nullptr); },
    [](auto p, O o) { return read(p, 1, 2, 2, 3, o.numbers, 48); },
};

constexpr struct {
    const char* name;
    int status;
    int (*call)(P whole, P bare, O o);  ///< `bare` tells neither look side nor wavelength
} kRefusals[] = {
    {"open nothing", 1, [](P, P, O o) { return quo_product_open(nullptr, nullptr, &o.handle); }},
    {"open what is not there", 9,
     [](P, P, O o) { return quo_product_open("/none/scene.hdr", nullptr, &o.handle); }},
    {"open no header", 1,
     [](P, P, O o) { return quo_product_open(QUO_TEST_DATA "/faults/a.par", nullptr, &o.handle); }},
    {"open without the raster's description", 1,
     [](P, P, O o) { return quo_product_open(kScene.path(".xml").c_str(), "/none/raster", &o.handle); }},
    {"length of nothing", 1, [](P whole, P, O o) { return quo_product_length(whole, nullptr, &o.length); }},
    {"length into nothing", 1, [](P whole, P, O) { return quo_product_length(whole, kArray, nullptr); }},
    {"absent section", 1,
     [](P whole, P, O o) { return quo_product_length(whole, "Pulse/PulseLength", &o.length); }},
    {"number into nothing", 1, [](P whole, P, O) { return quo_product_number(whole, kNumber, nullptr); }},
    {"numbers into nothing", 1, [](P whole, P, O) { return quo_product_numbers(whole, kNumber, nullptr, 1); }},
    {"numbers without room", 1, [](P whole, P, O o) { return quo_product_numbers(whole, kNumber, o.numbers, 0); }},
    {"text into nothing", 1, [](P whole, P, O) { return quo_product_text(whole, kText, nullptr, 512); }},
    {"text without its end", 1, [](P whole, P, O o) { return quo_product_text(whole, kText, o.text, 6); }},
    {"times beyond memory", 1, [](P whole, P, O o) { return ground(whole, SIZE_MAX / 8, kOnes, o.numbers); }},
    {"times overlapping", 1, [](P whole, P, O o) { return ground(whole, 8, o.numbers, o.numbers + 1); }},
    {"no look side", 1, [](P, P bare, O o) { return ground(bare, 8, kOnes, o.numbers); }},
    {"points missing", 1, [](P whole, P, O o) { return radar(whole, nullptr, kOnes, o.numbers); }},
    {"no wavelength", 1, [](P, P bare, O o) { return radar(bare, kOnes, kOnes, o.numbers); }},
    {"pixels missing", 1, [](P whole, P, O o) { return pixels(whole, 8, nullptr, o.numbers); }},
    {"pixels beyond memory", 1, [](P whole, P, O o) { return pixels(whole, SIZE_MAX / 8, kOnes, o.numbers); }},
    {"pixels overlapping", 1, [](P whole, P, O o) { return pixels(whole, 8, o.numbers, o.numbers + 1); }},
    {"times of pixels missing", 1, [](P whole, P, O o) { return pixels_of(whole, nullptr, o.numbers); }},
    {"pixels onto pixels", 1, [](P whole, P, O o) { return ground_of(whole, kOnes, o.numbers, o.numbers + 7); }},
    {"pixels without a look side", 1, [](P, P bare, O o) { return ground_of(bare, kOnes, o.numbers, nullptr); }},
    {"points of pixels missing", 1,
     [](P whole, P, O o) { return pixels_seeing(whole, nullptr, o.numbers, nullptr); }},
    {"points over pixels", 1,
     [](P whole, P, O o) { return pixels_seeing(whole, kOnes, o.numbers, o.numbers + 3); }},
    {"block into nothing", 1, [](P whole, P, O) { return read(whole, 0, 1, 0, 1, nullptr); }},
    {"block without room", 1, [](P whole, P, O o) { return read(whole, 0, 2, 0, 3, o.numbers, 47); }},
    {"before the lines", 1, [](P whole, P, O o) { return read(whole, -1, 1, 0, 1, o.numbers); }},
    {"behind the lines", 1, [](P whole, P, O o) { return read(whole, kLines, 1, 0, 1, o.numbers); }},
    {"behind the samples", 1,
     [](P whole, P, O o) { return read(whole, 0, 1, 1, INT32_MAX, o.numbers, SIZE_MAX); }},
    {"behind the file", 4, [](P whole, P, O o) { return read(whole, 4, 1, 0, 1, o.numbers); }},
};

TEST(Product, RefusesWithNothingWrittenAndAnEntry) {
    const test::Report report;
    const test::CapturedStderr captured;
    const std::string scene = kScene.path(".xml"), raster = report.file("raster.raw");
    write_raster(raster, INT16);
    std::filesystem::resize_file(raster, 7 + 4 * (3 + 2 * kSamples) + 4);  // within the fifth line
    GeneralSAR made;
    EXPECT_EQ(made.GSread(scene.c_str()), 0);
    for (const GSObject object : {gsDataSetInfo, gsSamplingConstants}) made.GSdisable(object);
    made.GSwrite(report.file("bare.xml").c_str());
    const Product whole = open_product(scene, raster.c_str()), bare = open_product(report.file("bare.xml"));
    quo_product* closed = nullptr;
    closed = open_product(scene).get();
    errno = 0;

    Outputs outputs, before;
    std::memset(&before, 0x3f, sizeof before);
    const auto expect_refusal = [&](const std::string& name, int status, const auto& call) {
        const auto entries = report.text().size();
        std::memcpy(&outputs, &before, sizeof outputs);
        EXPECT_EQ(call(), status) << name;
        EXPECT_EQ(std::memcmp(&outputs, &before, sizeof outputs), 0) << name;
        EXPECT_GT(report.text().size(), entries) << name;
    };
    for (const auto& row : kRefusals)
        expect_refusal(row.name, row.status, [&] { return row.call(whole.get(), bare.get(), outputs); });
    for (quo_product* const none :
         {closed, reinterpret_cast<quo_product*>(&outputs), static_cast<quo_product*>(nullptr)}) {
        expect_refusal("close", 1, [&] { return quo_product_close(none); });
        for (const auto& call : kCalls) expect_refusal("call", 1, [&] { return call(none, outputs); });
    }
    for (const auto& call : kCalls) EXPECT_EQ(call(whole.get(), outputs), 0);

    // What needs nothing needs no array either; what is missing of the geometry is asked only where it counts; and
    // that a raster has gone is told when it is read.
    EXPECT_EQ(ground(whole.get(), 0, nullptr, nullptr), 0);
    EXPECT_EQ(pixels(whole.get(), 0, nullptr, nullptr), 0);
    EXPECT_EQ(read(whole.get(), kLines, 0, 0, kSamples, nullptr, 0), 0);
    EXPECT_EQ(read(whole.get(), 0, 1, kSamples, 0, nullptr, 0), 0);
    EXPECT_EQ(radar(bare.get(), kOnes, nullptr, outputs.numbers), 0);
    std::filesystem::remove(raster);
    expect_refusal("gone", 9, [&] { return read(whole.get(), 0, 1, 0, 1, outputs.numbers); });
}

}  // namespace
