// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/ground/iso_time.h"

#include <charconv>
#include <chrono>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>

#include "quo_base/gen_utils.h"
#include "sarutillib/ground/bounded_text.h"

namespace quo {
namespace {

/** So many digits at the front of a text, which are taken from it, and a character behind them. */
std::optional<int> digits(std::string_view& text, std::size_t count, char behind) {
    int value = 0;
    if (text.size() < count) return std::nullopt;
    const auto [end, error] = std::from_chars(text.data(), text.data() + count, value);
    if (error != std::errc{} || end != text.data() + count || text[0] == '-') return std::nullopt;
    text.remove_prefix(count);
    if (behind == '\0') return value;
    if (!text.starts_with(behind)) return std::nullopt;
    text.remove_prefix(1);
    return value;
}

/** A fraction from its point on; -1 for another text. */
double fraction_of(std::string_view text) {
    double value = 0.0;
    const auto [end, error] =
        std::from_chars(text.data(), text.data() + text.size(), value, std::chars_format::fixed);
    return error == std::errc{} && end == text.data() + text.size() ? value : -1.0;
}

}  // namespace

std::optional<SplitTime> split_time(std::string_view text) {
    if (text.starts_with("UTC=")) text.remove_prefix(4);
    if (text.ends_with('Z')) text.remove_suffix(1);
    const auto year = digits(text, 4, '-'), month = digits(text, 2, '-'), day = digits(text, 2, 'T');
    const auto hour = digits(text, 2, ':'), minute = digits(text, 2, ':'), second = digits(text, 2, '\0');
    if (!year || !month || !day || !hour || !minute || !second) return std::nullopt;
    namespace chrono = std::chrono;
    const chrono::year_month_day date{chrono::year{*year}, chrono::month{static_cast<unsigned>(*month)},
                                      chrono::day{static_cast<unsigned>(*day)}};
    if (!date.ok() || *hour > 23 || *minute > 59 || *second > 60) return std::nullopt;
    const double fraction = text.empty() ? 0.0 : fraction_of(text);
    if (!(fraction >= 0.0 && fraction < 1.0) || (!text.empty() && text[0] != '.')) return std::nullopt;
    constexpr chrono::sys_days k1985{chrono::year{1985} / 1 / 1};
    const auto days = (chrono::sys_days{date} - k1985).count();
    return SplitTime{86400.0 * static_cast<double>(days) + 3600.0 * *hour + 60.0 * *minute + *second, fraction};
}

}  // namespace quo

int iso2sec85(const char* text, double* t_out) noexcept {
    const auto time = quo::split_time(quo::text_or_empty(text));
    if (!time || !t_out) return QUO_REFUSED;
    *t_out = time->seconds();
    return QUO_OK;
}

int sec852iso(double t, char* text_out) noexcept {
    constexpr double kYear10000 = 252928915200.0, kMicrosecond = 1e-6;
    if (!text_out || !(t >= 0.0 && t < kYear10000 - 1.0)) return QUO_REFUSED;
    namespace chrono = std::chrono;
    const auto whole = static_cast<std::int64_t>(t);
    std::int64_t micro = std::llround((t - static_cast<double>(whole)) / kMicrosecond);
    const chrono::sys_seconds second =
        chrono::sys_days{chrono::year{1985} / 1 / 1} + chrono::seconds{whole + micro / 1000000};
    micro %= 1000000;
    const auto day = chrono::floor<chrono::days>(second);
    const chrono::year_month_day date{day};
    const chrono::hh_mm_ss time{second - day};
    quo::format_bounded(text_out, ISO_TEXT_LENGTH + 1, "%04d-%02u-%02uT%02d:%02d:%02d.%06d",
                        static_cast<int>(date.year()), static_cast<unsigned>(date.month()),
                        static_cast<unsigned>(date.day()), static_cast<int>(time.hours().count()),
                        static_cast<int>(time.minutes().count()), static_cast<int>(time.seconds().count()),
                        static_cast<int>(micro));
    return QUO_OK;
}
