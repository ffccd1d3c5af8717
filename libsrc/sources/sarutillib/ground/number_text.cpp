// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/ground/number_text.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <limits>

namespace quo {
namespace {

constexpr int kPrintfDefaultPrecision = 6;
/** The longest text, as in "-1.234e-308" and "-0.0001234", takes seven characters beside its digits. */
constexpr int kMostDigits = static_cast<int>(kNumberRoom) - 8;

template <typename... How>
NumberText text_of(How... how) noexcept {
    NumberText text;
    const auto end = std::to_chars(text.data, text.data + kNumberRoom - 1, how...).ptr;
    *end = '\0';
    text.size = static_cast<std::size_t>(end - text.data);
    return text;
}

bool is_space(char c) noexcept { return c == ' ' || (c >= '\t' && c <= '\r'); }
bool is_digit(char c) noexcept { return c >= '0' && c <= '9'; }
/** Letters in lower case; no other character becomes a letter. */
char lower(char c) noexcept { return static_cast<char>(c | 0x20); }
bool is_hex_digit(char c) noexcept { return is_digit(c) || (lower(c) >= 'a' && lower(c) <= 'f'); }

/** What stands before the digits of a number: where they begin, and whether a minus comes first. */
struct Lead {
    const char* begin;
    bool negative;
};
Lead skip_sign(const char* at, const char* end) noexcept {
    if (at == end) return {at, false};
    // Signs come as they like: a branch would be guessed wrong half the time.
    const bool negative = *at == '-';
    return {at + static_cast<int>(negative | (*at == '+')), negative};
}
Lead skip_space_and_sign(const char* at, const char* end) noexcept {
    while (at != end && is_space(*at)) ++at;
    return skip_sign(at, end);
}

/** Exponent that follows a mark at `at`, held where one more digit could overflow, and where it ends; nothing
 * stands there when it ends at `at`. */
struct Exponent {
    std::int64_t value;
    const char* end;
};
Exponent scan_exponent(const char* at, const char* end) noexcept {
    constexpr std::int64_t kEnough = std::numeric_limits<std::int64_t>::max() / 100;
    const Lead lead = skip_sign(at + 1, end);
    const char* digit = lead.begin;
    std::int64_t value = 0;
    for (; digit != end && is_digit(*digit); ++digit)
        if (value < kEnough) value = 10 * value + (*digit - '0');
    return {value * (1 - 2 * static_cast<int>(lead.negative)), digit == lead.begin ? at : digit};
}

/** Whether an unsigned number too large or too small for a double is too large. `begin` to `end` holds just that
 * number; its exponent, if any, follows the mark (in lower case), and each place of a digit weighs
 * `exponents_per_place` steps of it. */
bool is_overflow(const char* begin, const char* end, char mark, std::int64_t exponents_per_place) noexcept {
    const char* const digits_end = std::find_if(begin, end, [=](char c) { return lower(c) == mark; });
    const char* const point = std::find(begin, digits_end, '.');
    const char* const leading = std::find_if(begin, digits_end, [](char c) { return c != '0' && c != '.'; });
    const std::int64_t places = leading < point ? point - leading : point - leading + 1;
    const std::int64_t exponent = digits_end != end ? scan_exponent(digits_end, end).value : 0;
    return places * exponents_per_place + exponent > 0;
}

/** Reads an unsigned number: from_chars leaves the value alone beyond the range, where strtod gives a limit. */
Scanned<double> scan_magnitude(const char* begin, const char* end, std::chars_format format) noexcept {
    double value = 0.0;
    const auto [stop, error] = std::from_chars(begin, end, value, format);
    if (error == std::errc::invalid_argument) return {0.0, 0};
    if (error == std::errc::result_out_of_range) {
        const bool overflow =
            format == std::chars_format::hex ? is_overflow(begin, stop, 'p', 4) : is_overflow(begin, stop, 'e', 1);
        value = overflow ? std::numeric_limits<double>::infinity() : 0.0;
    }
    return {value, static_cast<std::size_t>(stop - begin)};
}

/** Reads what follows "0x"; "0" alone is the number when no hexadecimal digit does. */
Scanned<double> scan_hexadecimal(const char* begin, const char* end) noexcept {
    const char* const digits_end =
        std::find_if_not(begin, end, [](char c) { return is_hex_digit(c) || c == '.'; });
    const bool marked = digits_end != end && lower(*digits_end) == 'p';
    // from_chars would take two signs for one, and infinity for a digit.
    const char* const stop = marked ? scan_exponent(digits_end, end).end : digits_end;
    const auto [value, length] = scan_magnitude(begin, stop, std::chars_format::hex);
    return length > 0 ? Scanned<double>{value, length + 2} : Scanned<double>{0.0, 1};
}

/** Reads an unsigned number in any of strtod's forms. */
Scanned<double> scan_unsigned(const char* begin, const char* end) noexcept {
    if (begin == end || *begin == '-') return {0.0, 0};  // from_chars would take a second sign
    if (end - begin > 2 && begin[0] == '0' && lower(begin[1]) == 'x') return scan_hexadecimal(begin + 2, end);
    return scan_magnitude(begin, end, std::chars_format::general);
}

}  // namespace

NumberText format_general(double value, int precision) noexcept {
    const int digits = precision < 0 ? kPrintfDefaultPrecision : std::clamp(precision, 1, kMostDigits);
    return text_of(value, std::chars_format::general, digits);
}

NumberText format_exact(double value) noexcept { return text_of(value); }
NumberText format_int(std::int64_t value) noexcept { return text_of(value); }

Scanned<double> scan_double(std::string_view text) noexcept {
    const char* const end = text.data() + text.size();
    const Lead lead = skip_space_and_sign(text.data(), end);
    const auto [magnitude, length] = scan_unsigned(lead.begin, end);
    if (length == 0) return {0.0, 0};
    return {std::copysign(magnitude, lead.negative ? -1.0 : 1.0),
            static_cast<std::size_t>(lead.begin - text.data()) + length};
}

Scanned<std::int64_t> scan_int64(std::string_view text) noexcept {
    using Limits = std::numeric_limits<std::int64_t>;
    const char* const end = text.data() + text.size();
    const Lead lead = skip_space_and_sign(text.data(), end);
    if (lead.begin == end || !is_digit(*lead.begin)) return {0, 0};

    std::int64_t value = 0;
    const auto [stop, error] = std::from_chars(lead.begin - (lead.negative ? 1 : 0), end, value);
    if (error == std::errc::result_out_of_range) value = lead.negative ? Limits::min() : Limits::max();
    return {value, static_cast<std::size_t>(stop - text.data())};
}

Scanned<std::int32_t> scan_int32(std::string_view text) noexcept {
    using Limits = std::numeric_limits<std::int32_t>;
    const auto [value, length] = scan_int64(text);
    return {static_cast<std::int32_t>(std::clamp<std::int64_t>(value, Limits::min(), Limits::max())), length};
}

}  // namespace quo
