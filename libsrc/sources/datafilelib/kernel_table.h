// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_KERNEL_TABLE_H
#define QUO_KERNEL_TABLE_H

#if defined(__SSE2__)
#include <immintrin.h>
#endif

#include "datafilelib/sample_kernels.h"
#include "sarutillib/ground/processor_level.h"

namespace quo {

/** The loops by access, memory type and the file's cell type; null where an access does not convert the pair. */
struct KernelTable {
    SampleKernel kernels[static_cast<int>(SampleAccess::kAnyRead) + 1][kCellTypes][kCellTypes];
    void (*store_past_caches)(const char* from, char* to, std::size_t size) noexcept;
};

namespace kernels_any {
extern const KernelTable kTable;  ///< for every processor
}
namespace kernels_avx2 {
extern const KernelTable kTable;  ///< for processors with AVX2; the same results
}
namespace kernels_avx512 {
extern const KernelTable
    kTable;  ///< for processors with AVX-512, bytes and short vectors included; the same results
}

/** The kernels of a level, which the processor must have. */
const KernelTable& kernel_table(ProcessorLevel level) noexcept;

}  // namespace quo

#endif
