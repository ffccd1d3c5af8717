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
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "list_model.h"
#include "quo_base/profile.h"
#include "support/diagnostics.h"

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
    ~ProfileAccess() override { FreeProfile(nullptr); }

    void store(const char* value) { GetSetProfileChar(1, kSection, kKey, value, file()); }
    [[nodiscard]] const char* stored() const { return GetSetProfileChar(0, kSection, kKey, nullptr, file()); }
    [[nodiscard]] const char* file() const { return path_.c_str(); }
    /** The report holds so many warnings of a list that is too short, and nothing else. */
    void expect_warnings(std::size_t number, std::size_t read, int wanted) const {
        const std::string message = "Read only " + std::to_string(read) + " elements of " +
                                    std::to_string(wanted) + " - SEC: Pulse, KEY: Length, FILE: " + path_;
        EXPECT_EQ(report_.messages("WARNING"), std::vector<std::string>(number, message));
        EXPECT_EQ(report_.entries().size(), number);
    }

    test::Report report_;
    std::string path_ = report_.file("a.par");
};

/* ---- Reading numbers ---- */

struct IntList {
    const char* name;
    const char* value;
    int count, status;
    std::vector<int> read;  // what must have been read, whatever the status
};
const IntList kIntLists[] = {
    {"Braces", "{ 1 2 3 }", 3, 0, {1, 2, 3}},
    {"NoBraces", "4 5 6", 3, 0, {4, 5, 6}},
    {"MoreThanWanted", "4 5 6", 2, 0, {4, 5}},
    {"TooFew", "{1 2}", 3, 10, {1, 2}},
    {"LoneClosingBrace", "{7 }", 2, 10, {7}},
    {"BlankBeforeTheOpeningBrace", " {7}", 1, 10, {}},
    {"TabsAndRunsOfBlanks", "{1\t \t2   3}", 3, 0, {1, 2, 3}},
    {"Signs", "-17 +29", 2, 0, {-17, 29}},
    {"RestOfAWordIsIgnored", "12abc 3,4 5.9", 3, 0, {12, 3, 5}},
    {"WordStopsTheScan", "12 abc 3", 3, 10, {12}},
    {"LineFeedInsideAWord", "1\n2 3", 2, 0, {1, 3}},
    {"WhiteSpaceBeforeANumber", "1 \r\n2", 2, 0, {1, 2}},
    {"OctalLooks", "010 0x10", 2, 0, {10, 0}},
    {"BeyondTheRange", "2147483648 -2147483649 99999999999999999999", 3, 0, {INT32_MAX, INT32_MIN, INT32_MAX}},
    {"Empty", "", 1, 10, {}},
    {"NothingWanted", "x", 0, 0, {}},
    {"LessThanNothingWanted", "x", -3, 0, {}},
};
class ProfileIntList : public ProfileAccess, public testing::WithParamInterface<IntList> {};

TEST_P(ProfileIntList, IsReadAsFarAsItGoes) {
    constexpr int kUntouched = -803457;
    const IntList& list = GetParam();
    store(list.value);
    std::vector<int> values(5, kUntouched), expected = list.read;
    expected.resize(values.size(), kUntouched);

    EXPECT_EQ(GetMyProfileIntArray(kSection, kKey, values.data(), list.count, file()), list.status);
    EXPECT_EQ(values, expected);
    std::vector<int32_t> longs(5, kUntouched);
    EXPECT_EQ(GetMyProfileLongArray(kSection, kKey, longs.data(), list.count, file()), list.status);
    EXPECT_EQ(longs, expected);

    expect_warnings(list.status == 0 ? 0 : 2, list.read.size(), list.count);
}
INSTANTIATE_TEST_SUITE_P(Lists, ProfileIntList, testing::ValuesIn(kIntLists),
                         [](const auto& row) { return std::string{row.param.name}; });

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
    store("+17.3 -1e-3 1e39 -1e39 1e-46 1e-40 3.4028235e38 0x1p-3 nan 1.00000005960464477539062500001");
    EXPECT_THAT((numbers<10, float>(GetMyProfileFloatArray, file())),
                ElementsAre(17.3F, -1e-3F, kFloatInfinity, -kFloatInfinity, 0.0F, 1e-40F, 3.4028235e38F, 0.125F,
                            IsNan(), std::nextafter(1.0F, 2.0F)));
}

