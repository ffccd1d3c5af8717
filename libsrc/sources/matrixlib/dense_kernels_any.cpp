// SPDX-License-Identifier: Apache-2.0
#include "matrixlib/dense_kernels.h"

namespace quo::dense_any {
extern const DenseKernels kTable;
#include "matrixlib/dense_kernels.inc"
}  // namespace quo::dense_any
