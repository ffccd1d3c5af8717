#ifndef QUO_EXAMPLES_SESSION_H
#define QUO_EXAMPLES_SESSION_H

#include <cstdio>
#include <exception>
#include <stdexcept>
#include <string>

#include "apart.h"
#include "quo_base/ckerr.h"
#include "quo_base/quorelReport.h"

namespace example {

/** A job that cannot be done: what failed, and the library's status. */
class Failure : public std::runtime_error {
public:
    explicit Failure(const std::string& what, int status = QUO_REFUSED) : runtime_error{what}, status_{status} {}
    [[nodiscard]] int status() const { return status_; }

private:
    int status_;
};

/** Turns a failing status of the library into a Failure. */
inline void require(int status, const std::string& what) {
    if (status != QUO_OK) throw Failure{what + " (status " + std::to_string(status) + ")", status};
}

/** The report and the log of a program, open as long as the object lives. Blocks that were allocated in between
 * and not freed are listed on the standard error stream at the end. */
class Session {
public:
    /** Level 1 to 3; 0 keeps no report. An empty name of the log keeps none. */
    Session(const char* title, const std::string& report, const std::string& log, int level = 1) {
        init_ckerr_locking();
        if (level == 0) return;
        init_report(report.c_str(), title, level);
        if (ckflg_report() == 0) {
            exit_ckerr();
            throw Failure{report + ": the report cannot be written", QUO_NOT_OPENED};
        }
        if (!log.empty()) init_log(log.c_str(), title, level);
    }
    ~Session() {
        exit_report();
        exit_ckerr();
    }
    Session(const Session&) = delete;
    Session& operator=(const Session&) = delete;
};

/** Runs a program's job under a report, and returns the program's exit status. What the job throws becomes an
 * entry of the report and a line on the standard error stream. `files` are those that the job reads and writes;
 * nothing is opened unless they are apart, report and log included. */
template <typename Job>
int run_program(const char* title, Files files, const std::string& report, const std::string& log, int level,
                Job&& job) {
    try {
        files.written.push_back(report);
        if (!log.empty()) files.written.push_back(log);
        require_apart(files);
        const Session session{title, report, log, level};
        try {
            job();
            return 0;
        } catch (const quorelException& failure) {
            quorelReport::addEntry(&failure);
            std::fprintf(stderr, "%s: %s\n", title, failure.what());
        } catch (const std::exception& failure) {
            quorelReport::addEntry(QUO_ERROR, __LINE__, __FILE__, title, "%s", failure.what());
        }
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "%s: %s\n", title, failure.what());
    }
    return 1;
}

}  // namespace example

#endif
