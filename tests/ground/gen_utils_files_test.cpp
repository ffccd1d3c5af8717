#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iomanip>
#include <string>
#include <utility>

#include "quo_base/gen_utils.h"
#include "sarutillib/ground/file_io.h"
#include "support/diagnostics.h"

namespace {

using test::read_text;
using test::TemporaryFolder;
using test::write_text;

constexpr std::int64_t kFar = 5'368'709'213;  // beyond 32 bits

class Seek : public testing::Test {
protected:
    /** A sparse file with a mark far out, and a short tail behind it. */
    void SetUp() override {
        const std::string name = folder_.file("image.raw");
        write_text(name, "first");
        std::filesystem::resize_file(name, static_cast<std::uintmax_t>(kFar));
        std::ofstream{name, std::ios::binary | std::ios::app} << "mark and tail";
        stream_.reset(std::fopen(name.c_str(), "r+b"));
        ASSERT_TRUE(stream_);
    }
    std::string read(std::size_t size) {
        std::string text(size, '\0');
        text.resize(std::fread(text.data(), 1, size, stream_.get()));
        return text;
    }

    TemporaryFolder folder_;
    quo::Stream stream_;
};

TEST_F(Seek, CountsFromStartPositionAndEnd) {
    const struct {
        std::int64_t offset;
        int whence;
        off_t place;
        const char* text;  // found there
    } rows[] = {{kFar, 0, kFar, "mark"}, {5, 1, kFar + 9, "tail"}, {-kFar - 13, 2, 0, "first"}, {-3, 1, 2, "rst"}};
    for (const auto& row : rows) {
        EXPECT_EQ(myfseek64_msc(stream_.get(), row.offset, row.whence), 0);
        EXPECT_EQ(lseek(fileno(stream_.get()), 0, SEEK_CUR), row.place);
        EXPECT_EQ(read(std::strlen(row.text)), row.text);
    }
    myfseek64_msc(stream_.get(), -4, 2);
    EXPECT_EQ(read(10), "tail");
    ASSERT_NE(std::feof(stream_.get()), 0);
    EXPECT_EQ(myfseek64_msc(stream_.get(), 0, 0), 0);
    EXPECT_EQ(std::feof(stream_.get()), 0);
    // What was written is flushed, and what follows goes to the new place.
    std::fputs("FIRST", stream_.get());
    EXPECT_EQ(myfseek64_msc(stream_.get(), kFar + 5, 0), 0);
    std::string seen;
    std::ifstream{folder_.file("image.raw")} >> std::setw(5) >> seen;
    EXPECT_EQ(seen, "FIRST");
    std::fputs("AND", stream_.get());
    EXPECT_EQ(myfseek64_msc(stream_.get(), -8, 1), 0);
    EXPECT_EQ(read(20), "mark AND tail");
}

TEST_F(Seek, RefusesWhatLeadsNowhere) {
    myfseek64_msc(stream_.get(), 2, 0);
    EXPECT_EQ(myfseek64_msc(nullptr, 0, 0), -1);
    for (const auto& [offset, whence] : {std::pair{std::int64_t{0}, 3}, {0, -1}, {-1, 0}, {-3, 1}, {INT64_MAX, 1}})
        EXPECT_EQ(myfseek64_msc(stream_.get(), offset, whence), -1) << offset << " from " << whence;
    EXPECT_EQ(read(3), "rst");
    EXPECT_EQ(myfseek64_msc(stream_.get(), INT64_MAX, 2), -1);

    int ends[2];
    ASSERT_EQ(pipe(ends), 0);
    const quo::Stream in{fdopen(ends[0], "rb")}, out{fdopen(ends[1], "wb")};
    for (const int whence : {0, 1, 2}) EXPECT_EQ(myfseek64_msc(in.get(), 0, whence), -1);
    errno = 0;
}

struct Path {
    const char *path, *without_separator, *name;
    int length;
};
constexpr Path kPaths[] = {{"dir/", "dir", "", 4},
                           {"dir\\", "dir", "", 4},
                           {"dir//", "dir/", "", 5},
                           {"dir", "dir", "dir", 3},
                           {"/", "", "", 1},
                           {"", "", "", 0},
                           {"a/b\\c", "a/b\\c", "b\\c", 5},
                           {"a\\b\\c.xml", "a\\b\\c.xml", "c.xml", 9}};

// Of a path with slashes, backslashes belong to the name.
TEST(Paths, LoseOneSeparatorAndShowTheirName) {
    for (const Path& row : kPaths) {
        SCOPED_TRACE(row.path);
        std::string path = row.path;
        EXPECT_STREQ(getFileNameFromPath(row.path), row.name);
        EXPECT_EQ(check_fsep(path.data()), row.length);
        EXPECT_STREQ(path.c_str(), row.without_separator);
    }
}

TEST(CopyParameterFile, CopiesEveryByteOrKeepsTheDestinationAndSaysNothing) {
    const TemporaryFolder folder;
    const auto copy = [&folder](const char* source, const char* destination) {
        return copyParameterFile(folder.file(source).c_str(), folder.file(destination).c_str());
    };
    std::string content = "[Section]\r\n";
    for (int i = 0; i < 70000; ++i) content += static_cast<char>(i * 37 % 256);
    write_text(folder.file("source"), content);
    write_text(folder.file("old"), content + "longer than the source");
    mkfifo(folder.file("pipe").c_str(), 0600);
    test::CapturedStderr captured;
    EXPECT_EQ(copy("source", "old") + copy("source", "new"), 0);
    for (const char* source : {"missing", "", "pipe", "old"}) EXPECT_EQ(copy(source, "old"), 0);
    for (const char* destination : {"no_folder/copy", ""}) EXPECT_EQ(copy("old", destination), 0);
    EXPECT_EQ(copyParameterFile(nullptr, nullptr), 0);

    EXPECT_EQ(errno, 0);
    EXPECT_EQ(captured.text(), "");
    EXPECT_TRUE(read_text(folder.file("old")) == content && read_text(folder.file("new")) == content);
}

}  // namespace
