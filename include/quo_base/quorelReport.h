// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_QUORELREPORT_H
#define QUO_BASE_QUORELREPORT_H

#include "quo_base/api.h"

/** @file
 * The exception that the library throws, and an object layer over the report and the log (quo_base/ckerr.h).
 *
 * All report state is process-wide; objects of quorelReport hold nothing of their own, and any number of threads
 * may use them at a time. The public names below are read while no thread sets one. */

/** The one exception type of the library: a message and a source position. Each text is cut at 511 bytes.
 *
 * Visible in programs that hide their own symbols, too, so that it is one type on both sides of the library. */
class __attribute__((visibility("default"))) quorelException {
public:
    /** "generic quorel exception.\n" at line 0 of no function; keeps the current errno. */
    quorelException() noexcept;
    /** "FILE: FUNCTION (LINE): exception found"; keeps the current errno. */
    quorelException(int line, const char* function, const char* file) noexcept;
    /** `message` as it stands; the error number stays 0. */
    quorelException(int line, const char* function, const char* file, const char* message) noexcept;
    /** `message` as it stands, at line -1 of "UNKNOWN FUNCTION" in "UNKNOWN FILE"; error number 0. */
    explicit quorelException(const char* message) noexcept;

    [[nodiscard]] const char* what() const noexcept { return message_; }
    [[nodiscard]] int getLine() const noexcept { return line_; }
    [[nodiscard]] const char* getFunction() const noexcept { return function_; }
    [[nodiscard]] const char* getFile() const noexcept { return file_; }
    /** The value of errno when the exception was made, for the two constructors that keep it; else 0. */
    [[nodiscard]] int getErrorNumber() const noexcept { return error_number_; }

private:
    char message_[512];
    int32_t line_;
    char function_[512];
    char file_[512];
    int32_t error_number_ = 0;
};

/** An ERROR entry, as the report shows it. Texts are cut to their room. */
struct quorelReportEntry {
    char message[512];   ///< empty where there is no entry
    char function[128];  ///< that made it
    char file[128];      ///< its source
    int32_t line;        ///< its line there
};

/** Writes report and log entries with printf-style formatting; messages are cut at 2047 bytes.
 *
 * The report is opened once: by setReportName(), by the constructor that names it, or by setLevel() after a name
 * was stored. Later attempts to change its name or level write a WARNING entry and change nothing. Closing it is
 * exit_report()'s. */
class QUO_BASE_API quorelReport {
public:
    /** Turns tracking on. */
    quorelReport() noexcept;
    /** Turns tracking on and opens the report `name` (null or empty: "quorelReport.txt") at `level`, 1 to 3;
     * another level leaves it closed with the name stored. While a report is open it warns as setReportName()
     * does; after exit_report() it opens the new one. */
    quorelReport(const char* name, int level) noexcept;

    /** One entry of the given kind (QuoReportKind) at the given source position, if the report is open. */
    static void addEntry(int kind, int line, const char* file, const char* function, const char* format,
                         ...) noexcept QUO_PRINTF_LIKE(5, 6);
    /** An ERROR entry at the exception's position; its message is written as it stands, percent signs too. */
    static void addEntry(const quorelException* exception) noexcept;
    /** An entry of unknown kind, at line 0 of "UNKNOWN". */
    void addEntry(const char* format, ...) noexcept QUO_PRINTF_LIKE(2, 3);
    /** An entry of the given kind, at line 0 of "UNKNOWN". */
    void addEntry(int kind, const char* format, ...) noexcept QUO_PRINTF_LIKE(3, 4);
    /** The latest ERROR entry that this thread has made since this was asked before, whether or not a report is
     * open: ask once before a call, to forget what is older, and again when it has failed. */
    static quorelReportEntry takeError() noexcept;
    /** A WARNING entry "errno N (TEXT)" when errno is not 0; clears errno. */
    static void checkErrno(int line, const char* function, const char* file) noexcept;
    /** A CHECKPOINT entry "End of processing". The report stays open. */
    void end_report() noexcept;
    /** A log entry, if the report is open. */
    void addLog(const char* format, ...) noexcept QUO_PRINTF_LIKE(2, 3);

    /** Opens the report under the stored name at `level`; without a stored name it does nothing. While the report
     * is open: the WARNING "Cannot change report LEVEL!". */
    void setLevel(int level) noexcept;
    [[nodiscard]] int getLevel() const noexcept;
    /** Stores the name, turns tracking on and opens the report at level 1. With a name set already: the WARNING
     * "Cannot change report FILENAME!". */
    void setReportName(const char* name) noexcept;
    /** The stored report name, empty when none was set. */
    [[nodiscard]] const char* getReportName() const noexcept;
    /** Stores the name, turns tracking on and opens the log at level 1. */
    void setLogName(const char* name) noexcept;
    /** Stores the name of the progress file, which progress_update() keeps. */
    void setProgressName(const char* name) noexcept;
    /** Replaces the progress file's content: the percentage as an integer (at most 100, cut towards zero; 0 for
     * not-a-number), a blank and a line feed, then the text as it stands.
     * @return 0, 9 when the file cannot be opened, 5 when it cannot be written. */
    int progress_update(float percentage, const char* text) noexcept;

    static char reportFilename[512];    ///< name of the report file; empty until set
    static char logFilename[512];       ///< name of the log file; empty until set
    static char progressFilename[512];  ///< name of the progress file; empty until set
};

#endif
