// SPDX-License-Identifier: Apache-2.0
#include <pybind11/stl.h>

#include <complex>
#include <string>

#include "arrays.h"
#include "errors.h"
#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/fft.h"
#include "quo_base/interp.h"
#include "tools.h"

namespace quo_python {

namespace {

using Complexes = Array<fcomplex>;
using Floats = Array<float>;

/** Statuses of transforms tell other things than those of the rest; the engine tells its reason itself. */
template <typename Call>
void transform(Call call) {
    std::string reason;
    const Failure failure = attempt([&] {
        const int status = call();
        if (status != QUO_OK) reason = fft_engine_error();
        return status;
    });
    if (failure.status == QUO_OK) return;
    reason = "transforming: " + (reason.empty() ? "an empty array, or a size that cannot be transformed" : reason);
    raise(failure.status == QUO_NO_MEMORY ? int{QUO_NO_MEMORY} : int{QUO_REFUSED}, reason.c_str());
}

template <typename Samples, auto Transform>
Samples fft(const Samples& image, int row_direction, int column_direction) {
    need_dimensions(image, 2);
    const int m = int_size(image.shape(0)), n = int_size(image.shape(1));
    Samples made{shape_of(image)};
    const auto* const from = image.data();
    auto* const to = made.mutable_data();
    transform([=] { return Transform(n, n, m, m, row_direction, column_direction, from, to); });
    return made;
}

Complexes czt(const Complexes& vectors, py::ssize_t outputs, double step, double first) {
    need_dimensions(vectors, 2);
    const int count = int_size(vectors.shape(0)), n = int_size(vectors.shape(1)), m = int_size(outputs);
    if (m < 1) throw py::value_error("at least one frequency is needed");
    Complexes made{{vectors.shape(0), outputs}};
    const fcomplex* const from = vectors.data();
    fcomplex* const to = made.mutable_data();
    transform([=] { return czt_c(from, n, to, m, step, first, count); });
    return made;
}

/** Another size by zero-padding of the spectrum, along one axis; the input is worked on. */
Complexes grow(Complexes image, py::ssize_t lines, py::ssize_t samples) {
    need_dimensions(image, 2);
    const int ny = int_size(image.shape(0)), nx = int_size(image.shape(1));
    const int ny_out = int_size(lines), nx_out = int_size(samples);
    if (lines < ny || samples < nx) throw py::value_error("an image can only grow");
    Complexes made{{lines, samples}};
    fcomplex *const from = image.mutable_data(), *const to = made.mutable_data();
    transform([=] { return interp{}.interpft(from, nx, ny, nx_out, ny_out, to); });
    return made;
}

Complexes sample_at(const Complexes& image, const Doubles& line, const Doubles& sample, int lowpass) {
    need_dimensions(image, 2);
    const int ny = int_size(image.shape(0)), nx = int_size(image.shape(1)), count = int_size(line.size());
    if (line.size() != sample.size()) throw py::value_error("arrays of different sizes");
    Complexes made{shape_of(line)};
    const fcomplex* const from = image.data();
    const double *const x = sample.data(), *const y = line.data();
    fcomplex* const to = made.mutable_data();
    run("interpolating", [=] { return interp2D{}.interp2(from, nx, ny, x, y, count, to, lowpass); });
    return made;
}

py::tuple least_squares(const Doubles& matrix, const Doubles& values) {
    need_dimensions(matrix, 2);
    need_dimensions(values, 1);
    const int rows = int_size(matrix.shape(0)), columns = int_size(matrix.shape(1));
    if (values.size() != matrix.shape(0)) throw py::value_error("as many values as rows are needed");
    Doubles solution{matrix.shape(1)};
    const double *const a = matrix.data(), *const b = values.data();
    double* const x = solution.mutable_data();
    LsqSummary summary{};
    run("fitting", [=, &summary] { return lsq_fit(a, rows, columns, b, x, &summary); });
    return py::make_tuple(solution, summary.rank, summary.condition, summary.residual_norm);
}

}  // namespace

void bind_signal(py::module_& module) {
    const auto array = py::arg().noconvert();
    module.def("fft", &fft<Complexes, fft_c>, array, py::arg(), py::arg());
    module.def("fft_real", &fft<Floats, fft_r>, array, py::arg(), py::arg());
    module.def("czt", &czt, array, py::arg(), py::arg(), py::arg());
    module.def("grow", &grow, array, py::arg(), py::arg());
    module.def("sample_at", &sample_at, array, array, array, py::arg());
    module.def("least_squares", &least_squares, array, array);
    module.def("engine", &fft_engine_name, py::call_guard<py::gil_scoped_release>());
    module.def("fast_length", [](int n) { return genpow(n, 1); });
}

}  // namespace quo_python
