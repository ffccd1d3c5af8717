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
#include <vector>

#include "quo_base/gen_utils.h"
#include "sarutillib/gen_utils_dates.h"
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

MjdRecord record_of(std::int32_t days, std::uint32_t seconds, std::uint32_t microseconds) {
    MjdRecord record;
    long2ch(days, record.days, 'm');
    long2ch(static_cast<std::int32_t>(seconds), record.seconds, 'm');
    long2ch(static_cast<std::int32_t>(microseconds), record.microseconds, 'm');
    return record;
}

/** The fields of the record of a time, as a text to compare. */
std::string record_text(double t) {
    MjdRecord record;
    sec852mjd(t, &record);
    std::ostringstream text;
    text << ch2int4(record.days, 'm') << ' ' << ch2uint4(record.seconds, 'm') << ' '
         << ch2uint4(record.microseconds, 'm');
    return text.str();
}

/** The date text of a time, by the form that ends it or the one that does not; both must write what they may. */
std::string date_text(double t) {
    std::array<char, 30> ended, plain;
    ended.fill('#');
    plain.fill('#');
    EXPECT_EQ(sec852myascii(t, ended.data()), 0);
    sec852ascii(t, plain.data());
    EXPECT_EQ(std::string(plain.data(), 27), std::string(ended.data()));
    EXPECT_EQ(std::string(plain.data() + 27, 3), "###");
    EXPECT_EQ(std::string(ended.data() + 27, 3), std::string("\0##", 3));
    return ended.data();
}

struct Instant {
    std::string source, text;
    std::int32_t days;
    std::uint32_t seconds, microseconds;
    double sec85;
};

/** The recorded instants; the columns are named in the file's second line. */
std::vector<Instant> recorded_instants() {
    std::ifstream file{QUO_TEST_DATA "/time/time_pairs.csv"};
    std::vector<Instant> instants;
    std::string line;
    std::getline(file, line);
    std::getline(file, line);
    while (std::getline(file, line)) {
        std::vector<std::string> columns;
        std::istringstream cells{line};
        for (std::string cell; std::getline(cells, cell, ',');) columns.push_back(cell);
        instants.push_back({columns.at(0), columns.at(4), std::stoi(columns.at(1)),
                            static_cast<std::uint32_t>(std::stoul(columns.at(2))),
                            static_cast<std::uint32_t>(std::stoul(columns.at(3))), std::stod(columns.at(5))});
    }
    return instants;
}

TEST(Time, AgreesWithRecordedInstants) {
    const auto instants = recorded_instants();
    ASSERT_FALSE(instants.empty());
    for (const Instant& instant : instants) {
        SCOPED_TRACE(instant.source);
        const MjdRecord record = record_of(instant.days, instant.seconds, instant.microseconds);
        EXPECT_NEAR(mjd2sec85(record), instant.sec85, 2e-7);
        EXPECT_NEAR(ascii2sec85(instant.text.c_str()), instant.sec85, 2e-7);

        std::array<char, 27> text;
        mjd2ascii(record, text.data());
        // A double holds these times to 1e-7 s, and cutting may take the last microsecond.
        EXPECT_EQ(std::string(text.data(), 20), instant.text.substr(0, 20));
        EXPECT_NEAR(std::stod(std::string(text.data() + 18, 9)), std::stod(instant.text.substr(18)), 1.1e-6);
    }
}

TEST(Time, KnowsItsEpochs) {
    EXPECT_EQ(mjd2sec85(record_of(0, 0, 0)), 473299200.0);
    EXPECT_EQ(mjd2sec85(record_of(-5478, 86399, 500000)), 86399.5);
    EXPECT_EQ(date_text(0.0), "01-JAN-1985 00:00:00.000000");
    EXPECT_EQ(date_text(473299200.0), "01-JAN-2000 00:00:00.000000");
    EXPECT_EQ(ascii2sec85("01-JAN-1986 00:00:00"), 31536000.0);
    EXPECT_EQ(ascii2sec85("1-JAN-1989") - ascii2sec85("1-JAN-1988"), 366 * kDay);
}

TEST(Time, IsCutToMicrosecondsNeverRounded) {
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
}

TEST(Time, CountsBackToTheFirstYears) {
    for (int year = 1; year < 1985; ++year) {
        const std::string text = "29-DEC-" +
                                 std::string(year < 10     ? "000"
                                             : year < 100  ? "00"
                                             : year < 1000 ? "0"
                                                           : "") +
                                 std::to_string(year);
        EXPECT_EQ(ascii2sec85(text.c_str()), sec85_of(chr::year{year} / 12 / 29)) << text;
    }
}

