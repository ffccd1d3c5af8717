#include "generalSAR/orbit_arrays/array_kernels.h"

namespace quo {

extern const ArrayKernels kKernelsOf2;
#if defined(QUO_WIDE_LANES)
extern const ArrayKernels kKernelsOf4, kKernelsOf8;
#endif

const ArrayKernels& array_kernels([[maybe_unused]] int widest) noexcept {
#if defined(QUO_WIDE_LANES)
    __builtin_cpu_init();
    if (widest >= 8 && __builtin_cpu_supports("avx512f") && __builtin_cpu_supports("avx512dq")) return kKernelsOf8;
    if (widest >= 4 && __builtin_cpu_supports("avx2")) return kKernelsOf4;
#endif
    return kKernelsOf2;
}

}  // namespace quo
