// SPDX-License-Identifier: Apache-2.0
#include "quo_base/quorelReport.h"

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <mutex>

#include "quo_base/ckerr.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/file_io.h"

namespace {

constexpr std::size_t kMessageRoom = 2048;
constexpr const char* kUnknown = "UNKNOWN";
constexpr const char* kDefaultReport = "quorelReport.txt";
constexpr const char* kTitle = "-";
// Given names are opened at the first level; all levels write every kind of entry.
constexpr int kDefaultLevel = 1;

/** A message formatted from a variable argument list, cut to the room. */
class Message {
public:
    [[gnu::format(printf, 2, 0)]] Message(const char* format, std::va_list arguments) noexcept {
        if (!format || std::vsnprintf(text_, sizeof text_, format, arguments) < 0) text_[0] = '\0';
    }
    [[nodiscard]] const char* text() const noexcept { return text_; }

private:
    char text_[kMessageRoom];
};

/** Held while a name is set and the file of that name is opened: two threads do not mix their names. */
std::mutex naming;

bool report_is_open() noexcept { return ckflg_report() >= 1; }

void add_plain(int kind, const char* text) noexcept { quo_add_report(text, kind, 0, kUnknown, kUnknown); }

int whole_percent(float percentage) noexcept {
    if (std::isnan(percentage)) return 0;
    return static_cast<int>(std::clamp(percentage, -2147483648.0F, 100.0F));
}

}  // namespace

quorelException::quorelException() noexcept : quorelException{0, "", "", "generic quorel exception.\n"} {
    error_number_ = errno;
}

quorelException::quorelException(int line, const char* function, const char* file) noexcept
    : quorelException{line, function, file, ""} {
    error_number_ = errno;
    quo::format_bounded(message_, sizeof message_, "%s: %s (%d): exception found", file ? file : "",
                        function ? function : "", line);
}

quorelException::quorelException(int line, const char* function, const char* file, const char* message) noexcept
    : line_{line} {
    quo::copy_bounded(message_, quo::text_or_empty(message));
    quo::copy_bounded(function_, quo::text_or_empty(function));
    quo::copy_bounded(file_, quo::text_or_empty(file));
}

quorelException::quorelException(const char* message) noexcept
    : quorelException{-1, "UNKNOWN FUNCTION", "UNKNOWN FILE", message} {}

char quorelReport::reportFilename[512];
char quorelReport::logFilename[512];
char quorelReport::progressFilename[512];

quorelReport::quorelReport() noexcept { init_ckerr_locking(); }

quorelReport::quorelReport(const char* name, int level) noexcept {
    const std::lock_guard guard{naming};
    init_ckerr_locking();
    if (report_is_open()) {
        add_plain(QUO_WARNING, "Cannot change report FILENAME!");
        return;
    }
    quo::copy_bounded(reportFilename, name && *name ? name : kDefaultReport);
    init_report(reportFilename, kTitle, level);
}

void quorelReport::addEntry(int kind, int line, const char* file, const char* function, const char* format,
                            ...) noexcept {
    if (!report_is_open()) return;
    std::va_list arguments;
    va_start(arguments, format);
    const Message message{format, arguments};
    va_end(arguments);
    quo_add_report(message.text(), kind, line, function, file);
}

void quorelReport::addEntry(const quorelException* exception) noexcept {
    if (!exception) return;
    addEntry(QUO_ERROR, exception->getLine(), exception->getFile(), exception->getFunction(), "%s",
             exception->what());
}

void quorelReport::addEntry(const char* format, ...) noexcept {
    if (!report_is_open()) return;
    std::va_list arguments;
    va_start(arguments, format);
    const Message message{format, arguments};
    va_end(arguments);
    add_plain(-1, message.text());
}

void quorelReport::addEntry(int kind, const char* format, ...) noexcept {
    if (!report_is_open()) return;
    std::va_list arguments;
    va_start(arguments, format);
    const Message message{format, arguments};
    va_end(arguments);
    add_plain(kind, message.text());
}

void quorelReport::checkErrno(int line, const char* function, const char* file) noexcept {
    const int number = errno;
    if (number != 0) addEntry(QUO_WARNING, line, file, function, "errno %d (%s)", number, std::strerror(number));
    errno = 0;
}

void quorelReport::end_report() noexcept { addEntry(QUO_CHECKPOINT, "End of processing"); }

void quorelReport::addLog(const char* format, ...) noexcept {
    if (!report_is_open()) return;
    std::va_list arguments;
    va_start(arguments, format);
    const Message message{format, arguments};
    va_end(arguments);
    quo_add_log(message.text());
}

void quorelReport::setLevel(int level) noexcept {
    const std::lock_guard guard{naming};
    if (report_is_open()) {
        add_plain(QUO_WARNING, "Cannot change report LEVEL!");
    } else if (reportFilename[0] != '\0') {
        init_report(reportFilename, kTitle, level);
    }
}

int quorelReport::getLevel() const noexcept { return ckflg_report(); }

void quorelReport::setReportName(const char* name) noexcept {
    const std::lock_guard guard{naming};
    if (reportFilename[0] != '\0') {
        add_plain(QUO_WARNING, "Cannot change report FILENAME!");
        return;
    }
    quo::copy_bounded(reportFilename, quo::text_or_empty(name));
    init_ckerr_locking();
    init_report(reportFilename, kTitle, kDefaultLevel);
}

const char* quorelReport::getReportName() const noexcept { return reportFilename; }

void quorelReport::setLogName(const char* name) noexcept {
    const std::lock_guard guard{naming};
    quo::copy_bounded(logFilename, quo::text_or_empty(name));
    init_ckerr_locking();
    init_log(logFilename, kTitle, kDefaultLevel);
}

void quorelReport::setProgressName(const char* name) noexcept {
    const std::lock_guard guard{naming};
    quo::copy_bounded(progressFilename, quo::text_or_empty(name));
}

int quorelReport::progress_update(float percentage, const char* text) noexcept {
    const std::lock_guard guard{naming};
    quo::Stream stream{std::fopen(progressFilename, "wb")};
    if (!stream) {
        errno = 0;
        return QUO_NOT_OPENED;
    }
    const bool written = std::fprintf(stream.get(), "%d \n", whole_percent(percentage)) > 0 &&
                         std::fputs(text ? text : "", stream.get()) >= 0 && std::fflush(stream.get()) == 0;
    if (!written) errno = 0;
    return written ? QUO_OK : QUO_WRITE_FAILED;
}
