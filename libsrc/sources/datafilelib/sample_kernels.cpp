#include "datafilelib/sample_kernels.h"

#include "datafilelib/kernel_table.h"
#include "sarutillib/ground/processor_level.h"

namespace quo {
namespace {

constexpr std::size_t kSizes[kCellTypes] = {8, 4, 16, 8, 8, 4, 4, 2, 2, 1};

bool is_cell_type(int code) noexcept { return code >= 0 && code < kCellTypes; }

const KernelTable& table_for_this_processor() noexcept {
    return processor_level() >= ProcessorLevel::kAvx2 ? kernels_avx2::kTable : kernels_any::kTable;
}

}  // namespace

SampleKernel find_kernel(SampleAccess access, int file_type, int memory_type) noexcept {
    if (!is_cell_type(file_type) || !is_cell_type(memory_type)) return nullptr;
    return table_for_this_processor().kernels[static_cast<int>(access)][memory_type][file_type];
}

std::size_t sample_size(int cell_type) noexcept { return is_cell_type(cell_type) ? kSizes[cell_type] : 0; }

bool is_complex_type(int cell_type) noexcept { return is_cell_type(cell_type) && cell_type % 2 == 0; }

}  // namespace quo
