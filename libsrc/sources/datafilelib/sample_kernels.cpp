// SPDX-License-Identifier: Apache-2.0
#include "datafilelib/sample_kernels.h"

#include "datafilelib/kernel_table.h"

namespace quo {
namespace {

constexpr std::size_t kSizes[kCellTypes] = {8, 4, 16, 8, 8, 4, 4, 2, 2, 1};

bool is_cell_type(int code) noexcept { return code >= 0 && code < kCellTypes; }

}  // namespace

const KernelTable& kernel_table(ProcessorLevel level) noexcept {
    if (level >= ProcessorLevel::kAvx512) return kernels_avx512::kTable;
    return level >= ProcessorLevel::kAvx2 ? kernels_avx2::kTable : kernels_any::kTable;
}

SampleKernel find_kernel(SampleAccess access, int file_type, int memory_type) noexcept {
    if (!is_cell_type(file_type) || !is_cell_type(memory_type)) return nullptr;
    return kernel_table(processor_level()).kernels[static_cast<int>(access)][memory_type][file_type];
}

void store_past_caches(const char* from, char* to, std::size_t size) noexcept {
    kernel_table(processor_level()).store_past_caches(from, to, size);
}
void order_stores() noexcept {
#if defined(__SSE2__)
    _mm_sfence();
#endif
}

std::size_t sample_size(int cell_type) noexcept { return is_cell_type(cell_type) ? kSizes[cell_type] : 0; }

bool is_complex_type(int cell_type) noexcept { return is_cell_type(cell_type) && cell_type % 2 == 0; }

}  // namespace quo
