// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PYTHON_ARRAYS_H
#define QUO_PYTHON_ARRAYS_H

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>

#include <complex>
#include <cstdint>
#include <limits>
#include <optional>
#include <vector>

/** @file
 * Arrays as the bindings take them: C-contiguous, aligned, of the very type, so that nothing is copied. The Python
 * side of the package converts and broadcasts before. */

namespace quo_python {

namespace py = pybind11;

template <typename T>
using Array = py::array_t<T, py::array::c_style>;
using Doubles = Array<double>;
using OptionalDoubles = std::optional<Doubles>;

inline std::vector<py::ssize_t> shape_of(const py::array& array) {
    return {array.shape(), array.shape() + array.ndim()};
}

/** The numbers of an input that must hold `count` of them; null where it is not given. */
inline const double* data_of(const OptionalDoubles& array, py::ssize_t count) {
    if (!array) return nullptr;
    if (array->size() != count) throw py::value_error("arrays of different sizes");
    return array->data();
}

/** A dimension as the library counts it. */
inline int int_size(py::ssize_t size) {
    if (size > std::numeric_limits<int>::max()) throw py::value_error("an array beyond 2^31 - 1 in one dimension");
    return static_cast<int>(size);
}

inline void need_dimensions(const py::array& array, py::ssize_t dimensions) {
    if (array.ndim() != dimensions) throw py::value_error("an array of another number of dimensions");
}

}  // namespace quo_python

#endif
