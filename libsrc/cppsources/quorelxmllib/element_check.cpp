// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>
#include <string>
#include <string_view>

#include "quo_base/gen_utils.h"
#include "quo_base/quorelxml_v2.h"
#include "sarutillib/ground/letters.h"
#include "sarutillib/ground/number_text.h"

namespace {

constexpr std::size_t kLongestQuote = 40;

std::string quoted(std::string_view text) {
    const bool cut = text.size() > kLongestQuote;
    return '"' + std::string{text.substr(0, kLongestQuote)} + (cut ? "...\"" : "\"");
}

std::string digits(double value) { return quo::format_exact(value).data; }

/** The bounds that hold for an element. */
parRule bounds_of(const parElement& element) {
    if (element.rule.bounded) return element.rule;
    parRule bounds{.bounded = element.minimum != 0.0 || element.maximum != 0.0};
    bounds.lowest = element.minimum;
    bounds.highest = element.maximum;
    return bounds;
}

std::string bounds_defect(const parElement& element, std::string_view text, double value) {
    const parRule bounds = bounds_of(element);
    if (bounds.bounded && bounds.above_lowest && value <= bounds.lowest)
        return std::string{text} + " is not above " + digits(bounds.lowest);
    if (bounds.bounded && value < bounds.lowest) return std::string{text} + " lies below " + digits(bounds.lowest);
    if (bounds.bounded && value > bounds.highest)
        return std::string{text} + " lies above " + digits(bounds.highest);
    // Reading would stop at the last int there is.
    constexpr double kMost = std::numeric_limits<std::int32_t>::max();
    if (element.type == parElement::typeInt && std::abs(value) > kMost)
        return std::string{text} + " does not fit into 32 bits";
    return "";
}

std::string number_defect(const parElement& element, std::string_view text) {
    const bool whole = element.type == parElement::typeInt;
    const auto number = quo::scan_double(text);
    const std::size_t length = whole ? quo::scan_int64(text).length : number.length;
    if (length == 0 || length != text.size())
        return quoted(text) + (whole ? " is no whole number" : " is no number");
    if (!std::isfinite(number.value)) return quoted(text) + " is not finite";
    return bounds_defect(element, text, number.value);
}

bool is_date(std::string_view text) {
    DateFields fields;
    return date2str(std::string{text}.c_str(), &fields) == 0;
}

std::string text_defect(const parElement& element, std::string_view text) {
    if (text.size() >= element.room)
        return "has " + std::to_string(text.size()) + " bytes, more than " + std::to_string(element.room - 1);
    switch (element.rule.text) {
        case parRule::anyText:
            break;
        case parRule::filledText:
            if (quo::trimmed(text).empty()) return "is empty";
            break;
        case parRule::listedText:
            if (std::ranges::find(element.rule.texts, text) == element.rule.texts.end())
                return quoted(text) + " is none of " + quo::joined(element.rule.texts);
            break;
        case parRule::dateText:
            if (!is_date(text)) return quoted(text) + " is no date such as 04-JAN-2022 17:05:58.5";
            break;
    }
    return "";
}

}  // namespace

std::string parElement::defect(std::string_view text) const {
    return type == typeString ? text_defect(*this, text) : number_defect(*this, quo::trimmed(text));
}

std::string parElement::countDefect(std::size_t values) const {
    if (count < 1 || values == static_cast<std::size_t>(count)) return "";
    return "has " + std::to_string(values) + (values == 1 ? " value, not " : " values, not ") +
           std::to_string(count);
}
