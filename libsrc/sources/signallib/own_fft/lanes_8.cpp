// SPDX-License-Identifier: Apache-2.0
#include "signallib/own_fft/lane_fft.h"

namespace quo {

extern const FftKernels kFftKernels8;
constexpr FftKernels kFftKernels8 = LaneFfts<8, ProcessorLevel::kAvx2>::kernels();

}  // namespace quo
