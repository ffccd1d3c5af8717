// SPDX-License-Identifier: Apache-2.0
#include "signallib/own_fft/lane_fft.h"

namespace quo {

extern const FftKernels kFftKernels16;
constexpr FftKernels kFftKernels16 = LaneFfts<16, ProcessorLevel::kAvx512>::kernels();

}  // namespace quo
