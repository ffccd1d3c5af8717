// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_MATRIX_KERNELS_H
#define QUO_MATRIX_KERNELS_H

#include <cstddef>
#include <span>

#include "quo_base/MatrixAlgebraANSI.h"

namespace quo {

// Reports of the matrix routines carry this fixed source name.
// Reports name this source so; programs that read them look for it.
inline constexpr const char* kMatrixSource = R"(..\..\..\libsrc\sources\matrixlib\MatrixAlgebraANSI)";

/** A 1-based matrix seen with 0-based rows and columns. */
class Rows {
public:
    explicit Rows(double** one_based) noexcept : rows_{one_based + 1} {}
    double* operator[](std::ptrdiff_t row) const noexcept { return rows_[row] + 1; }

private:
    double** rows_;
};

/** A contiguous row-major matrix. */
class FlatRows {
public:
    FlatRows(double* data, int columns) noexcept : data_{data}, columns_{columns} {}
    double* operator[](std::ptrdiff_t row) const noexcept { return data_ + row * columns_; }

private:
    double* data_;
    int columns_;
};

/** Writes a message of the numerical routines to the standard error stream, as it stands. */
void say(const char* message) noexcept;

/** to[i] -= factor * from[i]: the step that every elimination consists of. */
inline void subtract_multiple(double* to, const double* from, double factor, std::ptrdiff_t count) noexcept {
    for (std::ptrdiff_t i = 0; i < count; ++i) to[i] -= factor * from[i];
}

/** A design matrix row by row: basis functions over the standard deviation, and the observation likewise. */
struct WeightedPoints {
    const double *x, *y, *sig;  // [0..n-1]
    int n;
    QuoBasisFunction basis;

    /** Basis functions at point k into values[1..count]. */
    void at(int k, double* values, int count) const { basis(x[k], values, count); }
};

}  // namespace quo

#endif
