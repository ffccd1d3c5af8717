#include "quo_base/datafile.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>
#include <climits>
#include <cstring>
#include <filesystem>
#include <functional>
#include <limits>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "support/diagnostics.h"
#include "support/fields.h"
#include "support/limits.h"
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

std::vector<int64_t> values_of(const RasterDescription& raster) {
    return {raster.NrOfLinesPerImage, raster.NrOfPixelsPerLine, raster.HeaderOffset,
            raster.RowPrefix,         raster.ByteOrder,         raster.CellType};
}

// One side file for both classes: what either writes, either reads.
TEST(SideFile, ComesBackFieldByFieldInBothClasses) {
    const test::Report report;
    const std::string name = report.file("scene.raw"), side = name + ".hdr";
    DataFile data, read, cloned;
    BufferFile buffer{name.c_str()}, buffer_cloned;
    data.setFilename(name.c_str());
    describe(data, 17, 23, SHORT_COMPLEX, 1, 5, 1234);
    ASSERT_EQ(data.write_hdr(), 0);
    EXPECT_EQ(test::child_names(test::read_text(side), "RasterInfo"), test::field_names(data));
    for (const int status : {buffer.readhdr(side.c_str()), buffer.readhdr(), buffer.writehdr()})
        EXPECT_EQ(status, 0);
    EXPECT_EQ(values_of(buffer), values_of(data));
    buffer.NrOfLinesPerImage = 803;
    ASSERT_EQ(buffer.writehdr(side.c_str()), 0);
    read.BufferSize = 100;
    ASSERT_EQ(read.read_hdr(name.c_str()), 0);
    EXPECT_EQ(values_of(read), values_of(buffer));
    EXPECT_EQ(read.BufferSize, 0);
    EXPECT_EQ(cloned.clone(&read) + buffer_cloned.clone(&buffer), 0);
    EXPECT_EQ(values_of(cloned), values_of(read));
    EXPECT_EQ(values_of(buffer_cloned), values_of(buffer));
    char copied[512];
    buffer_cloned.getFilename(copied);
    EXPECT_EQ(copied, name);
    EXPECT_STREQ(cloned.FileName, name.c_str());
    EXPECT_TRUE(report.entries().empty());
}

// Names too long are none: neither another file's, nor that of a side file without a raster.
TEST(SideFile, ThatCannotBeIsRefused) {
    const test::Report report;
    const test::CapturedStderr silent;
    const std::string name = report.file("scene.raw"), folder = report.file("folder"),
                      too_long = report.file(std::string(512, 'n'));
    std::filesystem::create_directory(folder + ".hdr");
    DataFile data;
    BufferFile buffer{name.c_str()};
    data.setFilename(name.c_str());
    data.HeaderOffset = buffer.HeaderOffset = int64_t{1} << 40;
    EXPECT_EQ(data.write_hdr() + buffer.writehdr(), 2) << "the side file holds 32 bits";
    for (const std::string& side : {std::string{"x"}, name + ".hdr", folder + ".hdr", too_long + ".hdr"})
        EXPECT_EQ(buffer.readhdr(side.c_str()), 1) << side;
    for (const std::string& raster : {name, folder, too_long}) EXPECT_EQ(data.read_hdr(raster.c_str()), 1);
    data.setFilename(folder.c_str());
    EXPECT_EQ(data.write_hdr() + DataFile{}.write_hdr(), 2);
    buffer.setFilename(too_long.c_str());
    for (const int status : {buffer.readhdr(), buffer.writehdr(), data.copy(too_long.c_str())})
        EXPECT_EQ(status, 1);
}

