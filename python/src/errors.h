// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PYTHON_ERRORS_H
#define QUO_PYTHON_ERRORS_H

#include <pybind11/pybind11.h>

#include <cerrno>
#include <string>
#include <utility>

#include "quo_base/ckerr.h"
#include "quo_base/quorelReport.h"

/** @file
 * From statuses of the library to exceptions of Python. */

namespace quo_python {

namespace py = pybind11;

/** Why a call of the library failed. */
struct Failure {
    int status = QUO_OK;
    quorelReportEntry entry{};  ///< the call's own ERROR entry; empty where it made none
    int system_error = 0;       ///< what the system refused it; 0 where it refused nothing
};

/** Makes the failure to read a file one to open it, where it cannot be opened. */
void explain_absence(Failure& failure, const std::string& file);

/** Runs a call of the library, which gives a status, on objects that the interpreter's lock guards. */
template <typename Call>
Failure attempt_locked(Call&& call) {
    (void)quorelReport::takeError();
    (void)quo_take_system_error();
    errno = 0;  // whatever ran before in this process
    Failure failure;
    failure.status = std::forward<Call>(call)();
    failure.entry = quorelReport::takeError();
    failure.system_error = quo_take_system_error();
    errno = 0;
    return failure;
}

/** The same without the interpreter's lock: on objects that nobody changes, or that nobody else has. What `call`
 * needs of Python's objects is taken out of them before. */
template <typename Call>
Failure attempt(Call&& call) {
    const py::gil_scoped_release unlocked;
    return attempt_locked(std::forward<Call>(call));
}

/** Raises the exception of a failure; `doing` tells what was being done, such as "reading a block". */
[[noreturn]] void raise(const Failure& failure, const char* doing);
/** Raises the exception of a status that comes with a reason of its own. */
[[noreturn]] void raise(int status, const char* reason);

/** As attempt(); raises what failed. */
template <typename Call>
void run(const char* doing, Call&& call) {
    if (const Failure failure = attempt(std::forward<Call>(call)); failure.status != QUO_OK) raise(failure, doing);
}

/** Runs a call that reads a file, as run(); a file that cannot be opened is told as that, whatever status the call
 * had for it. */
template <typename Call>
void run_on_file(const std::string& file, Call&& call) {
    Failure failure;
    try {
        failure = attempt(std::forward<Call>(call));
    } catch (const quorelException&) {
        explain_absence(failure, file);
        if (failure.status == QUO_OK) throw;
    }
    if (failure.status == QUO_REFUSED) explain_absence(failure, file);
    if (failure.status != QUO_OK) raise(failure, ("reading " + file).c_str());
}

/** Exceptions of the library become those of the package. */
void translate_exceptions();

/** As attempt_locked(). */
template <typename Call>
void run_locked(const char* doing, Call&& call) {
    if (const Failure failure = attempt_locked(std::forward<Call>(call)); failure.status != QUO_OK)
        raise(failure, doing);
}

}  // namespace quo_python

#endif
