#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <bit>
#include <cerrno>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <functional>
#include <limits>
#include <random>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "quo_base/profile.h"
#include "support/diagnostics.h"
#include "support/escapes.h"

namespace {

using namespace std::string_view_literals;
using testing::ElementsAre;
using testing::IsNan;

constexpr const char* kSection = "Pulse";
constexpr const char* kKey = "Length";

/** A report, and a parameter file that exists in memory only. */
class ProfileAccess : public testing::Test {
protected:
    ProfileAccess() { FreeProfile(nullptr); }
    ~ProfileAccess() override {
        EXPECT_EQ(report_.messages("WARNING"), warnings_);
        EXPECT_EQ(report_.entries().size(), warnings_.size());
        FreeProfile(nullptr);
    }
    void store(const char* value) { GetSetProfileChar(1, kSection, kKey, value, file()); }
    [[nodiscard]] const char* stored() const { return GetSetProfileChar(0, kSection, kKey, nullptr, file()); }
    [[nodiscard]] const char* file() const { return path_.c_str(); }
    void expect_warning(std::size_t read, int wanted) {
        warnings_.push_back("Read only " + std::to_string(read) + " elements of " + std::to_string(wanted) +
                            " - SEC: Pulse, KEY: Length, FILE: " + path_);
    }

