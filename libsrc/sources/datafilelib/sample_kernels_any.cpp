// SPDX-License-Identifier: Apache-2.0
#include <cstdint>
#include <type_traits>

#include "datafilelib/kernel_table.h"

namespace quo::kernels_any {
#include "datafilelib/sample_kernels.inc"
}  // namespace quo::kernels_any
