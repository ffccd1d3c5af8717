// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_SAMPLE_KERNELS_H
#define QUO_SAMPLE_KERNELS_H

#include <cstddef>

#include "quo_base/datafile.h"

namespace quo {

/** Converts `count` samples from one type into another. The byte order of the file's side is reversed when `swap`
 * is set. Reading: `from` may be the upper end of the room that `to` starts, when samples do not shrink. */
using SampleKernel = void (*)(const void* from, void* to, std::size_t count, bool swap);

/** Which pairs of types an access offers, and what happens to a value that does not fit. */
enum class SampleAccess : unsigned char {
    kRegionRead,   ///< BufferIO::readbuffer: integers that do not fit keep their low bits
    kRegionWrite,  ///< BufferIO::writebuffer
    kBlockRead,    ///< BufferFile::readbuffer: rounded half away from zero, held at the bounds
    kBlockWrite,   ///< BufferFile::writebuffer
    kAnyRead,      ///< every pair but complex samples as real ones; values as for kBlockRead
};

/** The kernel for reading (file type to memory type) or writing (memory type to file type), or null when the
 * access does not convert this pair. */
SampleKernel find_kernel(SampleAccess access, int file_type, int memory_type) noexcept;

/** Copies to memory that is not looked at soon; other threads may see it after order_stores(). */
void store_past_caches(const char* from, char* to, std::size_t size) noexcept;
void order_stores() noexcept;

/** Cell types have the codes 0 to kCellTypes - 1. */
inline constexpr int kCellTypes = 10;
/** Bytes of a sample, 0 for a code that is not a cell type. */
std::size_t sample_size(int cell_type) noexcept;
bool is_complex_type(int cell_type) noexcept;

}  // namespace quo

#endif
