// SPDX-License-Identifier: Apache-2.0
/* The three time notations, and comparison without regard to case. */

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <limits>
#include <string_view>

#include "quo_base/gen_utils.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/gen_utils_dates.h"
#include "sarutillib/ground/number_text.h"

namespace {

constexpr double kSecondsPerDay = 86400.0;
constexpr double kMjdEpochSec85 = 5478 * kSecondsPerDay;  // 1 January 2000 in sec85
constexpr int kEpochYear = 1985;
constexpr int kFirstYearRefused = 10000;  // the text has room for four digits
constexpr int kDigitSearch = 40;          // characters looked at for the first digit

constexpr std::array<const char*, 12> kMonths{"JAN", "FEB", "MAR", "APR", "MAY", "JUN",
                                              "JUL", "AUG", "SEP", "OCT", "NOV", "DEC"};
constexpr int kMonthCount = static_cast<int>(kMonths.size());

constexpr bool is_leap(int year) noexcept { return (year % 4 == 0 && year % 100 != 0) || year % 400 == 0; }
constexpr int days_of_year(int year) noexcept { return is_leap(year) ? 366 : 365; }

/** Days of a month, counted from 0. */
constexpr int days_of_month(int month, int year) noexcept {
    constexpr std::array<int, 12> kDays{31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
    return kDays[static_cast<std::size_t>(month)] + (month == 1 && is_leap(year) ? 1 : 0);
}

/** Leap years before a year, as the date difference counts them. */
constexpr std::int64_t leap_years_before(std::int64_t year) noexcept {
    const std::int64_t fours = year / 4 - (year % 4 == 0 ? 1 : 0);
    return fours - fours / 25 + fours / 100;
}

/** First sec85 time that the date text cannot hold. */
constexpr double kEndSec85 =
    kSecondsPerDay * (365.0 * (kFirstYearRefused - kEpochYear) +
                      static_cast<double>(leap_years_before(kFirstYearRefused) - leap_years_before(kEpochYear)));

/** Index among the month names, or 12. */
template <typename Compare>
int find_month(const char* name, Compare compare) noexcept {
    const auto found =
        std::find_if(kMonths.begin(), kMonths.end(), [&](const char* month) { return compare(name, month) == 0; });
    return static_cast<int>(found - kMonths.begin());
}

/** Fields of a date text as they were read, before any check. */
struct RawDate {
    long day = 0, year = 0, hour = 0, minute = 0;
    char month_name[4] = "";
    double seconds = 0.0;
};

RawDate scan_date(const char* text) noexcept {
    RawDate raw;
    int seconds_at = 0;
    std::sscanf(text, "%2ld-%3s-%4ld %2ld:%2ld:%n", &raw.day, raw.month_name, &raw.year, &raw.hour, &raw.minute,
                &seconds_at);
    // The fraction's point must not hang on the locale, as it would in a floating-point conversion above.
    if (seconds_at > 0) raw.seconds = quo::scan_double(text + seconds_at).value;
    return raw;
}

/** Where parsing of a date text begins, or null when the text ends before the search does. */
const char* find_date(const char* text) noexcept {
    for (int i = 0; i < kDigitSearch; ++i, ++text) {
        if (*text == '\0') return nullptr;
        if (*text >= '0' && *text <= '9') return text;
    }
    return text;
}

int check_date(const RawDate& raw, int month) noexcept {
    const bool month_known = month < kMonthCount;
    const double whole_seconds = std::floor(raw.seconds);
    int flags = 0;
    if (raw.day < 0 || (month_known && raw.day > days_of_month(month, static_cast<int>(raw.year))))
        flags |= DATE_BAD_DAY;
    if (raw.hour < 0 || raw.hour >= 25) flags |= DATE_BAD_HOUR;
    if (raw.year < 0) flags |= DATE_BAD_YEAR;
    if (!month_known) flags |= DATE_BAD_MONTH_OR_MINUTE;
    if (raw.minute < 0 || raw.minute >= 61) flags |= DATE_BAD_MONTH_OR_MINUTE;
    if (!(whole_seconds >= 0.0 && whole_seconds < 61.0)) flags |= DATE_BAD_SECOND;
    return flags;
}

void put_field(unsigned char (&field)[4], std::uint32_t value) noexcept {
    long2ch(static_cast<std::int32_t>(value), field, 'm');
}

void write_27(double t, char* text_out) noexcept {
    char text[DATE_TEXT_LENGTH + 1];
    if (sec852myascii(t, text) != 0) std::memset(text, ' ', DATE_TEXT_LENGTH);
    std::memcpy(text_out, text, DATE_TEXT_LENGTH);
}

unsigned char folded(char c) noexcept {
    return static_cast<unsigned char>(c >= 'A' && c <= 'Z' ? c + ('a' - 'A') : c);
}

}  // namespace

int quo::date_difference_seconds(const char* first, const char* second, double* seconds_out) noexcept {
    DateFields a, b;
    if (const int code = date2str(first, &a)) return code;
    if (const int code = date2str(second, &b)) return code;

    const std::int64_t days = (std::int64_t{a.year} - b.year) * 365 + leap_years_before(a.year) -
                              leap_years_before(b.year) + a.day_of_year - b.day_of_year;
    const std::int64_t minutes = (days * 24 + a.hour - b.hour) * 60 + a.minute - b.minute;
    *seconds_out = static_cast<double>(minutes * 60 + a.second - b.second) + (a.fraction - b.fraction);
    return 0;
}

extern "C" {

double mjd2sec85(MjdRecord record) noexcept {
    return ch2long4(record.days, 'm') * kSecondsPerDay + ch2uint4(record.seconds, 'm') +
           ch2uint4(record.microseconds, 'm') * 1e-6 + kMjdEpochSec85;
}

void sec852mjd(double t, MjdRecord* record_out) noexcept {
    using Days = std::numeric_limits<std::int32_t>;
    const double since_2000 = t - kMjdEpochSec85;
    const double days = std::floor(since_2000 / kSecondsPerDay);
    std::int32_t whole_days = days > 0.0 ? Days::max() : Days::min();
    double seconds = 0.0;
    if (days >= Days::min() && days <= Days::max()) {
        whole_days = static_cast<std::int32_t>(days);
        seconds = since_2000 - days * kSecondsPerDay;
    }
    const auto whole_seconds = static_cast<std::uint32_t>(seconds);
    put_field(record_out->days, static_cast<std::uint32_t>(whole_days));
    put_field(record_out->seconds, whole_seconds);
    put_field(record_out->microseconds, static_cast<std::uint32_t>((seconds - whole_seconds) * 1e6));
}

int sec852myascii(double t, char* text_out) noexcept {
    if (t < 0.0) {
        std::fputs("Date should be later than 1-JAN-1985\n", stderr);
        return -1;
    }
    if (!(t < kEndSec85)) {
        std::fputs("Date should be earlier than 1-JAN-10000\n", stderr);
        return -1;
    }
    const double whole = std::floor(t);
    const auto seconds = static_cast<std::int64_t>(whole);
    const auto microseconds = static_cast<unsigned>((t - whole) * 1e6);

    auto days = static_cast<int>(seconds / 86400);
    int year = kEpochYear;
    for (; days >= days_of_year(year); ++year) days -= days_of_year(year);
    int month = 0;
    for (; days >= days_of_month(month, year); ++month) days -= days_of_month(month, year);

    quo::format_bounded(text_out, DATE_TEXT_LENGTH + 1, "%2.2u-%3s-%4.4u %2.2u:%2.2u:%2.2u.%06u",
                        static_cast<unsigned>(days + 1), kMonths[static_cast<std::size_t>(month)],
                        static_cast<unsigned>(year), static_cast<unsigned>(seconds / 3600 % 24),
                        static_cast<unsigned>(seconds / 60 % 60), static_cast<unsigned>(seconds % 60),
                        microseconds);
    return 0;
}

void sec852ascii(double t, char* text_out) noexcept { write_27(t, text_out); }
void mjd2ascii(MjdRecord record, char* text_out) noexcept { write_27(mjd2sec85(record), text_out); }

int date2str(const char* text, DateFields* fields_out) noexcept {
    const char* const date = text ? find_date(text) : nullptr;
    if (!date) return DATE_NO_TEXT;
    const RawDate raw = scan_date(date);
    const int month = find_month(raw.month_name, mystrcasecmp);
    if (const int flags = check_date(raw, month)) return flags;

    const auto year = static_cast<int>(raw.year);
    auto day_of_year = static_cast<int>(raw.day);
    for (int before = 0; before < month; ++before) day_of_year += days_of_month(before, year);
    const double whole_seconds = std::floor(raw.seconds);
    *fields_out = {year,
                   month + 1,
                   day_of_year,
                   static_cast<std::int32_t>(raw.hour),
                   static_cast<std::int32_t>(raw.minute),
                   static_cast<std::int32_t>(whole_seconds),
                   raw.seconds - whole_seconds};
    return 0;
}

double ascii2sec85(const char* text) noexcept {
    double seconds = 0.0;
    if (const int code = quo::date_difference_seconds(text, "1-JAN-1985", &seconds))
        std::fprintf(stderr, "Error: incorrect date format, code %d\n", code);
    return seconds;
}

double utc_ch2num(const char* text) noexcept {
    int day = 0, year = 0, hour = 0, minute = 0, second = 0, milliseconds = 0;
    char month_name[4] = "";
    if (text)
        std::sscanf(text, "%2d-%3s-%4d %2d:%2d:%2d.%3d", &day, month_name, &year, &hour, &minute, &second,
                    &milliseconds);
    const int month =
        1 + find_month(month_name, [](const char* a, const char* b) { return std::strncmp(a, b, 3); });
    return ((year * 100.0 + month) * 100.0 + day) * 1e6 + hour * 10000 + minute * 100 + second +
           milliseconds * 0.001;
}

int mystrcasecmp(const char* a, const char* b) noexcept {
    if (a == b) return 0;
    if (!a) a = "";
    if (!b) b = "";
    while (*a != '\0' && folded(*a) == folded(*b)) ++a, ++b;
    return folded(*a) - folded(*b);
}

}  // extern "C"