/* ---- Writing numbers ---- */

using Writer = std::function<int(const char* file)>;

TEST_F(ProfileAccess, WritesEveryForm) {
    const int ints[] = {1, -2, INT32_MIN};
    const int64_t wide[] = {INT64_MAX, INT64_MIN};
    const float floats[] = {1.0F / 3.0F, 16777216.0F, 1e-10F};
    const double doubles[] = {0.1, 2.0, 1.0 / 3.0, -std::numeric_limits<double>::infinity()};
    const double matrix[] = {11.5, 21.5, 12.5, 22.5, 13.5, 23.5};
    const char* const strings[] = {"11", "21", "31", "12", " 22 ", ""};
    const std::pair<Writer, const char*> rows[] = {
        {[&](auto file) { return WriteMyProfileIntArray(kSection, kKey, ints, 3, file); }, "{1 -2 -2147483648}"},
        {[&](auto file) { return WriteMyProfileLongArray(kSection, kKey, ints, 2, file); }, "{1 -2}"},
        {[&](auto file) { return WriteMyProfileInt64Array(kSection, kKey, wide, 2, file); },
         "{9223372036854775807 -9223372036854775808}"},
        {[&](auto file) { return WriteMyProfileFloatArray(kSection, kKey, floats, 3, file); },
         "{0.3333333 1.677722e+07 1e-10}"},
        {[&](auto file) { return WriteProfileDoubleArray(kSection, kKey, doubles, 4, file); },
         "{0.1 2 0.333333333333333 -inf}"},
        // Matrices stand column after column in memory, row after row in the value.
        {[&](auto file) { return WriteMyProfileDoubleMatrix(kSection, kKey, matrix, 2, 3, file); },
         "{11.5 12.5 13.5}\n\t{21.5 22.5 23.5}"},
        {[&](auto file) { return WriteMyProfileStringMatrix(kSection, kKey, strings, 3, 2, file); },
         "{\"11\" \"12\"}\n\t{\"21\" \" 22 \"}\n\t{\"31\" \"\"}"},
        {[&](auto file) { return WriteMyProfileStringArray(kSection, kKey, strings + 3, 3, file); },
         R"({"12" " 22 " ""})"},
        {[&](auto file) { return WriteMyProfileString(kSection, kKey, "  a \"b\" {c}", file); }, R"(  a "b" {c})"},
        {[&](auto file) { return WriteMyProfileStringQuote(kSection, kKey, " a b ", file); }, R"(" a b ")"},
        {[&](auto file) { return WriteMyProfileInt(kSection, kKey, -17, file); }, "-17"},
        {[&](auto file) { return WriteMyProfileInt64(kSection, kKey, INT64_MIN, file); }, "-9223372036854775808"},
        {[&](auto file) { return WriteMyProfileDouble(kSection, kKey, 803457.3, file); }, "803457.3"},
        {[&](auto file) { return WriteMyProfileIntArray(kSection, kKey, nullptr, 0, file); }, "{}"},
        {[&](auto file) { return WriteMyProfileIntArray(kSection, kKey, nullptr, -1, file); }, "{}"},
        {[&](auto file) { return WriteMyProfileDoubleMatrix(kSection, kKey, nullptr, 0, 3, file); }, "{}"},
        {[&](auto file) { return WriteMyProfileDoubleMatrix(kSection, kKey, nullptr, 2, 0, file); }, "{}\n\t{}"},
    };
    for (const auto& [write, value] : rows) {
        EXPECT_EQ(write(file()), 0);
        EXPECT_STREQ(stored(), value);
    }
}

