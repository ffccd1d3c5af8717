#ifndef QUO_TESTS_SUPPORT_DIAGNOSTICS_H
#define QUO_TESTS_SUPPORT_DIAGNOSTICS_H

#include <gtest/gtest.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <charconv>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include "quo_base/ckerr.h"

namespace test {

/** A fresh folder that goes with everything in it. */
class TemporaryFolder {
public:
    TemporaryFolder() {
        std::string name = (std::filesystem::temp_directory_path() / "quo_test_XXXXXX").string();
        if (!mkdtemp(name.data())) throw std::runtime_error("no temporary folder");
        path_ = name;
    }
    ~TemporaryFolder() {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
        errno = 0;
    }
    TemporaryFolder(const TemporaryFolder&) = delete;
    TemporaryFolder& operator=(const TemporaryFolder&) = delete;

    [[nodiscard]] const std::filesystem::path& path() const { return path_; }
    /** The full name of a file in the folder. */
    [[nodiscard]] std::string file(std::string_view name) const { return (path_ / name).string(); }

private:
    std::filesystem::path path_;
};

/** A file's bytes; empty when it cannot be opened. */
inline std::string read_text(const std::filesystem::path& path) {
    const int kept = errno;
    std::ifstream stream{path, std::ios::binary};
    std::string text{std::istreambuf_iterator<char>{stream}, {}};
    errno = kept;
    return text;
}

inline void write_text(const std::filesystem::path& path, std::string_view text) {
    std::ofstream{path, std::ios::binary} << text;
    errno = 0;
}

/** Collects what is written to the standard error stream until text() is asked for or the object goes. */
class CapturedStderr {
public:
    CapturedStderr() : file_{std::tmpfile()} {
        std::fflush(stderr);
        original_ = dup(STDERR_FILENO);
        if (!file_ || original_ < 0 || dup2(fileno(file_), STDERR_FILENO) < 0)
            throw std::runtime_error("cannot capture the standard error stream");
        errno = 0;
    }
    ~CapturedStderr() {
        stop();
        std::fclose(file_);
    }
    CapturedStderr(const CapturedStderr&) = delete;
    CapturedStderr& operator=(const CapturedStderr&) = delete;

    std::string text() {
        stop();
        std::string text(static_cast<std::size_t>(std::max(0L, std::ftell(file_))), '\0');
        std::rewind(file_);
        text.resize(std::fread(text.data(), 1, text.size(), file_));
        return text;
    }

private:
    void stop() {
        if (original_ < 0) return;
        std::fflush(stderr);
        dup2(original_, STDERR_FILENO);
        close(original_);
        original_ = -1;
        std::fseek(file_, 0, SEEK_END);
    }

    std::FILE* file_;
    int original_ = -1;
};

/** One entry as it stands in a report. Call-tree lines carry no number (-1) and no message. */
struct ReportEntry {
    int number = -1;
    std::string kind, message, file, function;
    int line = 0;
};

/** Reads a report back. Of a message with line feeds only the first line is kept. */
class ReportReader {
public:
    static std::vector<ReportEntry> read(const std::string& text) {
        ReportReader reader;
        std::istringstream lines{text};
        for (std::string line; std::getline(lines, line);) reader.take(line);
        return reader.entries_;
    }

private:
    static constexpr std::string_view kTree = "    . Call tree: FILE ", kPlace = "    . FILE ";

    void take(std::string_view line) {
        if (line.starts_with(kTree)) {
            entries_.push_back({-1, "ERROR_CALL_TREE", "", "", "", 0});
            take_place(line.substr(kTree.size()));
        } else if (entries_.empty() || !line.starts_with("    ")) {
            take_head(line);
        } else if (line.starts_with(kPlace)) {
            take_place(line.substr(kPlace.size()));
        } else {
            take_field(line);
        }
    }
    void take_head(std::string_view line) {  // "3)  ERROR [12 sec]." or "3)  WARNING [12 sec]: message"
        ReportEntry entry;
        const auto [end, error] = std::from_chars(line.data(), line.data() + line.size(), entry.number);
        std::string_view rest = line.substr(static_cast<std::size_t>(end - line.data()));
        const auto bracket = rest.find(" [");
        if (error != std::errc{} || !rest.starts_with(")  ") || bracket == rest.npos) return;
        entry.kind = rest.substr(3, bracket - 3);
        if (const auto colon = rest.find("]: "); colon != rest.npos) entry.message = rest.substr(colon + 3);
        entries_.push_back(std::move(entry));
    }
    void take_place(std::string_view place) {  // "<file>, FUNCTION <function>, LINE <line>."
        const auto function = place.find(", FUNCTION "), line = place.rfind(", LINE ");
        if (function == place.npos || line == place.npos) return;
        entries_.back().file = place.substr(0, function);
        entries_.back().function = place.substr(function + 11, line - function - 11);
        entries_.back().line = std::atoi(place.data() + line + 7);
    }
    void take_field(std::string_view line) {  // the lines of the long form
        const auto value = [line](std::string_view label) {
            return line.substr(label.size(), line.size() - label.size() - 1);
        };
        ReportEntry& entry = entries_.back();
        if (constexpr std::string_view label = "    FILE : "; line.starts_with(label)) entry.file = value(label);
        if (constexpr std::string_view label = "    FUNCTION : "; line.starts_with(label))
            entry.function = value(label);
        if (constexpr std::string_view label = "    LINE : "; line.starts_with(label))
            entry.line = std::atoi(line.data() + label.size());
        if (constexpr std::string_view label = "    MESSAGE : "; line.starts_with(label))
            entry.message = value(label);
    }

