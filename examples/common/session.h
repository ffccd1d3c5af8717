// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_SESSION_H
#define QUO_EXAMPLES_SESSION_H

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <exception>
#include <filesystem>
#include <fstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <system_error>
#include <utility>
#include <vector>

#include "quo_base/ckerr.h"
#include "quo_base/generalSAR.h"
#include "quo_base/quorelReport.h"
#include "same_file.h"

namespace example {

/** A job that cannot be done. */
class Failure : public std::runtime_error {
    using std::runtime_error::runtime_error;
};

/** Turns a failing status of the library into a Failure. */
inline void require(int status, const std::string& what) {
    if (status != QUO_OK) throw Failure{what + " (status " + std::to_string(status) + ")"};
}

/** Makes a product header anew from the objects that the product has; throws Failure. */
inline void write_product(GeneralSAR& product, const std::string& header) {
    std::error_code failure;
    std::filesystem::remove(header, failure);
    errno = 0;  // what that left would count as an error of the next function of the library
    quorelxml::setExactNumbers(true);  // 15 digits would cost the azimuth times their last microsecond
    product.GSwrite(header.c_str());   // 0 whatever happens
    if (!std::filesystem::exists(header, failure)) throw Failure{header + ": cannot be written"};
}

/** Where write_file() collects what is going to be a file. */
inline std::string unfinished_name(const std::string& name) { return name + ".part"; }

/** Writes a file beside its name and puts it there in one step, so that an older one of that name stays whole
 * until then. Links lead to the new one; a device or a pipe is written to. Throws Failure. */
inline void write_file(const std::string& name, std::string_view bytes) {
    std::error_code failure, ignored;
    const std::string target = std::filesystem::weakly_canonical(name, ignored).string();
    const bool replaced =
        !std::filesystem::exists(target, ignored) || std::filesystem::is_regular_file(target, ignored);
    const std::string unfinished = replaced ? unfinished_name(target) : target;
    std::ofstream stream{unfinished, std::ios::binary};
    const bool created = stream.is_open() && replaced;
    stream << bytes;
    stream.close();
    const bool written = !stream.fail();
    if (written && replaced) std::filesystem::rename(unfinished, target, failure);
    if (created && (!written || failure)) std::filesystem::remove(unfinished, ignored);
    errno = 0;  // what that left would count as an error of the next function of the library
    if (!written || failure) throw Failure{name + ": cannot be written"};
}

/** The files that a program reads and those that it writes. */
struct Files {
    std::vector<std::string> read, written;
};

/** Throws where a file to be written is one that is read, by whatever name or link, or stands there twice: the
 * program would destroy what it needs. Names of no file yet are apart from all. */
inline void require_apart(const Files& given) {
    const auto same = [](const std::string& a, const std::string& b) { return a == b || files::same_file(a, b); };
    std::vector<std::string> others = given.read;
    for (const std::string& name : given.written) {
        if (std::ranges::any_of(others, [&](const std::string& other) { return same(name, other); }))
            throw Failure{name + ": would replace a file that the program needs"};
        others.push_back(name);
    }
    errno = 0;  // what looking left would count as an error of the next function of the library
}

/** Throws where a file to be read cannot be opened, with the reason of the system. Empty names are of no file. */
inline void require_readable(const Files& given) {
    for (const std::string& name : given.read) {
        const bool is_file = name.empty() || std::ifstream{name}.is_open();
        const int reason = std::exchange(errno, 0);  // it would count as an error of the library's next function
        if (!is_file) throw Failure{name + ": " + std::generic_category().message(reason)};
    }
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
            throw Failure{report + ": the report cannot be written"};
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
 * nothing is written unless they are apart, report and log included, and those to be read can be. */
template <typename Job>
int run_program(const char* title, Files files, const std::string& report, const std::string& log, int level,
                Job&& job) {
    try {
        files.written.push_back(report);
        if (!log.empty()) files.written.push_back(log);
        require_apart(files);
        require_readable(files);
        const Session session{title, report, log, level};
        try {
            job();
            return 0;
        } catch (const quorelException& failure) {
            quorelReport::addEntry(&failure);
            std::fprintf(stderr, "%s: %s\n", title, failure.what());
        } catch (const std::exception& failure) {
            if (ckflg_report() == 0) throw;  // an entry shows itself on the standard error stream too
            quorelReport::addEntry(QUO_ERROR, __LINE__, __FILE__, title, "%s", failure.what());
        }
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "%s: %s\n", title, failure.what());
    }
    return 1;
}

}  // namespace example

#endif
