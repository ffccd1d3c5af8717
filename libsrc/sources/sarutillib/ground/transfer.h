// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TRANSFER_H
#define QUO_TRANSFER_H

#include <sys/types.h>

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

namespace quo {

/** What a transfer moved, and whether it is short because the system refused the rest: at the end of the file it
 * does not, and the bytes beyond are known not to be there. */
struct Transfer {
    std::size_t bytes = 0;
    bool refused = false;
};

/** Runs a system call again as long as a signal interrupts it. */
template <typename Call>
auto retried(Call call) noexcept {
    auto result = call();
    while (result < 0 && errno == EINTR) {
        errno = 0;
        result = call();
    }
    return result;
}

/** Repeats `step(done, left)`, which answers as read() and write() do, until everything is moved or a step moves
 * nothing. Where the system refuses, errno tells why. */
template <typename Step>
Transfer move_all(std::size_t size, Step step) noexcept {
    constexpr std::size_t kMostAtOnce = std::size_t{1}
                                        << 30U;  // the kernel moves less than 2^31 bytes in one call
    std::size_t done = 0;
    while (done < size) {
        const ssize_t moved = retried([&] { return step(done, std::min(size - done, kMostAtOnce)); });
        if (moved <= 0) return {done, moved < 0};
        done += static_cast<std::size_t>(moved);
    }
    return {done, false};
}

enum class Copied : std::uint8_t { kWhole, kNotRead, kNotWritten };

/** Copies the first `length` bytes of a file by way of `room`: `read(place, to, size)` gives a Transfer,
 * `write(bytes)` whether it took all. */
template <typename Read, typename Write>
Copied copy_pieces(std::int64_t length, std::span<char> room, Read read, Write write) {
    const auto most = static_cast<std::int64_t>(room.size());
    for (std::int64_t done = 0; done < length; done += most) {
        const auto size = static_cast<std::size_t>(std::min(most, length - done));
        if (read(done, room.data(), size).bytes != size) return Copied::kNotRead;
        if (!write(std::string_view{room.data(), size})) return Copied::kNotWritten;
    }
    return Copied::kWhole;
}

}  // namespace quo

#endif
