// SPDX-License-Identifier: Apache-2.0
#include "datafilelib/raster_region.h"

#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>

#include "diagnosticslib/call_frame.h"
#include "sarutillib/ground/checked_size.h"

namespace quo {
namespace {

// Large enough to make system calls rare, small enough to stay in the second-level cache while it is converted.
constexpr std::int64_t kChunk = std::int64_t{1} << 19;
// An output as large as this may still stand in a cache when it is looked at.
constexpr std::int64_t kMostCached = std::int64_t{16} << 20;
// Pieces nearer to each other than this are read in one transfer with what lies between.
constexpr std::int64_t kSmallGap = 4096;

using Offset = Checked<std::int64_t>;

std::optional<RasterRegion> checked_region(Offset first, Offset distance, Offset piece, std::int64_t count) {
    const Offset end = first + distance * std::max<std::int64_t>(count - 1, 0) + piece;
    if (!first.value() || !distance.value() || !piece.value() || !end.value()) return std::nullopt;
    return RasterRegion{*first.value(), *distance.value(), *piece.value(), count};
}

Offset line_distance(const RasterDescription& raster) {
    return Offset{raster.NrOfPixelsPerLine} * raster.element_sizeof() + raster.RowPrefix;
}

bool describes_lines(const RasterDescription& raster) {
    return raster.element_sizeof() > 0 && raster.NrOfPixelsPerLine >= 0 && raster.RowPrefix >= 0 &&
           raster.HeaderOffset >= 0;
}

/** Moves a region chunk by chunk. */
class RegionReader {
public:
    RegionReader(const RasterStream& stream, const RasterRegion& region, const RegionLayout& layout, char* to)
        : stream_{stream}, region_{region}, layout_{layout}, to_{to} {}

    int run() {
        const bool grows = layout_.memory_piece >= region_.piece;
        const bool packed = layout_.memory_row == layout_.memory_piece;
        if (region_.distance != region_.piece || !packed || !grows) return read_through_scratch();
        const bool fits = region_.count * layout_.memory_piece <= kMostCached;
        return fits || !layout_.kernel ? read_in_place() : read_past_caches();
    }

private:
    // Pieces without gaps on either side: each chunk goes into the upper end of its own room and is converted
    // there.
    int read_in_place() {
        const std::int64_t at_once =
            std::max<std::int64_t>(1, kChunk / std::max<std::int64_t>(layout_.memory_piece, 1));
        for (std::int64_t done = 0; done < region_.count; done += at_once) {
            const std::int64_t pieces = std::min(at_once, region_.count - done);
            const auto bytes = static_cast<std::size_t>(pieces * region_.piece);
            char* room = to_ + done * layout_.memory_piece;
            char* upper = room + pieces * (layout_.memory_piece - region_.piece);
            if (stream_.read_at(region_.first + done * region_.distance, upper, bytes).bytes != bytes)
                return QUO_READ_FAILED;
            if (layout_.kernel) {
                layout_.kernel(upper, room, static_cast<std::size_t>(pieces * layout_.samples), layout_.swap);
            }
        }
        return QUO_OK;
    }

    // Where no cache holds the whole output, its lines would be fetched from memory only to be overwritten:
    // samples are converted in small pieces and stored past the caches.
    int read_past_caches() {
        constexpr std::int64_t kSmall = 4096;
        const std::int64_t in = region_.piece / layout_.samples, out = layout_.memory_piece / layout_.samples;
        const std::int64_t samples = region_.count * layout_.samples, at_once = kChunk / out, few = kSmall / out;
        TrackedBuffer<char> scratch{static_cast<std::size_t>(at_once * in)};
        if (!scratch) return QUO_NO_MEMORY;
        alignas(64) char small[kSmall];
        for (std::int64_t done = 0; done < samples; done += at_once) {
            const std::int64_t now = std::min(at_once, samples - done);
            const auto bytes = static_cast<std::size_t>(now * in);
            if (stream_.read_at(region_.first + done * in, scratch.data(), bytes).bytes != bytes)
                return QUO_READ_FAILED;
            for (std::int64_t i = 0; i < now; i += few) {
                const std::int64_t count = std::min(few, now - i);
                layout_.kernel(scratch.data() + i * in, small, static_cast<std::size_t>(count), layout_.swap);
                store_past_caches(small, to_ + (done + i) * out, static_cast<std::size_t>(count * out));
            }
            order_stores();
        }
        return QUO_OK;
    }

