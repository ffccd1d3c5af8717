// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BOUNDED_TEXT_H
#define QUO_BOUNDED_TEXT_H

#include <cstddef>
#include <string_view>

#include "quo_base/api.h"

namespace quo {

/** Copies `text` into `to`, cut to room - 1 characters and always NUL-terminated; room 0 writes nothing.
 * A cut never splits a character that is whole in UTF-8; bytes of another encoding are cut where the room ends.
 * Returns the number of characters written. `text` may lie inside `to`. */
std::size_t copy_bounded(char* to, std::size_t room, std::string_view text) noexcept;

/** As above, into an array. */
template <std::size_t Room>
std::size_t copy_bounded(char (&to)[Room], std::string_view text) noexcept {
    return copy_bounded(to, Room, text);
}

/** Formats into `to`, cut as above and always NUL-terminated; text that cannot be formatted gives an empty one.
 * Returns the characters written; errno stays. Numbers with a decimal point are better made by number_text.h: here
 * they would follow the locale. */
std::size_t format_bounded(char* to, std::size_t room, const char* format, ...) noexcept QUO_PRINTF_LIKE(3, 4);

/** Text of a NUL-terminated string, empty for a null pointer. */
inline std::string_view text_or_empty(const char* text) noexcept { return text ? std::string_view{text} : ""; }

}  // namespace quo

#endif
