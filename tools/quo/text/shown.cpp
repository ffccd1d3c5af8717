// SPDX-License-Identifier: Apache-2.0
#include "shown.h"

#include <algorithm>
#include <cstdint>
#include <nlohmann/json.hpp>

#include "number.h"
#include "output.h"
#include "sarutillib/ground/utf8.h"

namespace tool {
namespace {

/** Whether a terminal would obey the character instead of showing it. */
bool is_command(std::uint32_t code) {
    struct Range {
        std::uint32_t first, last;
    };
    constexpr Range kCommands[] = {{0x00, 0x1F},     {0x7F, 0x9F},     {0x061C, 0x061C},
                                   {0x200E, 0x200F}, {0x2028, 0x202E}, {0x2066, 0x2069}};
    for (const auto& [first, last] : kCommands)
        if (code >= first && code <= last) return true;
    return false;
}

std::string hexadecimal(std::uint32_t value, int digits) {
    std::string text;
    for (int shift = 4 * (digits - 1); shift >= 0; shift -= 4) text += "0123456789abcdef"[value >> shift & 0xFU];
    return text;
}

std::string escaped(std::uint32_t code) {
    if (code == '\n') return "\\n";
    if (code == '\r') return "\\r";
    if (code == '\t') return "\\t";
    return "\\u" + hexadecimal(code, 4);
}

std::string shown_except(std::string_view text, std::string_view kept) {
    std::string line;
    line.reserve(text.size());
    while (!text.empty()) {
        const auto [code, length] = quo::first_utf8(text);
        if (length == 0) {
            line += "\\x" + hexadecimal(static_cast<unsigned char>(text[0]), 2);
        } else if (is_command(code) && kept.find(text[0]) == std::string_view::npos) {
            line += escaped(code);
        } else {
            line += text.substr(0, length);
        }
        text.remove_prefix(std::max<std::size_t>(length, 1));
    }
    return line;
}

}  // namespace

std::string shown(std::string_view text) { return shown_except(text, ""); }

std::string shown_lines(std::string_view text) { return shown_except(text, "\n\t"); }

std::string column(std::string text, std::size_t width) {
    text.append(text.size() < width ? width - text.size() : 1, ' ');
    return text;
}

void print(std::string_view lines) { write_output("-", shown_lines(lines)); }

std::string text_of(const nlohmann::ordered_json& value) {
    if (value.is_string()) return shown(value.get<std::string>());
    if (value.is_number_float()) return exact(value.get<double>());
    if (!value.is_array()) return value.dump();
    std::string text;
    for (const auto& part : value) (text += text.empty() ? "" : " ") += text_of(part);
    return text;
}

void print_json(const nlohmann::ordered_json& json, int indent) {
    print(json.dump(indent, ' ', false, nlohmann::ordered_json::error_handler_t::replace) + "\n");
}

}  // namespace tool
