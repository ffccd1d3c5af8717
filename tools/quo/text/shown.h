// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_SHOWN_H
#define QUO_TOOL_SHOWN_H

#include <nlohmann/json_fwd.hpp>
#include <string>
#include <string_view>

namespace tool {

/** A text as it may be shown to people, on one line: what a terminal would obey instead of showing it is escaped
 * as in JSON ("\n", "\u001b", "\u202e"). That is every control character, those of U+0080 to U+009F too, the marks
 * and overrides that turn the direction of writing, and the separators of lines and paragraphs. Bytes that are no
 * UTF-8 become "\x9b". Everything else stays, backslashes too, so that a shown text is shown unchanged. */
std::string shown(std::string_view text);

/** The same for lines that are complete: line feeds and tabs stay. */
std::string shown_lines(std::string_view text);

/** A text with blanks behind it up to a width, one at least, for lists of names and values. */
std::string column(std::string text, std::size_t width);

/** Writes lines to standard output, shown. Throws Failure where they do not arrive. */
void print(std::string_view lines);
/** A value as people see it: texts shown, numbers exact, the parts of a list with blanks in between. */
std::string text_of(const nlohmann::ordered_json& value);

/** Writes JSON, indented by `indent` (-1: on one line). What is escaped reads back as the same text. */
void print_json(const nlohmann::ordered_json& json, int indent = 2);

}  // namespace tool

#endif
