// SPDX-License-Identifier: Apache-2.0

// Every pair of cell type and memory type, in rasters of different layouts, against the rules told one by one.

#include "datafilelib/kernel_table.h"
#include "quo_base/datafile.h"
#include "support/diagnostics.h"
#include "support/levels.h"
#include "support/raster.h"

namespace {

/** A rectangle of the test raster, whose lines are longer than a few vectors, and odd. */
struct Cut {
    int line, lines, sample, samples;
    [[nodiscard]] bool holds(int l, int s) const {
        return l >= line && l < line + lines && s >= sample && s < sample + samples;
    }
};
constexpr int kLines = 5, kSamples = 67, kWidth = 58;
constexpr Cut kAll{0, kLines, 0, kSamples}, kPart{1, 3, 6, 53}, kNothing{};

struct Layout {
    const char* name;
    int order, prefix;
    int64_t offset;
    int buffer;  // of a DataFile
};
void PrintTo(const Layout& layout, std::ostream* out) { *out << layout.name; }
constexpr Layout kLayouts[] = {{"LittleEndian", 0, 0, 0, 0},
                               {"BigEndianPrefix", 1, 3, 0, 0},
                               {"LittleEndianLargePrefix", 0, 6000, 7, 0},
                               {"BigEndianHeaderBuffered", 1, 17, 101, 64}};

void append_sample(std::string& text, int type, int line, int sample, bool pairs, bool big) {
    for (int part = 0; part <= (quo::is_complex_type(type) ? 1 : 0); ++part)
        test::append_part(text, type, part == 1 && !pairs ? 0.0 : test::part_value(line, sample, part), big);
}
/** A raster with the samples of a cut, of real values where `pairs` is false, and dots elsewhere. */
std::string raster(int type, const Layout& layout, const Cut& cut, bool pairs) {
    std::string text(static_cast<std::size_t>(layout.offset), '.'), dots;
    append_sample(dots, type, 0, 0, true, false);
    dots.assign(dots.size(), '.');
    for (int line = 0; line < kLines; ++line) {
        text.append(static_cast<std::size_t>(layout.prefix), '.');
        for (int sample = 0; sample < kSamples; ++sample) {
            if (cut.holds(line, sample)) append_sample(text, type, line, sample, pairs, layout.order == 1);
            if (!cut.holds(line, sample)) text += dots;
        }
    }
    return text;
}
/** The samples of a cut as a caller holds them, in rows of `width` samples. */
std::string packed(int type, const Cut& cut, bool pairs, int width) {
    std::string text;
    for (int line = cut.line; line < cut.line + cut.lines; ++line) {
        const std::size_t start = text.size();
        for (int i = 0; i < cut.samples; ++i) append_sample(text, type, line, cut.sample + i, pairs, false);
        const std::size_t size = (text.size() - start) / static_cast<std::size_t>(cut.samples);
        text.append(size * static_cast<std::size_t>(width - cut.samples), 'U');
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

class EveryPair : public testing::TestWithParam<Layout> {
protected:
    void start(RasterDescription& description, int type, const std::string& content) {
        description.NrOfLinesPerImage = kLines;
        description.NrOfPixelsPerLine = kSamples;
        description.CellType = type;
        description.ByteOrder = GetParam().order;
        description.RowPrefix = GetParam().prefix;
        description.HeaderOffset = GetParam().offset;
        test::write_text(name_, content);
    }
    test::Report report_;
    std::string name_ = report_.file("raster");
};

TEST_P(EveryPair, IsMovedByRegionsAsTold) {
    const test::CapturedStderr silent;
    for (const Access& access : kAccesses)
        for (int type = 0; type <= INT8; ++type) {
            SCOPED_TRACE(testing::Message() << "file " << type << ", memory " << access.memory);
            const bool refused = type > INT16 || access.memory > INT16,
                       pairs = quo::is_complex_type(access.memory);
            const std::string wanted = packed(access.memory, kPart, quo::is_complex_type(type), kWidth);
            std::string memory(wanted.size(), 'U');
            DataFile file;
            file.setFilename(name_.c_str());
            file.BufferSize = GetParam().buffer;
            const std::string content = raster(type, GetParam(), kAll, true);
            start(file, type, content);
            BufferIO region{&file, kPart.sample, kPart.samples, kPart.line, kPart.lines, access.memory};
            EXPECT_EQ(region.readbuffer(memory.data(), kWidth), refused ? 1 : 0);
            EXPECT_EQ(memory, lists(access.region_reads, type) ? wanted : std::string(wanted.size(), 'U'));
            if (!refused) {
                const auto line = (static_cast<int64_t>(content.size()) - file.HeaderOffset) / kLines;
                EXPECT_EQ(file.tell(), file.HeaderOffset + 4 * line) << "the line after";
            }
            file.close();

            const std::string blank = raster(type, GetParam(), kNothing, true);
            start(file, type, blank);
            file.BufferSize = GetParam().buffer;
            ASSERT_EQ(file.open(3), 0);
            const bool writes = lists(access.region_writes, type);
            EXPECT_EQ(region.writebuffer(packed(access.memory, kPart, true, kWidth).data(), kWidth),
                      writes ? 0 : 1);
            file.close();
            EXPECT_EQ(test::read_text(name_), writes ? raster(type, GetParam(), kPart, pairs) : blank);
        }
}

/** Moves bytes as values of the memory type, where an accessor has it. */
template <typename Bytes, typename Move>
void by_type(int memory, Bytes* bytes, Move move) {
    const auto as = [&](int type, auto value) {
        using T = std::conditional_t<std::is_const_v<Bytes>, const decltype(value), decltype(value)>;
        if (type == memory) move(reinterpret_cast<T*>(bytes));
    };
    as(FLOAT_COMPLEX, fcomplex{});
    as(FLOAT32, float{});
    as(DOUBLE_COMPLEX, dcomplex{});
    as(FLOAT64, double{});
    as(INT32, int{});
    as(INT16, short{});
}

TEST_P(EveryPair, IsMovedByBlocksAsTold) {
    for (const Access& access : kAccesses)
        for (int type = 0; type <= INT8; ++type) {
            SCOPED_TRACE(testing::Message() << "file " << type << ", memory " << access.memory);
            BufferFile file{name_.c_str()};
            start(file, type, raster(type, GetParam(), kAll, true));
            for (const Cut& cut : {kPart, kAll}) {
                const std::string wanted = packed(access.memory, cut, true, cut.samples);
                const std::string untouched(wanted.size(), 'U');
                std::string memory = untouched;
                file.open(&cut == &kPart ? BufferFile::READ : BufferFile::READ_WRITE);
                const int samples = cut.samples == kSamples ? 0 : cut.samples;
                by_type(access.memory, memory.data(),
                        [&](auto* to) { file.readbuffer(to, cut.line, cut.lines, cut.sample, samples); });
                EXPECT_EQ(memory, lists(access.block_reads, type) ? wanted : untouched);
            }
            if (access.memory == FLOAT_COMPLEX && type == FLOAT64) continue;
            const std::string blank = raster(type, GetParam(), kNothing, true);
            const std::string source = packed(access.memory, kPart, true, kPart.samples);
            start(file, type, blank);
            by_type(access.memory, source.data(), [&](const auto* from) {
                file.writebuffer(from, kPart.line, kPart.lines, kPart.sample, kPart.samples);
            });
            file.close();
            EXPECT_EQ(test::read_text(name_),
                      lists(access.block_writes, type) ? raster(type, GetParam(), kPart, true) : blank);
        }
}

TEST_P(EveryPair, HasSingleSamplesOfItsOwnTypeInTheHostsOrder) {
    for (const int buffer : {0, 5, 9000})
        for (int type = 0; type <= INT8; ++type) {
            BufferFile file{name_.c_str()};
            start(file, type, raster(type, GetParam(), kAll, true));
            file.open(BufferFile::READ);
            file.initbuffer(buffer, 0);
            for (const auto& [l, s] : {std::pair{1, 2}, {0, 0}, {4, 66}, {5, 0}, {-1, 0}, {0, 67}}) {
                const bool there = GetParam().order == 0 && kAll.holds(l, s);
                const std::vector<double> found{file.readFloatComplex(l, s).imag(),
                                                file.readFloat(l, s),
                                                file.readDoubleComplex(l, s).imag(),
                                                file.readDouble(l, s),
                                                0.0,
                                                static_cast<double>(file.readInt(l, s)),
                                                0.0,
                                                static_cast<double>(file.readShort(l, s))};
                std::vector<double> wanted(8);
                if (there && type < 8 && type != INT_COMPLEX && type != SHORT_COMPLEX)
                    wanted[static_cast<std::size_t>(type)] = test::part_value(l, s, 1 - type % 2);
                EXPECT_EQ(found, wanted) << type << " at " << l << " " << s;
            }
        }
}
INSTANTIATE_TEST_SUITE_P(Layouts, EveryPair, testing::ValuesIn(kLayouts), testing::PrintToStringParamName());

/** The rule told plainly. Single precision has a bound of its own: the largest float below 2^31. */
template <typename To, typename From>
To rounded(From number) {
    constexpr double high = sizeof(To) == 4 && sizeof(From) == 4 ? 2147483520.0 : std::numeric_limits<To>::max();
    return std::isnan(number)
               ? To{0}
               : static_cast<To>(std::clamp<double>(std::round(number), std::numeric_limits<To>::min(), high));
}
template <typename From, typename To>
void expect_rounding(int real, To) {
    constexpr int integer = sizeof(To) == 4 ? INT32 : sizeof(To) == 2 ? INT16 : INT8;
    std::vector<From> numbers;
    for (const double edge :
         {0.0, 0.49999997, 2.5, 126.5, 127.5, 32766.5, 32767.5, 32768.5, 8388607.5, 2147483520.0, 2147483646.5,
          2147483647.5, 2147483648.0, 4294967296.0, HUGE_VAL, std::nan("")}) {
        const auto at = static_cast<From>(edge), above = std::nextafter(at, static_cast<From>(HUGE_VAL)),
                   below = std::nextafter(at, From{0});
        numbers.insert(numbers.end(), {at, above, below, -at, -above, -below});
    }
    std::mt19937_64 random{17};
    for (int i = 0; i < 9000; ++i)
        numbers.push_back(static_cast<From>(std::ldexp(int64_t(random()), -int(random() % 70))));
    std::vector<To> wanted, found(numbers.size());
    for (const From number : numbers) wanted.push_back(rounded<To>(number));
    for (const auto level : test::processor_levels()) {
        const auto& kernels = quo::kernel_table(level).kernels;
        // Access 4 reads whatever there is, and 3 writes blocks, though none of bytes.
        for (const auto kernel : {kernels[4][integer][real], kernels[3][real][integer]}) {
            if (kernel) kernel(numbers.data(), found.data(), numbers.size(), false);
            EXPECT_EQ(found, wanted) << real << " to " << integer << ", level " << static_cast<int>(level);
        }
    }
}
TEST(Rounding, IsHalfAwayFromZeroHeldAtTheBoundsAtEveryWidth) {
    const auto into = [](auto... to) {
        ((expect_rounding<float>(FLOAT32, to), expect_rounding<double>(FLOAT64, to)), ...);
    };
    into(std::int32_t{}, std::int16_t{}, std::int8_t{});
}

TEST(Kernels, GiveTheSameBytesAtEveryWidth) {
    std::mt19937 random{17};
    std::string in(77 * 16 + 1, ' ');  // at odd addresses, and no whole number of vectors
    std::ranges::generate(in, [&] { return static_cast<char>(random()); });
    for (int pair = 0; pair < 5 * 10 * 10 * 2; ++pair) {
        std::string first;
        for (const auto level : test::processor_levels()) {
            const auto kernel = quo::kernel_table(level).kernels[pair / 200][pair / 20 % 10][pair / 2 % 10];
            std::string out = in;
            if (kernel) kernel(in.data() + 1, out.data(), 77, pair % 2 == 1);
            EXPECT_TRUE(out == (level == quo::ProcessorLevel::kBase ? first = out : first))
                << pair << ", level " << static_cast<int>(level);
        }
    }
}

TEST(Kernels, StorePastCachesAtAnyPlace) {
    std::string in(200, ' ');
    std::iota(in.begin(), in.end(), '\0');
    for (const auto level : test::processor_levels())
        for (std::size_t place = 0; place < 33; ++place)
            for (const std::size_t size : {0, 1, 15, 16, 33, 200}) {
                std::string out(300, 'x'), expected = out;
                quo::kernel_table(level).store_past_caches(in.data(), out.data() + place, size);
                EXPECT_EQ(out, expected.replace(place, size, in, 0, size)) << place << ' ' << size;
            }
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

// At places that no vector is aligned to, and in chunks that end within a line.
TEST(BlockReading, OfMoreThanACacheHoldsGivesTheSame) {
    const test::TemporaryFolder folder;
    constexpr int lines = 2101, width = 1003;
    BufferFile file{folder.file("large").c_str()};
    file.NrOfLinesPerImage = lines;
    file.NrOfPixelsPerLine = width;
    file.CellType = SHORT_COMPLEX;
    file.ByteOrder = 1;
    std::mt19937 random{17};
    std::vector<float> written(2 * lines * width + 1), read = written;
    std::ranges::generate(written, [&] { return static_cast<float>(static_cast<std::int16_t>(random())); });
    const auto samples = [](std::vector<float>& of) { return reinterpret_cast<fcomplex*>(of.data() + 1); };
    file.open(BufferFile::WRITE);
    file.writebuffer(samples(written), 0, lines, 0, 0);
    file.open(BufferFile::READ);
    file.readbuffer(samples(read), 0, lines, 0, 0);
    read[0] = written[0];
    EXPECT_TRUE(read == written);
}

}  // namespace
