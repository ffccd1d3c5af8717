#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <filesystem>
#include <optional>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include "quo_base/datafile.h"
#include "support/diagnostics.h"
#include "support/limits.h"
#include "support/raster.h"

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

struct Walk {
    int mode, size, keep;
};
std::vector<Walk> walks() {
    std::vector<Walk> all;
    for (const int size : {0, 1, 2, 3, 7, 16, 33, 400}) {
        for (const int mode : {2, 3}) all.push_back({mode, size, 0});
        for (const int keep : {0, 1, 5, 100}) all.push_back({1, size, keep});
    }
    return all;
}
class RandomWalk : public testing::TestWithParam<Walk> {};

// Long sequences of requests against a plain file: what is read, what is written, where it goes on, and in the end
// the bytes on the disk. Once, a new buffer went to the start of a file that was written, and after a block bytes
// that were written apart took zeros between them to the disk.
TEST_P(RandomWalk, SeesWhatAPlainFileGives) {
    const Walk& walk = GetParam();
    const test::TemporaryFolder folder;
    const std::string name = folder.file("walk.raw");
    std::mt19937 generator{static_cast<unsigned>(walk.mode * 1000 + walk.size * 10 + walk.keep)};
    const auto random = [&](int low, int high) {
        return std::uniform_int_distribution<int>{low, high}(generator);
    };
    for (int round = 0; round < 12; ++round) {
        PlainFile plain;
        for (int i = 0; i < 211; ++i) plain.bytes += static_cast<char>(random(1, 255));
        test::write_text(name, plain.bytes);
        BufferFile file{name.c_str()};
        file.open(walk.mode);
        ASSERT_TRUE(file.is_open());
        if (walk.mode == 2) plain.bytes.clear();
        file.initbuffer(walk.size, walk.keep);
        EXPECT_EQ(file.is_buffered(), walk.size > 0);
        file.NrOfPixelsPerLine = kLineSamples;
        file.CellType = INT16;
        for (int step = 0; step < 400; ++step) {
            const int n = random(0, 9) == 0 ? random(0, 150) : random(0, 12);
            const int what = random(0, 39);
            if (what == 39) {
                file.initbuffer(walk.size, walk.keep);
                if (walk.mode == 1 && walk.size > 0) plain.place = 0;
            } else if (what == 38 && walk.mode != 1) {
                write_lines(file, plain, random(0, 20), random(1, 3), static_cast<short>(random(1, 9999)));
            } else if (what == 37 && walk.mode != 2) {
                read_lines(file, plain, random(0, 17), random(1, 3));
            } else if (what < 15) {
                std::string got(static_cast<std::size_t>(n), '?');
                const int moved = file.read(got.data(), n);
                got.resize(static_cast<std::size_t>(moved));
                ASSERT_EQ(got, walk.mode == 2 ? "" : plain.read(n)) << "round " << round << " step " << step;
            } else if (what < 26) {
                std::string piece;
                for (int i = 0; i < n; ++i) piece += static_cast<char>(random(1, 255));
                const int moved = file.write(piece.data(), n);
                ASSERT_EQ(moved, walk.mode == 1 ? 0 : n);
                if (walk.mode != 1) plain.write(piece);
            } else {
                const int type = random(0, 2);
                const int64_t offset = type == 0 ? random(0, 260) : type == 1 ? random(-40, 40) : random(-200, 20);
                file.seek(offset, type);
                plain.seek(offset, type);
            }
            if (walk.mode != 3 || walk.size == 0) {
                ASSERT_EQ(file.tell(), plain.place) << "round " << round << " step " << step;
            }
        }
        file.close();
        ASSERT_EQ(file.status(), 0);
        ASSERT_TRUE(test::read_text(name) == plain.bytes) << "round " << round;
    }
    EXPECT_EQ(errno, 0);
}
INSTANTIATE_TEST_SUITE_P(Buffers, RandomWalk, testing::ValuesIn(walks()), [](const auto& row) {
    return "Mode" + std::to_string(row.param.mode) + "Size" + std::to_string(row.param.size) + "Keep" +
           std::to_string(row.param.keep);
});

class BufferFileBytes : public testing::Test {
protected:
    BufferFileBytes() {
        for (int i = 0; i < 100; ++i) content_ += static_cast<char>(i);
        test::write_text(name_, content_);
    }
    void TearDown() override { EXPECT_TRUE(report_.entries().empty()) << "nothing is reported"; }

