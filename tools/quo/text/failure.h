// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_FAILURE_H
#define QUO_TOOL_FAILURE_H

#include <stdexcept>
#include <string>
#include <string_view>

#include "quo_base/ckerr.h"

namespace tool {

/** What the program's exit status says. */
enum ExitStatus {
    kFine = 0,
    kFindings = 1,  ///< a job that failed, rows without a solution, or something to look into
    kWrongUse = 2   ///< the command line cannot be understood
};

/** A job that cannot be done. The message is one line that names the file and the cause. */
class Failure : public std::runtime_error {
    using std::runtime_error::runtime_error;
};

/** Options that contradict each other, or a value of an option that makes no sense. */
class WrongUse : public std::runtime_error {
    using std::runtime_error::runtime_error;
};

/** "cause" of the current errno, as in "file: cause". */
std::string system_cause();

/** What a status code of the library means, such as "12 (not seen from this orbit)". */
std::string status_text(int status);

/** To be called before a call of the library whose failure is to be explained: what is older has nothing to do
 * with it, neither what the library knows nor an errno, which its functions would take for one of theirs. */
void forget_system_error();

/** The same of the last failure within the library, else what its status means. */
std::string library_cause(int status);

/** Makes a call of the library that returns a status; throws Failure "file: cannot ...: cause" unless that is 0.
 */
template <typename Call>
void require_done(const std::string& file, const char* cannot, Call call) {
    forget_system_error();
    if (const int status = call()) throw Failure(file + ": " + cannot + ": " + library_cause(status));
}

/** Writes "quo: message" as one line to standard error; "quo: out of memory" where there is none to make that
 * line. */
void complain(std::string_view message) noexcept;

}  // namespace tool

#endif