TEST(SideFile, OfTheProfileFormNamesItsType) {
    const char* const types[] = {"FLOAT_COMPLEX", "FLOAT32",       "DOUBLE_COMPLEX", "FLOAT64",      "",
                                 "INT32",         "SHORT_COMPLEX", "INT16",          "INT8_COMPLEX", "INT8"};
    struct Row {
        const char *type, *order, *lines;
        int status, code, big;
    };
    std::vector<Row> rows{{"INT16", "msbfirst", "2048", 0, 7, 0},
                          {"INT16", "", "2048", 1, 7, 0},
                          {"INT16", "MSBFirst", "", 1, 7, 1},
                          {"int16", "MSBFirst", "2048", 1, -1, 1},
                          {"4", "MSBFirst", "2048", 1, -1, 1}};
    for (int code = 0; code <= INT8; ++code)  // INT_COMPLEX has no name
        rows.push_back(
            {types[code], "MSBFirst", "2048", code == INT_COMPLEX ? 1 : 0, code == INT_COMPLEX ? -1 : code, 1});
    const test::Report report;
    const test::CapturedStderr silent;
    std::string name = report.file("scene");
    const auto line = [](const char* key, std::string_view value) {
        return value.empty() ? "" : key + std::string{" = "} + std::string{value} + "\n";
    };
    DataFile file;
    for (const auto& row : rows) {
        name += 'x';  // parameter files stay in memory under their names
        test::write_text(name + ".hdr",
                         "[RasterInfo]\nHeaderOffset = 7\nRowPrefix = 3\nNrOfPixelsPerLine = 1024\n" +
                             line("CellType", row.type) + line("ByteOrder", row.order) +
                             line("NrOfLinesPerImage", row.lines));
        file.NrOfLinesPerImage = 19;
        EXPECT_EQ(file.read_hdr(name.c_str()), row.status) << row.type << ' ' << row.order;
        EXPECT_EQ(values_of(file), (std::vector<int64_t>{*row.lines ? 2048 : 19, 1024, 7, 3, row.big, row.code}));
    }
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
    test::Report report_;
    std::string name_ = report_.file("bytes.raw"), content_;
    DataFile file_;
};

/** One request: 'r' reads and 'w' writes n bytes, 's' seeks by n, to the place `tell`. */
struct Step {
    char what;
    int64_t n;
    int whence = 0;
    int64_t tell = 0;
    int status = 0;
};
using Steps = std::vector<Step>;
struct Sequence {
    int mode;
    std::vector<int> buffers;
    Steps steps;
};
const std::vector<int> kBuffers = {0, 1, 7, 16, 60, 100};
constexpr int64_t kFar = int64_t{1} << 40;
const Steps kReads = {{'r', 1}, {'r', 3}, {'r', 0}, {'r', 20}, {'r', 36}, {'r', 1, 0, 0, 4}},
            kWrites = {{'w', 1}, {'w', 3}, {'w', 0}, {'w', 20}, {'w', 7}, {'w', 2}},
            kMixed = {{'r', 4}, {'w', 2}, {'r', 3}, {'w', 1}, {'w', 9}, {'r', 13}, {'w', 3}, {'r', 2}},
            kUnbufferedSeeks = {{'s', 10, 0, 10},     {'r', 5},
                                {'s', -3, 1, 12},     {'s', 0, 2, 12, 1},
                                {'s', -15, 1, 12, 1}, {'s', kFar, 0, kFar}},
            // Outside the buffer, a relative step counts from the buffer's start, here 40, not from the cursor.
    kReadingSeeks = {{'r', 4}, {'s', 3, 1, 7},   {'s', 2, 0, 2}, {'r', 2},           {'s', 40, 0, 40},
                     {'r', 3}, {'s', -5, 1, 35}, {'r', 2},       {'s', 0, 3, 37, 1}, {'s', -1000, 1, 37, 1}},
            // Writing, any step counts from the buffer's start, whatever the whence.
    kWritingSeeks = {{'w', 2}, {'s', 10, 0, 10}, {'w', 2}, {'s', 10, 1, 20}, {'w', 1}},
            kUpdatingSeeks = {{'r', 4}, {'s', 10, 0, 10}, {'w', 2}, {'r', 1}, {'s', 5, 1, 17}, {'r', 3}};
const Sequence kSequences[] = {{0, kBuffers, kReads},    {1, kBuffers, kWrites},     {2, kBuffers, kWrites},
                               {3, kBuffers, kMixed},    {0, {0}, kUnbufferedSeeks}, {0, {16}, kReadingSeeks},
                               {2, {16}, kWritingSeeks}, {3, {16}, kUpdatingSeeks}};

