// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_DENSE_KERNELS_H
#define QUO_DENSE_KERNELS_H

#include <cstddef>

#include "sarutillib/ground/processor_level.h"

namespace quo {

/** Columns of equal length at equal distances. */
struct Columns {
    double* first;
    std::ptrdiff_t distance;  ///< from one to the next
    int count;
    std::ptrdiff_t length;  ///< values of each
};

/** The inner loops of the dense matrices. Sums are carried in eight lanes whatever the processor's vectors hold,
 * and nothing is fused: results are the same bits on every processor. */
struct DenseKernels {
    /** Rows of a tile, and columns. */
    static constexpr int kTileRows = 4;
    int tile_columns;
    /** c[r][j] -= a[r][k] * b[k * tile_columns + j] for k = 0..inner-1 in their order: a tile of a product. */
    void (*subtract_tile)(double* const* c, const double* const* a, const double* b, std::ptrdiff_t inner);

    /** Largest magnitude; no number where a value is not finite. */
    double (*largest)(const double* values, std::ptrdiff_t count);
    /** sums[j] = u . column j. */
    void (*dots)(const double* u, const Columns& columns, double* sums);
    /** Column j -= factors[j] * u; squares[j] is then the square of its length. */
    void (*subtract_multiples)(const double* u, const double* factors, const Columns& columns, double* squares);

    /** u . v, summed with twice the digits. */
    double (*long_dot)(const double* u, const double* v, std::ptrdiff_t count);
    /** high + low = b - r - (columns times x), likewise; `high` may be r, and `low` null. */
    void (*long_residual)(const Columns& columns, const double* x, const double* b, const double* r, double* high,
                          double* low);
};

/** Those of a level, which the processor must have. */
const DenseKernels& dense_kernels(ProcessorLevel level = processor_level()) noexcept;

}  // namespace quo

#endif
