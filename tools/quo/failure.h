#ifndef QUO_TOOL_FAILURE_H
#define QUO_TOOL_FAILURE_H

#include <stdexcept>
#include <string>

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

/** A text that may quote a file, fit for one line: line feeds and other control characters become blanks. */
std::string one_line(std::string text);

/** Writes "quo: message" as one line to standard error. */
void complain(const std::string& message);

}  // namespace tool

#endif
