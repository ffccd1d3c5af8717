#include "field_check.h"

#include <cstdint>

#include "number.h"

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
    switch (element.type) {
        case parElement::typeDouble:
            return exact(static_cast<const double*>(element.pointer)[index]);
        case parElement::typeFloat:
            return exact(as_written(static_cast<const float*>(element.pointer)[index]));
        case parElement::typeInt:
            return std::to_string(static_cast<const std::int32_t*>(element.pointer)[index]);
        case parElement::typeString:
            return element.text_array ? static_cast<char* const*>(element.pointer)[index]
                                      : static_cast<const char*>(element.pointer);
        case parElement::typeNone:
            break;
    }
    return "";
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
