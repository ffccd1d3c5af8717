// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_NUMBER_TEXT_H
#define QUO_NUMBER_TEXT_H

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace quo {

/** Room for any number that the helpers below write, the final NUL included. */
inline constexpr std::size_t kNumberRoom = 40;

/** A number's text in a buffer of its own, NUL-terminated. */
struct NumberText {
    char data[kNumberRoom];
    std::size_t size;
    operator std::string_view() const noexcept { return {data, size}; }
};

/** The text of printf's "%.*g", whatever the locale (infinity is "inf", not-a-number "nan" or "-nan"). A negative
 * precision stands for 6, as there; more than 32 digits are never written. */
NumberText format_general(double value, int precision) noexcept;
/** The shortest text that reads back to the same double. */
NumberText format_exact(double value) noexcept;
NumberText format_int(std::int64_t value) noexcept;

/** The text without the white space around it. */
constexpr std::string_view trimmed(std::string_view text) noexcept {
    constexpr std::string_view kBlanks = " \t\r\n";
    const auto first = text.find_first_not_of(kBlanks);
    return first == text.npos ? "" : text.substr(first, text.find_last_not_of(kBlanks) - first + 1);
}

/** What a scan of a number found: the value, and the characters it took (0: no number stands there, value 0). */
template <typename T>
struct Scanned {
    T value;
    std::size_t length;
};

/** strtod's reading of the longest number at the start of `text`, locale-independent: leading white space and a
 * sign are taken, hexadecimal, "inf" and "nan" too; overflow gives infinity, underflow zero or a subnormal. */
Scanned<double> scan_double(std::string_view text) noexcept;
/** strtoll's decimal reading; values beyond 64 bits stop at the bounds. */
Scanned<std::int64_t> scan_int64(std::string_view text) noexcept;
/** strtol's reading cut to 32 bits: values beyond stop at the bounds. */
Scanned<std::int32_t> scan_int32(std::string_view text) noexcept;

}  // namespace quo

#endif
