// SPDX-License-Identifier: Apache-2.0
/* Numbers and dates of any text against the C library. */

#include <clocale>
#include <cmath>
#include <cstdlib>
#include <ctime>
#include <limits>

#include "bytes.h"
#include "quo_base/gen_utils.h"
#include "sarutillib/ground/number_text.h"

namespace {

using property::require;

void check_double(const std::string& text) {
    char* end = nullptr;
    const double expected = std::strtod(text.c_str(), &end);
    const auto scanned = quo::scan_double(text.c_str());
    const bool named = std::isnan(expected);  // the C library also takes what stands in brackets behind "nan"
    require(named || scanned.length == static_cast<std::size_t>(end - text.c_str()),
            "a number is as long as strtod's");
    require(named ? std::isnan(scanned.value) : scanned.value == expected, "a number has strtod's value");
    require(named || quo::scan_double(std::string_view{quo::format_exact(expected)}).value == expected,
            "a number's text reads back");
}

void check_integer(const std::string& text) {
    char* end = nullptr;
    const long long expected = std::strtoll(text.c_str(), &end, 10);
    const auto scanned = quo::scan_int64(text.c_str());
    require(scanned.value == expected && scanned.length == static_cast<std::size_t>(end - text.c_str()),
            "a whole number is strtoll's");
    const long long cut = std::min<long long>(std::max<long long>(expected, std::numeric_limits<int>::min()),
                                              std::numeric_limits<int>::max());
    require(quo::scan_int32(text.c_str()).value == cut, "a 32-bit number is cut at its bounds");
}

/** Times at whole seconds against the C library's calendar, and the way back. */
void check_time(double t) {
    char text[DATE_TEXT_LENGTH + 1] = {};
    if (sec852iso(t, text) != 0) {
        require(!(t >= 0.0 && t < 2.5e11), "a time that has a text gets it");
        return;
    }
    double back = -1.0;
    require(iso2sec85(text, &back) == 0 && std::abs(back - t) <= 0.6e-6 + 1e-15 * t, "an ISO text reads back");
    constexpr std::time_t kEpoch = 473385600;  // 1 January 1985 after that of 1970
    const std::time_t whole = static_cast<std::time_t>(std::floor(t)) + kEpoch;
    std::tm calendar{};
    char expected[32] = {};
    std::strftime(expected, sizeof expected, "%Y-%m-%dT%H:%M:%S", gmtime_r(&whole, &calendar));
    const bool rounded_up = t - std::floor(t) >= 0.9999995;
    require(rounded_up || std::string_view{text}.substr(0, 19) == expected, "an ISO text is the calendar's");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string text{reinterpret_cast<const char*>(data), size};
    check_double(text);
    check_integer(text);
    property::Bytes bytes{text};
    check_time(bytes.number<double>());
    check_time(std::floor(1e3 * bytes.number<std::uint32_t>()) / 7.0);

    DateFields fields{};
    date2str(text.c_str(), &fields);
    double t = -1.0;
    require(iso2sec85(text.c_str(), &t) == 0 || t == -1.0, "a text that is no date leaves the time");
    return 0;
}
