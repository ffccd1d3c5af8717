// SPDX-License-Identifier: Apache-2.0
#include "field_check.h"

#include <type_traits>

namespace tool {
namespace {

bool is_unknown(const parElement& fresh, int index, std::string_view text) {
    constexpr double kUnknown = -999.0;
    const bool known = index < fresh.count;
    if (fresh.type == parElement::typeString)
        return text == "NOT_AVAILABLE" || (known && text == value_text(fresh, index));
    const auto number = finite_number(text);
    if (number == kUnknown && fresh.type != parElement::typeInt) return true;
    return number && known && number == finite_number(value_text(fresh, index));
}

}  // namespace

std::string value_text(const parElement& element, int index) {
    return with_value(element, index, [](auto value) -> std::string {
        if constexpr (std::is_floating_point_v<decltype(value)>)
            return exact(value);
        else if constexpr (std::is_integral_v<decltype(value)>)
            return std::to_string(value);
        else
            return value;
    });
}

std::string value_defect(const parElement& element, const parElement& fresh, int index, std::string_view text) {
    return is_unknown(fresh, index, text) ? "" : element.defect(text);
}

std::string values_defect(const parElement& element, const parElement& fresh, std::span<const std::string> texts) {
    int index = 0;
    for (const std::string& text : texts) {
        std::string defect = value_defect(element, fresh, index++, text);
        if (!defect.empty()) return defect;
    }
    return element.countDefect(texts.size());
}

}  // namespace tool
