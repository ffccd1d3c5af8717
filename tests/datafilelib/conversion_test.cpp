// Every pair of cell type and memory type, in both byte orders, against the rules told one by one.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <optional>
#include <string>
#include <vector>

#include "quo_base/datafile.h"
#include "support/diagnostics.h"
#include "support/raster.h"

namespace {

constexpr int kLines = 3, kSamples = 701;  // more than one tile of the loops, and odd

bool complex_type(int type) { return type % 2 == 0; }
int part_size(int type) {
    constexpr int kSizes[] = {4, 4, 8, 8, 4, 4, 2, 2, 1, 1};
    return kSizes[type];
}
int size_of(int type) { return part_size(type) * (complex_type(type) ? 2 : 1); }

double part_at(const std::string& bytes, int type, std::size_t index) {
    const char* at = bytes.data() + index * static_cast<std::size_t>(part_size(type));
    const auto get = [at](auto value) {
        std::memcpy(&value, at, sizeof value);
        return static_cast<double>(value);
    };
    switch (type) {
        case FLOAT_COMPLEX:
        case FLOAT32:
            return get(float{});
        case DOUBLE_COMPLEX:
        case FLOAT64:
            return get(double{});
        case INT_COMPLEX:
        case INT32:
            return get(std::int32_t{});
        default:
            return get(std::int16_t{});
    }
}

/** File types that BufferIO converts to a memory type, besides the type itself. */
std::vector<int> sources_of(int memory) {
    switch (memory) {
        case FLOAT_COMPLEX:
            return {SHORT_COMPLEX, INT_COMPLEX, DOUBLE_COMPLEX, FLOAT32, FLOAT64, INT16, INT32};
        case FLOAT32:
            return {INT16, INT32, FLOAT64};
        case INT16:
            return {INT32};
        case INT32:
            return {INT16};
        case SHORT_COMPLEX:
            return {INT_COMPLEX};
        case INT_COMPLEX:
            return {SHORT_COMPLEX};
        case DOUBLE_COMPLEX:
            return {FLOAT_COMPLEX, SHORT_COMPLEX, INT_COMPLEX, FLOAT64};
        case FLOAT64:
            return {FLOAT32, INT16, INT32};
        default:
            return {};
    }
}
bool region_reads(int file, int memory) {
    if (file > INT16 || memory > INT16) return false;
    const std::vector<int> sources = sources_of(memory);
    return file == memory || std::ranges::find(sources, file) != sources.end();
}

class EveryPair : public testing::TestWithParam<int> {
protected:
    void describe(RasterDescription& raster, int type) const {
        raster.NrOfLinesPerImage = kLines;
        raster.NrOfPixelsPerLine = kSamples;
        raster.CellType = type;
        raster.ByteOrder = GetParam();
        raster.RowPrefix = 3;
    }
    test::Report report_;
};

TEST_P(EveryPair, IsReadByRegionsAsTold) {
    for (int type = 0; type <= 9; ++type) {
        DataFile file;
        describe(file, type);
        file.setFilename(report_.file("type" + std::to_string(type)).c_str());
        test::write_text(file.FileName, test::raster_bytes(file));
        for (int memory = 0; memory <= 9; ++memory) {
            SCOPED_TRACE(std::to_string(type) + " to " + std::to_string(memory));
            const auto size = static_cast<std::size_t>(kLines * kSamples * size_of(memory));
            std::string bytes(size, '\x55');
            const test::CapturedStderr silent;
            const int status = BufferIO{&file, 0, kSamples, 0, kLines, memory}.readbuffer(bytes.data(), kSamples);
            EXPECT_EQ(status, type > INT16 || memory > INT16 ? 1 : 0);
            if (!region_reads(type, memory)) {
                EXPECT_EQ(bytes, std::string(size, '\x55')) << "left untouched";
                continue;
            }
            const int parts = complex_type(memory) ? 2 : 1;
            for (int i = 0; i < kLines * kSamples * parts; ++i) {
                const int pixel = i / parts, part = i % parts;
                const double expected = part == 1 && !complex_type(type)
                                            ? 0.0
                                            : test::part_value(pixel / kSamples, pixel % kSamples, part);
                ASSERT_EQ(part_at(bytes, memory, static_cast<std::size_t>(i)), expected) << i;
            }
        }
    }
}

template <typename T>
constexpr int kMemoryType = -1;
template <>
constexpr int kMemoryType<float> = FLOAT32;
template <>
constexpr int kMemoryType<double> = FLOAT64;
template <>
constexpr int kMemoryType<int> = INT32;
template <>
constexpr int kMemoryType<short> = INT16;
template <>
constexpr int kMemoryType<fcomplex> = FLOAT_COMPLEX;
template <>
constexpr int kMemoryType<dcomplex> = DOUBLE_COMPLEX;

template <typename T>
T sample_value(int line, int sample) {
    if constexpr (requires(T value) { value.real(); }) {
        using Part = typename T::value_type;
        return {static_cast<Part>(test::part_value(line, sample, 0)),
                static_cast<Part>(test::part_value(line, sample, 1))};
    } else {
        return static_cast<T>(test::part_value(line, sample, 0));
    }
}

bool block_reads(int file, int memory) { return file <= INT16 && complex_type(file) == complex_type(memory); }
bool block_writes(int file, int memory) {
    if (memory == FLOAT_COMPLEX) return file == FLOAT_COMPLEX || file == INT_COMPLEX || file == SHORT_COMPLEX;
    if (memory == FLOAT64) return file == FLOAT64 || file == INT32 || file == INT16;
    return block_reads(file, memory);
}

template <typename T>
void check_blocks(int type, int order, const test::Report& report) {
    constexpr int kMemory = kMemoryType<T>;
    SCOPED_TRACE(std::to_string(type) + " and memory type " + std::to_string(kMemory));
    BufferFile file{report.file("block" + std::to_string(type)).c_str()};
    file.NrOfLinesPerImage = kLines;
    file.NrOfPixelsPerLine = kSamples;
    file.CellType = type;
    file.ByteOrder = order;
    file.RowPrefix = 3;
    char name[512];
    file.getFilename(name);
    const std::string content = test::raster_bytes(file);
    test::write_text(name, content);

    std::vector<T> values(kLines * kSamples, sample_value<T>(1000, 1000)), expected;
    const std::vector<T> untouched = values;
    for (int line = 0; line < kLines; ++line) {
        for (int sample = 0; sample < kSamples; ++sample) expected.push_back(sample_value<T>(line, sample));
    }
    file.open(BufferFile::READ);
    file.readbuffer(values.data(), 0, kLines, 0, 0);
    EXPECT_EQ(values, block_reads(type, kMemory) ? expected : untouched);
    file.close();

    if (type == FLOAT64 && kMemory == FLOAT_COMPLEX) return;  // has a test of its own
    std::string blank = content;
    std::ranges::replace_if(
        blank, [](char) { return true; }, '.');
    test::write_text(name, blank);
    file.open(BufferFile::READ_WRITE);
    file.writebuffer(expected.data(), 0, kLines, 0, kSamples);
    file.close();
    std::string written = blank;
    if (block_writes(type, kMemory)) {
        const std::size_t line = content.size() / kLines;
        for (std::size_t i = 0; i < kLines; ++i)
            written.replace(i * line + 3, line - 3, content, i * line + 3, line - 3);
    }
    EXPECT_TRUE(test::read_text(name) == written);
}

TEST_P(EveryPair, IsReadAndWrittenByBlocksAsTold) {
    for (int type = 0; type <= 9; ++type) {
        check_blocks<float>(type, GetParam(), report_);
        check_blocks<double>(type, GetParam(), report_);
        check_blocks<int>(type, GetParam(), report_);
        check_blocks<short>(type, GetParam(), report_);
        check_blocks<fcomplex>(type, GetParam(), report_);
        check_blocks<dcomplex>(type, GetParam(), report_);
    }
}

// What a region writes it must read back, for every pair that writes.
TEST_P(EveryPair, ComesBackFromWhatARegionWrote) {
    for (int type = 0; type <= INT16; ++type) {
        for (int memory = 0; memory <= INT16; ++memory) {
            SCOPED_TRACE(std::to_string(memory) + " into " + std::to_string(type));
            DataFile file;
            describe(file, type);
            file.setFilename(report_.file("written").c_str());
            ASSERT_EQ(file.open(1), 0);
            std::string bytes;
            for (int i = 0; i < kLines * kSamples; ++i) {
                for (int part = 0; part <= (complex_type(memory) ? 1 : 0); ++part) {
                    test::append_part(bytes, memory, test::part_value(i / kSamples, i % kSamples, part), false);
                }
            }
            const test::CapturedStderr silent;
            const int status = BufferIO{&file, 0, kSamples, 0, kLines, memory}.writebuffer(bytes.data(), kSamples);
            ASSERT_EQ(file.close(), 0);
            if (status != 0) {
                EXPECT_NE(complex_type(memory), complex_type(type)) << "only real and complex do not mix";
                continue;
            }
            std::string back(static_cast<std::size_t>(kLines * kSamples * size_of(type)), '\0');
            ASSERT_EQ((BufferIO{&file, 0, kSamples, 0, kLines, type}.readbuffer(back.data(), kSamples)), 0);
            ASSERT_EQ(file.close(), 0);
            const int parts = complex_type(type) ? 2 : 1;
            for (int i = 0; i < kLines * kSamples * parts; ++i) {
                const int pixel = i / parts, part = i % parts;
                const double expected = part == 1 && !complex_type(memory)
                                            ? 0.0
                                            : test::part_value(pixel / kSamples, pixel % kSamples, part);
                ASSERT_EQ(part_at(back, type, static_cast<std::size_t>(i)), expected) << i;
            }
        }
    }
}
INSTANTIATE_TEST_SUITE_P(Orders, EveryPair, testing::Values(0, 1),
                         [](const auto& row) { return row.param ? "BigEndian" : "LittleEndian"; });

struct RoundingRow {
    double value;
    int to_int, to_short;
};
constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr RoundingRow kRounding[] = {
    {2.5, 3, 3},
    {-2.5, -3, -3},
    {2.4999997, 2, 2},
    {0.49999997, 0, 0},
    {-0.5, -1, -1},
    {0.0, 0, 0},
    {32767.4, 32767, 32767},
    {32767.5, 32768, 32767},
    {-32768.5, -32769, -32768},
    {3e9, 2147483647, 32767},
    {-3e9, -2147483647 - 1, -32768},
    {1e300, 2147483647, 32767},
    {kInfinity, 2147483647, 32767},
    {-kInfinity, -2147483647 - 1, -32768},
    {std::numeric_limits<double>::quiet_NaN(), 0, 0},
};

TEST(BlockRounding, IsHalfAwayFromZeroHeldAtTheBounds) {
    const test::Report report;
    BufferFile file{report.file("doubles").c_str()};
    file.NrOfLinesPerImage = 1;
    file.NrOfPixelsPerLine = static_cast<int>(std::size(kRounding));
    file.CellType = FLOAT64;
    std::string content;
    for (const RoundingRow& row : kRounding) test::append_bytes(content, row.value, false);
    test::write_text(report.file("doubles"), content);
    file.open(BufferFile::READ);
    std::vector<int> ints(std::size(kRounding));
    std::vector<short> shorts(std::size(kRounding));
    file.readbuffer(ints.data(), 0, 1, 0, 0);
    file.readbuffer(shorts.data(), 0, 1, 0, 0);
    for (std::size_t i = 0; i < std::size(kRounding); ++i) {
        EXPECT_EQ(ints[i], kRounding[i].to_int) << kRounding[i].value;
        EXPECT_EQ(shorts[i], kRounding[i].to_short) << kRounding[i].value;
    }
}

// Single precision has bounds of its own: the largest float below 2^31, and halves that float still has.
TEST(BlockRounding, HoldsForFloatsToo) {
    const test::Report report;
    BufferFile file{report.file("floats").c_str()};
    const std::vector<float> values{2.5F,           -2.5F,         0.49999997F,
                                    8388607.5F,     2147483520.0F, 2147483648.0F,
                                    -2147483648.0F, -3e9F,         std::numeric_limits<float>::quiet_NaN(),
                                    32767.5F};
    file.NrOfLinesPerImage = 1;
    file.NrOfPixelsPerLine = static_cast<int>(values.size());
    file.CellType = FLOAT32;
    file.open(BufferFile::WRITE);
    file.writebuffer(values.data(), 0, 1, 0, 0);
    file.close();
    file.open(BufferFile::READ);
    std::vector<int> ints(values.size());
    file.readbuffer(ints.data(), 0, 1, 0, 0);
    const std::vector<int> expected{3, -3,   0, 8388608, 2147483520, 2147483520, -2147483647 - 1, -2147483647 - 1,
                                    0, 32768};
    EXPECT_EQ(ints, expected);
}

TEST(BlockWriting, OfComplexIntoFloat64TakesTwoDoublesASample) {
    const test::Report report;
    BufferFile file{report.file("pairs").c_str()};
    file.NrOfLinesPerImage = 2;
    file.NrOfPixelsPerLine = 7;
    file.CellType = FLOAT64;
    file.ByteOrder = 1;
    const std::vector<fcomplex> values{{1, 2}, {3, 4}, {5, 6}, {7, 8}, {9, 10}, {11, 12}};
    file.open(BufferFile::WRITE);
    file.writebuffer(values.data(), 0, 2, 0, 0);
    file.close();
    std::string expected;
    for (int i = 1; i <= 12; ++i) {
        test::append_bytes(expected, static_cast<double>(i), true);
        if (i == 6) expected.append(8, '\0');
    }
    EXPECT_EQ(test::read_text(report.file("pairs")), expected);
}

}  // namespace
