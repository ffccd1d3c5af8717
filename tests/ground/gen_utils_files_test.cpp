// SPDX-License-Identifier: Apache-2.0
#include "quo_base/gen_utils.h"
#include "sarutillib/ground/file_io.h"
#include "support/diagnostics.h"

namespace {

using test::TemporaryFolder;
using test::write_text;

constexpr std::int64_t kFar = 5'368'709'213;  // beyond 32 bits

// A sparse file with a mark far out. What was written is flushed, and what follows goes to the new place.
TEST(Seek, CountsFromStartPositionAndEndAndRefusesWhatLeadsNowhere) {
    const TemporaryFolder folder;
    const std::string name = folder.file("image.raw");
    write_text(name, "first");
    std::filesystem::resize_file(name, static_cast<std::uintmax_t>(kFar));
    std::ofstream{name, std::ios::binary | std::ios::app} << "mark and tail";
    const quo::Stream stream{std::fopen(name.c_str(), "r+b")};
    const auto read = [&](std::size_t size) {
        std::string text(size, '\0');
        text.resize(std::fread(text.data(), 1, size, stream.get()));
        return text;
    };
    const struct {
        std::int64_t offset;
        int whence;
        off_t place;
        std::string text;  // found there
    } rows[] = {{kFar, 0, kFar, "mark"}, {5, 1, kFar + 9, "tail"}, {-kFar - 13, 2, 0, "first"}, {-3, 1, 2, "rst"}};
    for (const auto& [offset, whence, place, text] : rows) {
        EXPECT_EQ(myfseek64_msc(stream.get(), offset, whence), 0);
        EXPECT_EQ(lseek(fileno(stream.get()), 0, SEEK_CUR), place);
        EXPECT_EQ(read(text.size()), text);
    }
    EXPECT_EQ(myfseek64_msc(stream.get(), 0, 0), 0);
    std::fputs("FIRST", stream.get());
    EXPECT_EQ(myfseek64_msc(stream.get(), kFar + 5, 0), 0);
    std::ifstream other{name};
    EXPECT_EQ(other.get(), 'F');
    std::fputs("AND", stream.get());
    EXPECT_EQ(myfseek64_msc(stream.get(), -8, 1), 0);
    EXPECT_EQ(read(20), "mark AND tail");

    myfseek64_msc(stream.get(), 2, 0);
    for (const auto& [offset, whence] : {std::pair{std::int64_t{0}, 3}, {0, -1}, {-1, 0}, {-3, 1}, {INT64_MAX, 1}})
        EXPECT_EQ(myfseek64_msc(stream.get(), offset, whence), -1) << offset << " from " << whence;
    EXPECT_EQ(read(3), "RST");
    EXPECT_EQ(myfseek64_msc(stream.get(), INT64_MAX, 2) + myfseek64_msc(nullptr, 0, 0), -2);
    int ends[2];
    ASSERT_EQ(pipe(ends), 0);
    const quo::Stream in{fdopen(ends[0], "rb")}, out{fdopen(ends[1], "wb")};
    for (const int whence : {0, 1, 2}) EXPECT_EQ(myfseek64_msc(in.get(), 0, whence), -1);
    errno = 0;
}

}  // namespace
