// SPDX-License-Identifier: Apache-2.0
#include "errors.h"

#include <unistd.h>

#include <exception>

namespace quo_python {

namespace {

void set_error(const Failure& failure, const char* doing) {
    const quorelReportEntry& entry = failure.entry;
    const auto text = [](const char* bytes) {
        return py::reinterpret_steal<py::str>(
            PyUnicode_DecodeUTF8(bytes, static_cast<Py_ssize_t>(strlen(bytes)), "replace"));
    };
    const py::object made = py::module_::import("quo_base.errors")
                                .attr("from_failure")(failure.status, doing, text(entry.message), entry.function,
                                                      entry.file, entry.line, failure.system_error);
    PyErr_SetObject(reinterpret_cast<PyObject*>(Py_TYPE(made.ptr())), made.ptr());
}

}  // namespace

void explain_absence(Failure& failure, const std::string& file) {
    if (access(file.c_str(), R_OK) == 0) return;
    failure.status = QUO_NOT_OPENED;
    failure.system_error = errno;
    errno = 0;
}

void raise(const Failure& failure, const char* doing) {
    set_error(failure, doing);
    throw py::error_already_set();
}

void raise(int status, const char* reason) {
    Failure failure;
    failure.status = status;
    raise(failure, reason);
}

void translate_exceptions() {
    py::register_local_exception_translator([](std::exception_ptr thrown) {
        try {
            if (thrown) std::rethrow_exception(thrown);
        } catch (const quorelException& refused) {
            Failure failure;
            failure.status = QUO_REFUSED;
            failure.entry = quorelReport::takeError();
            failure.system_error = quo_take_system_error();
            set_error(failure, refused.what());
        }
    });
}

}  // namespace quo_python