// The contents are those of a plain file. Once, in mode 3, bytes that were only read were written back where the
// buffer ended, and pending ones were lost to the next read; and a size raised by hand while the file was open ran
// over the end of the buffer.
TEST_F(DataFileBytes, AreMovedAsInAPlainFile) {
    const test::CapturedStderr silent;
    for (const Sequence& sequence : kSequences) {
        for (const int buffer : sequence.buffers) {
            SCOPED_TRACE(testing::Message() << &sequence - kSequences << ' ' << buffer);
            test::write_text(name_, content_);
            std::string plain = sequence.mode == 1 ? "" : content_;
            open(sequence.mode, buffer);
            EXPECT_EQ(file_.is_buffered(), buffer > 0 ? 1 : 0);
            file_.BufferSize = 9 * buffer;
            EXPECT_EQ(file_.is_writing(), sequence.mode == 3 ? 2 : sequence.mode > 0 ? 1 : 0);
            for (const Step& step : sequence.steps) {
                const auto n = static_cast<std::size_t>(step.n), before = static_cast<std::size_t>(file_.tell());
                std::string bytes(step.what == 's' ? 0 : n, static_cast<char>('A' + before));
                if (step.what == 's') {
                    EXPECT_EQ(file_.seek(step.n, step.whence), step.status);
                } else if (step.what == 'w') {
                    EXPECT_EQ(file_.write(bytes.data(), step.n), step.status);
                    plain.replace(before, n, bytes);
                } else {
                    EXPECT_EQ(file_.read(bytes.data(), step.n), step.status);
                    EXPECT_TRUE(step.status != 0 || bytes == plain.substr(before, n));
                }
                const int64_t after = file_.tell(), moved = step.status == 0 ? step.n : 0;
                EXPECT_EQ(after, step.what == 's' ? step.tell : static_cast<int64_t>(before) + moved);
            }
            if (sequence.mode == 3) {  // writes what is pending
                EXPECT_EQ(file_.seek(0, 1), 0);
            }
            EXPECT_EQ(file_.close(), 0);
            EXPECT_EQ(test::read_text(name_), plain);
            EXPECT_EQ(file_.BufferSize, 0) << "a closed file is unbuffered";
        }
    }
}

TEST_F(DataFileBytes, ReadingAndWritingDropsAPendingBufferOnClose) {
    open(3, 16);
    ASSERT_EQ(file_.write("AB", 2), 0);
    ASSERT_EQ(file_.close(), 0);
    EXPECT_EQ(test::read_text(name_), content_);
}

// Requests that the access state does not allow: in a row, closed and opened in modes 0 to 3.
TEST_F(DataFileBytes, WrongStatesAreRefused) {
    const test::CapturedStderr silent;
    char bytes[12] = {};
    describe(file_, 2, 3, INT16, 0, 0, 0);
    BufferIO region{&file_, 0, 3, 0, 2, INT16};
    EXPECT_EQ(file_.seek(1, 0), 1);
    EXPECT_EQ(file_.close() + file_.open(7) + file_.open(-1), 0);
    EXPECT_EQ(file_.is_open(), 0);
    for (const int mode : {-1, 0, 1, 2, 3}) {
        SCOPED_TRACE(mode);
        test::write_text(name_, content_);
        if (mode >= 0) open(mode, 0);
        const int reads = mode == 0 || mode == 3 ? 0 : 1, writes = mode > 0 ? 0 : 1;
        EXPECT_EQ(file_.read(bytes, 1), reads);
        EXPECT_EQ(file_.write(bytes, 1), writes);
        EXPECT_EQ(file_.read(bytes, -1), 1);
        EXPECT_EQ(file_.write(bytes, -1), 1);
        EXPECT_EQ(region.writebuffer(bytes), writes);
        EXPECT_EQ(region.writeprefix(bytes), writes);
        EXPECT_EQ((BufferIO{&file_, 0, 1, 0, 1, FLOAT_COMPLEX}.writebuffer(bytes)), 1) << "complex into real";
        if (mode < 0) continue;
        EXPECT_EQ(region.readbuffer(bytes, 3), reads);
        EXPECT_EQ(region.readprefix(bytes), reads);
        describe(file_, 2, 3, FLOAT_COMPLEX, 0, 0, 0);
        EXPECT_EQ((BufferIO{&file_, 0, 3, 0, 9, INT16}.readbuffer(bytes, 3)), reads == 1 ? 1 : 4)
            << "file too short";
        describe(file_, 2, 3, INT16, 0, 0, 0);
    }
}

