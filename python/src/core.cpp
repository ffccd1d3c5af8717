// SPDX-License-Identifier: Apache-2.0
#include <pybind11/pybind11.h>

#include "errors.h"
#include "grid.h"
#include "header.h"
#include "orbit.h"
#include "raster.h"
#include "record.h"
#include "tools.h"

PYBIND11_MODULE(_core, module) {
    module.doc() = "The library's calls, as the package needs them. What it offers stands in the package.";
    quo_python::translate_exceptions();
    quo_python::bind_records(module);
    quo_python::bind_grid(module);
    quo_python::bind_orbit(module);
    quo_python::bind_raster(module);
    quo_python::bind_header(module);
    quo_python::bind_times(module);
    quo_python::bind_models(module);
    quo_python::bind_parameters(module);
    quo_python::bind_signal(module);
    quo_python::bind_import(module);
}
