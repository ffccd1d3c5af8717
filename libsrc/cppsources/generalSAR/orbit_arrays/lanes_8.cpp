// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/orbit_arrays/lane_kernels.h"

namespace quo {

extern const ArrayKernels kKernelsOf8;
const ArrayKernels kKernelsOf8 = LaneKernels<Pack<8>>::kTable;

}  // namespace quo
