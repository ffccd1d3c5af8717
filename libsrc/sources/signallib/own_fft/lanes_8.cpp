#include "signallib/own_fft/lane_fft.h"

namespace quo {

extern const FftKernels kFftKernels8;
const FftKernels kFftKernels8 = LaneFfts<8>::kTable;

}  // namespace quo
