// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/orbit_arrays/lane_kernels.h"

namespace quo {

extern const ArrayKernels kKernelsOf2;
const ArrayKernels kKernelsOf2 = LaneKernels<Pack<2>>::kTable;

}  // namespace quo
