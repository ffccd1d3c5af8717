// The verbs on rasters, each against bytes made here.
#include "support/raster.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <cstring>
#include <filesystem>
#include <string>
#include <vector>

#include "tool.h"

namespace {

using testing::HasSubstr;
using testing::IsEmpty;

/** A folder with rasters of part_value(). */
class RasterVerbs : public testing::Test {
protected:
    // Writes raster and side file; returns the raster's name.
    std::string make(const char* name, int lines, int samples, int type, int order, int prefix = 0,
                     int offset = 0) {
        DataFile raster;
        raster.setFilename(folder_.file(name).c_str());
        raster.NrOfLinesPerImage = lines;
        raster.NrOfPixelsPerLine = samples;
        raster.CellType = type;
        raster.ByteOrder = order;
        raster.RowPrefix = prefix;
        raster.HeaderOffset = offset;
        test::write_text(raster.FileName, test::raster_bytes(raster));
        EXPECT_EQ(raster.write_hdr(), 0);
        return raster.FileName;
    }
    [[nodiscard]] std::vector<std::string> files() const {
        std::vector<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator{folder_.path()}) {
            names.push_back(entry.path().filename().string());
        }
        return names;
    }
    test::TemporaryFolder folder_;
};

TEST_F(RasterVerbs, ConvertCutsAndConverts) {
    const std::string in = make("in.raw", 40, 30, SHORT_COMPLEX, 1, 7, 100), out = folder_.file("out.raw");
    const test::Finished finished = test::quo(
        {"convert", in, out, "--type", "float_complex", "--order", "l", "--lines", "5:25", "--samples", ":11"});
    ASSERT_EQ(finished.exit_status, 0) << finished.err;
    EXPECT_THAT(finished.err, IsEmpty());
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

// Whatever the two types, the values arrive; prefixes are dropped.
TEST_F(RasterVerbs, ConvertKnowsEveryPairOfTypes) {
    constexpr const char* kNames[] = {"FLOAT_COMPLEX", "FLOAT32", "DOUBLE_COMPLEX", "FLOAT64",
                                      "INT32_COMPLEX", "INT32",   "SHORT_COMPLEX",  "INT16",
                                      "INT8_COMPLEX",  "INT8"};
    for (int from = 0; from <= 9; ++from) {
        const std::string in = make("in.raw", 3, 5, from, 1, 2);
        for (int to = 0; to <= 9; ++to) {
            SCOPED_TRACE(std::to_string(from) + " to " + std::to_string(to));
            const std::string out = folder_.file("out.raw");
            const test::Finished finished =
                test::quo({"convert", in, out, "--type", kNames[to], "--prefix", "drop", "--order", "m"});
            const bool possible = from == to || (from < 8 && to < 8 && (from % 2 == 1 || to % 2 == 0));
            ASSERT_EQ(finished.exit_status, possible ? 0 : 2) << finished.err;
            if (!possible) continue;
            std::string expected;
            for (int i = 0; i < 15; ++i) {
                for (int part = 0; part < (to % 2 == 0 ? 2 : 1); ++part) {
                    const bool zero = part == 1 && from % 2 == 1;
                    test::append_part(expected, to, zero ? 0.0 : test::part_value(i / 5, i % 5, part), true);
                }
            }
            EXPECT_TRUE(test::read_text(out) == expected);
        }
    }
}

struct BadRaster {
    const char* name;
    std::vector<std::string> arguments;  // IN and OUT stand for the files
    int exit_status;
    const char* message;
};
TEST_F(RasterVerbs, RefusalsNameFileAndCauseAndLeaveNothing) {
    const std::string in = make("in.raw", 4, 5, INT16, 0), short_one = make("short.raw", 4, 5, INT16, 0);
    std::filesystem::resize_file(short_one, 39);
    make("bad.raw", 4, 5, INT16, 0);
    test::write_text(folder_.file("bad.raw.hdr"), "[RasterInfo]\nCellType = INT99\n");
    const std::size_t before = files().size();
    const std::vector<BadRaster> rows = {
        {"Missing", {"convert", folder_.file("none.raw"), "OUT"}, 1, "none.raw"},
        {"TooShort", {"convert", short_one, "OUT"}, 1, "has 39 bytes, its description needs 40"},
        {"BadHeader", {"convert", folder_.file("bad.raw"), "OUT"}, 1, "no complete description"},
        {"BadLines", {"convert", in, "OUT", "--lines", "3:9"}, 2, "no part of 0:4"},
        {"BadType", {"convert", in, "OUT", "--type", "INT99"}, 2, "INT99"},
        {"FolderAsTarget", {"convert", in, folder_.path().string()}, 1, "no regular file"},
        {"NoSuchFolder", {"convert", in, folder_.file("no/out.raw")}, 1, "cannot be created"},
        {"Looks", {"quicklook", in, "OUT", "--looks", "0x3"}, 2, "--looks"},
        {"Decibels", {"quicklook", in, "OUT", "--db", "5:1"}, 2, "--db"},
        {"VrtOfNothing", {"vrt", folder_.file("none.raw")}, 1, "none.raw"},
    };
    for (const BadRaster& row : rows) {
        SCOPED_TRACE(row.name);
        std::vector<std::string> arguments = row.arguments;
        for (std::string& argument : arguments) {
            if (argument == "OUT") argument = folder_.file("out.raw");
        }
        const test::Finished finished = test::quo(arguments);
        EXPECT_EQ(finished.exit_status, row.exit_status);
        ASSERT_EQ(finished.messages().size(), 1U) << finished.err;
        EXPECT_THAT(finished.err, HasSubstr(row.message));
        EXPECT_EQ(files().size(), before) << "nothing is left behind";
    }
}

std::uint32_t big_endian(const std::string& bytes, std::size_t at) {
    std::uint32_t value = 0;
    for (std::size_t i = 0; i < 4; ++i) value = (value << 8U) | static_cast<unsigned char>(bytes.at(at + i));
    return value;
}

TEST_F(RasterVerbs, QuicklookHasTheSizeOfItsLooks) {
    const std::string in = make("in.raw", 40, 30, FLOAT32, 1), picture = folder_.file("picture.png");
    struct Row {
        std::vector<std::string> options;
        std::uint32_t width, height;
    };
    for (const Row& row : {Row{{}, 30, 40}, Row{{"--looks", "3x4"}, 7, 13}, Row{{"--width", "10"}, 10, 13},
                           Row{{"--looks", "1000x1000"}, 1, 1}, Row{{"--db", "-10:40"}, 30, 40}}) {
        std::vector<std::string> arguments{"quicklook", in, picture};
        arguments.insert(arguments.end(), row.options.begin(), row.options.end());
        const test::Finished finished = test::quo(arguments);
        ASSERT_EQ(finished.exit_status, 0) << finished.err;
        const std::string bytes = test::read_text(picture);
        ASSERT_EQ(bytes.substr(1, 3), "PNG");
        EXPECT_EQ(big_endian(bytes, 16), row.width);
        EXPECT_EQ(big_endian(bytes, 20), row.height);
    }
}

TEST_F(RasterVerbs, VrtTellsTheLayout) {
    make("a&b.raw", 4, 5, SHORT_COMPLEX, 1, 12, 1000);
    ASSERT_EQ(test::quo({"vrt", folder_.file("a&b.raw")}).exit_status, 0);
    const std::string text = test::read_text(folder_.file("a&b.raw.vrt"));
    for (const char* part :
         {"rasterXSize=\"5\" rasterYSize=\"4\"", "dataType=\"CInt16\"",
          "<SourceFilename relativeToVRT=\"1\">a&amp;b.raw</SourceFilename>", "<ImageOffset>1012</ImageOffset>",
          "<PixelOffset>4</PixelOffset>", "<LineOffset>32</LineOffset>", "<ByteOrder>MSB</ByteOrder>"}) {
        EXPECT_THAT(text, HasSubstr(part));
    }
}

// GDAL, where it is installed, is the judge of the virtual rasters: it must see the very samples.
TEST_F(RasterVerbs, VrtIsReadByGdal) {
    if (std::system("gdal_translate --version > /dev/null 2>&1") != 0) GTEST_SKIP() << "GDAL is not installed";
    for (int type = 0; type <= 7; ++type) {
        SCOPED_TRACE(type);
        const std::string in = make("in.raw", 6, 5, type, type % 3 == 0 ? 0 : 1, 3 + type, 50),
                          out = folder_.file("out.bin");
        ASSERT_EQ(test::quo({"vrt", in}).exit_status, 0);
        const std::string command = "gdal_translate -q -of ENVI -ot " +
                                    std::string{type % 2 == 0 ? "CFloat64" : "Float64"} + " '" + in + ".vrt' '" +
                                    out + "' > /dev/null 2>&1";
        ASSERT_EQ(std::system(command.c_str()), 0);
        std::string expected;
        for (int i = 0; i < 30; ++i) {
            for (int part = 0; part < (type % 2 == 0 ? 2 : 1); ++part) {
                test::append_bytes(expected, test::part_value(i / 5, i % 5, part), false);
            }
        }
        EXPECT_TRUE(test::read_text(out) == expected);
    }
}

}  // namespace
