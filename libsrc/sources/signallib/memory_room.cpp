// SPDX-License-Identifier: Apache-2.0
#include "signallib/memory_room.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <charconv>
#include <cstdlib>
#include <limits>
#include <string_view>

#include "diagnosticslib/errno_kept.h"

namespace quo {
namespace {

constexpr std::size_t kUnlimited = std::numeric_limits<std::size_t>::max();

/** Needs below it are not worth reading the system's files. */
constexpr std::size_t kSmall = std::size_t{8} << 20;

/** The start of one of the system's small files; empty where there is none. */
class SystemFile {
public:
    explicit SystemFile(const char* name) noexcept {
        const int file = open(name, O_RDONLY | O_CLOEXEC);
        if (file < 0) return;
        const ssize_t bytes = read(file, text_, sizeof text_);
        close(file);
        size_ = bytes > 0 ? static_cast<std::size_t>(bytes) : 0;
    }

    /** The number behind `label`, or the file's first one where that is empty. */
    [[nodiscard]] std::size_t number(std::string_view label, std::size_t otherwise) const noexcept {
        const std::string_view text{text_, size_};
        const auto found = text.find(label);
        if (found == text.npos) return otherwise;
        const auto first = text.find_first_not_of(" \t", found + label.size());
        if (first == text.npos) return otherwise;
        std::size_t value = 0;
        const auto [end, error] = std::from_chars(text.data() + first, text.data() + text.size(), value);
        return error == std::errc{} ? value : otherwise;
    }

private:
    char text_[4096];
    std::size_t size_ = 0;
};

std::size_t kib(std::size_t count) noexcept { return count > kUnlimited / 1024 ? kUnlimited : count * 1024; }

std::size_t free_in_system() noexcept {
    const SystemFile memory{"/proc/meminfo"};
    const std::size_t available = kib(memory.number("MemAvailable:", kUnlimited));
    return available == kUnlimited ? kUnlimited : available + kib(memory.number("SwapFree:", 0));
}

/** What the limit of the container leaves. Its file cache counts against the limit but
 * gives way, so that only what this process holds itself is taken off. */
std::size_t free_in_group() noexcept {
    const std::size_t limit =
        std::min(SystemFile{"/sys/fs/cgroup/memory.max"}.number("", kUnlimited),
                 SystemFile{"/sys/fs/cgroup/memory/memory.limit_in_bytes"}.number("", kUnlimited));
    const std::size_t held = kib(SystemFile{"/proc/self/status"}.number("RssAnon:", 0));
    return limit > held ? limit - held : 0;
}

bool can_be_asked_for(std::size_t bytes) noexcept {
    // Through a volatile pointer: a compiler may leave out an allocation that nothing looks at.
    void* volatile block = std::malloc(bytes);
    const bool given = block != nullptr;
    std::free(block);
    return given;
}

}  // namespace

bool has_room(const MemoryNeed& need) noexcept {
    const ErrnoKept kept;
    if (!can_be_asked_for(need.addresses)) return false;
    return need.touched < kSmall || need.touched <= std::min(free_in_system(), free_in_group());
}

}  // namespace quo
