// SPDX-License-Identifier: Apache-2.0
#include "diagnosticslib/report.h"

#include <atomic>
#include <climits>
#include <cstdio>
#include <cstring>
#include <ctime>
#include <mutex>
#include <optional>
#include <utility>

#include "diagnosticslib/call_stack.h"
#include "diagnosticslib/errno_kept.h"
#include "quo_base/ckerr.h"
#include "quo_base/quorelReport.h"
#include "sarutillib/ground/bounded_text.h"

namespace {

constexpr char kRule[] = "==============================================================================";
static_assert(sizeof kRule == 78 + 1);
constexpr std::size_t kTitleRoom = 4096;

/** The report or the log. The level can be asked for at any time, by any thread; all else waits for `writing`, so
 * that every entry is whole and every number given once. */
struct Channel {
    std::FILE* stream;
    std::atomic<int> level;
    int entries;

    [[nodiscard]] bool is_open() const noexcept { return level >= 1 && level <= 3; }
};

std::mutex writing;
Channel report, log_file;

// What each thread reported last, for the exceptions of other languages: they come before anybody opens a report.
thread_local quorelReportEntry latest_error;

// Report and log tell of one run and share its title and start time: opening the log after the report moves the
// origin of the report's elapsed times and replaces the title of its closing banner.
char shared_title[kTitleRoom];
std::time_t shared_start;

const char* shown(const char* text) noexcept { return text ? text : "(null)"; }

/** The answer to a request that names no valid level. Callers only test it for zero. */
int one_below(int level) noexcept { return level == INT_MIN ? level : level - 1; }

/** EOF when the file is not open or anything written to it was lost. */
int close_channel(Channel& channel) noexcept {
    if (!channel.stream) return EOF;
    const bool lost = std::fflush(channel.stream) != 0 || std::ferror(channel.stream) != 0;
    const bool unclosed = std::fclose(channel.stream) != 0;
    channel.stream = nullptr;
    return lost || unclosed ? EOF : 0;
}

/** An empty file, or null. Opening it for appending first leaves an existing file whole when it is not writable.
 */
std::FILE* create(const char* file_name) noexcept {
    if (!file_name) return nullptr;
    std::FILE* probe = std::fopen(file_name, "ae");
    if (!probe) return nullptr;
    std::fclose(probe);
    return std::fopen(file_name, "we");
}

/** Opens report or log. Returns the answer for a request that opens nothing, or nothing once the file is open. */
std::optional<int> open_channel(Channel& channel, const char* file_name, const char* title, int level) noexcept {
    if (channel.is_open() || !ckflg_ckerr()) return channel.level;
    channel.level = 0;
    if (level < 1 || level > 3) return one_below(level);

    std::FILE* stream = create(file_name);
    if (!stream) return 0;
    // A file may still be open behind a level that was forced to 0; all of it is on the disk already.
    if (channel.stream) close_channel(channel);
    channel.stream = stream;
    channel.entries = 0;
    std::time(&shared_start);
    quo::copy_bounded(shared_title, shown(title));
    channel.level = level;
    return std::nullopt;
}

/** Date and time in the 24-character calendar form and a line feed. */
struct DateText {
    char text[32];
    explicit DateText(std::time_t at) noexcept {
        if (!ctime_r(&at, text)) quo::copy_bounded(text, "\n");
    }
};

struct KindName {
    QuoReportKind kind;
    const char* name;
};
constexpr KindName kKindNames[] = {
    {QUO_ERROR, "ERROR"},
    {QUO_WARNING, "WARNING"},
    {QUO_CHECKPOINT, "CHECKPOINT"},
    {QUO_ERROR_CALL_TREE, "ERROR_CALL_TREE"},
    {QUO_CORRECT_FUNCTION_CALL, "CORRECT_FUNCTION_CALL"},
    {QUO_CORRECT_SYSTEM_CALL, "CORRECT_SYSTEM_CALL"},
    {QUO_MESSAGE, "MESSAGE"},
    {QUO_EXCEPTION, "EXCEPTION"},
};

const char* name_of(int kind) noexcept {
    for (const KindName& row : kKindNames) {
        if (row.kind == kind) return row.name;
    }
    return "UNKNOWN";
}

struct Entry {
    const char* message;
    int kind, line;
    const char *function, *file;
};

void keep_error(const Entry& entry) noexcept {
    quo::copy_bounded(latest_error.message, entry.message);
    quo::copy_bounded(latest_error.function, entry.function);
    quo::copy_bounded(latest_error.file, entry.file);
    latest_error.line = entry.line;
}

void write_entry(std::FILE* stream, int number, const Entry& entry) noexcept {
    const int elapsed_s = static_cast<int>(std::time(nullptr) - shared_start);
    if (entry.kind == QUO_ERROR) {
        std::fprintf(
            stream, "\n%d)  %s [%d sec].\n    FILE : %s.\n    FUNCTION : %s.\n    LINE : %d.\n    MESSAGE : %s.\n",
            number, name_of(entry.kind), elapsed_s, entry.file, entry.function, entry.line, entry.message);
    } else if (entry.kind == QUO_ERROR_CALL_TREE) {
        std::fprintf(stream, "    . Call tree: FILE %s, FUNCTION %s, LINE %d.\n", entry.file, entry.function,
                     entry.line);
    } else {
        std::fprintf(stream, "\n%d)  %s [%d sec]: %s\n    . FILE %s, FUNCTION %s, LINE %d.\n", number,
                     name_of(entry.kind), elapsed_s, entry.message, entry.file, entry.function, entry.line);
    }
    std::fflush(stream);
}

}  // namespace

