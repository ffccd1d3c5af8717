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

const DenseKernels& dense_kernels(int widest) noexcept {
    const bool fuses = __builtin_cpu_supports("fma");
    if (widest >= 512 && fuses && __builtin_cpu_supports("avx512f")) return dense_avx512::kTable;
    return widest >= 256 && fuses && __builtin_cpu_supports("avx2") ? dense_avx2::kTable : dense_any::kTable;
}

}  // namespace quo
