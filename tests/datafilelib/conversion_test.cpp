// Every pair of cell type and memory type, in both byte orders, against the rules told one by one.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string>
#include <utility>
#include <vector>

#include "quo_base/datafile.h"
#include "support/diagnostics.h"
#include "support/raster.h"

namespace {

constexpr int kLines = 3, kSamples = 131, kPrefix = 3;  // odd, and more than a few vectors

bool complex_type(int type) { return type % 2 == 0; }

/** The test raster with samples of a type; of real values where `pairs` is false. */
std::string bytes_of(int type, int order, int prefix, bool pairs) {
    std::string text;
    for (int line = 0; line < kLines; ++line) {
        text.append(static_cast<std::size_t>(prefix), '.');
        for (int sample = 0; sample < kSamples; ++sample) {
            for (int part = 0; part <= (complex_type(type) ? 1 : 0); ++part) {
                const double value = part == 1 && !pairs ? 0.0 : test::part_value(line, sample, part);
                test::append_part(text, type, value, order == 1);
            }
        }
    }
    return text;
}

/** The cell types that an access converts from or to a memory type; 8-bit types never. */
struct Access {
    int memory;
    const char *region_reads, *region_writes, *block_reads, *block_writes;
};
constexpr Access kAccesses[] = {
    {FLOAT_COMPLEX, "01234567", "0246", "0246", "046"},  // blocks into FLOAT64: a test of its own
    {FLOAT32, "1357", "01357", "1357", "1357"},
    {DOUBLE_COMPLEX, "02346", "0246", "0246", "0246"},
    {FLOAT64, "1357", "012357", "1357", "357"},
    {INT_COMPLEX, "46", "0246", "", ""},
    {INT32, "57", "13457", "1357", "1357"},
    {SHORT_COMPLEX, "46", "0246", "", ""},
    {INT16, "57", "13567", "1357", "1357"},
    {INT8_COMPLEX, "", "", "", ""},
    {INT8, "", "", "", ""},
};
bool lists(const char* types, int type) { return std::strchr(types, '0' + type) != nullptr; }

/** A raster file of one cell type and byte order. */
class EveryPair : public testing::TestWithParam<int> {
protected:
    void start(RasterDescription& raster, int type, const std::string& content) {
        raster.NrOfLinesPerImage = kLines;
        raster.NrOfPixelsPerLine = kSamples;
        raster.CellType = type;
        raster.ByteOrder = GetParam();
        raster.RowPrefix = kPrefix;
        test::write_text(name_, content);
    }
    /** What is expected of a reader or writer that converts, or does not. */
    static void expect(const std::string& found, bool converts, const std::string& wanted,
                       const std::string& untouched) {
        EXPECT_TRUE(found == (converts ? wanted : untouched));
    }
    test::Report report_;
    std::string name_ = report_.file("raster");
};

TEST_P(EveryPair, IsMovedByRegionsAsTold) {
    const test::CapturedStderr silent;
    for (const Access& access : kAccesses) {
        for (int type = 0; type <= INT8; ++type) {
            SCOPED_TRACE(testing::Message() << "file " << type << ", memory " << access.memory);
            const bool refused = type > INT16 || access.memory > INT16, pairs = complex_type(access.memory);
            const std::string packed = bytes_of(access.memory, 0, 0, complex_type(type));
            std::string memory(packed.size(), 'U');
            DataFile file;
            file.setFilename(name_.c_str());
            start(file, type, bytes_of(type, GetParam(), kPrefix, true));
            BufferIO region{&file, 0, kSamples, 0, kLines, access.memory};
            EXPECT_EQ(region.readbuffer(memory.data(), kSamples), refused ? 1 : 0);
            expect(memory, lists(access.region_reads, type), packed, std::string(packed.size(), 'U'));
            file.close();

            const std::string written = bytes_of(type, GetParam(), kPrefix, pairs), blank(written.size(), '.');
            start(file, type, blank);
            ASSERT_EQ(file.open(2), 0);
            const bool writes = lists(access.region_writes, type);
            EXPECT_EQ(region.writebuffer(bytes_of(access.memory, 0, 0, true).data()), writes ? 0 : 1);
            file.close();
            expect(test::read_text(name_), writes, written, blank);
        }
    }
}

/** readbuffer() of a memory type; false for one that has none. */
bool read_block(BufferFile& file, int memory, char* to) {
    const auto read = [&](auto* typed) { return file.readbuffer(typed, 0, kLines, 0, 0), true; };
    switch (memory) {
        case FLOAT_COMPLEX:
            return read(reinterpret_cast<fcomplex*>(to));
        case FLOAT32:
            return read(reinterpret_cast<float*>(to));
        case DOUBLE_COMPLEX:
            return read(reinterpret_cast<dcomplex*>(to));
        case FLOAT64:
            return read(reinterpret_cast<double*>(to));
        case INT32:
            return read(reinterpret_cast<int*>(to));
        case INT16:
            return read(reinterpret_cast<short*>(to));
        default:
            return false;
    }
}
void write_block(BufferFile& file, int memory, const char* from) {
    const auto write = [&](const auto* typed) { file.writebuffer(typed, 0, kLines, 0, kSamples); };
    if (memory == FLOAT_COMPLEX) write(reinterpret_cast<const fcomplex*>(from));
    if (memory == FLOAT32) write(reinterpret_cast<const float*>(from));
    if (memory == DOUBLE_COMPLEX) write(reinterpret_cast<const dcomplex*>(from));
    if (memory == FLOAT64) write(reinterpret_cast<const double*>(from));
    if (memory == INT32) write(reinterpret_cast<const int*>(from));
    if (memory == INT16) write(reinterpret_cast<const short*>(from));
}

TEST_P(EveryPair, IsMovedByBlocksAsTold) {
    for (const Access& access : kAccesses) {
        for (int type = 0; type <= INT8; ++type) {
            SCOPED_TRACE(testing::Message() << "file " << type << ", memory " << access.memory);
            const std::string packed = bytes_of(access.memory, 0, 0, true), untouched(packed.size(), 'U');
            std::string memory = untouched;
            BufferFile file{name_.c_str()};
            start(file, type, bytes_of(type, GetParam(), kPrefix, true));
            file.open(BufferFile::READ);
            if (!read_block(file, access.memory, memory.data())) continue;
            expect(memory, lists(access.block_reads, type), packed, untouched);
            memory = untouched;
            file.open(BufferFile::READ_WRITE);
            read_block(file, access.memory, memory.data());
            expect(memory, lists(access.block_reads, type), packed, untouched);

            if (access.memory == FLOAT_COMPLEX && type == FLOAT64) continue;
            const std::string written = bytes_of(type, GetParam(), kPrefix, true), blank(written.size(), '.');
            start(file, type, blank);
            write_block(file, access.memory, packed.data());
            file.close();
            expect(test::read_text(name_), lists(access.block_writes, type), written, blank);
        }
    }
}
TEST_P(EveryPair, HasSingleSamplesOfItsOwnTypeInTheHostsOrder) {
    for (const int buffer : {0, 5, 5000}) {
        const int prefix = buffer == 5 ? 0 : kPrefix;  // the first sample may stand at 0, where seek() does not go
        for (int type = 0; type <= INT8; ++type) {
            BufferFile file{name_.c_str()};
            start(file, type, bytes_of(type, GetParam(), prefix, true));
            file.RowPrefix = prefix;
            file.open(BufferFile::READ);
            file.initbuffer(buffer, 0);
            for (const auto& [line, sample] : {std::pair{1, 2}, {0, 0}, {2, 130}, {3, 0}, {-1, 0}, {0, 131}}) {
                const bool there = GetParam() == 0 && line >= 0 && line < kLines && sample < kSamples;
                const auto expect = [&, l = line, s = sample](auto found, int wanted, int part) {
                    EXPECT_EQ(static_cast<double>(found),
                              there && type == wanted ? test::part_value(l, s, part) : 0.0);
                };
                expect(file.readFloat(line, sample), FLOAT32, 0);
                expect(file.readDouble(line, sample), FLOAT64, 0);
                expect(file.readInt(line, sample), INT32, 0);
                expect(file.readShort(line, sample), INT16, 0);
                expect(file.readFloatComplex(line, sample).imag(), FLOAT_COMPLEX, 1);
                expect(file.readDoubleComplex(line, sample).imag(), DOUBLE_COMPLEX, 1);
            }
        }
    }
}
INSTANTIATE_TEST_SUITE_P(Orders, EveryPair, testing::Values(0, 1),
                         [](const auto& row) { return row.param ? "BigEndian" : "LittleEndian"; });

struct RoundingRow {
    double value;
    int from_double, from_float, to_short;
};
constexpr double kInfinity = std::numeric_limits<double>::infinity();
// Single precision has bounds of its own: the largest float below 2^31.
constexpr int kMax = 2147483647, kMin = -kMax - 1, kMaxFloat = 2147483520;
constexpr RoundingRow kRounding[] = {
    {2.5, 3, 3, 3},
    {-2.5, -3, -3, -3},
    {2.4999997, 2, 2, 2},
    {0.49999997, 0, 0, 0},
    {-0.5, -1, -1, -1},
    {0.0, 0, 0, 0},
    {32767.4, 32767, 32767, 32767},
    {32767.5, 32768, 32768, 32767},
    {-32768.5, -32769, -32769, -32768},
    {8388607.5, 8388608, 8388608, 32767},
    {2147483520.0, 2147483520, kMaxFloat, 32767},
    {2147483648.0, kMax, kMaxFloat, 32767},
    {-2147483648.0, kMin, kMin, -32768},
    {-3e9, kMin, kMin, -32768},
    {1e38, kMax, kMaxFloat, 32767},
    {kInfinity, kMax, kMaxFloat, 32767},
    {-kInfinity, kMin, kMin, -32768},
    {std::numeric_limits<double>::quiet_NaN(), 0, 0, 0},
};
constexpr int kRows = static_cast<int>(std::size(kRounding));

/** Values through a file of one type: written as they are, read back as another type. */
template <typename Out, typename In>
std::vector<Out> through(const std::string& name, int cell_type, const std::vector<In>& values) {
    BufferFile file{name.c_str()};
    file.NrOfLinesPerImage = 1;
    file.NrOfPixelsPerLine = kRows;
    file.CellType = cell_type;
    file.open(BufferFile::WRITE);
    file.writebuffer(values.data(), 0, 1, 0, 0);
    std::vector<Out> back(values.size(), Out{77});
    file.readbuffer(back.data(), 0, 1, 0, 0);
    EXPECT_EQ(back[0], Out{77}) << "a file that is only written";
    file.open(BufferFile::READ);
    file.readbuffer(back.data(), 0, 1, 0, 0);
    return back;
}

// Reading rounds where the file holds real numbers, writing where it holds integers.
TEST(BlockRounding, IsHalfAwayFromZeroHeldAtTheBounds) {
    const test::TemporaryFolder folder;
    const std::string name = folder.file("values");
    std::vector<double> doubles;
    std::vector<float> floats;
    std::vector<int> from_double, from_float;
    std::vector<short> shorts;
    for (const RoundingRow& row : kRounding) {
        doubles.push_back(row.value);
        floats.push_back(static_cast<float>(row.value));
        from_double.push_back(row.from_double);
        from_float.push_back(row.from_float);
        shorts.push_back(static_cast<short>(row.to_short));
    }
    for (const int type : {FLOAT64, INT32}) EXPECT_EQ((through<int>(name, type, doubles)), from_double);
    for (const int type : {FLOAT64, INT16}) EXPECT_EQ((through<short>(name, type, doubles)), shorts);
    for (const int type : {FLOAT32, INT32}) EXPECT_EQ((through<int>(name, type, floats)), from_float);
    for (const int type : {FLOAT32, INT16}) EXPECT_EQ((through<short>(name, type, floats)), shorts);
}

// Lines with room for the pairs keep their place; others grow, so that no sample is lost.
TEST(BlockWriting, OfComplexIntoFloat64TakesTwoDoublesASample) {
    const test::TemporaryFolder folder;
    const struct {
        int width, samples, first_sample;
        std::vector<double> file;
    } rows[] = {{3, 0, 0, {1, 2, 3, 4, 5, 6, 7, 8, 9, 10, 11, 12}},
                {7, 3, 0, {1, 2, 3, 4, 5, 6, 0, 7, 8, 9, 10, 11, 12}},
                {7, 3, 1, {0, 1, 2, 3, 4, 5, 6, 0, 7, 8, 9, 10, 11, 12}},
                {4, 3, 1, {0, 1, 2, 3, 4, 5, 6, 0, 7, 8, 9, 10, 11, 12}},
                {3, 3, 1, {}}};
    const std::vector<fcomplex> values{{1, 2}, {3, 4}, {5, 6}, {7, 8}, {9, 10}, {11, 12}};
    for (const auto& row : rows) {
        const std::string name = folder.file(std::to_string(row.width) + std::to_string(row.first_sample));
        BufferFile file{name.c_str()};
        file.NrOfLinesPerImage = 2;
        file.NrOfPixelsPerLine = row.width;
        file.CellType = FLOAT64;
        file.ByteOrder = 1;
        file.open(BufferFile::WRITE);
        file.writebuffer(values.data(), 0, 2, row.first_sample, row.samples);
        file.close();
        std::string expected;
        for (const double value : row.file) test::append_bytes(expected, value, true);
        EXPECT_EQ(test::read_text(name), expected) << row.width << ' ' << row.first_sample;
    }
}

}  // namespace