// Doubles go the way that the tests of the number texts cover; floats are narrowed on it.
TEST_F(ProfileAccess, FloatsCarrySevenDigits) {
    test::Dice dice{318309};
    for (int i = 0; i < 2000; ++i) {
        const auto value = std::bit_cast<float>(dice.below(0x7F800000U));
        char text[64];
        std::snprintf(text, sizeof text, "{%.7g}", static_cast<double>(value));
        WriteMyProfileFloatArray(kSection, kKey, &value, 1, file());
        ASSERT_STREQ(stored(), text);
        const float expected = std::strtof(text + 1, nullptr);
        errno = 0;  // strtof's own: it counts a subnormal number as out of range
        ASSERT_EQ((numbers<1, float>(GetMyProfileFloatArray, file()))[0], expected) << text;
    }
}

TEST_F(ProfileAccess, RefusedWritesAreReported) {
    const double value = 17.3;
    const char* const text = "t";
    EXPECT_EQ(WriteMyProfileStringQuote(kSection, nullptr, "v", file()), 10);
    EXPECT_EQ(WriteMyProfileStringArray(kSection, nullptr, &text, 1, file()), 10);
    EXPECT_EQ(WriteMyProfileStringMatrix(kSection, nullptr, &text, 1, 1, file()), 10);
    EXPECT_EQ(WriteMyProfileDoubleMatrix(kSection, nullptr, &value, 1, 1, file()), 10);
    EXPECT_EQ(report_.messages("WARNING"),
              std::vector<std::string>(4, "Parameter writing failed - SEC: Pulse, KEY: , FILE: " + path_));
    EXPECT_EQ(report_.entries().front().function, "WriteMyProfileStringQuote");
    EXPECT_EQ(report_.entries().size(), 4U);
}

TEST_F(ProfileAccess, MissingDataIsAFailure) {
    store("{1 2}");
    EXPECT_EQ(GetMyProfileIntArray(kSection, kKey, nullptr, 2, file()), 10);
    EXPECT_EQ(WriteMyProfileIntArray(kSection, kKey, nullptr, 2, file()), 10);
    EXPECT_EQ(WriteMyProfileString(kSection, kKey, nullptr, file()), 10);
    EXPECT_EQ(WriteMyProfileStringQuote(kSection, kKey, nullptr, file()), 10);
    EXPECT_STREQ(stored(), "{1 2}");
    store("{\"a\"}");
    EXPECT_EQ(GetMyProfileStringArray(kSection, kKey, nullptr, 1, 10, file()), 10);
    EXPECT_EQ(report_.entries("WARNING").size(), 5U);
}

// The buffer stands for any type: nothing may be written.
TEST_F(ProfileAccess, AMissingKeyIsSilent) {
    alignas(8) char text[] = "as before";
    void* const any = text;
    char* const strings[] = {text};
    EXPECT_EQ(GetMyProfileString(kSection, kKey, text, 8, file()), 10);
    EXPECT_EQ(GetMyProfileStringArray(kSection, kKey, strings, 1, 8, file()), 10);
    EXPECT_EQ(GetMyProfileIntArray(kSection, kKey, static_cast<int*>(any), 1, file()), 10);
    EXPECT_EQ(GetMyProfileInt64Array(kSection, kKey, static_cast<int64_t*>(any), 1, file()), 10);
    EXPECT_EQ(GetMyProfileLongArray(kSection, kKey, static_cast<int32_t*>(any), 1, file()), 10);
    EXPECT_EQ(GetMyProfileFloatArray(kSection, kKey, static_cast<float*>(any), 1, file()), 10);
    EXPECT_EQ(GetProfileDoubleArray(kSection, kKey, static_cast<double*>(any), 1, file()), 10);
    EXPECT_STREQ(text, "as before");
    EXPECT_EQ(report_.entries().size(), 0U);
}

// A name of any length in a warning must neither overrun nor lose the entry.
TEST_F(ProfileAccess, WarningsBoundTheNamesTheyShow) {
    const std::string section(1 << 20, 's');
    int value = 0;
    GetSetProfileChar(1, section.c_str(), kKey, "", file());
    EXPECT_EQ(GetMyProfileIntArray(section.c_str(), kKey, &value, 1, file()), 10);
    ASSERT_EQ(report_.messages("WARNING").size(), 1U);
    EXPECT_THAT(report_.messages("WARNING")[0], testing::StartsWith("Read only 0 elements of 1 - SEC: sssss"));
}