TEST_F(DataFileBytes, WhatCannotBeOpenedGivesNine) {
    const test::CapturedStderr silent;
    const auto cannot_be_opened = [&] {
        for (const int mode : {0, 2, 3}) EXPECT_EQ(file_.open(mode), 9);
        EXPECT_EQ((BufferIO{&file_, 0, 3, 0, 2, INT16}.readprefix(name_.data())), 9);
        EXPECT_EQ(file_.exists(), 0);
    };
    for (const std::string& name : {report_.file("missing"), report_.folder().path().string()}) {
        file_.setFilename(name.c_str());
        cannot_be_opened();
    }
    std::fill(std::begin(file_.FileName), std::end(file_.FileName), 'n');  // by hand, without an end
    cannot_be_opened();
    EXPECT_THAT(report_.messages("ERROR"),
                testing::Each(testing::AnyOf("File not opened!", std::strerror(ENOENT), std::strerror(EISDIR))));
}

// The entry names the call that failed, and the line of it that did; who called it stands in the call tree. Once
// all of them bore the name of the region's function and one helper's line.
TEST_F(DataFileBytes, FailuresOfRegionsNameTheCallAndItsLine) {
    const test::CapturedStderr silent;
    char bytes[120] = {};
    describe(file_, 9, 3, INT16, 0, 2, 0);
    BufferIO region{&file_, 0, 3, 0, 9, INT16}, outside{&file_, 1, 3, 0, 9, INT16};
    open(0, 0);
    EXPECT_EQ(region.readbuffer(bytes, 3) + region.readprefix(bytes), 4 + 4);
    EXPECT_EQ(outside.readbuffer(bytes, 3) + outside.writebuffer(bytes), 1 + 1);
    std::vector<std::string> places;
    std::set<int> lines;
    for (const test::ReportEntry& entry : report_.entries()) {
        places.push_back(entry.kind + " " + entry.function);
        lines.insert(entry.line);
    }
    EXPECT_THAT(places, testing::ElementsAre("ERROR DataFile::read", "ERROR_CALL_TREE BufferIO::readbuffer",
                                             "ERROR DataFile::read", "ERROR_CALL_TREE BufferIO::readprefix",
                                             "ERROR BufferIO::readbuffer", "ERROR BufferIO::writebuffer"));
    EXPECT_EQ(lines.size(), 5U);
}

// Once there is room again nothing is missing.
TEST_F(DataFileBytes, AFullDiskGivesFiveAndLosesNothing) {
    const test::CapturedStderr silent;
    describe(file_, 4, 15, INT16, 0, 2, 0);
    const std::string bytes(120, 'w');
    for (const int buffer : {0, 16, 200}) {  // whether write() meets the end of the disk, or close()
        for (const bool region : {false, true}) {
            const auto write = [&] {
                BufferIO part{&file_, 0, 15, 0, 4, INT16};
                return region ? part.writebuffer(bytes.data()) : file_.write(bytes.data(), 120);
            };
            open(1, buffer);
            const bool later = buffer == 200 && !region;
            {
                const test::FullDisk full{37};
                EXPECT_EQ(later ? write() + file_.seek(0, 1) + file_.close() : write(), later ? 10 : 5);
                EXPECT_EQ(file_.is_open(), 1);
            }
            EXPECT_EQ((later ? 0 : write()) + file_.close(), 0);
            const std::string written = test::read_text(name_);
            EXPECT_EQ(std::count(written.begin(), written.end(), 'w'), 120) << buffer << region;
        }
    }
    file_.setFilename("/dev/full");  // there the report has room
    open(2, 0);
    EXPECT_EQ(file_.write("w", 1), 5);
    EXPECT_THAT(report_.messages("ERROR"), testing::Contains("File writing failed!"));
}

