// SPDX-License-Identifier: Apache-2.0
#include "date.h"

#include "failure.h"
#include "number.h"
#include "quo_base/gen_utils.h"

namespace tool {
namespace {

constexpr double kYear10000 = 252928915200.0;  // s since 1985

std::optional<double> date_of(const std::string& text) {
    double seconds = 0.0;
    if (iso2sec85(text.c_str(), &seconds) == 0) return seconds;
    DateFields fields;
    if (date2str(text.c_str(), &fields) != 0) return std::nullopt;
    return ascii2sec85(text.c_str());
}

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

std::optional<std::string> date_text(double seconds, DateForm form) {
    if (form == DateForm::kHeader) return date_text(seconds);
    const std::string text = iso_text(seconds);
    return text.empty() ? std::nullopt : std::optional{text + "Z"};
}

std::string iso_or_number(double seconds) { return date_text(seconds, DateForm::kIso).value_or(exact(seconds)); }

std::optional<double> time_of(std::string_view text) {
    const auto number = finite_number(text);
    return number ? number : date_of(std::string{text});
}

double seconds_of(const std::string& text) {
    if (const auto seconds = time_of(text)) return *seconds;
    throw WrongUse("\"" + text +
                   "\" is neither seconds nor a date such as \"04-JAN-2022 17:05:58.5\" or "
                   "\"2022-01-04T17:05:58.5\"");
}

}  // namespace tool
