// SPDX-License-Identifier: Apache-2.0
#include "signallib/own_fft/lane_fft.h"

namespace quo {

extern const FftKernels kFftKernels8Avx512;
constexpr FftKernels kFftKernels8Avx512 = LaneFfts<8, ProcessorLevel::kAvx512>::kernels();

}  // namespace quo