// Raster and side file. A copy to a new name was open to all whatever its source was; and only the rasters were
// held apart: a copy could take the place of its source's side file, or its side file that of the source.
TEST_F(DataFileBytes, CopiesGrantNoMoreAndReplaceNothingOfTheirSource) {
    const test::CapturedStderr silent;
    describe(file_, 4, 15, INT8, 0, 0, 0);
    BufferFile buffer{name_.c_str()};
    buffer.copyDescription(file_);
    const auto copy = [&](const std::string& to, int overwrite = 1) {
        const int status = file_.copy(to.c_str(), overwrite);
        EXPECT_EQ(buffer.copy(to.c_str(), overwrite), status);
        return status;
    };
    const std::string held = report_.file("held"), looped = report_.file("looped");
    std::filesystem::create_directory(held + ".hdr");
    EXPECT_EQ(copy(held), 9) << "a side file that cannot be replaced";
    EXPECT_EQ(copy(report_.file("no/copy.raw")), 9);

    const mode_t umask_before = umask(022);
    const std::pair<unsigned, unsigned> modes[] = {{0600, 0600}, {0640, 0640}, {0666, 0644}, {0440, 0640}};
    for (const auto& [source, wanted] : modes) {
        const std::string made = report_.file("mode" + std::to_string(source));
        chmod(name_.c_str(), source);
        EXPECT_EQ(copy(made), 0);
        struct stat found {};
        EXPECT_TRUE(stat(made.c_str(), &found) == 0 && (found.st_mode & 0777U) == wanted) << source;
        EXPECT_EQ(test::read_text(made), content_);
        EXPECT_EQ(copy(made, 0), 1) << "not to be overwritten";
    }
    umask(umask_before);

    const std::string in = report_.file("in"), side = in + ".hdr";
    std::filesystem::create_symlink("in.hdr", report_.file("shared.hdr"));
    std::filesystem::create_symlink("looped", looped + ".hdr");
    const std::pair<std::string, std::string> onto[] = {
        {in, in}, {in, side}, {side, in}, {in, report_.file("shared")}, {in, looped}};
    for (const auto& [from, to] : onto) {
        for (const std::string& file : {in, side, looped}) test::write_text(file, "old");
        file_.setFilename(from.c_str());
        buffer.setFilename(from.c_str());
        EXPECT_EQ(copy(to), 1) << from << " to " << to;
        for (const std::string& file : {in, side, looped}) EXPECT_EQ(test::read_text(file), "old");
    }
}

// Until it is complete and committed, a new raster leaves an older one alone.
TEST_F(DataFileBytes, ANewRasterThatIsNotCompleteGoes) {
    BufferFile made{name_.c_str()};
    describe(made, 4, 15, INT16, 0, 0, 0);
    EXPECT_EQ(made.commit(), 1) << "nothing is begun";
    for (const bool commits : {false, true}) {
        ASSERT_EQ(made.create(), 0);
        EXPECT_EQ(made.write(content_.data(), 60), 60);
        if (commits) {
            EXPECT_EQ(made.commit(), 5) << "60 bytes of 120";
        } else {
            made.close();
        }
        EXPECT_FALSE(made.is_open());
    }
    ASSERT_EQ(made.create(), 0);
    made.NrOfLinesPerImage = -1;
    EXPECT_EQ(made.commit(), 1);
    made.setFilename("");
    EXPECT_EQ(made.create(), 1);
    EXPECT_EQ(test::read_text(name_), content_);
    const auto files = std::filesystem::directory_iterator{report_.folder().path()};
    EXPECT_EQ(std::distance(begin(files), end(files)), 2) << "the raster and the report";
}

struct Hostile {
    int lines, samples, type, prefix;
    int64_t offset;
    int first_line, count, first_sample, width, status;
};
// Descriptions that make no raster or one beyond the file, then regions of a good one.
constexpr int kDescriptions = 10;
const Hostile kHostile[] = {
    {-1, 10, INT16, 0, 0, 0, -1, 0, 10, 1},
    {1, -10, INT16, 0, 0, 0, 1, 0, -10, 1},
    {1, 10, INT16, -4, 0, 0, 1, 0, 10, 1},
    {1, 10, INT16, 0, -4, 0, 1, 0, 10, 1},
    {INT_MIN, INT_MIN, INT16, INT_MIN, INT_MIN, 0, INT_MIN, 0, INT_MIN, 1},
    {1, 10, 42, 0, 0, 0, 1, 0, 10, 1},
    {1, 10, CELL_NOT_SET, 0, 0, 0, 1, 0, 10, 1},
    {2, 29, INT16, 3, 1, 0, 2, 0, 29, 4},                                             // longer than the file
    {INT_MAX, INT_MAX, INT16, 0, 0, 0, INT_MAX, 0, INT_MAX, 4},                       // 32 bits overflow
    {INT_MAX, INT_MAX, DOUBLE_COMPLEX, INT_MAX, INT_MAX, 0, INT_MAX, 0, INT_MAX, 1},  // 64 bits overflow
    {5, 10, INT16, 0, 0, -1, 1, 0, 10, 1},
    {5, 10, INT16, 0, 0, 0, -1, 0, 10, 1},
    {5, 10, INT16, 0, 0, 0, 1, -1, 5, 1},
    {5, 10, INT16, 0, 0, 0, 1, 6, 5, 1},
    {5, 10, INT16, 0, 0, 0, 1, 0, -3, 1},
    {5, 10, INT16, 0, 0, 4, 2, 0, 10, 4},
    {5, 10, INT16, 0, 0, INT_MAX, INT_MAX, 0, 10, 4},
};

