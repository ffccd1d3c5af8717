// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_XML_TEXT_H
#define QUO_XML_TEXT_H

#include <optional>
#include <string>
#include <string_view>

namespace quo {

/** `text` as an XML document can hold it: bytes that are no UTF-8 are taken as Latin-1 characters. Nothing when it
 * contains what XML has no form for (control characters other than tab, line feed and carriage return), or when it
 * is longer than a reader accepts. */
std::optional<std::string> xml_text(std::string_view text);

/** Whether every part between the slashes of `path` can be the name of an element, and the document still be read
 * when they are nested. */
bool is_field_path(std::string_view path);

}  // namespace quo

#endif