    test::Report report_;
    std::string path_ = report_.file("a.par");
    std::vector<std::string> warnings_;  // all that the report must hold in the end
};

TEST_F(ProfileAccess, ReadsIntsAsFarAsTheyGo) {
    for (const auto& row : test::read_table("profile/ints.txt", '|')) {
        std::vector<int> values(5, -803457), longs = values, expected = values;
        for (std::size_t i = 2; i < row.size(); ++i) expected[i - 2] = std::stoi(row[i]);
        const int count = std::stoi(row[1]), read = static_cast<int>(row.size()) - 2,
                  status = read < count ? 10 : 0;
        store(test::unescaped(row[0]).c_str());
        EXPECT_EQ(GetMyProfileIntArray(kSection, kKey, values.data(), count, file()), status) << row[0];
        EXPECT_EQ(GetMyProfileLongArray(kSection, kKey, longs.data(), count, file()), status) << row[0];
        EXPECT_TRUE(values == expected && longs == expected) << row[0];
        for (int twice = 0; status != 0 && twice < 2; ++twice) expect_warning(row.size() - 2, count);
    }
}

/** Reads `Count` numbers from a value. */
template <std::size_t Count, typename Number, typename Reader>
std::array<Number, Count> numbers(Reader reader, const char* file) {
    std::array<Number, Count> values{};
    EXPECT_EQ(reader(kSection, kKey, values.data(), int{Count}, file), 0);
    return values;
}

TEST_F(ProfileAccess, ReadsEveryTypeToItsBounds) {
    store("{9223372036854775807 -9223372036854775808 9223372036854775808 -17}");
    EXPECT_THAT((numbers<4, int64_t>(GetMyProfileInt64Array, file())),
                ElementsAre(INT64_MAX, INT64_MIN, INT64_MAX, -17));
    constexpr double kInfinity = std::numeric_limits<double>::infinity();
    store("{17.3 -1e-3 .5 6.02214076e+23 1e999 -1e999 inf 0x1p-3 nan}");
    EXPECT_THAT((numbers<9, double>(GetProfileDoubleArray, file())),
                ElementsAre(17.3, -1e-3, 0.5, 6.02214076e+23, kInfinity, -kInfinity, kInfinity, 0.125, IsNan()));
    constexpr float kFloatInfinity = std::numeric_limits<float>::infinity();
    // The last is a little above the middle between 1 and the next float: the nearest double is the middle itself,
    // which would round down.
    store("+17.3 1e39 -1e39 1e-46 1e-40 3.4028235e38 nan 1.00000005960464477539062500001");
    EXPECT_THAT((numbers<8, float>(GetMyProfileFloatArray, file())),
                ElementsAre(17.3F, kFloatInfinity, -kFloatInfinity, 0.0F, 1e-40F, 3.4028235e38F, IsNan(),
                            std::nextafter(1.0F, 2.0F)));
}

TEST_F(ProfileAccess, WritesEveryForm) {
    const int ints[] = {1, -2, INT32_MIN};
    const int64_t wide[] = {INT64_MAX, INT64_MIN};
    const float floats[] = {1.0F / 3.0F, 16777216.0F, 1e-10F};
    const double doubles[] = {0.1, 2.0, 1.0 / 3.0, -std::numeric_limits<double>::infinity()};
    const double matrix[] = {11.5, 21.5, 12.5, 22.5, 13.5, 23.5};
    const char* const strings[] = {"11", "21", "31", "12", " 22 ", ""};
    const auto write = [this](auto function, auto... data) {
        return [=, this] { return function(kSection, kKey, data..., file()); };
    };
    const std::pair<std::function<int()>, const char*> rows[] = {
        {write(WriteMyProfileIntArray, ints, 3), "{1 -2 -2147483648}"},
        {write(WriteMyProfileLongArray, ints, 2), "{1 -2}"},
        {write(WriteMyProfileInt64Array, wide, 2), "{9223372036854775807 -9223372036854775808}"},
        {write(WriteMyProfileFloatArray, floats, 3), "{0.3333333 1.677722e+07 1e-10}"},
        {write(WriteProfileDoubleArray, doubles, 4), "{0.1 2 0.333333333333333 -inf}"},
        // Matrices stand column after column in memory, row after row in the value.
        {write(WriteMyProfileDoubleMatrix, matrix, 2, 3), "{11.5 12.5 13.5}\n\t{21.5 22.5 23.5}"},
        {write(WriteMyProfileStringMatrix, strings, 3, 2),
         "{\"11\" \"12\"}\n\t{\"21\" \" 22 \"}\n\t{\"31\" \"\"}"},
        {write(WriteMyProfileStringArray, strings + 3, 3), R"({"12" " 22 " ""})"},
        {write(WriteMyProfileString, "  a \"b\" {c}"), R"(  a "b" {c})"},
        {write(WriteMyProfileStringQuote, " a b "), R"(" a b ")"},
        {write(WriteMyProfileInt, -17), "-17"},
        {write(WriteMyProfileInt64, INT64_MIN), "-9223372036854775808"},
        {write(WriteMyProfileDouble, 803457.3), "803457.3"},
        {write(WriteMyProfileIntArray, nullptr, -1), "{}"},
        {write(WriteMyProfileDoubleMatrix, nullptr, 0, 3), "{}"},
        {write(WriteMyProfileDoubleMatrix, nullptr, 2, 0), "{}\n\t{}"},
    };
    for (const auto& [run, value] : rows) {
        EXPECT_EQ(run(), 0);
        EXPECT_STREQ(stored(), value);
    }
}

// Doubles go the way that the tests of the number texts cover; floats are narrowed on it.
TEST_F(ProfileAccess, FloatsCarrySevenDigits) {
    std::mt19937 random{318309};
    for (int i = 0; i < 2000; ++i) {
        const auto value = std::bit_cast<float>(static_cast<std::uint32_t>(random() % 0x7F800000U));
        char text[64];
        std::snprintf(text, sizeof text, "{%.7g}", static_cast<double>(value));
        WriteMyProfileFloatArray(kSection, kKey, &value, 1, file());
        ASSERT_STREQ(stored(), text);
        const float expected = std::strtof(text + 1, nullptr);
        errno = 0;  // strtof's own: it counts a subnormal number as out of range
        ASSERT_EQ((numbers<1, float>(GetMyProfileFloatArray, file()))[0], expected) << text;
    }
}

// A name of any length in a warning must neither overrun nor lose the entry.
TEST(ProfileWarning, BoundsTheNamesItShows) {
    const test::Report report;
    const std::string section(1 << 20, 's');
    int value = 0;
    GetSetProfileChar(1, section.c_str(), kKey, "", "/nowhere/a.par");
    EXPECT_EQ(GetMyProfileIntArray(section.c_str(), kKey, &value, 1, "/nowhere/a.par"), 10);
    EXPECT_THAT(report.messages("WARNING"),
                ElementsAre(testing::StartsWith("Read only 0 elements of 1 - SEC: sssss")));
}

TEST_F(ProfileAccess, CopiesStringsWithinTheirRoom) {
    constexpr std::pair<int, std::string_view> kCopies[] = {
        {4, "abc\0####"sv}, {1, "\0#######"sv}, {8, "abcdef\0\0"sv}, {0, "########"sv}, {-5, "########"sv}};
    store("abcdef");
    for (const auto& [size, expected] : kCopies) {
        std::string buffer(8, '#');
        EXPECT_EQ(GetMyProfileString(kSection, kKey, buffer.data(), size, file()), size < 1 ? 10 : 0) << size;
        EXPECT_EQ(buffer, expected) << size;
    }
    store(R"({"abcdef" "gh"})");
    for (const auto& [room, expected] :
         {std::pair{4, "abc\0####gh\0#####"sv}, {1, "\0#######\0#######"sv}, {-1, "################"sv}}) {
        std::string memory(16, '#');
        char* const strings[] = {memory.data(), memory.data() + 8};
        EXPECT_EQ(GetMyProfileStringArray(kSection, kKey, strings, 2, room, file()), 0);
        EXPECT_EQ(memory, expected) << room;
    }
}

TEST_F(ProfileAccess, ReadsStringsAsFarAsTheyGo) {
    for (const auto& row : test::read_table("profile/strings.txt", '|')) {
        std::vector<std::string> rooms(4, std::string(16, '#'));
        char* const strings[] = {rooms[0].data(), rooms[1].data(), rooms[2].data(), rooms[3].data()};
        store(test::unescaped(row[0]).c_str());
        EXPECT_EQ(GetMyProfileStringArray(kSection, kKey, strings, std::stoi(row[1]), 16, file()),
                  std::stoi(row[2]));
        for (std::size_t i = 0; i < rooms.size(); ++i)
            EXPECT_STREQ(rooms[i].c_str(), i + 3 < row.size() ? row[i + 3].c_str() : "################") << row[0];
        if (row[2] == "10") expect_warning(row.size() - 3, std::stoi(row[1]));
    }
}

}  // namespace
