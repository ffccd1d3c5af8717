// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_RASTER_REGION_H
#define QUO_RASTER_REGION_H

#include <cstddef>
#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "datafilelib/raster_stream.h"
#include "datafilelib/sample_kernels.h"
#include "sarutillib/ground/file_io.h"

namespace quo {

/** Equal pieces of a file at equal distances: the lines of a rectangle, or their prefixes. */
struct RasterRegion {
    std::int64_t first = 0;     ///< offset of the first piece
    std::int64_t distance = 0;  ///< from one piece to the next
    std::int64_t piece = 0;     ///< bytes of each
    std::int64_t count = 0;     ///< number of pieces

    [[nodiscard]] std::int64_t end() const { return count > 0 ? first + (count - 1) * distance + piece : first; }
};

/** The samples of a rectangle, `bytes_per_sample` each in the file; nothing when a number is negative, the
 * rectangle leaves the lines, or an offset overflows. */
std::optional<RasterRegion> region_of_samples(const RasterDescription& raster, std::int64_t first_line,
                                              std::int64_t lines, std::int64_t first_sample, std::int64_t samples);
/** The prefixes of some lines; nothing as above. */
std::optional<RasterRegion> region_of_prefixes(const RasterDescription& raster, std::int64_t first_line,
                                               std::int64_t lines);
/** Where the line after the region starts. */
std::int64_t line_after(const RasterDescription& raster, std::int64_t first_line, std::int64_t lines);

/** How the pieces lie in memory and how they are converted. */
struct RegionLayout {
    SampleKernel kernel;        ///< null: bytes as they stand
    std::int64_t samples;       ///< samples of a piece
    std::int64_t memory_piece;  ///< bytes of a piece in memory
    std::int64_t memory_row;    ///< bytes from one piece to the next in memory
    bool swap;                  ///< the file has the other byte order
};

/** 0, or 4 when the file ends before the region. */
int check_region(const RasterStream& stream, const RasterRegion& region);

/** Moves a whole region with few large transfers. 0, 4 when the file ends before the region (nothing is touched
 * then), 5, or 7. */
int read_region(const RasterStream& stream, const RasterRegion& region, const RegionLayout& layout, char* to);
int write_region(const RasterStream& stream, const RasterRegion& region, const RegionLayout& layout,
                 const char* from);

/** Copies bytes of one file to a place of another. 0, 1 for ranges of one file that overlap, of which pieces would
 * be read after they were written, 4 also where the source ends before, 5, or 7. */
int copy_range(const RasterStream& from, std::int64_t place, const RasterStream& to, std::int64_t to_place,
               std::int64_t bytes);

/** What an entry of the report says about a status of the raster classes. */
const char* raster_failure(int status) noexcept;

constexpr std::string_view kSideSuffix = ".hdr";
/** Name of the file that describes a raster. */
std::string side_file_of(std::string_view raster);

/** Copies a file's bytes as they are into a new file, which the caller commits. 0, 1 when the target exists and
 * must be kept, or where it or its side file is the source, the source's side file or the other, 4, 5, 7, 9. A
 * file of a new name is open to nobody else whom its source is closed to; its owner may write it all the same. */
int copy_raster(const char* from, const char* to, bool overwrite, std::optional<AtomicFile>& copy);

}  // namespace quo

#endif