    int read_through_scratch() {
        const bool together = region_.distance - region_.piece <= kSmallGap;
        const std::int64_t at_once =
            together ? std::max<std::int64_t>(1, kChunk / std::max<std::int64_t>(region_.distance, 1)) : 1;
        const std::int64_t longest = span(std::min(at_once, region_.count));
        TrackedBuffer<char> scratch{static_cast<std::size_t>(longest)};
        if (!scratch) return QUO_NO_MEMORY;
        for (std::int64_t done = 0; done < region_.count; done += at_once) {
            const std::int64_t pieces = std::min(at_once, region_.count - done);
            const auto bytes = static_cast<std::size_t>(span(pieces));
            if (stream_.read_at(region_.first + done * region_.distance, scratch.data(), bytes).bytes != bytes) {
                return QUO_READ_FAILED;
            }
            for (std::int64_t i = 0; i < pieces; ++i) {
                store(scratch.data() + i * region_.distance, to_ + (done + i) * layout_.memory_row);
            }
        }
        return QUO_OK;
    }

    [[nodiscard]] std::int64_t span(std::int64_t pieces) const {
        return (pieces - 1) * region_.distance + region_.piece;
    }
    void store(const char* from, char* to) const {
        if (layout_.kernel) {
            layout_.kernel(from, to, static_cast<std::size_t>(layout_.samples), layout_.swap);
        } else {
            std::memcpy(to, from, static_cast<std::size_t>(region_.piece));
        }
    }

