// SPDX-License-Identifier: Apache-2.0
#include <chrono>

#include "quo_base/gen_utils.h"
#include "support/diagnostics.h"

namespace {

namespace chr = std::chrono;

constexpr double kDay = 86400.0, kInfinity = std::numeric_limits<double>::infinity(), kYear2000 = 473299200.0;
constexpr auto kEpoch = chr::sys_days{chr::year{1985} / 1 / 1};
constexpr auto kEndOfText = chr::sys_days{chr::year{10000} / 1 / 1};

double sec85_of(chr::sys_days day) { return kDay * static_cast<double>((day - kEpoch).count()); }

/** The fields of the record of a time, as a text to compare. */
std::string record_text(double t) {
    MjdRecord record;
    sec852mjd(t, &record);
    return std::to_string(ch2int4(record.days, 'm')) + ' ' + std::to_string(ch2uint4(record.seconds, 'm')) + ' ' +
           std::to_string(ch2uint4(record.microseconds, 'm'));
}

/** The date text of a time, by the form that ends it or the one that does not; both must write what they may. */
std::string date_text(double t) {
    std::string ended(30, '#'), plain(30, '#');
    EXPECT_EQ(sec852myascii(t, ended.data()), 0);
    sec852ascii(t, plain.data());
    const std::string text = ended.c_str();
    EXPECT_EQ(ended, text + std::string("\0##", 3));
    EXPECT_EQ(plain, text + "###");
    return text;
}

// The first two are the first and the last line of the grid of a real ENVISAT product. A double holds these times
// to 1e-7 s, and cutting, never rounding, may take the last microsecond.
TEST(Time, IsTheSameInItsThreeNotations) {
    const struct {
        std::int32_t record[3];
        std::string text;
        double sec85;
    } rows[] = {{{1645, 75218, 232230}, "03-JUL-2004 20:53:38.232230", 615502418.232230},
                {{1645, 75236, 573257}, "03-JUL-2004 20:53:56.573257", 615502436.573257},
                {{0, 0, 0}, "01-JAN-2000 00:00:00.000000", kYear2000},
                {{-5478, 86399, 500000}, "01-JAN-1985 23:59:59.500000", 86399.5}};
    for (const auto& row : rows) {
        MjdRecord record;
        long2ch(row.record[0], record.days, 'm');
        long2ch(row.record[1], record.seconds, 'm');
        long2ch(row.record[2], record.microseconds, 'm');
        EXPECT_NEAR(mjd2sec85(record), row.sec85, 2e-7);
        EXPECT_NEAR(ascii2sec85(row.text.c_str()), row.sec85, 2e-7);
        std::string found(28, '#');
        mjd2ascii(record, found.data());
        EXPECT_EQ(found.substr(0, 20) + found[27], row.text.substr(0, 20) + '#');
        EXPECT_NEAR(std::stod(found.substr(18, 9)), std::stod(row.text.substr(18)), 1.1e-6);
    }
    EXPECT_EQ(date_text(0.0), "01-JAN-1985 00:00:00.000000");
    EXPECT_EQ(date_text(86399.9999999), "01-JAN-1985 23:59:59.999999");
    EXPECT_EQ(date_text(17.25 + 0.0009765625), "01-JAN-1985 00:00:17.250976");
    EXPECT_EQ(record_text(kYear2000 + 17.25 + 0.0009765625), "0 17 250976");
}

// Every day up to 2110, and then in steps that meet all months, against the calendar of the standard library.
TEST(Time, FollowsTheCalendar) {
    std::mt19937 random{1985};
    for (auto day = kEpoch; day < kEndOfText;
         day += chr::days{day < chr::sys_days{chr::year{2110} / 1 / 1} ? 1 : 97}) {
        const chr::year_month_day date{day};
        const int second = static_cast<int>(random() % 86400);
        std::array<char, 60> expected;
        std::snprintf(
            expected.data(), expected.size(), "%02u-%.3s-%04d %02d:%02d:%02d.750000", unsigned{date.day()},
            &"JANFEBMARAPRMAYJUNJULAUGSEPOCTNOVDEC" [3 * (unsigned{date.month()} - 1)], int { date.year() },
            second / 3600, second / 60 % 60, second % 60);
        const double t = sec85_of(day) + second + 0.75;
        ASSERT_EQ(date_text(t), expected.data());
        ASSERT_EQ(ascii2sec85(expected.data()), t);
        DateFields fields;
        ASSERT_EQ(date2str(expected.data(), &fields), 0);
        ASSERT_EQ(fields.day_of_year, (day - chr::sys_days{date.year() / 1 / 1}).count() + 1);
        ASSERT_EQ(fields.month, static_cast<int>(unsigned{date.month()}));
    }
    for (int year = 1; year < 1985; ++year)
        ASSERT_EQ(ascii2sec85(("29-DEC-" + std::to_string(year)).c_str()), sec85_of(chr::year{year} / 12 / 29));
}

TEST(MjdRecord, ComesBackToTheMicrosecond) {
    std::mt19937_64 random{2000};
    for (int i = 0; i < 20000; ++i) {
        const double t = std::ldexp(static_cast<double>(random() % (1ULL << 50)), -18) - 2e9;
        MjdRecord record;
        sec852mjd(t, &record);
        ASSERT_LT(ch2uint4(record.seconds, 'm'), 86400U);
        ASSERT_LT(ch2uint4(record.microseconds, 'm'), 1000000U);
        ASSERT_NEAR(mjd2sec85(record), t - 0.5e-6, 1e-6);
    }
    for (const double beyond : {1e300, kInfinity}) EXPECT_EQ(record_text(beyond), "2147483647 0 0");
    for (const double beyond : {-1e300, std::nan("")}) EXPECT_EQ(record_text(beyond), "-2147483648 0 0");
    // Just before midnight the day is still the old one.
    for (int days = 1; days < 40000; ++days)
        ASSERT_EQ(record_text(std::nextafter(kYear2000 + days * kDay, 0.0)),
                  std::to_string(days - 1) + " 86399 999999");
}

}  // namespace
