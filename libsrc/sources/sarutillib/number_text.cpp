#include "sarutillib/number_text.h"

#include <algorithm>
#include <charconv>
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

bool is_space(char c) noexcept {
    return c == ' ' || (c >= '\t' && c <= '\r');
}
bool is_digit(char c) noexcept {
    return c >= '0' && c <= '9';
}
char lower(char c) noexcept {
    return c >= 'A' && c <= 'Z' ? static_cast<char>(c + ('a' - 'A')) : c;
}
bool is_hex_digit(char c) noexcept {
    return is_digit(c) || (lower(c) >= 'a' && lower(c) <= 'f');
}

/** Leading white space and sign of a number: where its digits begin, and whether a minus stood before them. */
struct Lead {
    const char* begin;
    bool negative;
};
Lead skip_lead(std::string_view text) noexcept {
    const char* const end = text.data() + text.size();
    const char* at = std::find_if_not(text.data(), end, is_space);
    const bool negative = at != end && *at == '-';
    if (at != end && (*at == '-' || *at == '+')) ++at;
    return {at, negative};
}

/** Reads a run of digits, holding the value where one more digit could overflow. */
std::int64_t saturated_digits(const char* at, const char* end) noexcept {
    constexpr std::int64_t kEnough = std::numeric_limits<std::int64_t>::max() / 100;
    std::int64_t value = 0;
    for (; at != end && is_digit(*at); ++at)
        if (value < kEnough) value = 10 * value + (*at - '0');
    return value;
}

/** Whether an unsigned number too large or too small for a double is too large. `begin` to `end` is a whole number
 * in digits accepted by `is_digit_of`, with its exponent, if any, after `mark` (in lower case); one place of a
 * digit weighs `exponents_per_place` steps of the exponent. */
bool is_overflow(const char* begin, const char* end, bool (*is_digit_of)(char), char mark,
                 std::int64_t exponents_per_place) noexcept {
    const char* const digits_end =
        std::find_if_not(begin, end, [=](char c) { return is_digit_of(c) || c == '.'; });
    const char* const point = std::find(begin, digits_end, '.');
    const char* const leading = std::find_if(begin, digits_end, [](char c) { return c != '0' && c != '.'; });
    const std::int64_t places = leading < point ? point - leading : point - leading + 1;

    std::int64_t exponent = 0;
    if (digits_end != end && lower(*digits_end) == mark) {
        const Lead lead = skip_lead({digits_end + 1, end});
        exponent = saturated_digits(lead.begin, end);
        if (lead.negative) exponent = -exponent;
    }
    return places * exponents_per_place + exponent > 0;
}

/** Reads an unsigned number: from_chars leaves the value alone beyond the range, where strtod gives a limit. */
Scanned<double> scan_magnitude(const char* begin, const char* end, std::chars_format format) noexcept {
    double value = 0.0;
    const auto [stop, error] = std::from_chars(begin, end, value, format);
    if (error == std::errc::invalid_argument) return {0.0, 0};
    if (error == std::errc::result_out_of_range) {
        const bool overflow = format == std::chars_format::hex ? is_overflow(begin, stop, is_hex_digit, 'p', 4)
                                                               : is_overflow(begin, stop, is_digit, 'e', 1);
        value = overflow ? std::numeric_limits<double>::infinity() : 0.0;
    }
    return {value, static_cast<std::size_t>(stop - begin)};
}

/** As above, with strtod's choice of base: hexadecimal after "0x", and "0" alone when no digit follows that. */
Scanned<double> scan_any_base(const char* begin, const char* end) noexcept {
    if (begin == end || *begin == '-') return {0.0, 0};
    if (end - begin > 2 && begin[0] == '0' && lower(begin[1]) == 'x') {
        const auto hexadecimal = scan_magnitude(begin + 2, end, std::chars_format::hex);
        const char first = begin[2];
        if (hexadecimal.length > 0 && (is_hex_digit(first) || first == '.'))
            return {hexadecimal.value, hexadecimal.length + 2};
        return {0.0, 1};
    }
    return scan_magnitude(begin, end, std::chars_format::general);
}

}  // namespace

NumberText format_general(double value, int precision) noexcept {
    const int digits = precision < 0 ? kPrintfDefaultPrecision : std::min(precision, kMostDigits);
    return text_of(value, std::chars_format::general, digits);
}

NumberText format_exact(double value) noexcept {
    return text_of(value);
}
NumberText format_int(std::int64_t value) noexcept {
    return text_of(value);
}

Scanned<double> scan_double(std::string_view text) noexcept {
    const char* const end = text.data() + text.size();
    const Lead lead = skip_lead(text);
    const auto [magnitude, length] = scan_any_base(lead.begin, end);
    if (length == 0) return {0.0, 0};
    return {lead.negative ? -magnitude : magnitude, static_cast<std::size_t>(lead.begin - text.data()) + length};
}

Scanned<std::int64_t> scan_int64(std::string_view text) noexcept {
    using Limits = std::numeric_limits<std::int64_t>;
    const char* const end = text.data() + text.size();
    const Lead lead = skip_lead(text);
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
