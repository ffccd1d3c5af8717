// SPDX-License-Identifier: Apache-2.0

// Compiled with AVX-512 and fused multiplication switched on.
#include "matrixlib/dense_kernels.h"

namespace quo::dense_avx512 {
extern const DenseKernels kTable;
#include "matrixlib/dense_kernels.inc"
}  // namespace quo::dense_avx512