TEST(Time, RefusesWhatTheTextCannotHold) {
    struct Refused {
        double t;
        const char* message;
    };
    const Refused cases[] = {{-1e-9, "Date should be later than 1-JAN-1985\n"},
                             {-kInfinity, "Date should be later than 1-JAN-1985\n"},
                             {sec85_of(kEndOfText), "Date should be earlier than 1-JAN-10000\n"},
                             {1e300, "Date should be earlier than 1-JAN-10000\n"},
                             {kInfinity, "Date should be earlier than 1-JAN-10000\n"},
                             {std::nan(""), "Date should be earlier than 1-JAN-10000\n"}};
    for (const auto& [t, message] : cases) {
        std::array<char, 28> text;
        text.fill('#');
        CapturedStderr captured;
        EXPECT_EQ(sec852myascii(t, text.data()), -1);
        EXPECT_EQ(captured.text(), message);
        EXPECT_EQ(std::string(text.data(), 28), std::string(28, '#'));
        CapturedStderr again;
        sec852ascii(t, text.data());
        EXPECT_EQ(again.text(), message);
        EXPECT_EQ(std::string(text.data(), 28), std::string(27, ' ') + '#');
    }
    EXPECT_EQ(date_text(sec85_of(kEndOfText) - 0.25), "31-DEC-9999 23:59:59.750000");
}

TEST(MjdRecord, ComesBackToTheMicrosecond) {
    static_assert(sizeof(MjdRecord) == 12);
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
}

TEST(MjdRecord, HoldsItsFirstOrLastDayForTimesBeyond) {
    EXPECT_EQ(record_text(1e300), "2147483647 0 0");
    EXPECT_EQ(record_text(kInfinity), "2147483647 0 0");
    EXPECT_EQ(record_text(-1e300), "-2147483648 0 0");
    EXPECT_EQ(record_text(std::nan("")), "-2147483648 0 0");
}

// Just before midnight the quotient of a time and a day's length may round up to the next day.
TEST(MjdRecord, NeverHasNegativeSeconds) {
    for (int days = 1; days < 40000; ++days) {
        const std::string record = record_text(std::nextafter(473299200.0 + days * kDay, 0.0));
        const std::string next = std::to_string(days) + " 0 0", same = std::to_string(days - 1) + " 86399 999999";
        ASSERT_TRUE(record == next || record == same) << record;
    }
}

struct DateText {
    const char* text;
    int code;
    DateFields fields;
};
const std::string kForty(40, '.'), kThirtyNine(39, '.');
const DateText kDates[] = {
    {"03-JUL-2004 20:53:38.75", 0, {2004, 7, 185, 20, 53, 38, 0.75}},
    {"Start = 3-jul-2004 7:05", 0, {2004, 7, 185, 7, 5, 0, 0.0}},
    {"1-JAN-1985", 0, {1985, 1, 1, 0, 0, 0, 0.0}},
    {"29-Feb-2000 24:60:60.5", 0, {2000, 2, 60, 24, 60, 60, 0.5}},
    {"0-MAR-2001", 0, {2001, 3, 59, 0, 0, 0, 0.0}},
    {"31-DEC-1988 00:00:1e1", 0, {1988, 12, 366, 0, 0, 10, 0.0}},
    {"", -1, {}},
    {"no digits", -1, {}},
    {"29-FEB-1900", 0x1, {}},
    {"31-APR-2001", 0x1, {}},
    {"12-APR-2001 25:00:00", 0x10, {}},
    {"12-APR-2001 -1:00:00", 0x10, {}},
    {"12-APR--99", 0x100, {}},
    {"31-XYZ-2001 10:61:00", 0x1000, {}},
    {"12-APRIL-2001", 0, {0, 4, 103, 0, 0, 0, 0.0}},  // the third letter is not followed by a hyphen: no year
    {"12", 0x1000, {}},
    {"12-APR-2001 10:20:61", 0x10000, {}},
    {"12-APR-2001 10:20:-0.5", 0x10000, {}},
    {"12-APR-2001 10:20:nan", 0x10000, {}},
    {"12-APR-2001 10:20:inf", 0x10000, {}},
    {"12-APR-2001 10:20:1e300", 0x10000, {}},
    {"32-APR--99 25:61:61", 0x11111, {}},
};