// Read and written by either class: nothing is touched, and no memory is taken, for a byte is all there is.
TEST(Hostile, DescriptionsAndRegionsAreRefusedBeforeMemoryIsTaken) {
    const test::Report report;
    const test::CapturedStderr silent;
    const std::string name = report.file("hostile.raw"), content(100, 'x');
    test::write_text(name, content);
    for (const Hostile& row : kHostile) {
        SCOPED_TRACE(&row - kHostile);
        DataFile file;
        file.setFilename(name.c_str());
        describe(file, row.lines, row.samples, row.type, 0, row.prefix, row.offset);
        if (file.write_hdr() == 0) {
            EXPECT_EQ(file.read_hdr(name.c_str()), 0);
        }
        const std::size_t before = report.entries("ERROR").size();
        char untouched = 'u';
        BufferIO region{&file, row.first_sample, row.width, row.first_line, row.count, row.type};
        EXPECT_EQ(region.readbuffer(&untouched, row.width), row.status);
        EXPECT_EQ(region.readbuffer(&untouched, std::max(row.width, 1) - 1), 1) << "too narrow";
        EXPECT_GT(report.entries("ERROR").size(), before);
        if (&row < kHostile + kDescriptions) {
            EXPECT_EQ(file.rasterSize() < 0, row.status == 1);
        }
        BufferFile buffer{name.c_str()};
        buffer.copyDescription(file);
        const auto block = [&](auto call) { call(row.first_line, row.count, row.first_sample, row.width); };
        for (const int mode : {BufferFile::READ, BufferFile::READ_WRITE}) {
            buffer.open(mode);
            block([&](auto... at) { buffer.readbuffer(reinterpret_cast<short*>(&untouched), at...); });
            block([&](auto... at) { buffer.readbuffer(reinterpret_cast<dcomplex*>(&untouched), at...); });
            EXPECT_EQ(buffer.readInt(row.lines, row.samples), 0);
        }
        EXPECT_EQ(untouched, 'u');
        if (row.status == 1) {
            ASSERT_EQ(file.open(3), 0);
            EXPECT_EQ(region.writebuffer(&untouched), 1);
            block([&](auto... at) { buffer.writebuffer(reinterpret_cast<const short*>(&untouched), at...); });
        }
        buffer.close();
        EXPECT_EQ(test::read_text(name), content);
    }
}

// The block itself has places, the line after it has none: computing that overflowed once.
TEST(Hostile, RegionsEndWithThePlacesOfAFile) {
    const test::Report report;
    const std::string name = report.file("raster"), content(100, 'x');
    test::write_text(name, content);
    BufferFile buffer{name.c_str()};
    describe(buffer, 5, 1000, INT16, 0, 0, std::numeric_limits<int64_t>::max() - 100);
    buffer.open(BufferFile::READ_WRITE);
    buffer.seek(10, BufferFile::FROM_START);
    const short sample = 77;
    buffer.writebuffer(&sample, 0, 1, 0, 1);
    EXPECT_EQ(buffer.tell(), 10);
    buffer.close();
    EXPECT_EQ(test::read_text(name), content);
}

// A count in the text that 32 bits do not hold does not wrap round to a small one.
TEST(Hostile, CountsAreNotCutToFit) {
    const test::TemporaryFolder folder;
    const std::string name = folder.file("scene"), side = name + ".hdr";
    DataFile file;
    file.setFilename(name.c_str());
    for (const char* count : {"99999999999", "4294967297", "-4294967297", "-99999999999999999999"}) {
        describe(file, 17, 1, INT16, 0, 0, 0);
        ASSERT_EQ(file.write_hdr(), 0);
        std::string text = test::read_text(side);
        test::write_text(side, text.replace(text.find(">17<") + 1, 2, count));
        EXPECT_EQ(file.read_hdr(name.c_str()), 0);
        EXPECT_EQ(file.NrOfLinesPerImage, *count == '-' ? INT_MIN : INT_MAX) << count;
    }
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
