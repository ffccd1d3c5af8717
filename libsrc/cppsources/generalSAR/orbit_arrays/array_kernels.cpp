// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/orbit_arrays/array_kernels.h"

#include "sarutillib/ground/processor_level.h"

namespace quo {

extern const ArrayKernels kKernelsOf2;
#if defined(QUO_WIDE_LANES)
extern const ArrayKernels kKernelsOf4, kKernelsOf8;
#endif

const ArrayKernels& array_kernels([[maybe_unused]] int widest) noexcept {
#if defined(QUO_WIDE_LANES)
    if (widest >= 8 && processor_level() >= ProcessorLevel::kAvx512) return kKernelsOf8;
    if (widest >= 4 && processor_level() >= ProcessorLevel::kAvx2) return kKernelsOf4;
#endif
    return kKernelsOf2;
}

}  // namespace quo
