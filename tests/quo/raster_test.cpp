// The verbs on rasters, each against bytes made here.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <png.h>

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <vector>

#include "raster_folder.h"

namespace {

using RasterVerbs = test::RasterFolder;

TEST_F(RasterVerbs, ConvertCutsAndConverts) {
    const std::string in = make("in.raw", 40, 30, SHORT_COMPLEX, 1, 7, 100), out = file("out.raw");
    const test::Finished finished = test::quo(
        {"convert", in, out, "--type", "float_complex", "--order", "l", "--lines", "5:25", "--samples", ":11"});
    ASSERT_EQ(finished.exit_status, 0) << finished.err;
    EXPECT_EQ(finished.err, "");
    DataFile read;
    ASSERT_EQ(read.read_hdr(out.c_str()), 0);
    EXPECT_EQ(read.NrOfLinesPerImage, 20);
    EXPECT_EQ(read.NrOfPixelsPerLine, 11);
    EXPECT_EQ(read.CellType, FLOAT_COMPLEX);
    EXPECT_EQ(read.ByteOrder, 0);
    EXPECT_EQ(read.RowPrefix, 7);
    EXPECT_EQ(read.HeaderOffset, 0);
    std::string expected;
    for (int line = 5; line < 25; ++line) {
        for (int i = 0; i < 7; ++i) expected += static_cast<char>('a' + (line + i) % 26);
        for (int sample = 0; sample < 11; ++sample) {
            for (int part = 0; part < 2; ++part) {
                test::append_part(expected, FLOAT_COMPLEX, test::part_value(line, sample, part), false);
            }
        }
    }
    EXPECT_TRUE(test::read_text(out) == expected);
}

// The tool itself widens and narrows samples of 8 bits; the other types are the library's. Prefixes are dropped.
TEST_F(RasterVerbs, ConvertKnowsSamplesOfEightBits) {
    constexpr const char* kNames[] = {"FLOAT_COMPLEX", "FLOAT32", "DOUBLE_COMPLEX", "FLOAT64",
                                      "INT32_COMPLEX", "INT32",   "SHORT_COMPLEX",  "INT16",
                                      "INT8_COMPLEX",  "INT8"};
    for (int pair = 0; pair < 100; ++pair) {
        const int from = pair / 10, to = pair % 10;
        if ((from < INT8_COMPLEX && to < INT8_COMPLEX) || (from % 2 == 0 && to % 2 == 1)) continue;
        SCOPED_TRACE(std::string{kNames[from]} + " to " + kNames[to]);
        const std::string in = make("in.raw", 3, 5, from, 1, 2), out = file("out.raw");
        const test::Finished finished =
            test::quo({"convert", in, out, "--type", kNames[to], "--prefix", "drop", "--order", "m"});
        ASSERT_EQ(finished.exit_status, 0) << finished.err;
        std::string expected;
        for (int i = 0; i < 15; ++i) {
            for (int part = 0; part <= 1 - to % 2; ++part) {
                const bool zero = part == 1 && from % 2 == 1;
                test::append_part(expected, to, zero ? 0.0 : test::part_value(i / 5, i % 5, part), true);
            }
        }
        EXPECT_TRUE(test::read_text(out) == expected);
    }
}

struct Narrowing {
    int from;
    std::vector<std::string> options;
    std::string expected;  // INT8, or pairs of it
    const char* said;      // after the name
};
// What does not fit is held at the bounds, what is no number becomes 0: once, without a word.
TEST_F(RasterVerbs, ConvertTellsWhatNarrowTypesCannotHold) {
    const std::vector<double> values = {2.5, -2.5, 127.4, 127.5, -128.4, -1e9, std::nan(""), INFINITY};
    const Narrowing rows[] = {
        {FLOAT32,
         {"--type", "INT8"},
         {3, -3, 127, 127, -128, -128, 0, 127},
         ": clipped to the bounds of INT8: 3 of 8 samples\n: no number, written as 0: 1 of 8 samples\n"},
        {FLOAT64,
         {"--type", "INT8", "--scale", "0.5", "--offset", "-64"},
         {-63, -65, 0, 0, -128, -128, 0, 127},  // -62.75, -65.25, -0.3, -0.25, -128.2
         ": clipped to the bounds of INT8: 2 of 8 samples\n: no number, written as 0: 1 of 8 samples\n"},
        {FLOAT_COMPLEX,  // 2.5 - 2.5i, 127.4 + 127.5i, -128.4 - 1e9i, nan + inf i
         {"--type", "INT8_COMPLEX"},
         {3, -3, 127, 127, -128, -128, 0, 127},
         ": clipped to the bounds of INT8_COMPLEX: 2 of 4 samples\n: no number, written as 0: 1 of 4 samples\n"},
        {DOUBLE_COMPLEX,  // the offset moves the real part
         {"--type", "INT8_COMPLEX", "--offset", "1", "--samples", ":2"},
         {4, -3, 127, 127},  // 3.5 - 2.5i, 128.4 + 127.5i
         ": clipped to the bounds of INT8_COMPLEX: 1 of 2 samples\n"},
        {FLOAT32, {"--type", "INT8", "--samples", ":3"}, {3, -3, 127}, ""},
    };
    for (const Narrowing& row : rows) {
        SCOPED_TRACE(testing::PrintToString(row.options));
        std::string bytes;
        for (const double value : values) test::append_part(bytes, row.from, value, false);
        const int samples = row.from % 2 == 0 ? 4 : 8;
        const std::string in = make("in.raw", 1, samples, row.from, 0), out = file("out.raw");
        test::write_text(in, bytes);
        std::vector<std::string> arguments{"convert", in, out};
        arguments.insert(arguments.end(), row.options.begin(), row.options.end());
        test::Finished finished = test::quo(arguments);
        ASSERT_EQ(finished.exit_status, 0) << finished.err;
        EXPECT_EQ(test::read_text(out), row.expected);
        const std::string name = "quo: " + out;
        for (auto at = finished.err.find(name); at != std::string::npos; at = finished.err.find(name))
            finished.err.erase(at, name.size());
        EXPECT_EQ(finished.err, row.said);
    }
}

// 1 + 2^-30 times 2^30, less 2^30: the scaling is done in double precision, also where both types are narrower.
TEST_F(RasterVerbs, ConvertScalesInDoublePrecision) {
    for (const int to : {FLOAT32, FLOAT_COMPLEX}) {
        SCOPED_TRACE(to);
        std::string bytes, expected;
        test::append_part(bytes, FLOAT64, 1.0 + 0x1p-30, false);
        test::append_part(expected, to, 1.0, false);
        if (to == FLOAT_COMPLEX) test::append_part(expected, to, 0.0, false);
        const std::string in = make("in.raw", 1, 1, FLOAT64, 0), out = file("out.raw");
        test::write_text(in, bytes);
        const test::Finished finished =
            test::quo({"convert", in, out, "--type", to == FLOAT32 ? "FLOAT32" : "FLOAT_COMPLEX", "--scale",
                       "1073741824", "--offset", "-1073741824"});
        ASSERT_EQ(finished.exit_status, 0) << finished.err;
        EXPECT_EQ(test::read_text(out), expected);
    }
}

/** A grey picture as its file shows it. */
struct Grey {
    explicit Grey(const std::string& name) {
        png_image image{};
        image.version = PNG_IMAGE_VERSION;
        if (png_image_begin_read_from_file(&image, name.c_str()) == 0) throw std::runtime_error{image.message};
        EXPECT_EQ(image.format, static_cast<png_uint_32>(PNG_FORMAT_GRAY));
        pixels.resize(PNG_IMAGE_SIZE(image));
        width = image.width;
        height = image.height;
        png_image_finish_read(&image, nullptr, pixels.data(), 0, nullptr);
    }
    std::size_t width = 0, height = 0;
    std::vector<unsigned char> pixels;
};

TEST_F(RasterVerbs, QuicklookHasTheSizeOfItsLooks) {
    const std::string in = make("in.raw", 40, 30, FLOAT32, 1), picture = file("picture.png");
    struct Row {
        std::vector<std::string> options;
        std::size_t width, height;
    };
    for (const Row& row : {Row{{}, 30, 40}, Row{{"--looks", "3x4"}, 7, 13}, Row{{"--width", "10"}, 10, 13},
                           Row{{"--looks", "1000x1000"}, 1, 1}}) {
        std::vector<std::string> arguments{"quicklook", in, picture};
        arguments.insert(arguments.end(), row.options.begin(), row.options.end());
        const test::Finished finished = test::quo(arguments);
        ASSERT_EQ(finished.exit_status, 0) << finished.err;
        const Grey grey{picture};
        EXPECT_EQ(grey.width, row.width);
        EXPECT_EQ(grey.height, row.height);
        EXPECT_NE(std::ranges::min(grey.pixels),
                  std::ranges::max(grey.pixels) + (grey.pixels.size() == 1 ? 1 : 0));
    }
}

// 10 log10 of the mean power of the looks, 0 to 51 dB over 0 to 255: 5 a dB.
TEST_F(RasterVerbs, QuicklookShowsThePowerInDecibels) {
    const float not_a_number = std::nanf("");
    const std::vector<float> parts = {
        10, 0, 0, 10, 0,    100, 30,           -40,  // 20 dB and 40 dB; 34 dB in the second pair
        1,  0, 0, 0,  1e9F, 0,   not_a_number, 1};
    std::string bytes;
    for (const float part : parts) test::append_bytes(bytes, part, true);
    const std::string in = make("in.raw", 2, 4, FLOAT_COMPLEX, 1), picture = file("picture.png");
    test::write_text(in, bytes);
    const auto grey = [&](const char* looks) {
        EXPECT_EQ(test::quo({"quicklook", in, picture, "--db", "0:51", "--looks", looks}).exit_status, 0);
        return Grey{picture}.pixels;
    };
    EXPECT_THAT(grey("1x1"), testing::ElementsAre(100, 100, 200, 170, 0, 0, 255, 0));
    EXPECT_THAT(grey("1x2"), testing::ElementsAre(100, 190, 0, 255));  // 10 log10(6250) = 37.96
    EXPECT_THAT(grey("2x2"), testing::ElementsAre(85, 255));           // 10 log10(201 / 4) = 17.01
}

// GDAL is the judge of the virtual rasters: it must see the very samples. It has no type of signed bytes
// before 3.7, only their mark, so that their bytes are compared.
TEST_F(RasterVerbs, VrtIsReadByGdal) {
    if (std::system("gdal_translate --version > /dev/null 2>&1") != 0) GTEST_SKIP() << "GDAL is not installed";
    for (const int type : {0, 1, 2, 3, 4, 5, 6, 7, 9}) {
        SCOPED_TRACE(type);
        const std::string in = make("a&b.raw", 6, 5, type, type % 3 == 0 ? 0 : 1, 3 + type, 50),
                          out = file("out.bin");
        ASSERT_EQ(test::quo({"vrt", in}).exit_status, 0);
        const std::string same = type == INT8 ? "" : (type % 2 == 0 ? "-ot CFloat64 " : "-ot Float64 ");
        const std::string command =
            "gdal_translate -q -of ENVI " + same + "'" + in + ".vrt' '" + out + "' > /dev/null 2>&1";
        ASSERT_EQ(std::system(command.c_str()), 0);
        std::string expected;
        for (int i = 0; i < 30; ++i) {
            for (int part = 0; part < (type % 2 == 0 ? 2 : 1); ++part) {
                test::append_part(expected, type == INT8 ? INT8 : FLOAT64, test::part_value(i / 5, i % 5, part),
                                  false);
            }
        }
        EXPECT_TRUE(test::read_text(out) == expected);
    }
}

}  // namespace
