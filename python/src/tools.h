// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PYTHON_TOOLS_H
#define QUO_PYTHON_TOOLS_H

#include <pybind11/pybind11.h>

namespace quo_python {

void bind_times(pybind11::module_& module);
void bind_parameters(pybind11::module_& module);
void bind_import(pybind11::module_& module);
void bind_models(pybind11::module_& module);
void bind_signal(pybind11::module_& module);

}  // namespace quo_python

#endif
