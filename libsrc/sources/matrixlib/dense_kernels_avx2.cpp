// SPDX-License-Identifier: Apache-2.0

// Compiled with AVX2 and fused multiplication switched on.
#include "matrixlib/dense_kernels.h"

namespace quo::dense_avx2 {
extern const DenseKernels kTable;
#include "matrixlib/dense_kernels.inc"
}  // namespace quo::dense_avx2
