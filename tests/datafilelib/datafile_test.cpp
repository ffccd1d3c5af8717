#include "quo_base/datafile.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <climits>
#include <cstring>
#include <filesystem>
#include <numeric>
#include <string>
#include <vector>

#include "support/diagnostics.h"
#include "support/raster.h"

namespace {

void describe(RasterDescription& raster, int lines, int samples, int type, int order, int prefix, int64_t offset) {
    raster.NrOfLinesPerImage = lines;
    raster.NrOfPixelsPerLine = samples;
    raster.CellType = type;
    raster.ByteOrder = order;
    raster.RowPrefix = prefix;
    raster.HeaderOffset = offset;
}

TEST(DataFileHeader, ComesBackFromTheXmlForm) {
    const test::Report report;
    const std::string name = report.file("scene.raw");
    DataFile written, read;
    written.setFilename(name.c_str());
    describe(written, 17, 23, SHORT_COMPLEX, 1, 5, 1234);
    ASSERT_EQ(written.write_hdr(), 0);
    read.BufferSize = 100;
    ASSERT_EQ(read.read_hdr(name.c_str()), 0);
    EXPECT_STREQ(read.FileName, name.c_str());
    EXPECT_EQ(read.NrOfLinesPerImage, 17);
    EXPECT_EQ(read.NrOfPixelsPerLine, 23);
    EXPECT_EQ(read.CellType, SHORT_COMPLEX);
    EXPECT_EQ(read.ByteOrder, 1);
    EXPECT_EQ(read.RowPrefix, 5);
    EXPECT_EQ(read.HeaderOffset, 1234);
    EXPECT_EQ(read.BufferSize, 0);
    EXPECT_TRUE(report.entries().empty());

    written.HeaderOffset = int64_t{1} << 40;
    const test::CapturedStderr silent;
    EXPECT_EQ(written.write_hdr(), 1) << "the side file holds 32 bits";
}

struct ProfileHeader {
    const char *name, *type, *order;
    int status, code, big;
};
const ProfileHeader kProfileHeaders[] = {
    {"BigFloatComplex", "FLOAT_COMPLEX", "MSBFirst", 0, 0, 1},
    {"Float32", "FLOAT32", "LSBFirst", 0, 1, 0},
    {"DoubleComplex", "DOUBLE_COMPLEX", "MSBFirst", 0, 2, 1},
    {"Float64", "FLOAT64", "MSBFirst", 0, 3, 1},
    {"Int32", "INT32", "MSBFirst", 0, 5, 1},
    {"ShortComplex", "SHORT_COMPLEX", "MSBFirst", 0, 6, 1},
    {"Int16", "INT16", "MSBFirst", 0, 7, 1},
    {"Int8Complex", "INT8_COMPLEX", "MSBFirst", 0, 8, 1},
    {"Int8", "INT8", "MSBFirst", 0, 9, 1},
    {"LowerCaseOrder", "INT16", "msbfirst", 0, 7, 0},
    {"LowerCaseType", "int16", "MSBFirst", 1, -1, 1},
    {"Code", "4", "MSBFirst", 1, -1, 1},
};
class DataFileProfileHeader : public testing::TestWithParam<ProfileHeader> {};

TEST_P(DataFileProfileHeader, MapsNamesExactly) {
    const test::Report report;
    const test::CapturedStderr silent;
    const std::string name = report.file("scene.raw");
    test::write_text(name + ".hdr",
                     std::string{"[RasterInfo]\nHeaderOffset = 7\nRowPrefix = 3\nNrOfPixelsPerLine = 1024\n"
                                 "NrOfLinesPerImage = 2048\nCellType = "} +
                         GetParam().type + "\nByteOrder = " + GetParam().order + "\n");
    DataFile file;
    EXPECT_EQ(file.read_hdr(name.c_str()), GetParam().status);
    EXPECT_EQ(file.CellType, GetParam().code);
    EXPECT_EQ(file.ByteOrder, GetParam().big);
    EXPECT_EQ(file.NrOfPixelsPerLine, 1024);
    EXPECT_EQ(file.HeaderOffset, 7);
}
INSTANTIATE_TEST_SUITE_P(Names, DataFileProfileHeader, testing::ValuesIn(kProfileHeaders),
                         [](const auto& row) { return row.param.name; });

TEST(DataFileHeader, MissingKeysFailAndKeepWhatWasFound) {
    const test::Report report;
    const test::CapturedStderr silent;
    const std::string name = report.file("scene.raw");
    test::write_text(name + ".hdr",
                     "[RasterInfo]\nNrOfPixelsPerLine = 1024\nCellType = INT16\nByteOrder = MSBFirst\n");
    DataFile file;
    EXPECT_EQ(file.read_hdr(name.c_str()), 1);
    EXPECT_EQ(file.NrOfPixelsPerLine, 1024);
    EXPECT_EQ(file.read_hdr(report.file("missing").c_str()), 1);
    EXPECT_EQ(file.read_hdr(std::string(600, 'x').c_str()), 1);
}

/** A raster of 60 bytes, 0, 1, 2, ..., and a file over it. */
class DataFileBytes : public testing::Test {
protected:
    DataFileBytes() {
        for (int i = 0; i < 60; ++i) content_ += static_cast<char>(i);
        test::write_text(name_, content_);
        file_.setFilename(name_.c_str());
    }
    void open(int mode, int buffer) {
        file_.BufferSize = buffer;
        ASSERT_EQ(file_.open(mode), 0);
    }
    // The next n bytes start with `first`.
    void expect_bytes(int first, int n) {
        std::string bytes(static_cast<std::size_t>(n), '\0');
        ASSERT_EQ(file_.read(bytes.data(), n), 0);
        EXPECT_EQ(bytes, content_.substr(static_cast<std::size_t>(first), static_cast<std::size_t>(n)));
    }
    test::Report report_;
    std::string name_ = report_.file("bytes.raw"), content_;
    DataFile file_;
};

TEST_F(DataFileBytes, AreReadInOrderWithAnyBuffer) {
    for (const int buffer : {0, 1, 7, 16, 60, 100}) {
        SCOPED_TRACE(buffer);
        open(0, buffer);
        EXPECT_EQ(file_.is_buffered(), buffer > 0 ? 1 : 0);
        int place = 0;
        for (const int n : {1, 3, 0, 20, 7, 2, 27}) {
            expect_bytes(place, n);
            place += n;
            EXPECT_EQ(file_.tell(), place);
        }
        const test::CapturedStderr silent;
        char more = 0;
        EXPECT_EQ(file_.read(&more, 1), 4);
        EXPECT_EQ(file_.close(), 0);
        EXPECT_EQ(file_.BufferSize, 0) << "a closed file is unbuffered";
    }
}

TEST_F(DataFileBytes, UnbufferedSeeksFromStartAndPlace) {
    open(0, 0);
    EXPECT_EQ(file_.seek(10, 0), 0);
    expect_bytes(10, 5);
    EXPECT_EQ(file_.seek(-3, 1), 0);
    expect_bytes(12, 2);
    const test::CapturedStderr silent;
    EXPECT_EQ(file_.seek(0, 2), 1);
    EXPECT_EQ(file_.seek(-100, 1), 1);
    EXPECT_EQ(file_.tell(), 14);
    EXPECT_EQ(file_.seek(int64_t{1} << 40, 0), 0);
    EXPECT_EQ(file_.tell(), int64_t{1} << 40);
}

TEST_F(DataFileBytes, BufferedReadingSeeksAsTold) {
    open(0, 16);
    expect_bytes(0, 4);  // buffer 0..15, cursor 4
    EXPECT_EQ(file_.seek(3, 1), 0);
    expect_bytes(7, 1);
    EXPECT_EQ(file_.seek(2, 0), 0);  // within
    expect_bytes(2, 2);
    EXPECT_EQ(file_.seek(40, 0), 0);  // outside: the buffer starts there
    EXPECT_EQ(file_.tell(), 40);
    expect_bytes(40, 3);
    // Outside by a relative step: measured from the buffer's start at 40, not from the cursor at 43.
    EXPECT_EQ(file_.seek(-5, 1), 0);
    expect_bytes(35, 2);
    const test::CapturedStderr silent;
    EXPECT_EQ(file_.seek(0, 3), 1);
    EXPECT_EQ(file_.seek(-1000, 1), 1);
}

TEST_F(DataFileBytes, BufferedWritingReachesTheFile) {
    for (const int mode : {1, 2}) {
        for (const int buffer : {0, 1, 7, 64}) {
            SCOPED_TRACE(buffer);
            test::write_text(name_, content_);
            open(mode, buffer);
            EXPECT_EQ(file_.is_writing(), 1);
            std::string written;
            for (const int n : {1, 3, 0, 20, 7, 2}) {
                const std::string piece(static_cast<std::size_t>(n), static_cast<char>('A' + n));
                ASSERT_EQ(file_.write(piece.data(), n), 0);
                written += piece;
                EXPECT_EQ(file_.tell(), static_cast<int64_t>(written.size()));
            }
            ASSERT_EQ(file_.close(), 0);
            const std::string rest = mode == 1 ? "" : content_.substr(written.size());
            EXPECT_EQ(test::read_text(name_), written + rest);
        }
    }
}

TEST_F(DataFileBytes, BufferedWritingSeeksRelativeForEitherWhence) {
    open(2, 16);
    ASSERT_EQ(file_.write("AB", 2), 0);
    ASSERT_EQ(file_.seek(10, 0), 0);
    EXPECT_EQ(file_.tell(), 10);
    ASSERT_EQ(file_.write("CD", 2), 0);
    ASSERT_EQ(file_.seek(10, 0), 0);
    EXPECT_EQ(file_.tell(), 20);
    ASSERT_EQ(file_.close(), 0);
    std::string expected = content_;
    expected.replace(0, 2, "AB").replace(10, 2, "CD");
    EXPECT_EQ(test::read_text(name_), expected);
}

TEST_F(DataFileBytes, ReadingAndWritingDropsAPendingBufferOnClose) {
    open(3, 16);
    EXPECT_EQ(file_.is_writing(), 2);
    ASSERT_EQ(file_.write("AB", 2), 0);
    ASSERT_EQ(file_.close(), 0);
    EXPECT_EQ(test::read_text(name_), content_);
}

TEST_F(DataFileBytes, WrongStatesAreRefused) {
    const test::CapturedStderr silent;
    char byte = 0;
    EXPECT_EQ(file_.read(&byte, 1), 1);
    EXPECT_EQ(file_.write(&byte, 1), 1);
    EXPECT_EQ(file_.seek(1, 0), 1);
    EXPECT_EQ(file_.close(), 0);
    EXPECT_EQ(file_.open(7), 0);
    EXPECT_EQ(file_.open(-1), 0);
    EXPECT_EQ(file_.is_open(), 0);
    open(0, 0);
    EXPECT_EQ(file_.write(&byte, 1), 1);
    EXPECT_EQ(file_.read(&byte, -1), 1);
    open(2, 0);
    EXPECT_EQ(file_.read(&byte, 1), 1);
    EXPECT_EQ(test::read_text(name_), content_);
}

TEST_F(DataFileBytes, WhatCannotBeOpenedGivesNine) {
    const test::CapturedStderr silent;
    file_.setFilename(report_.file("missing").c_str());
    EXPECT_EQ(file_.exists(), 0);
    for (const int mode : {0, 2, 3}) EXPECT_EQ(file_.open(mode), 9);
    file_.setFilename(report_.folder().path().c_str());
    EXPECT_EQ(file_.open(0), 9) << "a folder is no raster";
    EXPECT_EQ(file_.exists(), 0);
    for (const std::string& message : report_.messages("ERROR")) {
        EXPECT_THAT(message, testing::AnyOf("File not opened!", std::string{std::strerror(ENOENT)},
                                            std::string{std::strerror(EISDIR)}));
    }
}

TEST_F(DataFileBytes, AFullDiskGivesFive) {
    const test::CapturedStderr silent;
    for (const int buffer : {0, 8}) {
        DataFile full;
        full.setFilename("/dev/full");
        full.BufferSize = buffer;
        ASSERT_EQ(full.open(2), 0);
        const char bytes[20] = {};
        EXPECT_EQ(full.write(bytes, 20), 5);
    }
    EXPECT_THAT(report_.messages("ERROR"), testing::Contains("File writing failed!"));
}

TEST_F(DataFileBytes, CopyAndCloneTakeTheDescription) {
    describe(file_, 4, 15, INT8, 0, 0, 0);
    const std::string other = report_.file("copy.raw");
    ASSERT_EQ(file_.copy(other.c_str()), 0);
    EXPECT_EQ(test::read_text(other), content_);
    DataFile read;
    ASSERT_EQ(read.read_hdr(other.c_str()), 0);
    EXPECT_EQ(read.NrOfPixelsPerLine, 15);
    DataFile cloned;
    EXPECT_EQ(cloned.clone(&file_), 0);
    EXPECT_STREQ(cloned.FileName, name_.c_str());
    EXPECT_EQ(cloned.NrOfLinesPerImage, 4);
    EXPECT_EQ(cloned.is_open(), 0);

    const test::CapturedStderr silent;
    EXPECT_EQ(file_.copy(other.c_str(), 0), 1);
    EXPECT_EQ(file_.copy(name_.c_str()), 1) << "onto itself";
    EXPECT_EQ(test::read_text(name_), content_);
    EXPECT_EQ(file_.copy(report_.file("no/copy.raw").c_str()), 9);
}

struct Hostile {
    const char* name;
    int lines, samples, type, prefix;
    int64_t offset;
    int status;
};
const Hostile kHostile[] = {
    {"NegativeLines", -1, 10, INT16, 0, 0, 1},
    {"NegativeSamples", 1, -10, INT16, 0, 0, 1},
    {"NegativePrefix", 1, 10, INT16, -4, 0, 1},
    {"NegativeOffset", 1, 10, INT16, 0, -4, 1},
    {"UnknownType", 1, 10, 42, 0, 0, 1},
    {"MinusOneType", 1, 10, -1, 0, 0, 1},
    {"EightBit", 1, 10, INT8, 0, 0, 1},
    {"LongerThanTheFile", 2, 29, INT16, 3, 1, 4},
    {"Overflow32", INT_MAX, INT_MAX, INT16, 0, 0, 4},
    {"Overflow64", INT_MAX, INT_MAX, DOUBLE_COMPLEX, INT_MAX, LLONG_MAX - 5, 1},
};
class DataFileHostile : public testing::TestWithParam<Hostile> {};

// Read as a whole image, and nothing may be touched: the destination is one byte.
TEST_P(DataFileHostile, IsRefusedBeforeMemoryIsTaken) {
    const test::Report report;
    const test::CapturedStderr silent;
    const std::string name = report.file("hostile.raw");
    test::write_text(name, std::string(60, 'x'));
    const Hostile& row = GetParam();
    DataFile file;
    file.setFilename(name.c_str());
    describe(file, row.lines, row.samples, row.type, 0, row.prefix, row.offset);
    char untouched = 'u';
    BufferIO region{&file, 0, row.samples, 0, row.lines, row.type};
    EXPECT_EQ(region.readbuffer(&untouched, row.samples), row.status);
    EXPECT_EQ(untouched, 'u');
    EXPECT_FALSE(report.entries("ERROR").empty());
    if (row.status == 1 && row.type != INT8) {
        EXPECT_EQ(file.rasterSize(), -1);
    }
}
INSTANTIATE_TEST_SUITE_P(Descriptions, DataFileHostile, testing::ValuesIn(kHostile),
                         [](const auto& row) { return row.param.name; });

/** Every layout of prefix and header, as DataFile regions see it. */
struct Layout {
    const char* name;
    int prefix;
    int64_t offset;
    int buffer;
};
constexpr Layout kLayouts[] = {{"Plain", 0, 0, 0},   {"Prefix", 5, 0, 0},         {"Header", 0, 13, 0},
                               {"Both", 17, 101, 0}, {"LargePrefix", 6000, 7, 0}, {"Buffered", 5, 13, 64}};
class Regions : public testing::TestWithParam<Layout> {
protected:
    Regions() {
        describe(file_, 9, 21, INT16, 1, GetParam().prefix, GetParam().offset);
        file_.setFilename(report_.file("region.raw").c_str());
        bytes_ = test::raster_bytes(file_);
        test::write_text(file_.FileName, bytes_);
        file_.BufferSize = GetParam().buffer;
    }
    [[nodiscard]] std::size_t offset(int line, int sample) const {
        return static_cast<std::size_t>(file_.HeaderOffset + line * (21 * 2 + file_.RowPrefix) + file_.RowPrefix +
                                        sample * 2);
    }
    test::Report report_;
    DataFile file_;
    std::string bytes_;
};

TEST_P(Regions, AreCutOutWithAnyRowWidth) {
    for (const int width : {8, 11}) {
        std::vector<float> values(static_cast<std::size_t>(4 * width), -99.0F);
        BufferIO region{&file_, 6, 8, 3, 4, FLOAT32};
        ASSERT_EQ(region.readbuffer(reinterpret_cast<char*>(values.data()), width), 0);
        for (int line = 0; line < 4; ++line) {
            for (int sample = 0; sample < width; ++sample) {
                const double expected = sample < 8 ? test::part_value(line + 3, sample + 6, 0) : -99.0;
                EXPECT_EQ(static_cast<double>(values[static_cast<std::size_t>(line * width + sample)]), expected);
            }
        }
        EXPECT_EQ(file_.tell(), static_cast<int64_t>(offset(7, 0)) - file_.RowPrefix) << "the line after";
    }
    const test::CapturedStderr silent;
    char untouched = 'u';
    EXPECT_EQ((BufferIO{&file_, 6, 8, 3, 4, FLOAT32}.readbuffer(&untouched, 7)), 1);
    EXPECT_EQ((BufferIO{&file_, 14, 8, 3, 4, FLOAT32}.readbuffer(&untouched, 8)), 1);
    EXPECT_EQ((BufferIO{&file_, -1, 8, 3, 4, FLOAT32}.readbuffer(&untouched, 8)), 1);
    EXPECT_EQ((BufferIO{&file_, 0, 8, 8, 2, FLOAT32}.readbuffer(&untouched, 8)), 4);
    EXPECT_EQ(untouched, 'u');
}

TEST_P(Regions, AreWrittenIntoTheirPlaceOnly) {
    ASSERT_EQ(file_.open(3), 0);
    std::vector<float> values(4 * 11);
    std::iota(values.begin(), values.end(), 1000.0F);
    BufferIO region{&file_, 6, 8, 3, 4, FLOAT32};
    ASSERT_EQ(region.writebuffer(reinterpret_cast<const char*>(values.data()), 11), 0);
    ASSERT_EQ(file_.close(), 0);
    std::string expected = bytes_;
    for (int line = 0; line < 4; ++line) {
        std::string row;
        for (int sample = 0; sample < 8; ++sample) {
            test::append_part(row, INT16,
                              static_cast<double>(values[static_cast<std::size_t>(line * 11 + sample)]), true);
        }
        expected.replace(offset(line + 3, 6), row.size(), row);
    }
    EXPECT_EQ(test::read_text(file_.FileName), expected);
}

TEST_P(Regions, HavePrefixesOfTheirOwn) {
    const auto size = static_cast<std::size_t>(3 * file_.RowPrefix);
    std::string prefixes(size, '\0'), expected;
    BufferIO region{&file_, 0, 21, 2, 3, INT16};
    ASSERT_EQ(region.readprefix(prefixes.data()), 0);
    for (int line = 2; line < 5; ++line) {
        expected += bytes_.substr(offset(line, 0) - static_cast<std::size_t>(file_.RowPrefix),
                                  static_cast<std::size_t>(file_.RowPrefix));
    }
    EXPECT_EQ(prefixes, expected);

    ASSERT_EQ(file_.open(2), 0);
    const std::string marks(size, '#');
    ASSERT_EQ(region.writeprefix(marks.data()), 0);
    ASSERT_EQ(file_.close(), 0);
    std::string written = bytes_;
    for (int line = 2; line < 5; ++line) {
        written.replace(offset(line, 0) - static_cast<std::size_t>(file_.RowPrefix),
                        static_cast<std::size_t>(file_.RowPrefix), static_cast<std::size_t>(file_.RowPrefix), '#');
    }
    EXPECT_EQ(test::read_text(file_.FileName), written);
}
INSTANTIATE_TEST_SUITE_P(Layouts, Regions, testing::ValuesIn(kLayouts),
                         [](const auto& row) { return row.param.name; });

TEST(BufferIORegions, NeedTheRightState) {
    const test::Report report;
    const test::CapturedStderr silent;
    DataFile file;
    describe(file, 2, 3, INT16, 0, 0, 0);
    file.setFilename(report.file("state.raw").c_str());
    char bytes[12] = {};
    BufferIO region{&file, 0, 3, 0, 2, INT16};
    EXPECT_EQ(region.readbuffer(bytes, 3), 9);
    EXPECT_EQ(region.writebuffer(bytes, 3), 1);
    EXPECT_EQ(region.writeprefix(bytes), 1);
    ASSERT_EQ(file.open(1), 0);
    EXPECT_EQ(region.writebuffer(bytes, 3), 0);
    EXPECT_EQ(region.readbuffer(bytes, 3), 1);
    EXPECT_EQ((BufferIO{&file, 0, 3, 0, 2, FLOAT_COMPLEX}.writebuffer(bytes, 3)), 1) << "complex into real";
}

// The last line of 6 GB takes no more memory than itself, and the hole stays a hole.
TEST(BufferIORegions, ReachBeyondFourGigabytes) {
    const test::Report report;
    DataFile file;
    describe(file, 110000, 8000, FLOAT_COMPLEX, 0, 64, 1000);
    file.setFilename(report.file("sparse.raw").c_str());
    test::write_text(file.FileName, "");
    ASSERT_GT(file.rasterSize(), int64_t{6} << 30);
    std::filesystem::resize_file(file.FileName, static_cast<std::uintmax_t>(file.rasterSize()));
    ASSERT_EQ(file.open(3), 0);
    std::vector<fcomplex> line(8000), back(8000);
    for (std::size_t i = 0; i < line.size(); ++i) line[i] = {static_cast<float>(i), -1.0F};
    BufferIO region{&file, 0, 8000, 109999, 1, FLOAT_COMPLEX};
    ASSERT_EQ(region.writebuffer(reinterpret_cast<const char*>(line.data()), 8000), 0);
    ASSERT_EQ(region.readbuffer(reinterpret_cast<char*>(back.data()), 8000), 0);
    EXPECT_EQ(back, line);
    struct stat status {};
    ASSERT_EQ(stat(file.FileName, &status), 0);
    EXPECT_EQ(status.st_size, file.rasterSize());
    EXPECT_LT(status.st_blocks * 512, 1 << 20);
}

}  // namespace
