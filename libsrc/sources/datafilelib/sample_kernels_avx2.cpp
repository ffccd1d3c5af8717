// SPDX-License-Identifier: Apache-2.0

// Compiled with AVX2 switched on.
#include <cstdint>
#include <type_traits>

#include "datafilelib/kernel_table.h"

namespace quo::kernels_avx2 {
#include "datafilelib/sample_kernels.inc"
}  // namespace quo::kernels_avx2
