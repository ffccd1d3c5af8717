// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/xml_text.h"

#include <libxml/tree.h>

#include <algorithm>
#include <cstddef>
#include <cstdint>

#include "sarutillib/ground/utf8.h"

namespace quo {
namespace {

// What libxml2 refuses to read back: texts of 10 million bytes and elements nested 256 deep, of which root,
// channel and `val` take three.
constexpr std::size_t kLongestText = 9'999'999;
constexpr std::ptrdiff_t kMostParts = 250;
constexpr std::size_t kLongestPath = 511;

constexpr bool is_xml_character(std::uint32_t code) {
    if (code < 0x20) return code == '\t' || code == '\n' || code == '\r';
    return code != 0xFFFE && code != 0xFFFF;
}

void append_latin1(std::string& text, char byte) {
    const auto code = static_cast<std::uint8_t>(byte);
    text += static_cast<char>(0xC0U | code >> 6U);
    text += static_cast<char>(0x80U | (code & 0x3FU));
}

bool is_utf8(std::string_view text) {
    while (!text.empty()) {
        const std::size_t length = first_utf8(text).length;
        if (length == 0) return false;
        text.remove_prefix(length);
    }
    return true;
}

bool is_element_name(std::string_view name) {
    // The validation takes a Latin-1 letter for a letter.
    return is_utf8(name) && xmlValidateNCName(reinterpret_cast<const xmlChar*>(std::string{name}.c_str()), 0) == 0;
}

}  // namespace

std::optional<std::string> xml_text(std::string_view text) {
    if (text.size() > kLongestText) return std::nullopt;
    std::string result;
    std::size_t copied = 0;
    for (std::size_t place = 0; place < text.size();) {
        const Utf8Character next = first_utf8(text.substr(place));
        if (next.length > 0 && !is_xml_character(next.code)) return std::nullopt;
        place += std::max<std::size_t>(next.length, 1);
        if (next.length > 0) continue;
        result.append(text, copied, place - 1 - copied);
        append_latin1(result, text[place - 1]);
        copied = place;
    }
    result.append(text, copied);
    if (result.size() > kLongestText) return std::nullopt;
    return result;
}

bool is_field_path(std::string_view path) {
    if (path.size() > kLongestPath || std::ranges::count(path, '/') >= kMostParts) return false;
    for (;;) {
        const auto slash = path.find('/');
        if (!is_element_name(path.substr(0, slash))) return false;
        if (slash == std::string_view::npos) return true;
        path.remove_prefix(slash + 1);
    }
}

}  // namespace quo
