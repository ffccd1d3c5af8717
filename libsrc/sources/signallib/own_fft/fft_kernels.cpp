#include "signallib/own_fft/fft_kernels.h"

namespace quo {

extern const FftKernels kFftKernels4;
#if defined(QUO_WIDE_LANES)
extern const FftKernels kFftKernels8, kFftKernels16;
#endif

const FftKernels* fft_kernels(int lanes) noexcept {
    if (lanes == 4) return &kFftKernels4;
#if defined(QUO_WIDE_LANES)
    __builtin_cpu_init();
    if (lanes == 8 && __builtin_cpu_supports("avx2")) return &kFftKernels8;
    if (lanes == 16 && __builtin_cpu_supports("avx512f") && __builtin_cpu_supports("avx512dq"))
        return &kFftKernels16;
#endif
    return nullptr;
}

}  // namespace quo
