// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_UTF8_H
#define QUO_UTF8_H

#include <cstddef>
#include <cstdint>
#include <string_view>

namespace quo {

/** Bytes of the UTF-8 character that `lead` begins, 0 where it begins none. */
constexpr std::size_t utf8_length(char lead) noexcept {
    const auto byte = static_cast<unsigned char>(lead);
    if (byte < 0x80) return 1;
    if (byte < 0xC2 || byte > 0xF4) return 0;
    if (byte >= 0xF0) return 4;
    return byte >= 0xE0 ? 3 : 2;
}

constexpr bool continues_utf8(char byte) noexcept { return (static_cast<unsigned char>(byte) & 0xC0U) == 0x80U; }

/** A character at the start of a text; length 0 where no well-formed and whole one stands there. */
struct Utf8Character {
    std::uint32_t code;
    std::size_t length;
};

/** The character that a text, which is not empty, begins with. */
constexpr Utf8Character first_utf8(std::string_view text) noexcept {
    constexpr std::uint32_t kLeast[] = {0, 0, 0x80, 0x800, 0x10000};  // shorter forms are no UTF-8
    const std::size_t length = utf8_length(text.front());
    std::uint32_t code = static_cast<unsigned char>(text.front());
    if (length == 1) return {code, 1};
    if (length == 0 || text.size() < length) return {0, 0};
    code &= 0x7FU >> length;
    for (const char next : text.substr(1, length - 1)) {
        if (!continues_utf8(next)) return {0, 0};
        code = code << 6U | (static_cast<unsigned char>(next) & 0x3FU);
    }
    const bool surrogate = code >= 0xD800 && code <= 0xDFFF;
    return code < kLeast[length] || code > 0x10FFFF || surrogate ? Utf8Character{0, 0}
                                                                 : Utf8Character{code, length};
}

}  // namespace quo

#endif
