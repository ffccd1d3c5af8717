// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_FIELD_CHECK_H
#define QUO_TOOL_FIELD_CHECK_H

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "number.h"
#include "quo_base/quorelxml_v2.h"

namespace tool {

/** What is wrong with one value of a field, or nothing. What a new object holds in its place, "NOT_AVAILABLE", and
 * -999 where it is no count, mark a value that is not known. */
std::string value_defect(const parElement& element, const parElement& fresh, int index, std::string_view text);

/** The same for all values of a field, their number included. */
std::string values_defect(const parElement& element, const parElement& fresh, std::span<const std::string> texts);

/** Calls `use` with a value in memory: a double, as a header would hold it, an int or a text. */
template <typename Use>
auto with_value(const parElement& element, int index, Use use) {
    switch (element.type) {
        case parElement::typeDouble:
            return use(static_cast<const double*>(element.pointer)[index]);
        case parElement::typeFloat:
            return use(as_written(static_cast<const float*>(element.pointer)[index]));
        case parElement::typeInt:
            return use(static_cast<const std::int32_t*>(element.pointer)[index]);
        case parElement::typeString:
            return use(element.text_array ? static_cast<const char* const*>(element.pointer)[index]
                                          : static_cast<const char*>(element.pointer));
        case parElement::typeNone:
            break;
    }
    return use("");
}

/** A value in memory as text: what a header would hold. */
std::string value_text(const parElement& element, int index);

}  // namespace tool

#endif
