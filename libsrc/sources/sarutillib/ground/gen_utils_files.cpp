// SPDX-License-Identifier: Apache-2.0
/* File positions, names and copies. */

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <limits>
#include <optional>

#include "quo_base/gen_utils.h"
#include "sarutillib/ground/file_io.h"

namespace {

/** Offset that `whence` counts from, or nothing. */
std::optional<std::int64_t> seek_base(std::FILE* stream, int whence) noexcept {
    if (!stream) return std::nullopt;
    if (whence == 0) return 0;
    if (whence != 1 && whence != 2) return std::nullopt;
    if (whence == 2 && ::fseeko(stream, 0, SEEK_END) != 0) return std::nullopt;
    const off_t here = ::ftello(stream);
    return here < 0 ? std::nullopt : std::optional<std::int64_t>{here};
}

bool is_separator(char c) noexcept { return c == '/' || c == '\\'; }

}  // namespace

extern "C" {

int myfseek64_msc(std::FILE* stream, std::int64_t offset64, int whence) noexcept {
    const auto base = seek_base(stream, whence);
    std::int64_t target = 0;
    if (!base || __builtin_add_overflow(*base, offset64, &target)) return -1;
    // The seek may end inside the stream's buffer; the flush then brings the descriptor to the same place.
    return ::fseeko(stream, target, SEEK_SET) == 0 && std::fflush(stream) == 0 ? 0 : -1;
}

int check_fsep(char* path) noexcept {
    const std::size_t length = path ? std::strlen(path) : 0;
    if (length > 0 && is_separator(path[length - 1])) path[length - 1] = '\0';
    return static_cast<int>(std::min<std::size_t>(length, std::numeric_limits<int>::max()));
}

const char* getFileNameFromPath(const char* path) noexcept {
    if (!path) return nullptr;
    const char* separator = std::strrchr(path, '/');
    if (!separator) separator = std::strrchr(path, '\\');
    return separator ? separator + 1 : path;
}

int copyParameterFile(const char* source, const char* destination) noexcept {
    // Only a regular file has a size to read; waiting for a pipe's end or a device's would never finish.
    if (quo::file_length(source)) {
        if (const auto content = quo::read_file(source, std::numeric_limits<std::int64_t>::max())) {
            quo::AtomicFile copy{destination};
            (void)(copy.write(*content) && copy.commit());
        }
    }
    errno = 0;  // or the next tracked function would report the failure
    return 0;
}

}  // extern "C"