    test::Report report_;
    std::string name_ = report_.file("bytes.raw"), content_;
    BufferFile file_{name_.c_str()};
};

TEST_F(BufferFileBytes, IgnoresWhatItCannotDo) {
    char bytes[10] = {};
    EXPECT_EQ(file_.read(bytes, 4) + file_.write(bytes, 4), 0);
    file_.open(7);
    EXPECT_FALSE(file_.is_open());
    file_.open(1);
    EXPECT_EQ(file_.write(bytes, 4) + file_.read(bytes, -4), 0);
    for (const int size : {0, -5}) file_.initbuffer(size, 0);
    EXPECT_FALSE(file_.is_buffered());
    EXPECT_EQ(file_.read(bytes, 4), 4);
    file_.open(9);  // once closed the file
    EXPECT_EQ(file_.tell(), 0);
    EXPECT_EQ(file_.read(bytes, 4), 4);
    file_.seek(70, 0);
    for (const int type : {0, 1, 2, 5}) {
        file_.seek(type == 5 ? 1000 : 0, type);
        EXPECT_EQ(file_.tell(), 70) << "an offset of 0 or an unknown type changes nothing";
    }
    EXPECT_EQ(std::string(bytes, 4), content_.substr(0, 4));
    EXPECT_EQ(file_.status(), 0);
    file_.open(3);
    file_.initbuffer(20, 5);
    ASSERT_EQ(file_.read(bytes, 8), 8);
    EXPECT_EQ(file_.tell(), 0) << "reading and writing: the buffer's start";
    file_.seek(70, 0);
    EXPECT_EQ(file_.tell(), 60) << "half a buffer before the target";
    file_.setFilename(report_.folder().path().c_str());
    file_.open(1);
    EXPECT_FALSE(file_.is_open() || file_.exists()) << "a folder";
    // Side files that cannot be read or written once came up in the report.
    file_.setFilename(report_.file("no/raster").c_str());
    EXPECT_EQ(file_.writehdr() + file_.readhdr(), 2);
    EXPECT_EQ(errno, 0);
    EXPECT_EQ(test::read_text(name_), content_);
}

// A full disk takes less, and what it did not take is not lost: with room again the file is the plain one.
TEST_F(BufferFileBytes, AFullDiskMovesLess) {
    std::string letters;
    for (int i = 0; i < 400; ++i) letters += static_cast<char>('A' + i % 23);
    for (const int buffer : {0, 16, 200}) {
        file_.open(2);
        file_.initbuffer(buffer, 0);
        int done = 0;
        const auto write = [&] {
            const int n = std::min(37, 400 - done), moved = file_.write(letters.data() + done, n);
            done += moved;
            return moved == n;
        };
        {
            const test::FullDisk full{90};
            while (done < 300 && write()) EXPECT_LE(done, 90 + buffer);
            EXPECT_LT(done, 300);
        }
        while (done < 400) ASSERT_TRUE(write());
        file_.close();
        EXPECT_EQ(test::read_text(name_), letters) << buffer;
    }
}

/** The memory of a process that has ended takes no bytes, without an error. */
void open_memory_of_dead_process(BufferFile& file) {
    const pid_t process = fork();
    if (process == 0) {
        pause();
        _exit(0);
    }
    ASSERT_GT(process, 0);
    file.setFilename(("/proc/" + std::to_string(process) + "/mem").c_str());
    file.open(BufferFile::READ_WRITE);
    kill(process, SIGKILL);
    waitpid(process, nullptr, 0);
    ASSERT_EQ(file.status(), 0);
}

