#include "datafilelib/sample_kernels.h"

#include <algorithm>
#include <array>
#include <span>

#include "datafilelib/kernel_table.h"

namespace quo {
namespace {

constexpr std::size_t kSizes[] = {8, 4, 16, 8, 8, 4, 4, 2, 2, 1};

const KernelTable& table_for_this_processor() noexcept {
    static const KernelTable& table = __builtin_cpu_supports("avx2") ? kernels_avx2::kTable : kernels_any::kTable;
    return table;
}

}  // namespace

SampleKernel find_kernel(SampleAccess access, int file_type, int memory_type) noexcept {
    const KernelTable& table = table_for_this_processor();
    const std::span rows{table.rows, table.count};
    const auto row = std::ranges::find_if(rows, [&](const KernelRow& candidate) {
        return candidate.access == access && candidate.file_type == file_type &&
               candidate.memory_type == memory_type;
    });
    return row == rows.end() ? nullptr : row->kernel;
}

std::size_t sample_size(int cell_type) noexcept {
    return cell_type >= 0 && static_cast<std::size_t>(cell_type) < std::size(kSizes)
               ? kSizes[static_cast<std::size_t>(cell_type)]
               : 0;
}

bool is_complex_type(int cell_type) noexcept {
    return cell_type >= 0 && static_cast<std::size_t>(cell_type) < std::size(kSizes) && cell_type % 2 == 0;
}

}  // namespace quo
