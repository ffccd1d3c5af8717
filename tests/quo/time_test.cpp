#include <gmock/gmock.h>

#include <nlohmann/json.hpp>

#include "tool.h"

namespace {

using test::quo;

struct Pair {
    const char *name, *given, *seconds, *date;
};
void PrintTo(const Pair& row, std::ostream* stream) { *stream << row.name; }
// Days and leap years of the calendar; the microseconds are those of real product times, whose doubles lie a
// little below or above the decimal value.
constexpr Pair kPairs[] = {
    {"Epoch", "0", "0", "01-JAN-1985 00:00:00.000000"},
    {"Year2000", "01-JAN-2000", "473299200", "01-JAN-2000 00:00:00.000000"},
    {"LeapDay", "29-feb-2000 12:00:00", "478440000", "29-FEB-2000 12:00:00.000000"},
    {"CutNotRounded", "86399.9999999", "86399.9999999", "01-JAN-1985 23:59:59.999999"},
    {"BelowTheMicrosecond", "1167930296.781409", "1167930296.781409", "04-JAN-2022 17:04:56.781409"},
    {"DateWithMicroseconds", "04-JAN-2022 17:04:56.781409", "1167930296.781409", "04-JAN-2022 17:04:56.781409"},
    {"FlightDate", "17-JUL-2012 14:36:47.1366454", "869150207.1366454", "17-JUL-2012 14:36:47.136645"},
    {"LastYear", "31-DEC-9999 23:59:59", "252928915199", "31-DEC-9999 23:59:59.000000"},
};

class Time : public testing::TestWithParam<Pair> {};

TEST_P(Time, ShowsSecondsAndDate) {
    const Pair& pair = GetParam();
    const auto shown = quo({"time", pair.given});
    EXPECT_EQ(shown.exit_status, 0);
    EXPECT_EQ(shown.out, std::string{pair.seconds} + "  " + pair.date + "\n");
}
INSTANTIATE_TEST_SUITE_P(BothWays, Time, testing::ValuesIn(kPairs),
                         [](const auto& row) { return row.param.name; });

// Every microsecond of a stretch of real azimuth times goes to a text and back without a change.
TEST(Time, TextsOfWholeMicrosecondsRoundTrip) {
    std::vector<std::string> arguments{"time"};
    for (int i = 0; i < 200; ++i) arguments.push_back("27-NOV-2020 11:13:57." + std::to_string(492938 + 37 * i));
    const auto shown = quo(arguments);
    std::istringstream lines{shown.out};
    for (std::size_t i = 1; i < arguments.size(); ++i) {
        std::string line;
        std::getline(lines, line);
        EXPECT_EQ(line.substr(line.find("  ") + 2), arguments[i]);
    }
}

TEST(Time, TimesWithoutADateTextAreAFinding) {
    for (const char* time : {"-5", "31-DEC-1984 23:59:59", "252928915200", "1e300"}) {
        const auto shown = quo({"time", time, "12.5"});
        EXPECT_EQ(shown.exit_status, 1);
        EXPECT_EQ(shown.messages().size(), 1U) << shown.err;
        EXPECT_THAT(shown.out, testing::EndsWith("  -\n12.5  01-JAN-1985 00:00:12.500000\n"));
    }
}

TEST(Time, PrintsJson) {
    const auto shown = quo({"time", "--json", "01-JAN-2000 00:00:00.25", "5"});
    const auto list = nlohmann::json::parse(shown.out);
    ASSERT_EQ(list.size(), 2U);
    EXPECT_EQ(list[0].at("seconds").get<double>(), 473299200.25);
    EXPECT_EQ(list[1].at("date"), "01-JAN-1985 00:00:05.000000");
}

}  // namespace
