// SPDX-License-Identifier: Apache-2.0
#include <pybind11/stl.h>

#include <cstdint>
#include <exception>
#include <optional>
#include <string>

#include "errors.h"
#include "quo_base/mission_import.h"
#include "tools.h"

namespace quo_python {

namespace {

/** Calls Python's function of the progress; what it raises ends the import and is raised again behind it. */
class Progress {
public:
    explicit Progress(const py::object& function) : function_{function} {}

    static int tell(void* context, std::int64_t done, std::int64_t all) {
        auto& self = *static_cast<Progress*>(context);
        const py::gil_scoped_acquire locked;
        try {
            self.function_(done, all);
            return 0;
        } catch (...) {
            self.raised_ = std::current_exception();
            return 1;
        }
    }
    void raise_again() const {
        if (raised_) std::rethrow_exception(raised_);
    }

private:
    const py::object& function_;
    std::exception_ptr raised_;
};

const char* given(const std::optional<std::string>& text) { return text ? text->c_str() : nullptr; }

/** Lines, samples, whether it is a link, and what the tie points show. */
py::tuple import_sentinel1(const std::string& source, const std::string& raster,
                           const std::optional<std::string>& swath, const std::optional<std::string>& polarization,
                           const std::optional<std::string>& orbit_file, bool link, const py::object& progress) {
    Progress told{progress};
    quo_import_request request{};
    request.source = source.c_str();
    request.raster = raster.c_str();
    request.swath = given(swath);
    request.polarization = given(polarization);
    request.orbit_file = given(orbit_file);
    request.link = link ? 1 : 0;
    request.progress = progress.is_none() ? nullptr : &Progress::tell;
    request.context = &told;
    quo_import_result result{};
    const Failure failure = attempt([&] { return quo_import_sentinel1(&request, &result); });
    told.raise_again();
    if (failure.status != QUO_OK) raise(failure, result.message);
    const quo_tie_points& ties = result.ties;
    return py::make_tuple(result.lines, result.samples, result.linked != 0, ties.count, ties.rms_line,
                          ties.most_line, ties.rms_sample, ties.most_sample, ties.rms_ground_m,
                          ties.most_ground_m);
}

}  // namespace

void bind_import(py::module_& module) { module.def("import_sentinel1", &import_sentinel1); }

}  // namespace quo_python
