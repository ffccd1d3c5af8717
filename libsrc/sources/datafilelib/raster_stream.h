// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_RASTER_STREAM_H
#define QUO_RASTER_STREAM_H

#include <cstddef>
#include <cstdint>
#include <optional>

#include "sarutillib/ground/transfer.h"

namespace quo {

/** An open raster file: whole transfers at 64-bit positions. Folders are refused. */
class RasterStream {
public:
    enum class Mode : std::uint8_t { kRead, kCreate, kCreateAndRead, kUpdate };

    RasterStream() noexcept = default;
    ~RasterStream() { close(); }
    RasterStream(const RasterStream&) = delete;
    RasterStream& operator=(const RasterStream&) = delete;

    [[nodiscard]] bool open(const char* path, Mode mode) noexcept;
    /** Reads and writes through another descriptor of a file that somebody else opened for both. */
    [[nodiscard]] bool open_same(int descriptor) noexcept;
    /** False when what was written could not be handed to the disk. */
    bool close() noexcept;
    [[nodiscard]] bool is_open() const noexcept { return descriptor_ >= 0; }
    [[nodiscard]] int descriptor() const noexcept { return descriptor_; }
    /** Bytes in the file, or nothing when they cannot be told. */
    [[nodiscard]] std::optional<std::int64_t> length() const noexcept;

    /** Where the system refuses, errno tells why. */
    Transfer read_at(std::int64_t offset, void* to, std::size_t size) const noexcept;
    Transfer write_at(std::int64_t offset, const void* from, std::size_t size) const noexcept;
    /** Has the system copy bytes to a place of another file by itself. How many it did: not every file system and
     * pair of files can be copied so, and why the rest was not shows when it is read and written. errno is 0. */
    std::size_t copy_to(std::int64_t offset, const RasterStream& to, std::int64_t place,
                        std::size_t size) const noexcept;

private:
    int descriptor_ = -1;
};

/** Whether a raster can be opened for reading. */
[[nodiscard]] bool raster_exists(const char* path) noexcept;

}  // namespace quo

#endif
