// SPDX-License-Identifier: Apache-2.0
#include "datafilelib/raster_stream.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

namespace quo {
namespace {

// Copies as large as this start on their way to the disk at once: who waits for the disk at the end, as for a new
// raster, waits less.
constexpr ssize_t kLargeCopy = ssize_t{1} << 20;

int flags_of(RasterStream::Mode mode) {
    switch (mode) {
        case RasterStream::Mode::kRead:
            return O_RDONLY;
        case RasterStream::Mode::kCreate:
            return O_WRONLY | O_CREAT | O_TRUNC;
        case RasterStream::Mode::kCreateAndRead:
            return O_RDWR | O_CREAT | O_TRUNC;
        case RasterStream::Mode::kUpdate:
            return O_RDWR;
    }
    return O_RDONLY;
}

}  // namespace

bool RasterStream::open(const char* path, Mode mode) noexcept {
    close();
    const int descriptor = ::open(path, flags_of(mode) | O_CLOEXEC, 0666);
    if (descriptor < 0) return false;
    struct stat status {};
    if (fstat(descriptor, &status) != 0 || S_ISDIR(status.st_mode)) {
        ::close(descriptor);
        errno = EISDIR;
        return false;
    }
    descriptor_ = descriptor;
    return true;
}

bool RasterStream::open_same(int descriptor) noexcept {
    close();
    descriptor_ = fcntl(descriptor, F_DUPFD_CLOEXEC, 0);
    return descriptor_ >= 0;
}

bool RasterStream::close() noexcept {
    if (descriptor_ < 0) return true;
    const bool closed = ::close(descriptor_) == 0;
    descriptor_ = -1;
    return closed;
}

std::optional<std::int64_t> RasterStream::length() const noexcept {
    struct stat status {};
    if (descriptor_ < 0 || fstat(descriptor_, &status) != 0) return std::nullopt;
    return status.st_size;
}

Transfer RasterStream::read_at(std::int64_t offset, void* to, std::size_t size) const noexcept {
    if (descriptor_ < 0 || offset < 0) return {0, true};
    return move_all(size, [&](std::size_t done, std::size_t left) {
        return pread(descriptor_, static_cast<char*>(to) + done, left, offset + static_cast<std::int64_t>(done));
    });
}

Transfer RasterStream::write_at(std::int64_t offset, const void* from, std::size_t size) const noexcept {
    if (descriptor_ < 0 || offset < 0) return {0, true};
    return move_all(size, [&](std::size_t done, std::size_t left) {
        return pwrite(descriptor_, static_cast<const char*>(from) + done, left,
                      offset + static_cast<std::int64_t>(done));
    });
}

std::size_t RasterStream::copy_to(std::int64_t offset, const RasterStream& to, std::int64_t place,
                                  std::size_t size) const noexcept {
    const Transfer moved = move_all(size, [&](std::size_t done, std::size_t left) {
        off_t from_here = offset + static_cast<off_t>(done), to_there = place + static_cast<off_t>(done);
        const ssize_t copied = copy_file_range(descriptor_, &from_here, to.descriptor_, &to_there, left, 0);
        if (copied >= kLargeCopy)
            (void)sync_file_range(to.descriptor_, to_there - copied, copied, SYNC_FILE_RANGE_WRITE);
        return copied;
    });
    errno = 0;
    return moved.bytes;
}

bool raster_exists(const char* path) noexcept {
    RasterStream stream;
    const int kept = errno;
    const bool exists = stream.open(path, RasterStream::Mode::kRead);
    errno = kept;
    return exists;
}

}  // namespace quo
