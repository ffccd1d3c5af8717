#include "signallib/own_fft/lane_fft.h"

namespace quo {

extern const FftKernels kFftKernels16;
const FftKernels kFftKernels16 = LaneFfts<16>::kTable;

}  // namespace quo
