#include "sarutillib/bounded_text.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstdarg>
#include <cstdio>
#include <cstring>

namespace quo {
namespace {

/** Bytes that a UTF-8 sequence begun by `lead` has; 1 for anything that begins none. */
std::size_t sequence_length(unsigned char lead) noexcept {
    if (lead >= 0xF0) return 4;
    if (lead >= 0xE0) return 3;
    return lead >= 0xC0 ? 2 : 1;
}

bool continues_sequence(unsigned char byte) noexcept { return (byte & 0xC0) == 0x80; }

/** Length of a cut text without the sequence that the cut left incomplete. Bytes that are no UTF-8 stay. */
std::size_t whole_sequences(const char* text, std::size_t length) noexcept {
    for (std::size_t back = 1; back <= std::min<std::size_t>(3, length); ++back) {
        const auto byte = static_cast<unsigned char>(text[length - back]);
        if (!continues_sequence(byte)) return sequence_length(byte) > back ? length - back : length;
    }
    return length;
}

}  // namespace

std::size_t copy_bounded(char* to, std::size_t room, std::string_view text) noexcept {
    if (room == 0) return 0;
    const std::size_t length = text.size() < room ? text.size() : whole_sequences(text.data(), room - 1);
    if (length > 0) std::memmove(to, text.data(), length);
    to[length] = '\0';
    return length;
}

std::size_t format_bounded(char* to, std::size_t room, const char* format, ...) noexcept {
    if (room == 0) return 0;
    const int error_before = errno;
    std::va_list arguments;
    va_start(arguments, format);
    const int wanted = std::vsnprintf(to, std::min<std::size_t>(room, INT_MAX), format, arguments);
    va_end(arguments);

    std::size_t length = 0;
    if (wanted >= 0) {
        const auto whole = static_cast<std::size_t>(wanted);
        length = whole < room ? whole : whole_sequences(to, room - 1);
    }
    to[length] = '\0';
    errno = error_before;
    return length;
}

}  // namespace quo
