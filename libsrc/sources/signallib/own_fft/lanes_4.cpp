#include "signallib/own_fft/lane_fft.h"

namespace quo {

extern const FftKernels kFftKernels4;
const FftKernels kFftKernels4 = LaneFfts<4>::kTable;

}  // namespace quo
