// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/ground/bounded_text.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstdarg>
#include <cstdio>
#include <cstring>

#include "sarutillib/ground/utf8.h"

namespace quo {
namespace {

/** Whether `text` begins with all bytes of a character of `length` bytes. */
bool begins_whole(std::string_view text, std::size_t length) noexcept {
    return text.size() >= length && std::ranges::all_of(text.substr(1, length - 1), continues_utf8);
}

/** Length of a text cut to `length` bytes without the character that the cut splits. One that is not whole in the
 * text either is no UTF-8, as in Latin-1, and its bytes stay. */
std::size_t whole_characters(std::string_view text, std::size_t length) noexcept {
    for (std::size_t back = 1; back <= std::min<std::size_t>(3, length); ++back) {
        const std::string_view last = text.substr(length - back);
        if (continues_utf8(last.front())) continue;
        const std::size_t wanted = utf8_length(last.front());
        return wanted > back && begins_whole(last, wanted) ? length - back : length;
    }
    return length;
}

/** The same where what follows the cut is lost: it is taken to go on with the last character. */
std::size_t whole_formatted(const char* text, std::size_t length) noexcept {
    constexpr std::size_t kMost = 3;
    char window[2 * kMost];
    std::ranges::fill(window, '\x80');
    const std::size_t seen = std::min(kMost, length);
    std::copy_n(text + length - seen, seen, window);
    return length - seen + whole_characters({window, sizeof window}, seen);
}

}  // namespace

std::size_t copy_bounded(char* to, std::size_t room, std::string_view text) noexcept {
    if (room == 0) return 0;
    const std::size_t length = text.size() < room ? text.size() : whole_characters(text, room - 1);
    if (length > 0) std::memmove(to, text.data(), length);
    to[length] = '\0';
    return length;
}

std::size_t format_bounded(char* to, std::size_t room, const char* format, ...) noexcept {
    if (room == 0) return 0;
    const int error_before = errno;
    std::va_list arguments;
    va_start(arguments, format);
    // NOLINTNEXTLINE(clang-analyzer-valist.Uninitialized): the analyzer overlooks the line above
    const int wanted = std::vsnprintf(to, std::min<std::size_t>(room, INT_MAX), format, arguments);
    va_end(arguments);

    std::size_t length = 0;
    if (wanted >= 0) {
        const auto whole = static_cast<std::size_t>(wanted);
        length = whole < room ? whole : whole_formatted(to, room - 1);
    }
    to[length] = '\0';
    errno = error_before;
    return length;
}

}  // namespace quo
