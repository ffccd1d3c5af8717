#ifndef QUO_KERNEL_TABLE_H
#define QUO_KERNEL_TABLE_H

#include <cstddef>

#include "datafilelib/sample_kernels.h"

namespace quo {

/** One pair of types of one access, and its loop. */
struct KernelRow {
    SampleAccess access;
    int file_type, memory_type;
    SampleKernel kernel;
};
struct KernelTable {
    const KernelRow* rows;
    std::size_t count;
};

namespace kernels_any {
extern const KernelTable kTable;  ///< for every processor
}
namespace kernels_avx2 {
extern const KernelTable kTable;  ///< for processors with AVX2; the same results
}

}  // namespace quo

#endif
