// SPDX-License-Identifier: Apache-2.0
#include "matrixlib/dense_kernels.h"

namespace quo {

namespace dense_any {
extern const DenseKernels kTable;
}
namespace dense_avx2 {
extern const DenseKernels kTable;
}
namespace dense_avx512 {
extern const DenseKernels kTable;
}

const DenseKernels& dense_kernels(ProcessorLevel level) noexcept {
    if (level >= ProcessorLevel::kAvx512) return dense_avx512::kTable;
    return level >= ProcessorLevel::kAvx2 ? dense_avx2::kTable : dense_any::kTable;
}

}  // namespace quo
