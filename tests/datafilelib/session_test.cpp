// SPDX-License-Identifier: Apache-2.0

// Runs the sessions of data/rasters/sessions.txt.
#include "support/session.h"

#include "quo_base/datafile.h"
#include "support/limits.h"

namespace {

constexpr char kScript[] = QUO_TEST_DATA "/rasters/sessions.txt";

class Session : public testing::TestWithParam<std::string> {
protected:
    Session() {
        test::write_text(file("raster"), "0123456789abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWX");
        data_.setFilename(file("raster").c_str());
        buffer_.setFilename(file("raster").c_str());
    }
    [[nodiscard]] std::string file(std::string_view name) const {
        return name.empty() || name[0] == '/' ? std::string{name} : report_.file(name);
    }
    /** The status of a region that is not there. Nothing is touched by either class, and no memory is taken, for a
     * byte is all there is. */
    int refused(int first_line, int count, int first_sample, int width) {
        char untouched = 'u';
        auto* const shorts = reinterpret_cast<short*>(&untouched);
        const std::size_t before = report_.entries("ERROR").size();
        BufferIO region{&data_, first_sample, width, first_line, count, data_.CellType};
        const int status = region.readbuffer(&untouched, width);
        EXPECT_EQ(region.readbuffer(&untouched, std::max(width, 1) - 1), 1) << "too narrow";
        EXPECT_GT(report_.entries("ERROR").size(), before);
        buffer_.copyDescription(data_);
        for (const int mode : {BufferFile::READ, BufferFile::READ_WRITE}) {
            buffer_.open(mode);
            buffer_.readbuffer(shorts, first_line, count, first_sample, width);
            buffer_.readbuffer(reinterpret_cast<dcomplex*>(&untouched), first_line, count, first_sample, width);
            EXPECT_EQ(buffer_.readInt(data_.NrOfLinesPerImage, data_.NrOfPixelsPerLine), 0);
        }
        if (status == 1) {
            EXPECT_EQ(data_.open(3), 0);
            EXPECT_EQ(region.writebuffer(&untouched), 1);
            buffer_.writebuffer(shorts, first_line, count, first_sample, width);
        }
        buffer_.close();
        EXPECT_EQ(untouched, 'u');
        return status + data_.close();
    }

