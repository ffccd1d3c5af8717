// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_FIELD_CHECK_H
#define QUO_TOOL_FIELD_CHECK_H

#include <cstddef>
#include <span>
#include <string>
#include <string_view>
#include <type_traits>

#include "number.h"
#include "quo_base/quorelxml_v2.h"

namespace tool {

/** What is wrong with one value of a field, or nothing. What a new object holds in its place other than 0,
 * "NOT_AVAILABLE", and -999 where it is no count, mark a value that is not known. */
std::string value_defect(const parElement& element, const parElement& fresh, int index, std::string_view text);

/** The same for all values of a field, their number included. */
std::string values_defect(const parElement& element, const parElement& fresh, std::span<const std::string> texts);

/** Calls `use` with a value in memory: a double, as a header would hold it, an int or a text. */
template <typename Use>
auto with_value(const parElement& element, int index, Use use) {
    return element.withValues([&]<typename T>(std::span<T> values) {
        const auto value = values[static_cast<std::size_t>(index)];
        if constexpr (std::is_same_v<T, float>)
            return use(as_written(value));
        else
            return use(value);
    });
}

/** A value in memory as text: what a header would hold. */
std::string value_text(const parElement& element, int index);

}  // namespace tool

#endif
