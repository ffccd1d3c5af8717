#include <gtest/gtest.h>

#include <array>
#include <chrono>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <limits>
#include <random>
#include <sstream>
#include <string>
#include <utility>

#include "quo_base/gen_utils.h"
#include "sarutillib/ground/gen_utils_dates.h"
#include "support/diagnostics.h"

namespace {

namespace chr = std::chrono;
using test::CapturedStderr;

constexpr double kDay = 86400.0, kInfinity = std::numeric_limits<double>::infinity();
constexpr std::array<const char*, 12> kMonths{"JAN", "FEB", "MAR", "APR", "MAY", "JUN",
                                              "JUL", "AUG", "SEP", "OCT", "NOV", "DEC"};
constexpr auto kEpoch = chr::sys_days{chr::year{1985} / 1 / 1};
constexpr auto kEndOfText = chr::sys_days{chr::year{10000} / 1 / 1};

double sec85_of(chr::sys_days day) { return kDay * static_cast<double>((day - kEpoch).count()); }

MjdRecord record_of(std::int32_t days, std::int32_t seconds, std::int32_t microseconds) {
    MjdRecord record;
    long2ch(days, record.days, 'm');
    long2ch(seconds, record.seconds, 'm');
    long2ch(microseconds, record.microseconds, 'm');
    return record;
}

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

// Instants with their records, texts and sec85 times; the file's first two lines are its source and its columns.
TEST(Time, AgreesWithRecordedInstants) {
    std::ifstream file{QUO_TEST_DATA "/time/time_pairs.csv"};
    std::string line;
    for (int i = 0; i < 2; ++i) std::getline(file, line);
    int instants = 0;
    for (; std::getline(file, line); ++instants) {
        SCOPED_TRACE(line);
        std::istringstream cells{line};
        std::string name, days, seconds, microseconds, text, sec85;
        for (std::string* cell : {&name, &days, &seconds, &microseconds, &text, &sec85})
            std::getline(cells, *cell, ',');
        const MjdRecord record = record_of(std::stoi(days), std::stoi(seconds), std::stoi(microseconds));
        EXPECT_NEAR(mjd2sec85(record), std::stod(sec85), 2e-7);
        EXPECT_NEAR(ascii2sec85(text.c_str()), std::stod(sec85), 2e-7);

        std::array<char, 27> found;
        mjd2ascii(record, found.data());
        // A double holds these times to 1e-7 s, and cutting may take the last microsecond.
        EXPECT_EQ(std::string(found.data(), 20), text.substr(0, 20));
        EXPECT_NEAR(std::stod(std::string(found.data() + 18, 9)), std::stod(text.substr(18)), 1.1e-6);
    }
    EXPECT_GT(instants, 0);
}

TEST(Time, KnowsItsEpochsAndIsCutToMicrosecondsNeverRounded) {
    EXPECT_EQ(mjd2sec85(record_of(0, 0, 0)), 473299200.0);
    EXPECT_EQ(mjd2sec85(record_of(-5478, 86399, 500000)), 86399.5);
    EXPECT_EQ(date_text(0.0), "01-JAN-1985 00:00:00.000000");
    EXPECT_EQ(date_text(473299200.0), "01-JAN-2000 00:00:00.000000");
    EXPECT_EQ(date_text(86399.9999999), "01-JAN-1985 23:59:59.999999");
    EXPECT_EQ(date_text(std::nextafter(1.0, 0.0)), "01-JAN-1985 00:00:00.999999");
    EXPECT_EQ(date_text(17.25 + 0.0009765625), "01-JAN-1985 00:00:17.250976");
    EXPECT_EQ(record_text(473299200.0 + 17.25 + 0.0009765625), "0 17 250976");
}

// Every day up to 2110, and then in steps that meet all months, against the calendar of the standard library.
TEST(Time, FollowsTheCalendar) {
    std::mt19937 random{1985};
    for (auto day = kEpoch; day < kEndOfText;
         day += chr::days{day < chr::sys_days{chr::year{2110} / 1 / 1} ? 1 : 97}) {
        const chr::year_month_day date{day};
        const int second = static_cast<int>(random() % 86400);
        std::array<char, 60> expected;
        std::snprintf(expected.data(), expected.size(), "%02u-%s-%04d %02d:%02d:%02d.750000", unsigned{date.day()},
                      kMonths[unsigned{date.month()} - 1], int{date.year()}, second / 3600, second / 60 % 60,
                      second % 60);
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

TEST(Time, RefusesWhatTheTextCannotHold) {
    for (const double t : {-1e-9, -kInfinity, sec85_of(kEndOfText), 1e300, kInfinity, std::nan("")}) {
        const std::string message =
            t < 0.0 ? "Date should be later than 1-JAN-1985\n" : "Date should be earlier than 1-JAN-10000\n";
        std::string text(28, '#');
        CapturedStderr captured;
        EXPECT_EQ(sec852myascii(t, text.data()), -1);
        EXPECT_EQ(text, std::string(28, '#'));
        sec852ascii(t, text.data());
        EXPECT_EQ(text, std::string(27, ' ') + '#');
        EXPECT_EQ(captured.text(), message + message);
    }
    EXPECT_EQ(date_text(sec85_of(kEndOfText) - 0.25), "31-DEC-9999 23:59:59.750000");
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
    EXPECT_EQ(record_text(0.0), "-5478 0 0");
    EXPECT_EQ(record_text(473299199.5), "-1 86399 500000");
    for (const double beyond : {1e300, kInfinity}) EXPECT_EQ(record_text(beyond), "2147483647 0 0");
    for (const double beyond : {-1e300, std::nan("")}) EXPECT_EQ(record_text(beyond), "-2147483648 0 0");
    // Just before midnight the day is still the old one.
    for (int days = 1; days < 40000; ++days)
        ASSERT_EQ(record_text(std::nextafter(473299200.0 + days * kDay, 0.0)),
                  std::to_string(days - 1) + " 86399 999999");
}

std::string shown(const DateFields& f) {
    std::ostringstream text;
    text << f.year << '-' << f.month << " day " << f.day_of_year << ' ' << f.hour << ':' << f.minute << ':'
         << f.second << " + " << f.fraction;
    return text.str();
}

/** What date2str makes of a text: its fields, or its code when it refuses and keeps its hands off the output. */
std::string parsed(const std::string& text) {
    const DateFields before{-1, -1, -1, -1, -1, -1, -1.0};
    DateFields found = before;
    const int code = date2str(text.c_str(), &found);
    EXPECT_TRUE(code == 0 || shown(found) == shown(before)) << text;
    return code == 0 ? shown(found) : std::to_string(code);
}

TEST(DateText, IsTakenApart) {
    const std::pair<const char*, DateFields> cases[] = {
        {"03-JUL-2004 20:53:38.75", {2004, 7, 185, 20, 53, 38, 0.75}},
        {"Start = 3-jul-2004 7:05", {2004, 7, 185, 7, 5, 0, 0.0}},
        {"1-JAN-1985", {1985, 1, 1, 0, 0, 0, 0.0}},
        {"29-Feb-2000 24:60:60.5", {2000, 2, 60, 24, 60, 60, 0.5}},
        {"0-MAR-2001", {2001, 3, 59, 0, 0, 0, 0.0}},
        {"31-DEC-1988 00:00:1e1", {1988, 12, 366, 0, 0, 10, 0.0}},
        {"12-APRIL-2001", {0, 4, 103, 0, 0, 0, 0.0}},  // no hyphen after the third letter: the year is not read
    };
    for (const auto& [text, fields] : cases) EXPECT_EQ(parsed(text), shown(fields)) << text;
}

// Looked for in 40 characters: from the 41st on everything is taken as it stands.
TEST(DateText, IsRefusedWithItsFlags) {
    const std::string forty(40, '.'), thirty_nine(39, '.');
    using Case = std::pair<std::string, int>;
    for (const auto& [text, flags] :
         {Case{"no digits", -1}, Case{"29-FEB-1900", 0x1}, Case{"31-APR-2001", 0x1},
          Case{"12-APR-2001 25:00:00", 0x10}, Case{"12-APR-2001 -1:00:00", 0x10}, Case{"12-APR--99", 0x100},
          Case{"31-XYZ-2001 10:61:00", 0x1000}, Case{"12", 0x1000}, Case{"12-APR-2001 10:20:61", 0x10000},
          Case{"12-APR-2001 10:20:-0.5", 0x10000}, Case{"12-APR-2001 10:20:nan", 0x10000},
          Case{"12-APR-2001 10:20:1e300", 0x10000}, Case{"32-APR--99 25:61:61", 0x11111},
          Case{forty + ".1-MAY-1991", 0x1000}, Case{forty + "-1-MAY-1991", 0x1}, Case{forty, 0x1000},
          Case{thirty_nine, -1}})
        EXPECT_EQ(parsed(text), std::to_string(flags)) << text;
    for (const std::string& before : {forty, thirty_nine})
        EXPECT_EQ(parsed(before + "1-MAY-1991"), parsed("1-MAY-1991"));
}

TEST(DateDifference, IsSignedAndPassesTheFirstErrorOn) {
    double seconds = 17.3;
    EXPECT_EQ(quo::date_difference_seconds("3-JUL-2004 20:53:38.25", "3-JUL-2004 20:53:56.75", &seconds), 0);
    EXPECT_EQ(quo::date_difference_seconds("32-JUL-2004", "1-XYZ-2004", &seconds), 0x1);
    EXPECT_EQ(quo::date_difference_seconds("1-JUL-2004", "1-XYZ-2004", &seconds), 0x1000);
    EXPECT_EQ(seconds, -18.5);
    CapturedStderr captured;
    EXPECT_EQ(ascii2sec85("31-XYZ-2001") + ascii2sec85(nullptr), 0.0);
    EXPECT_EQ(captured.text(), "Error: incorrect date format, code 4096\nError: incorrect date format, code -1\n");
}

TEST(UtcNumber, IsReadWithoutAnyCheck) {
    using Case = std::pair<const char*, double>;
    for (const auto& [text, number] :
         {Case{"03-JUL-2004 20:53:38.232", 20040703205338.232}, Case{"3-DEC-2004 7:05:09.5", 20041203070509.005},
          Case{"31-JAN-1985", 19850131e6}, Case{"99-JAN-1985 99:99:99.000", 19850199999999.0}, Case{"", 13e8}})
        EXPECT_NEAR(utc_ch2num(text), number, 0.004) << text;
}

TEST(CompareWithoutCase, FoldsAsciiLettersOnly) {
    struct Case {
        const char *a, *b;
        int difference;
    };
    for (const auto& [a, b, difference] :
         {Case{"DescendING", "dESCENDing", 0}, Case{"abc", "ABD", -1}, Case{"abcd", "ABC", 'd'},
          Case{"", "A", -'a'}, Case{"@", "`", '@' - '`'}, Case{"[", "{", '[' - '{'},
          Case{"\xC4", "\xE4", 0xC4 - 0xE4}, Case{nullptr, "", 0}, Case{nullptr, nullptr, 0}}) {
        EXPECT_EQ(mystrcasecmp(a, b), difference);
        EXPECT_EQ(mystrcasecmp(b, a), -difference);
    }
}

}  // namespace