    /** What "b." begins with calls the BufferFile, the rest the DataFile or both. */
    std::int64_t call(const test::Words& words, std::string& told) {
        const test::CapturedStderr silent;
        const std::string text = words.text(1, ""), path = file(text);
        const char *const from = text.data(), *const name = path.c_str();
        const auto n = [&](std::size_t word) { return words.whole(word); };
        const auto size = [&] { return words.text(2) ? n(2) : static_cast<int>(text.size()); };
        const auto tell = [&](int bytes, auto read) {  // what is read, as far as it is said to be
            std::string room(static_cast<std::size_t>(std::clamp(bytes, 0, 999)), '?');
            const int result = read(room.data());
            if (room.find_first_not_of('?') != room.npos) told = room.substr(0, room.find('?')) + "\n";
            return result;
        };
        const auto block = [&](auto call) { call(n(1), n(2), n(3), n(4)); };
        const auto region = [&] {
            return words.text(5) ? BufferIO{&data_, n(1), n(2), n(3), n(4), n(5)}
                                 : BufferIO{&data_, 0, 3, 0, 2, INT16};
        };
        const std::map<std::string, std::function<std::int64_t()>> calls = {
            {"name", [&] { return buffer_.setFilename(name), data_.setFilename(name); }},
            {"describe",
             [&] {
                 data_.NrOfLinesPerImage = n(1), data_.NrOfPixelsPerLine = n(2), data_.CellType = n(3);
                 data_.ByteOrder = n(4), data_.RowPrefix = n(5), data_.HeaderOffset = words.number(6);
                 return buffer_.copyDescription(data_), 0;
             }},
            {"description",
             [&] {
                 const RasterDescription& d = text == "b" ? static_cast<RasterDescription&>(buffer_) : data_;
                 for (const auto value : {d.NrOfLinesPerImage, d.NrOfPixelsPerLine, d.CellType, d.ByteOrder,
                                          d.RowPrefix, static_cast<int>(d.HeaderOffset)})
                     told += std::to_string(value) + " ";
                 return told.back() = '\n', 0;
             }},
            {"open", [&] { return data_.BufferSize = n(2), data_.open(n(1)); }},
            {"enlarge", [&] { return data_.BufferSize *= 9; }},
            {"close", [&] { return data_.close(); }},
            {"read", [&] { return tell(n(1), [&](char* to) { return data_.read(to, n(1)); }); }},
            {"write", [&] { return data_.write(from, size()); }},
            {"seek", [&] { return data_.seek(words.number(1), n(2)); }},
            {"tell", [&] { return data_.tell(); }},
            {"is", [&] { return 100 * data_.is_open() + 10 * data_.is_buffered() + data_.is_writing(); }},
            {"exists", [&] { return data_.exists() + (buffer_.exists() ? 1 : 0); }},
            {"read_hdr", [&] { return data_.read_hdr(name); }},
            {"write_hdr", [&] { return data_.write_hdr(); }},
            {"copy", [&] { return 10 * data_.copy(name, n(2)) + buffer_.copy(name, n(2)); }},
            {"readbuffer",
             [&] {
                 return tell(words.text(6) ? 0 : 12,
                             [&](char* to) { return region().readbuffer(to, words.text(6) ? n(6) : 3); });
             }},
            {"writebuffer",
             [&] { return region().writebuffer(words.text(5) ? std::string(999, 'w').data() : from); }},
            {"readprefix", [&] { return tell(8, [&](char* to) { return region().readprefix(to); }); }},
            {"writeprefix", [&] { return region().writeprefix(words.text(6, from)); }},
            {"b.open", [&] { return buffer_.open(n(1)), buffer_.is_open() ? 1 : 0; }},
            {"b.initbuffer", [&] { return buffer_.initbuffer(n(1), n(2)), buffer_.is_buffered() ? 1 : 0; }},
            {"b.close", [&] { return buffer_.close(), buffer_.is_open() ? 1 : 0; }},
            {"b.read", [&] { return tell(n(1), [&](char* to) { return buffer_.read(to, n(1)); }); }},
            {"b.write", [&] { return buffer_.write(from, size()); }},
            {"b.copyFrom",
             [&] {
                 BufferFile source{name};
                 return source.open(1), 10 * buffer_.copyFrom(source, n(2)) + source.status();
             }},
            {"b.seek", [&] { return buffer_.seek(n(1), n(2)), buffer_.tell(); }},
            {"b.tell", [&] { return buffer_.tell(); }},
            {"b.status", [&] { return buffer_.status(); }},
            {"b.systemError", [&] { return buffer_.systemError(); }},
            {"b.readbuffer",
             [&] {
                 return tell(2 * n(2) * n(4), [&](char* to) {
                     return block([&](auto... at) { buffer_.readbuffer(reinterpret_cast<short*>(to), at...); }), 0;
                 });
             }},
            {"b.writebuffer",
             [&] { return buffer_.writebuffer(reinterpret_cast<const short*>(from), n(2), n(3), n(4), n(5)), 0; }},
            {"b.readprefix",
             [&] { return tell(4, [&](char* to) { return buffer_.readprefix(to, n(1), n(2)), 0; }); }},
            {"b.writeprefix", [&] { return buffer_.writeprefix(from, n(2), n(3)), 0; }},
            {"b.writeOffset", [&] { return buffer_.writeOffset(from, size()), 0; }},
            {"b.readShort", [&] { return buffer_.readShort(n(1), n(2)); }},
            {"b.readhdr", [&] { return words.text(1) ? buffer_.readhdr(name) : buffer_.readhdr(); }},
            {"b.writehdr", [&] { return words.text(1) ? buffer_.writehdr(name) : buffer_.writehdr(); }},
            {"b.create", [&] { return buffer_.create(); }},
            {"b.commit", [&] { return buffer_.commit(); }},
            {"ofDeadProcess",
             [&] {  // whose memory takes no bytes, without an error
                 const pid_t process = fork();
                 if (process == 0) {
                     pause();
                     _exit(0);
                 }
                 buffer_.setFilename(("/proc/" + std::to_string(process) + "/mem").c_str());
                 buffer_.open(BufferFile::READ_WRITE);
                 kill(process, SIGKILL);
                 waitpid(process, nullptr, 0);
                 return buffer_.is_open() ? 1 : 0;
             }},
            {"refused", [&] { return refused(n(1), n(2), n(3), n(4)); }},
            {"makesRaster", [&] { return data_.rasterSize() < 0 ? 0 : 1; }},
            {"room", [&] { return full_.emplace(static_cast<rlim_t>(n(1))), 0; }},
            {"endless", [&] { return full_.reset(), 0; }},
            {"folder", [&] { return std::filesystem::create_directory(name) ? 1 : 0; }},
            {"text",
             [&] {
                 std::string content = words.text(2);
                 std::ranges::replace(content, ';', '\n');
                 return test::write_text(name, content), 0;
             }},
            {"replace",
             [&] {
                 std::string content = test::read_text(name);
                 const std::string_view old = words.text(2);
                 return test::write_text(name, content.replace(content.find(old), old.size(), words.text(3))), 0;
             }},
            {"show", [&] { return told = test::read_text(name) + "\n", 0; }},
            {"files",
             [&] {
                 const auto all = std::filesystem::directory_iterator{report_.folder().path()};
                 return std::distance(begin(all), end(all));
             }},
            {"report", [&] {
                 std::map<int, std::size_t> lines;
                 for (const auto& entry : report_.entries())
                     told += entry.kind + " " + entry.function + " " +
                             std::to_string(lines.try_emplace(entry.line, lines.size() + 1).first->second) +
                             (entry.message.empty() ? "" : " " + entry.message) + "\n";
                 return 0;
             }}};
        return calls.at(words.text(0))();
    }

private:
    test::Report report_;
    DataFile data_;
    BufferFile buffer_;
    std::optional<test::FullDisk> full_;
};

TEST_P(Session, AnswersAndWritesWhatTheScriptSays) {
    test::run_session(kScript, GetParam(), [this](const test::Words& words, std::string& told) {
        const std::int64_t result = call(words, told);
        EXPECT_TRUE(errno == 0 || *words.text(0) != 'b');
        return result;
    });
}
INSTANTIATE_TEST_SUITE_P(Script, Session, testing::ValuesIn(test::sessions_of(kScript)),
                         [](const auto& row) { return row.param; });

}  // namespace
