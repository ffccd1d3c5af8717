#ifndef QUO_KERNEL_TABLE_H
#define QUO_KERNEL_TABLE_H

#include "datafilelib/sample_kernels.h"

namespace quo {

/** The loops by access, memory type and the file's cell type; null where an access does not convert the pair. */
struct KernelTable {
    SampleKernel kernels[static_cast<int>(SampleAccess::kAnyRead) + 1][kCellTypes][kCellTypes];
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

/** The kernels with the widest vectors that this processor has, of at most so many bits. */
const KernelTable& kernel_table(int widest) noexcept;

}  // namespace quo

#endif
