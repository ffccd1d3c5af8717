// SPDX-License-Identifier: Apache-2.0
#include "number.h"

#include <charconv>
#include <cmath>

#include "failure.h"

namespace tool {
namespace {

std::string with_digits(double value, int digits) {
    char room[32];
    const auto [end, error] =
        std::to_chars(std::begin(room), std::end(room), value, std::chars_format::general, digits);
    return error == std::errc{} ? std::string{room, end} : exact(value);
}

}  // namespace

void append_exact(std::string& text, double value) {
    char room[32];  // a sign, 17 digits, a point and an exponent of five characters
    const auto [end, error] = std::to_chars(std::begin(room), std::end(room), value);
    if (error == std::errc{}) text.append(room, end);
}

std::string exact(double value) {
    std::string text;
    append_exact(text, value);
    return text;
}

double as_written(float value) {
    char room[32];
    const auto [end, error] = std::to_chars(std::begin(room), std::end(room), value);
    const auto read = error == std::errc{} ? finite_number({room, end}) : std::nullopt;
    return read.value_or(static_cast<double>(value));
}

std::string fixed(double value, int decimals) {
    char room[400];  // 309 digits before the point at most
    const auto [end, error] =
        std::to_chars(std::begin(room), std::end(room), value, std::chars_format::fixed, decimals);
    return error == std::errc{} ? std::string{room, end} : exact(value);
}

std::string rough(double value) { return with_digits(value, 3); }
std::string handy(double value) { return with_digits(value, 10); }

std::string_view trimmed(std::string_view text) {
    const auto is_blank = [](char c) { return c == ' ' || c == '\t'; };
    while (!text.empty() && is_blank(text.front())) text.remove_prefix(1);
    while (!text.empty() && is_blank(text.back())) text.remove_suffix(1);
    return text;
}

std::optional<double> finite_number(std::string_view text) {
    text = trimmed(text);
    if (text.size() > 1 && text[0] == '+' && text[1] != '-') text.remove_prefix(1);

    double value = 0.0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc{} || end != text.data() + text.size() || !std::isfinite(value)) return std::nullopt;
    return value;
}

double finite_number(std::string_view text, const char* option) {
    if (const auto number = finite_number(text)) return *number;
    throw WrongUse(std::string{option} + " " + std::string{text} + ": no finite number");
}

std::optional<int> whole_number(std::string_view text) {
    int value = 0;
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    return error == std::errc{} && end == text.data() + text.size() ? std::optional{value} : std::nullopt;
}

std::optional<std::pair<double, double>> number_pair(std::string_view text, char separator) {
    const auto middle = text.find(separator);
    if (middle == text.npos) return std::nullopt;
    const auto first = finite_number(text.substr(0, middle)), second = finite_number(text.substr(middle + 1));
    return first && second ? std::optional{std::pair{*first, *second}} : std::nullopt;
}

}  // namespace tool
