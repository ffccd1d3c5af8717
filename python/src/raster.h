// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PYTHON_RASTER_H
#define QUO_PYTHON_RASTER_H

#include <pybind11/pybind11.h>

namespace quo_python {

void bind_raster(pybind11::module_& module);

}  // namespace quo_python

#endif