    std::vector<ReportEntry> entries_;
};

/** Turns tracking on and opens a report in a folder of its own. When it goes, the report is closed, tracking ends
 * and the test fails if a tracked block is left. */
class Report {
public:
    explicit Report(const char* title = "test", int level = 1) {
        exit_ckerr();
        init_ckerr_locking();
        EXPECT_EQ(init_report(name_.c_str(), title, level), 0);
        errno = 0;
    }
    ~Report() {
        exit_report();
        CapturedStderr captured;
        exit_ckerr();
        EXPECT_EQ(captured.text(), "") << "Tracked blocks are left";
    }
    Report(const Report&) = delete;
    Report& operator=(const Report&) = delete;

    [[nodiscard]] std::string text() const { return read_text(name_); }
    [[nodiscard]] std::vector<ReportEntry> entries() const { return ReportReader::read(text()); }
    /** The entries of one kind, by the name that stands in the report: "ERROR", "WARNING", "ERROR_CALL_TREE", ...
     */
    [[nodiscard]] std::vector<ReportEntry> entries(std::string_view kind) const {
        std::vector<ReportEntry> all = entries();
        std::erase_if(all, [kind](const ReportEntry& entry) { return entry.kind != kind; });
        return all;
    }
    /** The messages of the entries of one kind. */
    [[nodiscard]] std::vector<std::string> messages(std::string_view kind) const {
        std::vector<std::string> all;
        for (ReportEntry& entry : entries(kind)) all.push_back(std::move(entry.message));
        return all;
    }
    /** The report's own folder, free for other files of the test. */
    [[nodiscard]] const TemporaryFolder& folder() const { return folder_; }
    [[nodiscard]] std::string file(std::string_view name) const { return folder_.file(name); }

private:
    TemporaryFolder folder_;
    std::string name_ = folder_.file("report.txt");
};

/** Leaves room for so many tracked blocks: the next allocation fails. Needs tracking to be on, and the function
 * under test must open a frame, or its clean-up would take the blocks that fill the table. */
class AllocationLimit {
public:
    explicit AllocationLimit(int room) {
        fill();
        for (; room > 0 && !blocks_.empty(); --room) drop();
    }
    ~AllocationLimit() {
        while (!blocks_.empty()) drop();
    }
    AllocationLimit(const AllocationLimit&) = delete;
    AllocationLimit& operator=(const AllocationLimit&) = delete;

    /** How many blocks could be had now: the room as given, when everything has been freed since. */
    int room() {
        const std::size_t before = blocks_.size();
        fill();
        const std::size_t found = blocks_.size() - before;
        while (blocks_.size() > before) drop();
        return static_cast<int>(found);
    }

private:
    void fill() {
        const int level = ckflg_report(), kept = errno;
        set_flg_report(0);  // the refusal is no news here
        while (void* block = malloc_ckerr(1)) blocks_.push_back(block);
        set_flg_report(level);
        errno = kept;
    }
    void drop() {
        free_ckerr(blocks_.back());
        blocks_.pop_back();
    }

    std::vector<void*> blocks_;
};

/** Calls `attempt()` with room for 0, 1, 2, ... tracked blocks until it returns 0. Every failure must give
 * `status` and leave no block behind. */
template <typename Attempt>
void fail_every_allocation(Attempt attempt, int status = QUO_NO_MEMORY, int most = 500) {
    for (int room = 0; room <= most; ++room) {
        SCOPED_TRACE("room for " + std::to_string(room) + " tracked blocks");
        AllocationLimit limit{room};
        const int result = attempt();
        errno = 0;
        if (result == 0) return;
        EXPECT_EQ(result, status);
        EXPECT_EQ(limit.room(), room) << "a failed call left blocks";
    }
    ADD_FAILURE() << "never succeeded";
}

}  // namespace test

#endif