    const RasterStream& stream_;
    const RasterRegion& region_;
    const RegionLayout& layout_;
    char* to_;
};

// A line of samples that no cache holds any more: each piece asks for what lies a few pieces on, which the
// processor by itself would see too late beside so many stores.
void convert_from_memory(const RegionLayout& layout, std::int64_t piece, const char* from, char* to) {
    constexpr std::int64_t kSmall = 1024, kAhead = 8 * kSmall, kLine = 64;
    const std::int64_t in = layout.memory_piece / layout.samples, out = piece / layout.samples, few = kSmall / in;
    for (std::int64_t i = 0; i < layout.samples; i += few) {
        const std::int64_t count = std::min(few, layout.samples - i);
        for (std::int64_t k = 0; k < count * in; k += kLine) __builtin_prefetch(from + i * in + kAhead + k);
        layout.kernel(from + i * in, to + i * out, static_cast<std::size_t>(count), layout.swap);
    }
}

// By way of memory, as far as the system does not copy by itself.
int copy_through_memory(const RasterStream& from, std::int64_t place, const RasterStream& to,
                        std::int64_t to_place, std::int64_t bytes) {
    TrackedBuffer<char> chunk{static_cast<std::size_t>(std::min(kChunk, bytes))};
    if (!chunk) return QUO_NO_MEMORY;
    std::int64_t written = to_place;
    const auto read = [&](std::int64_t done, char* piece, std::size_t size) {
        return from.read_at(place + done, piece, size);
    };
    const auto write = [&](std::string_view piece) {
        const Transfer moved = to.write_at(written, piece.data(), piece.size());
        written += static_cast<std::int64_t>(moved.bytes);
        return moved.bytes == piece.size();
    };
    switch (copy_pieces(bytes, {chunk.data(), chunk.size()}, read, write)) {
        case Copied::kWhole:
            return QUO_OK;
        case Copied::kNotRead:
            return QUO_READ_FAILED;
        case Copied::kNotWritten:
            return QUO_WRITE_FAILED;
    }
    return QUO_OK;
}

bool same_file(const std::string& a, const std::string& b) {
    struct stat first {
    }, second{};
    return stat(a.c_str(), &first) == 0 && stat(b.c_str(), &second) == 0 && first.st_dev == second.st_dev &&
           first.st_ino == second.st_ino;
}

// Whether a copy would take the place of a file that it is made from, or its side file the place of the copy.
bool replaces_a_needed_file(const char* from, const char* to) {
    const std::array source{std::string{from}, side_file_of(from)}, copy{std::string{to}, side_file_of(to)};
    const auto is_needed = [&](const std::string& written) {
        return std::ranges::any_of(source, [&](const std::string& read) { return same_file(read, written); });
    };
    return std::ranges::any_of(copy, is_needed) || same_file(copy[0], copy[1]);
}

// Takes from group and others what the source does not grant them. A group that is not the source's counts as
// others.
bool keep_closed(int source, int copy) {
    struct stat from {
    }, to{};
    if (fstat(source, &from) != 0 || fstat(copy, &to) != 0) return false;
    const mode_t others = from.st_mode & 07U,
                 group = to.st_gid == from.st_gid ? from.st_mode & 070U : others << 3U;
    const bool kept = fchmod(copy, to.st_mode & (0700U | group | others)) == 0;
    if (!kept && errno != EPERM && errno != ENOTSUP) return false;  // as file systems without permissions answer
    errno = 0;
    return true;
}

}  // namespace

std::optional<RasterRegion> region_of_samples(const RasterDescription& raster, std::int64_t first_line,
                                              std::int64_t lines, std::int64_t first_sample,
                                              std::int64_t samples) {
    if (!describes_lines(raster) || first_line < 0 || lines < 0 || first_sample < 0 || samples < 0 ||
        first_sample + samples > raster.NrOfPixelsPerLine) {
        return std::nullopt;
    }
    const Offset distance = line_distance(raster);
    const Offset first = Offset{raster.HeaderOffset} + distance * first_line + raster.RowPrefix +
                         Offset{first_sample} * raster.element_sizeof();
    return checked_region(first, distance, Offset{samples} * raster.element_sizeof(), lines);
}

std::optional<RasterRegion> region_of_prefixes(const RasterDescription& raster, std::int64_t first_line,
                                               std::int64_t lines) {
    if (!describes_lines(raster) || first_line < 0 || lines < 0) return std::nullopt;
    const Offset distance = line_distance(raster);
    return checked_region(Offset{raster.HeaderOffset} + distance * first_line, distance, raster.RowPrefix, lines);
}

std::int64_t line_after(const RasterDescription& raster, std::int64_t first_line, std::int64_t lines) {
    const Offset place = Offset{raster.HeaderOffset} + line_distance(raster) * (Offset{first_line} + lines);
    return place.value().value_or(raster.HeaderOffset);
}

int check_region(const RasterStream& stream, const RasterRegion& region) {
    if (region.count == 0 || region.piece == 0) return QUO_OK;
    const auto length = stream.length();
    return length && region.end() <= *length ? QUO_OK : QUO_READ_FAILED;
}

int read_region(const RasterStream& stream, const RasterRegion& region, const RegionLayout& layout, char* to) {
    if (const int status = check_region(stream, region)) return status;
    if (region.count == 0 || region.piece == 0) return QUO_OK;
    return RegionReader{stream, region, layout, to}.run();
}

int write_region(const RasterStream& stream, const RasterRegion& region, const RegionLayout& layout,
                 const char* from) {
    if (region.count == 0 || region.piece == 0) return QUO_OK;
    const bool gapless = region.distance == region.piece;
    const std::int64_t at_once = gapless ? std::max<std::int64_t>(1, kChunk / region.piece) : 1;
    TrackedBuffer<char> scratch{static_cast<std::size_t>(std::min(at_once, region.count) * region.piece)};
    if (!scratch) return QUO_NO_MEMORY;
    for (std::int64_t done = 0; done < region.count; done += at_once) {
        const std::int64_t pieces = std::min(at_once, region.count - done);
        for (std::int64_t i = 0; i < pieces; ++i) {
            const char* row = from + (done + i) * layout.memory_row;
            char* room = scratch.data() + i * region.piece;
            if (layout.kernel) {
                convert_from_memory(layout, region.piece, row, room);
            } else {
                std::memcpy(room, row, static_cast<std::size_t>(region.piece));
            }
        }
        const auto bytes = static_cast<std::size_t>(pieces * region.piece);
        if (stream.write_at(region.first + done * region.distance, scratch.data(), bytes).bytes != bytes) {
            return QUO_WRITE_FAILED;
        }
    }
    return QUO_OK;
}

int copy_range(const RasterStream& from, std::int64_t place, const RasterStream& to, std::int64_t to_place,
               std::int64_t bytes) {
    struct stat source {
    }, target{};
    if (::fstat(from.descriptor(), &source) != 0 || ::fstat(to.descriptor(), &target) != 0) return QUO_READ_FAILED;
    const bool one_file = source.st_dev == target.st_dev && source.st_ino == target.st_ino;
    if (one_file && std::abs(place - to_place) < bytes) return QUO_REFUSED;
    const auto copied =
        static_cast<std::int64_t>(from.copy_to(place, to, to_place, static_cast<std::size_t>(bytes)));
    if (copied == bytes) return QUO_OK;
    return copy_through_memory(from, place + copied, to, to_place + copied, bytes - copied);
}

const char* raster_failure(int status) noexcept {
    switch (status) {
        case QUO_READ_FAILED:
            return "File reading failed!";
        case QUO_WRITE_FAILED:
            return "File writing failed!";
        case QUO_NO_MEMORY:
            return "Memory allocation failure";
        case QUO_NOT_OPENED:
            return "File not opened!";
        default:
            return "The request does not fit the raster";
    }
}

std::string side_file_of(std::string_view raster) { return std::string{raster} + std::string{kSideSuffix}; }

int copy_raster(const char* from, const char* to, bool overwrite, std::optional<AtomicFile>& copy) {
    const bool exists = access(to, F_OK) == 0;
    const bool refused = replaces_a_needed_file(from, to) || (!overwrite && exists);
    errno = 0;  // that a file is missing is no failure here
    if (refused) return QUO_REFUSED;
    RasterStream source;
    if (!source.open(from, RasterStream::Mode::kRead)) return QUO_NOT_OPENED;
    copy.emplace(to);
    if (!copy->good() || !(exists || keep_closed(source.descriptor(), copy->descriptor()))) return QUO_NOT_OPENED;
    const auto length = source.length();
    if (!length) return QUO_READ_FAILED;
    RasterStream target;
    if (!target.open_same(copy->descriptor())) return QUO_NOT_OPENED;
    return copy_range(source, 0, target, 0, *length);
}

}  // namespace quo
