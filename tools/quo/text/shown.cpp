#include "shown.h"

#include <cstdint>
#include <nlohmann/json.hpp>

#include "output.h"

namespace tool {
namespace {

/** A character at the start of a text; 0 bytes where none is whole there. */
struct Character {
    std::uint32_t code;
    std::size_t bytes;
};

Character first_of(std::string_view text) {
    const auto byte = [text](std::size_t i) { return static_cast<unsigned char>(text[i]); };
    const unsigned char lead = byte(0);
    if (lead < 0x80) return {lead, 1};
    const std::size_t bytes = lead >= 0xF0 ? 4 : lead >= 0xE0 ? 3 : 2;
    constexpr std::uint32_t kLeast[] = {0, 0, 0x80, 0x800, 0x10000};  // shorter forms are no UTF-8
    if (lead < 0xC2 || lead > 0xF4 || text.size() < bytes) return {lead, 0};
    std::uint32_t code = lead & (0x7FU >> bytes);
    for (std::size_t i = 1; i < bytes; ++i) {
        if ((byte(i) & 0xC0U) != 0x80U) return {lead, 0};
        code = code << 6U | (byte(i) & 0x3FU);
    }
    const bool surrogate = code >= 0xD800 && code <= 0xDFFF;
    if (code < kLeast[bytes] || code > 0x10FFFF || surrogate) return {lead, 0};
    return {code, bytes};
}

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
        const Character character = first_of(text);
        if (character.bytes == 0) {
            line += "\\x" + hexadecimal(character.code, 2);
        } else if (is_command(character.code) && kept.find(text[0]) == std::string_view::npos) {
            line += escaped(character.code);
        } else {
            line += text.substr(0, character.bytes);
        }
        text.remove_prefix(character.bytes == 0 ? 1 : character.bytes);
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

void print_json(const nlohmann::ordered_json& json, int indent) {
    print(json.dump(indent, ' ', false, nlohmann::ordered_json::error_handler_t::replace) + "\n");
}

}  // namespace tool
