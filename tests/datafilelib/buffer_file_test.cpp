// SPDX-License-Identifier: Apache-2.0
#include "quo_base/datafile.h"
#include "support/diagnostics.h"

namespace {

constexpr int kLineSamples = 5;  // of INT16

/** A plain file in memory. */
struct PlainFile {
    std::string bytes;
    int64_t place = 0;

    std::string read(int n) {
        if (place >= static_cast<int64_t>(bytes.size())) return "";
        const std::string piece = bytes.substr(static_cast<std::size_t>(place), static_cast<std::size_t>(n));
        place += static_cast<int64_t>(piece.size());
        return piece;
    }
    void write(const std::string& piece) {
        if (piece.empty()) return;
        const std::size_t end = static_cast<std::size_t>(place) + piece.size();
        if (bytes.size() < end) bytes.resize(end, '\0');
        bytes.replace(static_cast<std::size_t>(place), piece.size(), piece);
        place += static_cast<int64_t>(piece.size());
    }
    void seek(int64_t offset, int type) {
        if (offset == 0) return;
        const int64_t base = type == 1 ? place : type == 2 ? static_cast<int64_t>(bytes.size()) : 0;
        if (base + offset >= 0) place = base + offset;
    }
};

void write_lines(BufferFile& file, PlainFile& plain, int line, int lines, short value) {
    const std::vector<short> block(static_cast<std::size_t>(lines * kLineSamples), value);
    file.writebuffer(block.data(), line, lines, 0, 0);
    plain.place = std::int64_t{line} * kLineSamples * 2;
    plain.write({reinterpret_cast<const char*>(block.data()), 2 * block.size()});
}
void read_lines(BufferFile& file, PlainFile& plain, int line, int lines) {
    std::vector<short> block(static_cast<std::size_t>(lines * kLineSamples));
    file.readbuffer(block.data(), line, lines, 0, 0);
    plain.place = std::int64_t{line} * kLineSamples * 2;
    EXPECT_EQ((std::string{reinterpret_cast<const char*>(block.data()), 2 * block.size()}),
              plain.read(2 * lines * kLineSamples));
}

using RandomWalk = testing::TestWithParam<std::tuple<int, int, int>>;

// Long sequences of requests against a plain file: what is read, what is written, where it goes on, and in the end
// the bytes on the disk. Once, a new buffer went to the start of a file that was written, and after a block bytes
// that were written apart took zeros between them to the disk.
TEST_P(RandomWalk, SeesWhatAPlainFileGives) {
    const auto [mode, size, keep] = GetParam();
    const test::TemporaryFolder folder;
    const std::string name = folder.file("walk.raw");
    std::mt19937 generator{static_cast<unsigned>(mode * 1000 + size * 10 + keep)};
    const auto random = [&](int low, int high) {
        return std::uniform_int_distribution<int>{low, high}(generator);
    };
    for (int round = 0; round < 12; ++round) {
        PlainFile plain;
        for (int i = 0; i < 211; ++i) plain.bytes += static_cast<char>(random(1, 255));
        test::write_text(name, plain.bytes);
        BufferFile file{name.c_str()};
        file.open(mode);
        ASSERT_TRUE(file.is_open());
        if (mode == 2) plain.bytes.clear();
        file.initbuffer(size, keep);
        EXPECT_EQ(file.is_buffered(), size > 0);
        file.NrOfPixelsPerLine = kLineSamples;
        file.CellType = INT16;
        for (int step = 0; step < 400; ++step) {
            const int n = random(0, 9) == 0 ? random(0, 150) : random(0, 12);
            const int what = random(0, 39);
            if (what == 39) {
                file.initbuffer(size, keep);
                if (mode == 1 && size > 0) plain.place = 0;
            } else if (what == 38 && mode != 1) {
                write_lines(file, plain, random(0, 20), random(1, 3), static_cast<short>(random(1, 9999)));
            } else if (what == 37 && mode != 2) {
                read_lines(file, plain, random(0, 17), random(1, 3));
            } else if (what < 15) {
                std::string got(static_cast<std::size_t>(n), '?');
                const int moved = file.read(got.data(), n);
                got.resize(static_cast<std::size_t>(moved));
                ASSERT_EQ(got, mode == 2 ? "" : plain.read(n)) << "round " << round << " step " << step;
            } else if (what < 26) {
                std::string piece;
                for (int i = 0; i < n; ++i) piece += static_cast<char>(random(1, 255));
                const int moved = file.write(piece.data(), n);
                ASSERT_EQ(moved, mode == 1 ? 0 : n);
                if (mode != 1) plain.write(piece);
            } else {
                const int type = random(0, 2);
                const int64_t offset = type == 0 ? random(0, 260) : type == 1 ? random(-40, 40) : random(-200, 20);
                file.seek(offset, type);
                plain.seek(offset, type);
            }
            if (mode != 3 || size == 0) {
                ASSERT_EQ(file.tell(), plain.place) << "round " << round << " step " << step;
            }
        }
        file.close();
        ASSERT_EQ(file.status(), 0);
        ASSERT_TRUE(test::read_text(name) == plain.bytes) << "round " << round;
    }
    EXPECT_EQ(errno, 0);
}
const auto kSizes = testing::Values(0, 1, 2, 3, 7, 16, 33, 400);
INSTANTIATE_TEST_SUITE_P(Reading, RandomWalk,
                         testing::Combine(testing::Values(1), kSizes, testing::Values(0, 1, 5, 100)));
INSTANTIATE_TEST_SUITE_P(Writing, RandomWalk, testing::Combine(testing::Values(2, 3), kSizes, testing::Values(0)));

}  // namespace