// Calls that the system lets down, in mode READ_WRITE with three bytes pending in a buffer of 16: they stay
// pending, or are given up where the place leaves the buffer, and the status says so until the next open(). Once
// nobody could tell, and a read that could not write them first slid the buffer away beneath them; a write that
// moved nothing had no status, and create() lost the error of a side file that it could not replace.
TEST_F(BufferFileBytes, WhatTheSystemRefusesIsTold) {
    file_.NrOfPixelsPerLine = kLineSamples;
    file_.CellType = INT16;
    const struct {
        const char* name;
        int status, error;  // EFBIG: while the disk is full
        const char* start;  // of the file in the end
        void (*call)(BufferFile&);
    } rows[] = {
        {"seek", 5, EFBIG, "\0\1\2", [](BufferFile& f) { f.seek(80, 0); }},
        {"close", 5, EFBIG, "\0\1\2", [](BufferFile& f) { f.close(); }},
        {"open", 5, EFBIG, "\0\1\2", [](BufferFile& f) { f.open(1); }},
        {"initbuffer", 5, EFBIG, "abc", [](BufferFile& f) { f.initbuffer(8, 0); }},
        {"copy", 5, EFBIG, "abc", [](BufferFile& f) { EXPECT_EQ(f.copy("/no/copy"), 5); }},
        {"read", 5, EFBIG, "abc", [](BufferFile& f) { EXPECT_EQ(f.read(std::string(40, ' ').data(), 40), 13); }},
        {"write", 5, EFBIG, "abc", [](BufferFile& f) { EXPECT_EQ(f.write("0123456789ABCDEF", 16), 0); }},
        {"block", 5, EFBIG, "abc", [](BufferFile& f) { f.readbuffer(std::vector<short>(5).data(), 0, 1, 0, 5); }},
        {"block beyond", 4, 0, "abc",
         [](BufferFile& f) { f.readbuffer(std::vector<short>(5).data(), 10, 1, 0, 0); }},
        {"sample beyond", 4, 0, "abc", [](BufferFile& f) { EXPECT_EQ(f.readShort(10, 0), 0); }},
        {"missing", 9, ENOENT, "abc",
         [](BufferFile& f) {
             f.setFilename("/no/raster");
             f.open(3);
         }},
        {"nothing taken", 5, 0, "abc",
         [](BufferFile& f) {
             open_memory_of_dead_process(f);
             EXPECT_EQ(f.write("w", 1), 0);
         }},
        {"create", 9, EISDIR, "abc", [](BufferFile& f) { EXPECT_EQ(f.create(), 9); }},
    };
    std::filesystem::create_directory(name_ + ".hdr");
    for (const auto& row : rows) {
        SCOPED_TRACE(row.name);
        test::write_text(name_, content_);
        file_.setFilename(name_.c_str());
        file_.open(3);
        EXPECT_EQ(file_.status() + file_.systemError(), 0);
        file_.initbuffer(16, 0);
        ASSERT_EQ(file_.write("abc", 3), 3);
        {
            std::optional<test::FullDisk> full;
            if (row.error == EFBIG) full.emplace(0);
            row.call(file_);
        }
        file_.close();
        EXPECT_EQ(file_.status(), row.status);
        EXPECT_EQ(file_.systemError(), row.error);
        EXPECT_EQ(test::read_text(name_).substr(0, 3), std::string(row.start, 3));
    }
}

TEST_F(BufferFileBytes, BlocksAndBytesSeeTheSameFile) {
    file_.NrOfLinesPerImage = 6;
    file_.NrOfPixelsPerLine = 5;
    file_.RowPrefix = 2;
    file_.HeaderOffset = 4;
    file_.CellType = INT16;
    std::string expected = test::raster_bytes(file_);
    test::write_text(name_, expected);
    file_.open(3);
    file_.initbuffer(16, 0);
    ASSERT_EQ(file_.write("ab", 2), 2);  // pending in the buffer while blocks move
    const short values[] = {0x4141, 0x4242, 0x4343, 0x4444};
    file_.writebuffer(values, 2, 2, 1, 2);
    char prefixes[4];
    file_.readprefix(prefixes, 1, 2);
    EXPECT_EQ(std::string(prefixes, 2), expected.substr(4 + 12, 2));
    file_.writeprefix("PQRS", 3, 2);
    file_.writeOffset("HEADER", 6);
    short back[4];
    file_.readbuffer(back, 2, 2, 1, 2);
    EXPECT_TRUE(std::equal(back, back + 4, values));
    EXPECT_EQ(file_.write("z", 1), 1) << "after a block the next line follows";
    file_.close();
    const std::pair<std::size_t, const char*> written[] = {
        {0, "HEAD"}, {4 + 2 * 12 + 4, "AABB"}, {4 + 3 * 12, "PQ"}, {4 + 3 * 12 + 4, "CCDD"}, {4 + 4 * 12, "zS"}};
    for (const auto& [place, text] : written) expected.replace(place, std::strlen(text), text);
    EXPECT_EQ(test::read_text(name_), expected);
}

}  // namespace