void expect_date(const std::string& text, int code, const DateFields& expected) {
    SCOPED_TRACE(text);
    DateFields found{-1, -1, -1, -1, -1, -1, -1.0};
    EXPECT_EQ(date2str(text.c_str(), &found), code);
    const DateFields wanted = code == 0 ? expected : DateFields{-1, -1, -1, -1, -1, -1, -1.0};
    EXPECT_EQ(found.year, wanted.year);
    EXPECT_EQ(found.month, wanted.month);
    EXPECT_EQ(found.day_of_year, wanted.day_of_year);
    EXPECT_EQ(found.hour, wanted.hour);
    EXPECT_EQ(found.minute, wanted.minute);
    EXPECT_EQ(found.second, wanted.second);
    EXPECT_EQ(found.fraction, wanted.fraction);
}

TEST(DateText, IsTakenApartOrRefusedWithItsFlags) {
    for (const DateText& row : kDates) expect_date(row.text, row.code, row.fields);
}

TEST(DateText, IsLookedForInFortyCharacters) {
    const DateFields first_of_may{1991, 5, 121, 0, 0, 0, 0.0};
    expect_date(kThirtyNine + "1-MAY-1991", 0, first_of_may);
    expect_date(kForty + "1-MAY-1991", 0, first_of_may);
    expect_date(kThirtyNine, -1, {});
    // Deliberate: from the 41st character on everything is taken as it stands.
    expect_date(kForty, 0x1000, {});
    expect_date(kForty + ".1-MAY-1991", 0x1000, {});
    expect_date(kForty + "-1-MAY-1991", 0x1, {});
}

TEST(DateText, ThatIsWrongCountsAsZeroAndIsNamed) {
    CapturedStderr captured;
    EXPECT_EQ(ascii2sec85("31-XYZ-2001"), 0.0);
    EXPECT_EQ(ascii2sec85(""), 0.0);
    EXPECT_EQ(ascii2sec85(nullptr), 0.0);
    EXPECT_EQ(captured.text(),
              "Error: incorrect date format, code 4096\n"
              "Error: incorrect date format, code -1\n"
              "Error: incorrect date format, code -1\n");
}

TEST(DateDifference, IsSignedAndPassesTheFirstErrorOn) {
    double seconds = 17.3;
    EXPECT_EQ(quo::date_difference_seconds("3-JUL-2004 20:53:38.25", "3-JUL-2004 20:53:56.75", &seconds), 0);
    EXPECT_EQ(seconds, -18.5);
    EXPECT_EQ(quo::date_difference_seconds("32-JUL-2004", "1-XYZ-2004", &seconds), 0x1);
    EXPECT_EQ(quo::date_difference_seconds("1-JUL-2004", "1-XYZ-2004", &seconds), 0x1000);
    EXPECT_EQ(seconds, -18.5);
}

struct UtcText {
    const char* text;
    double number;
};
constexpr UtcText kUtcTexts[] = {
    {"03-JUL-2004 20:53:38.232", 20040703205338.232},
    {"3-DEC-2004 7:05:09.5", 20041203070509.005},
    {"31-JAN-1985", 19850131000000.0},
    {"99-JAN-1985 99:99:99.000", 19850199999999.0},
    {"03-jul-2004", 20041303000000.0},
    {"", 13e8},
};

TEST(UtcNumber, IsReadWithoutAnyCheck) {
    for (const auto [text, number] : kUtcTexts) EXPECT_NEAR(utc_ch2num(text), number, 0.004) << text;
}

struct Pair {
    const char *a, *b;
    int difference;
};
constexpr Pair kPairs[] = {{"DescendING", "dESCENDing", 0},
                           {"abc", "ABD", -1},
                           {"abcd", "ABC", 'd'},
                           {"", "A", -'a'},
                           {"@", "`", '@' - '`'},
                           {"[", "{", '[' - '{'},
                           {"\xC4", "\xE4", 0xC4 - 0xE4},
                           {"\xC4", "a", 0xC4 - 'a'},
                           {nullptr, "", 0}};

TEST(CompareWithoutCase, FoldsAsciiLettersOnly) {
    for (const auto& [a, b, difference] : kPairs) {
        EXPECT_EQ(mystrcasecmp(a, b), difference) << b;
        EXPECT_EQ(mystrcasecmp(b, a), -difference) << b;
    }
    EXPECT_EQ(mystrcasecmp(nullptr, nullptr), 0);
}

}  // namespace