/* ---- Strings ---- */

TEST_F(ProfileAccess, CopiesStringsWithinTheirRoom) {
    constexpr std::pair<int, std::string_view> kCopies[] = {
        {4, "abc\0####"sv},  {1, "\0#######"sv}, {6, "abcde\0##"sv}, {7, "abcdef\0#"sv},
        {8, "abcdef\0\0"sv}, {0, "########"sv},  {-5, "########"sv}};
    store("abcdef");
    for (const auto& [size, expected] : kCopies) {
        std::string buffer(8, '#');
        EXPECT_EQ(GetMyProfileString(kSection, kKey, buffer.data(), size, file()), size < 1 ? 10 : 0) << size;
        EXPECT_EQ(buffer, expected) << size;
    }
    EXPECT_EQ(report_.entries().size(), 0U);
}

struct StringList {
    const char* name;
    const char* value;
    int count, status;
    std::vector<std::string> read;
    bool warns;
};
const StringList kStringLists[] = {
    {"Strings", R"({ "{b}""c d " ""})", 3, 0, {"{b}", "c d ", ""}, false},
    {"MoreThanWanted", R"({"ab" "c"})", 1, 0, {"ab"}, false},
    {"NoClosingBrace", R"({"ab")", 1, 0, {"ab"}, false},
    {"EarlyBraceReturnsTheCount", R"({"ab" "c"})", 3, 2, {"ab", "c"}, false},
    {"EmptyBracesReturnTheCountToo", "{}", 3, 0, {}, false},
    {"TextEndsEarly", R"({"ab" "c" )", 3, 10, {"ab", "c"}, true},
    {"TextEndsInsideAString", R"({"ab" "c)", 2, 10, {"ab"}, true},
    {"NoOpeningBrace", R"("ab" "c")", 2, 0, {}, false},
    {"OtherCharacterEndsWithSuccess", R"({"ab", "c"})", 2, 0, {"ab"}, false},
    {"TabIsAnotherCharacter", "{\"ab\"\t\"c\"}", 2, 0, {"ab"}, false},
    {"NothingWanted", R"({"ab"})", 0, 0, {}, false},
    {"OpeningBraceAlone", "{", 1, 10, {}, true},
    {"EmptyValue", "", 1, 0, {}, false},
};
class ProfileStringList : public ProfileAccess, public testing::WithParamInterface<StringList> {};

TEST_P(ProfileStringList, IsReadAsFarAsItGoes) {
    const StringList& list = GetParam();
    store(list.value);
    std::vector<std::string> rooms(4, std::string(16, '#'));
    char* const strings[] = {rooms[0].data(), rooms[1].data(), rooms[2].data(), rooms[3].data()};
    EXPECT_EQ(GetMyProfileStringArray(kSection, kKey, strings, list.count, 16, file()), list.status);
    for (std::size_t i = 0; i < rooms.size(); ++i) {
        const bool is_read = i < list.read.size();
        EXPECT_EQ(is_read ? rooms[i].c_str() : rooms[i], is_read ? list.read[i] : std::string(16, '#'));
    }
    expect_warnings(list.warns ? 1 : 0, list.read.size(), list.count);
}
INSTANTIATE_TEST_SUITE_P(Lists, ProfileStringList, testing::ValuesIn(kStringLists),
                         [](const auto& row) { return std::string{row.param.name}; });

TEST_F(ProfileAccess, StringListsAreCutToTheRoomPerString) {
    store(R"({"abcdef" "gh"})");
    for (const auto& [room, expected] : {std::pair{4, "abc\0####gh\0#####"sv},
                                         {1, "\0#######\0#######"sv},
                                         {0, "################"sv},
                                         {-1, "################"sv}}) {
        std::string memory(16, '#');
        char* const strings[] = {memory.data(), memory.data() + 8};
        EXPECT_EQ(GetMyProfileStringArray(kSection, kKey, strings, 2, room, file()), 0);
        EXPECT_EQ(memory, expected) << room;
    }
}

}  // namespace
