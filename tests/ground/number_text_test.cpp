// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/ground/number_text.h"

#include "support/prelude.h"

namespace {

using Double = std::numeric_limits<double>;

/** Values as products hold them (a few digits, moderate powers of ten) in turn with any bit pattern, after the
 * numbers where texts and roundings change their form. */
std::vector<double> mixed_values(std::size_t count) {
    std::vector<double> values{0.0, -0.0, 0.5, 1.5, 2.5, 0.125, 1e23, 999999.5, 9.5e-5, 123456789012345.6};
    for (const double limit : {Double::infinity(), Double::quiet_NaN(), Double::max(), Double::denorm_min()})
        values.insert(values.end(), {limit, -limit});
    for (int power = -323; power <= 308; ++power) {
        const double value = std::strtod(("1e" + std::to_string(power)).c_str(), nullptr);
        values.insert(values.end(), {value, std::nextafter(value, 0.0), std::nextafter(value, 1e308)});
    }
    for (int power = -1074; power <= 1023; ++power) values.push_back(std::ldexp(1.0, power));

    std::mt19937_64 random{20040703};
    while (values.size() < count) {
        const auto digits = static_cast<double>(static_cast<std::int64_t>(random() % 2000000000) - 1000000000);
        values.push_back(digits * std::pow(10.0, -static_cast<int>(random() % 12)));
        values.push_back(std::bit_cast<double>(random()));
    }
    return values;
}

/** The C library's text of a value, as "%g" or "%a". */
std::string printed(char conversion, int precision, double value) {
    std::array<char, 400> text;
    std::snprintf(text.data(), text.size(), conversion == 'g' ? "%.*g" : "%.*a", precision, value);
    return text.data();
}

bool same_number(double a, double b) {
    if (std::isnan(a) && std::isnan(b)) return std::signbit(a) == std::signbit(b);
    return std::bit_cast<std::uint64_t>(a) == std::bit_cast<std::uint64_t>(b);
}

/** Reads a text as strtod does, or fails: once, for there may be a million of them. */
void expect_reading_of_strtod(const std::string& text) {
    if (testing::Test::HasFailure()) return;
    char* end = nullptr;
    const double expected = std::strtod(text.c_str(), &end);
    const std::vector<char> unterminated(text.begin(), text.end());  // so that a step too far shows
    const auto found = quo::scan_double({unterminated.data(), unterminated.size()});
    EXPECT_EQ(found.length, static_cast<std::size_t>(end - text.c_str())) << text;
    EXPECT_TRUE(same_number(found.value, expected)) << text << " as " << found.value;
}

// A precision has its bounds. The exact text reads back, and is no longer than a text of 15 digits that does.
TEST(NumberText, IsThatOfPrintfAndStrtodForAMillionMixedValues) {
    std::mt19937 random{151};
    for (const double value : mixed_values(1000000)) {
        const int any = static_cast<int>(random() % 40) - 1;
        for (const int precision : {15, any}) {
            const auto found = quo::format_general(value, precision);
            ASSERT_EQ(printed('g', std::min(precision, 32), value), found.data) << precision;
            ASSERT_EQ(found.size, std::string_view{found.data}.size());
        }
        expect_reading_of_strtod(printed('g', any, value));
        expect_reading_of_strtod(printed('a', any % 15, value));
        const auto exact = quo::format_exact(value);
        ASSERT_TRUE(same_number(std::strtod(exact.data, nullptr), value)) << exact.data;
        const std::string short_text = printed('g', 15, value);
        ASSERT_TRUE(exact.size <= short_text.size() || std::strtod(short_text.c_str(), nullptr) != value);
    }
    errno = 0;  // which stays as it is beyond the range, other than strtod's
    EXPECT_EQ(quo::scan_double("1.79769313486232e+308").value - quo::scan_double("-1e-400").value, HUGE_VAL);
    EXPECT_EQ(errno, 0);
}

// Pieces of numbers in any order: signs in wrong places, marks without digits, digits beyond every range.
TEST(ScanDouble, IsStrtodForBrokenTexts) {
    constexpr std::string_view kCharacters = " \t\v+-0179.eEpPxXfabc)_\xA0";
    const std::string pieces[] = {"0x", "inf", "INFINITY", "nan", "nan(", "+400", "-30", "99999999999999999999"};
    std::mt19937 random{17};
    for (int i = 0; i < 400000; ++i) {
        std::string text;
        for (auto count = random() % 9; count > 0; --count)
            text += random() % 2 == 0 ? std::string(1, kCharacters[random() % kCharacters.size()])
                                      : pieces[random() % std::size(pieces)];
        expect_reading_of_strtod(text);
    }
}

// Here strtoll is the truth, and its bounds are met on purpose.
TEST(ScanInteger, IsStrtollAndStopsAtTheBounds) {
    for (const std::string text :
         {"803457", " \n\t+17;", "-0042.5", "0x1F", "", "  -", "+-3", "abc", "2147483648", "-2147483649",
          "9223372036854775807", "9223372036854775808 ", "-9223372036854775809", "-99999999999999999999999"}) {
        SCOPED_TRACE(text);
        char* end = nullptr;
        const std::int64_t wide = std::strtoll(text.c_str(), &end, 10);
        const auto length = static_cast<std::size_t>(end - text.c_str());
        const auto found = quo::scan_int64(text);
        const auto narrow = quo::scan_int32(text);
        EXPECT_TRUE(found.value == wide && found.length == length && narrow.length == length);
        EXPECT_EQ(narrow.value, std::clamp<std::int64_t>(wide, INT32_MIN, INT32_MAX));
        EXPECT_EQ(quo::format_int(wide).data, std::to_string(wide));
    }
}

}  // namespace