void quo::silence_report_and_log() noexcept { report.level = log_file.level = 0; }

extern "C" int init_report(const char* file_name, const char* title, int level) noexcept {
    const std::lock_guard guard{writing};
    if (const auto answer = open_channel(report, file_name, title, level)) return *answer;
    const quo::ErrnoKept kept;
    std::fprintf(report.stream, "\n%s\n QUOREL report (level %d) - %s - Started on %s%s\n", kRule, level,
                 shared_title, DateText{shared_start}.text, kRule);
    return std::fflush(report.stream);
}

extern "C" int init_log(const char* file_name, const char* title, int level) noexcept {
    const std::lock_guard guard{writing};
    return open_channel(log_file, file_name, title, level).value_or(1);
}

extern "C" int exit_report(void) noexcept {
    const std::lock_guard guard{writing};
    if (!report.is_open()) return one_below(report.level);
    const quo::ErrnoKept kept;
    quo::silence_report_and_log();
    if (report.stream)
        std::fprintf(report.stream, "\n%s\n QUOREL report - %s - Ended on %s%s\n", kRule, shared_title,
                     DateText{std::time(nullptr)}.text, kRule);
    const int report_closed = close_channel(report);
    const int log_closed = log_file.stream ? close_channel(log_file) : 0;
    return report_closed != 0 ? report_closed : log_closed;
}

extern "C" int ckflg_report(void) noexcept { return report.level; }

extern "C" int set_flg_report(int level) noexcept { return report.level = level; }

extern "C" void quo_add_report(const char* message, int kind, int line, const char* function,
                               const char* file) noexcept {
    if (quo::call_stack().muted > 0) return;
    const quo::ErrnoKept kept;
    const Entry entry{shown(message), kind, line, shown(function), shown(file)};
    if (kind == QUO_ERROR) keep_error(entry);
    if (!report.is_open()) return;
    const std::lock_guard guard{writing};
    if (!report.is_open()) return;                                         // closed by another thread meanwhile
    if (report.stream) write_entry(report.stream, report.entries, entry);  // none behind a level that was forced
    if (kind == QUO_ERROR || kind == QUO_MESSAGE) {
        std::fprintf(stderr, "MSG_%s: %s.\n", name_of(kind), entry.message);
        std::fflush(stderr);
    }
    ++report.entries;
}

extern "C" int quo_add_log(const char* text) noexcept {
    const std::lock_guard guard{writing};
    if (!log_file.stream) return EOF;
    const quo::ErrnoKept kept;
    std::fprintf(log_file.stream, "\n%d) %s\n", log_file.entries++, shown(text));
    return std::fflush(log_file.stream);
}

extern "C" void quo_check(int error_number, int line, const char* function, const char* file) noexcept {
    if (error_number != 0) quo::call_stack().system_error = error_number;
    if (error_number == 0 || !report.is_open()) return;
    const quo::ErrnoKept kept;
    quo_add_report(std::strerror(error_number), QUO_ERROR, line, function, file);
}

quorelReportEntry quorelReport::takeError() noexcept { return std::exchange(latest_error, {}); }

extern "C" int quo_take_system_error(void) noexcept { return std::exchange(quo::call_stack().system_error, 0); }
