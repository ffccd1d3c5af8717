// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_DIAGNOSTICS_H
#define QUO_TESTS_SUPPORT_DIAGNOSTICS_H

#include "quo_base/ckerr.h"
#include "support/prelude.h"

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

/** The lines of a table of the test data, each cut at the separator into at most `columns` texts. */
inline std::vector<std::vector<std::string>> read_table(const std::string& name, char separator = ',',
                                                        std::size_t columns = 100) {
    std::istringstream lines{read_text(QUO_TEST_DATA + ("/" + name))};
    if (lines.str().empty()) throw std::runtime_error("no table " + name);
    std::vector<std::vector<std::string>> rows;
    for (std::string line; std::getline(lines, line);) {
        if (line.starts_with('#')) continue;
        std::vector<std::string>& row = rows.emplace_back();
        for (auto end = line.find(separator); end != line.npos && row.size() + 1 < columns;
             end = line.find(separator)) {
            row.push_back(line.substr(0, end));
            line.erase(0, end + 1);
        }
        row.push_back(line);
    }
    return rows;
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

/** One entry as it stands in a report. Call-tree lines carry no message. */
struct ReportEntry {
    std::string kind, message, file, function;
    int line = 0;
};

/** What stands in a line between two texts, up to the last of the second; empty where they do not. */
inline std::string between(std::string_view line, std::string_view before, std::string_view after) {
    const auto start = line.find(before), end = line.rfind(after);
    if (start == line.npos || end == line.npos || start + before.size() > end) return "";
    return std::string{line.substr(start + before.size(), end - start - before.size())};
}

/** The entries of a report. Of a message with line feeds only the first line is kept. */
inline std::vector<ReportEntry> entries_of(const std::string& report) {
    std::vector<ReportEntry> entries;
    std::istringstream lines{report};
    for (std::string line; std::getline(lines, line);) {
        // "3)  ERROR [12 sec]." or "3)  WARNING [12 sec]: message"
        if (line[0] >= '0' && line[0] <= '9' && line.find(" sec]") != line.npos)
            entries.push_back({between(line, ")  ", " ["), between(line + '\n', "]: ", "\n"), "", "", 0});
        if (line.starts_with("    . Call tree: ")) entries.push_back({"ERROR_CALL_TREE", "", "", "", 0});
        if (entries.empty() || !line.starts_with("    ")) continue;
        ReportEntry& entry = entries.back();
        if (line.starts_with("    . "))  // "    . FILE <file>, FUNCTION <function>, LINE <line>."
            entry = {entry.kind, entry.message, between(line, "FILE ", ", FUNCTION "),
                     between(line, ", FUNCTION ", ", LINE "), std::atoi(between(line, ", LINE ", ".").c_str())};
        // The long form has a line for each.
        for (const auto& [label, value] : {std::pair{"    FILE : ", &entry.file},
                                           {"    FUNCTION : ", &entry.function},
                                           {"    MESSAGE : ", &entry.message}})
            if (line.starts_with(label))
                *value = line.substr(std::strlen(label), line.size() - std::strlen(label) - 1);
        if (line.starts_with("    LINE : ")) entry.line = std::atoi(line.c_str() + 11);
    }
    return entries;
}

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
    [[nodiscard]] std::vector<ReportEntry> entries() const { return entries_of(text()); }
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
