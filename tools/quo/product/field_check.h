#ifndef QUO_TOOL_FIELD_CHECK_H
#define QUO_TOOL_FIELD_CHECK_H

#include <span>
#include <string>
#include <string_view>

#include "quo_base/quorelxml_v2.h"

namespace tool {

/** What is wrong with one value of a field, or nothing. What a new object holds in its place, "NOT_AVAILABLE", and
 * -999 where it is no count, mark a value that is not known. */
std::string value_defect(const parElement& element, const parElement& fresh, int index, std::string_view text);

/** The same for all values of a field, their number included. */
std::string values_defect(const parElement& element, const parElement& fresh, std::span<const std::string> texts);

/** A value in memory as text: what a header would hold. */
std::string value_text(const parElement& element, int index);

}  // namespace tool

#endif
