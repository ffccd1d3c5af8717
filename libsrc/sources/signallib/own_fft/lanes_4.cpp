// SPDX-License-Identifier: Apache-2.0
#include "signallib/own_fft/lane_fft.h"

namespace quo {

extern const FftKernels kFftKernels4;
constexpr FftKernels kFftKernels4 = LaneFfts<4, ProcessorLevel::kBase>::kernels();

}  // namespace quo
