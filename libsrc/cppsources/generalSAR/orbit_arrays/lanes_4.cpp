// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/orbit_arrays/lane_kernels.h"

namespace quo {

extern const ArrayKernels kKernelsOf4;
const ArrayKernels kKernelsOf4 = LaneKernels<Pack<4>>::kTable;

}  // namespace quo
