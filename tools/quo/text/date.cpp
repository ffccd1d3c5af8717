#include "date.h"

#include "failure.h"
#include "number.h"
#include "quo_base/gen_utils.h"

namespace tool {
namespace {

constexpr double kYear10000 = 252928915200.0;  // s since 1985

}  // namespace

std::optional<std::string> date_text(double seconds) {
    if (!(seconds >= 0.0 && seconds < kYear10000)) return std::nullopt;
    const bool whole_microsecond = finite_number(fixed(seconds, 6)) == seconds;
    char text[DATE_TEXT_LENGTH + 1];
    constexpr double kHalfMicrosecond = 0.5e-6;
    if (sec852myascii(whole_microsecond ? seconds + kHalfMicrosecond : seconds, text) != 0) return std::nullopt;
    return text;
}

std::string iso_text(double seconds) {
    char text[ISO_TEXT_LENGTH + 1] = "";
    return sec852iso(seconds, text) == 0 ? text : "";
}

std::optional<double> date_of(std::string_view text) {
    const std::string copy{text};
    double seconds = 0.0;
    if (iso2sec85(copy.c_str(), &seconds) == 0) return seconds;
    DateFields fields;
    if (date2str(copy.c_str(), &fields) != 0) return std::nullopt;
    return ascii2sec85(copy.c_str());
}

double seconds_of(const std::string& text) {
    if (const auto number = finite_number(text)) return *number;
    if (const auto seconds = date_of(text)) return *seconds;
    throw WrongUse("\"" + text +
                   "\" is neither seconds nor a date such as \"04-JAN-2022 17:05:58.5\" or "
                   "\"2022-01-04T17:05:58.5\"");
}

}  // namespace tool
