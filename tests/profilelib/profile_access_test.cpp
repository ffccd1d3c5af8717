#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <bit>
#include <cerrno>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <string>
#include <string_view>
#include <vector>

#include "list_model.h"
#include "quo_base/profile.h"
#include "support/diagnostics.h"

namespace {

using testing::ElementsAre;

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
    [[nodiscard]] std::string place() const { return " - SEC: Pulse, KEY: Length, FILE: " + path_; }

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
    {"Braces", "{1 2 3}", 3, 0, {1, 2, 3}},
    {"NoBraces", "4 5 6", 3, 0, {4, 5, 6}},
    {"MoreThanWanted", "4 5 6", 2, 0, {4, 5}},
    {"TooFew", "{1 2}", 3, 10, {1, 2}},
    {"LoneClosingBrace", "{7 }", 2, 10, {7}},
    {"BlankAfterTheOpeningBrace", "{ 7 8 }", 2, 0, {7, 8}},
    {"BlankBeforeTheOpeningBrace", " {7}", 1, 10, {}},
    {"SecondOpeningBrace", "{{7}", 1, 10, {}},
    {"TabsAndRunsOfBlanks", "{1\t \t2   3}", 3, 0, {1, 2, 3}},
    {"TabsAlone", "{1\t2\t}", 2, 0, {1, 2}},
    {"Signs", "-17 +29", 2, 0, {-17, 29}},
    {"SignAlone", "17 - 3", 2, 10, {17}},
    {"RestOfAWordIsIgnored", "12abc 3,4 5.9", 3, 0, {12, 3, 5}},
    {"WordStopsTheScan", "12 abc 3", 3, 10, {12}},
    {"LineFeedInsideAWord", "1\n2 3", 2, 0, {1, 3}},
    {"WhiteSpaceBeforeANumber", "1 \r\n2", 2, 0, {1, 2}},
    {"OctalLooks", "010 0x10", 2, 0, {10, 0}},
    {"BeyondTheRange", "2147483648 -2147483649 99999999999999999999", 3, 0, {INT32_MAX, INT32_MIN, INT32_MAX}},
    {"Empty", "", 1, 10, {}},
    {"EmptyBraces", "{}", 1, 10, {}},
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

    const std::string warning =
        "Read only " + std::to_string(list.read.size()) + " elements of " + std::to_string(list.count) + place();
    const auto warnings = report_.entries("WARNING");
    ASSERT_EQ(warnings.size(), list.status == 0 ? 0U : 2U);
    for (const auto& entry : warnings) EXPECT_EQ(entry.message, warning);
    EXPECT_EQ(report_.entries().size(), warnings.size());
}
INSTANTIATE_TEST_SUITE_P(Lists, ProfileIntList, testing::ValuesIn(kIntLists),
                         [](const auto& row) { return std::string{row.param.name}; });

TEST_F(ProfileAccess, Reads64BitIntegersToTheirBounds) {
    store("{9223372036854775807 -9223372036854775808 9223372036854775808 -17}");
    std::array<int64_t, 4> values{};
    EXPECT_EQ(GetMyProfileInt64Array(kSection, kKey, values.data(), 4, file()), 0);
    EXPECT_THAT(values, ElementsAre(INT64_MAX, INT64_MIN, INT64_MAX, -17));
}

TEST_F(ProfileAccess, ReadsDoubles) {
    store("{17.3 -1e-3 .5 6.02214076e+23 1e999 -1e999 inf 0x1p-3}");
    std::array<double, 8> values{};
    const double infinity = std::numeric_limits<double>::infinity();
    EXPECT_EQ(GetProfileDoubleArray(kSection, kKey, values.data(), 8, file()), 0);
    EXPECT_THAT(values, ElementsAre(17.3, -1e-3, 0.5, 6.02214076e+23, infinity, -infinity, infinity, 0.125));
}

TEST_F(ProfileAccess, ReadsFloats) {
    store("+17.3 -1e-3 1e39 -1e39 1e-46 1e-40 3.4028235e38 0x1p-3");
    std::array<float, 8> values{};
    const float infinity = std::numeric_limits<float>::infinity();
    EXPECT_EQ(GetMyProfileFloatArray(kSection, kKey, values.data(), 8, file()), 0);
    EXPECT_THAT(values, ElementsAre(17.3F, -1e-3F, infinity, -infinity, 0.0F, 1e-40F, 3.4028235e38F, 0.125F));
}

// A little above the middle between 1 and the next float. The nearest double is the middle itself, which rounds
// down.
TEST_F(ProfileAccess, RoundsFloatsOnce) {
    store("1.00000005960464477539062500001");
    float value = 0.0F;
    EXPECT_EQ(GetMyProfileFloatArray(kSection, kKey, &value, 1, file()), 0);
    EXPECT_EQ(value, std::nextafter(1.0F, 2.0F));
}

TEST_F(ProfileAccess, NotANumberIsANumber) {
    store("{nan}");
    float single = 0.0F;
    double value = 0.0;
    EXPECT_EQ(GetMyProfileFloatArray(kSection, kKey, &single, 1, file()), 0);
    EXPECT_EQ(GetProfileDoubleArray(kSection, kKey, &value, 1, file()), 0);
    EXPECT_TRUE(std::isnan(single) && std::isnan(value));
}

TEST_F(ProfileAccess, LongListIsReadToItsEnd) {
    std::vector<int> values(100000), read(values.size());
    for (std::size_t i = 0; i < values.size(); ++i) values[i] = static_cast<int>(i * 7919 % 65537) - 32768;
    const int count = static_cast<int>(values.size());
    EXPECT_EQ(WriteMyProfileIntArray(kSection, kKey, values.data(), count, file()), 0);
    EXPECT_EQ(GetMyProfileIntArray(kSection, kKey, read.data(), count, file()), 0);
    EXPECT_EQ(read, values);
}

/* ---- Writing numbers ---- */

TEST_F(ProfileAccess, WritesLists) {
    const std::array<int, 3> ints{1, -2, INT32_MIN};
    EXPECT_EQ(WriteMyProfileIntArray(kSection, kKey, ints.data(), 3, file()), 0);
    EXPECT_STREQ(stored(), "{1 -2 -2147483648}");
    EXPECT_EQ(WriteMyProfileLongArray(kSection, kKey, ints.data(), 2, file()), 0);
    EXPECT_STREQ(stored(), "{1 -2}");
    const std::array<int64_t, 2> wide{INT64_MAX, INT64_MIN};
    EXPECT_EQ(WriteMyProfileInt64Array(kSection, kKey, wide.data(), 2, file()), 0);
    EXPECT_STREQ(stored(), "{9223372036854775807 -9223372036854775808}");
    const std::array<float, 3> floats{1.0F / 3.0F, 16777216.0F, 1e-10F};
    EXPECT_EQ(WriteMyProfileFloatArray(kSection, kKey, floats.data(), 3, file()), 0);
    EXPECT_STREQ(stored(), "{0.3333333 1.677722e+07 1e-10}");
    const std::array<double, 4> doubles{0.1, 2.0, 1.0 / 3.0, -std::numeric_limits<double>::infinity()};
    EXPECT_EQ(WriteProfileDoubleArray(kSection, kKey, doubles.data(), 4, file()), 0);
    EXPECT_STREQ(stored(), "{0.1 2 0.333333333333333 -inf}");
}

TEST_F(ProfileAccess, WritesNoElementsAsEmptyBraces) {
    for (const int count : {0, -1}) {
        store("before");
        EXPECT_EQ(WriteMyProfileIntArray(kSection, kKey, nullptr, count, file()), 0);
        EXPECT_STREQ(stored(), "{}");
        EXPECT_EQ(WriteMyProfileDoubleMatrix(kSection, kKey, nullptr, count, 3, file()), 0);
        EXPECT_STREQ(stored(), "{}");
    }
    EXPECT_EQ(WriteMyProfileDoubleMatrix(kSection, kKey, nullptr, 2, 0, file()), 0);
    EXPECT_STREQ(stored(), "{}\n\t{}");
}

TEST_F(ProfileAccess, WritesScalarsWithoutBraces) {
    EXPECT_EQ(WriteMyProfileInt(kSection, kKey, -17, file()), 0);
    EXPECT_STREQ(stored(), "-17");
    EXPECT_EQ(WriteMyProfileInt64(kSection, kKey, INT64_MIN, file()), 0);
    EXPECT_STREQ(stored(), "-9223372036854775808");
    EXPECT_EQ(WriteMyProfileDouble(kSection, kKey, 803457.3, file()), 0);
    EXPECT_STREQ(stored(), "803457.3");
}

// Column after column in memory, row after row in the file.
TEST_F(ProfileAccess, WritesMatricesRowByRow) {
    const std::array<double, 6> values{11.5, 21.5, 12.5, 22.5, 13.5, 23.5};
    EXPECT_EQ(WriteMyProfileDoubleMatrix(kSection, kKey, values.data(), 2, 3, file()), 0);
    EXPECT_STREQ(stored(), "{11.5 12.5 13.5}\n\t{21.5 22.5 23.5}");
    const std::array<const char*, 6> strings{"11", "21", "31", "12", " 22 ", ""};
    EXPECT_EQ(WriteMyProfileStringMatrix(kSection, kKey, strings.data(), 3, 2, file()), 0);
    EXPECT_STREQ(stored(), "{\"11\" \"12\"}\n\t{\"21\" \" 22 \"}\n\t{\"31\" \"\"}");
}

/** A double of any magnitude, 53 random bits in it. */
double any_double(test::Dice& dice) {
    const std::uint64_t bits = (std::uint64_t{dice.below(0x7FF00000U)} << 32) | dice.below(0xFFFFFFFFU);
    return dice.below(2) ? -std::bit_cast<double>(bits) : std::bit_cast<double>(bits);
}

TEST_F(ProfileAccess, NumbersCarryTheDigitsOfTheirType) {
    test::Dice dice{318309};
    for (int i = 0; i < 2000; ++i) {
        const double wide = any_double(dice);
        const auto single = std::bit_cast<float>(dice.below(0x7F800000U));
        char text[64];

        WriteMyProfileDouble(kSection, kKey, wide, file());
        std::snprintf(text, sizeof text, "%.15g", wide);
        ASSERT_STREQ(stored(), text);
        double wide_read = 0.0;
        ASSERT_EQ(GetProfileDoubleArray(kSection, kKey, &wide_read, 1, file()), 0);
        ASSERT_EQ(wide_read, std::strtod(text, nullptr)) << text;
        errno = 0;  // strtod's own: it counts a subnormal number as out of range

        WriteMyProfileFloatArray(kSection, kKey, &single, 1, file());
        std::snprintf(text, sizeof text, "{%.7g}", static_cast<double>(single));
        ASSERT_STREQ(stored(), text);
        float single_read = 0.0F;
        ASSERT_EQ(GetMyProfileFloatArray(kSection, kKey, &single_read, 1, file()), 0);
        ASSERT_EQ(single_read, std::strtof(text + 1, nullptr)) << text;
        errno = 0;
    }
}

TEST_F(ProfileAccess, RefusedWritesAreReported) {
    const double value = 17.3;
    const char* const text = "t";
    const std::string message = "Parameter writing failed - SEC: Pulse, KEY: , FILE: " + path_;
    EXPECT_EQ(WriteMyProfileString(kSection, nullptr, "v", file()), 10);
    EXPECT_EQ(WriteMyProfileStringQuote(kSection, nullptr, "v", file()), 10);
    EXPECT_EQ(WriteMyProfileStringArray(kSection, nullptr, &text, 1, file()), 10);
    EXPECT_EQ(WriteMyProfileStringMatrix(kSection, nullptr, &text, 1, 1, file()), 10);
    EXPECT_EQ(WriteMyProfileInt(kSection, nullptr, 17, file()), 10);
    EXPECT_EQ(WriteMyProfileInt64(kSection, nullptr, 17, file()), 10);
    EXPECT_EQ(WriteMyProfileDouble(kSection, nullptr, 17.3, file()), 10);
    EXPECT_EQ(WriteProfileDoubleArray(kSection, nullptr, &value, 1, file()), 10);
    EXPECT_EQ(WriteMyProfileDoubleMatrix(kSection, nullptr, &value, 1, 1, file()), 10);
    EXPECT_EQ(report_.messages("WARNING"), std::vector<std::string>(9, message));
    EXPECT_EQ(report_.entries("WARNING").front().function, "WriteMyProfileString");
    EXPECT_EQ(report_.entries().size(), 9U);
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

TEST_F(ProfileAccess, AMissingKeyIsSilent) {
    int ints = 7;
    int64_t wide = 7;
    float single = 7.0F;
    double value = 7.0;
    char text[4] = "abc";
    char* const strings[] = {text};
    EXPECT_EQ(GetMyProfileString(kSection, kKey, text, 4, file()), 10);
    EXPECT_EQ(GetMyProfileStringArray(kSection, kKey, strings, 1, 4, file()), 10);
    EXPECT_EQ(GetMyProfileIntArray(kSection, kKey, &ints, 1, file()), 10);
    EXPECT_EQ(GetMyProfileInt64Array(kSection, kKey, &wide, 1, file()), 10);
    EXPECT_EQ(GetMyProfileLongArray(kSection, kKey, &ints, 1, file()), 10);
    EXPECT_EQ(GetMyProfileFloatArray(kSection, kKey, &single, 1, file()), 10);
    EXPECT_EQ(GetProfileDoubleArray(kSection, kKey, &value, 1, file()), 10);
    EXPECT_STREQ(text, "abc");
    EXPECT_THAT((std::array{double(ints), double(wide), double(single), value}), ElementsAre(7, 7, 7, 7));
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
    struct Copy {
        int size;
        std::string_view buffer;  // all of it, eight bytes
    };
    using namespace std::string_view_literals;
    constexpr Copy kCopies[] = {{4, "abc\0####"sv},  {1, "\0#######"sv}, {6, "abcde\0##"sv}, {7, "abcdef\0#"sv},
                                {8, "abcdef\0\0"sv}, {0, "########"sv},  {-5, "########"sv}};
    store("abcdef");
    for (const auto& [size, expected] : kCopies) {
        std::string buffer(8, '#');
        EXPECT_EQ(GetMyProfileString(kSection, kKey, buffer.data(), size, file()), size < 1 ? 10 : 0) << size;
        EXPECT_EQ(buffer, expected) << size;
    }
    EXPECT_EQ(report_.entries().size(), 0U);
}

TEST_F(ProfileAccess, WritesStringsAsTheyStand) {
    EXPECT_EQ(WriteMyProfileString(kSection, kKey, "  a \"b\" {c}", file()), 0);
    EXPECT_STREQ(stored(), "  a \"b\" {c}");
    EXPECT_EQ(WriteMyProfileStringQuote(kSection, kKey, " a b ", file()), 0);
    char text[16];
    EXPECT_EQ(GetMyProfileString(kSection, kKey, text, 16, file()), 0);
    EXPECT_STREQ(text, "\" a b \"");
}

struct StringList {
    const char* name;
    const char* value;
    int count, status;
    std::vector<std::string> read;
    bool warns;
};
const StringList kStringLists[] = {
    {"Strings", R"({"ab" "c d" ""})", 3, 0, {"ab", "c d", ""}, false},
    {"NoSeparators", R"({"ab""c"})", 2, 0, {"ab", "c"}, false},
    {"MoreThanWanted", R"({"ab" "c"})", 1, 0, {"ab"}, false},
    {"BracesAndBlanksInside", R"({   "{a} " })", 1, 0, {"{a} "}, false},
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
    std::array<std::array<char, 16>, 4> rooms{};
    std::array<char*, 4> strings{};
    for (std::size_t i = 0; i < rooms.size(); ++i) strings[i] = rooms[i].data();
    for (auto& room : rooms) room.fill('#');

    EXPECT_EQ(GetMyProfileStringArray(kSection, kKey, strings.data(), list.count, 16, file()), list.status);
    for (std::size_t i = 0; i < rooms.size(); ++i) {
        if (i < list.read.size())
            EXPECT_EQ(std::string{strings[i]}, list.read[i]);
        else
            EXPECT_THAT(rooms[i], testing::Each('#'));
    }
    const std::string warning =
        "Read only " + std::to_string(list.read.size()) + " elements of " + std::to_string(list.count) + place();
    EXPECT_EQ(report_.messages("WARNING"), std::vector<std::string>(list.warns ? 1 : 0, warning));
}
INSTANTIATE_TEST_SUITE_P(Lists, ProfileStringList, testing::ValuesIn(kStringLists),
                         [](const auto& row) { return std::string{row.param.name}; });

TEST_F(ProfileAccess, StringListsAreCutToTheRoomPerString) {
    store(R"({"abcdef" "gh"})");
    for (const int room : {4, 1, 0, -1}) {
        std::array<char, 16> memory{};
        memory.fill('#');
        char* const strings[] = {memory.data(), memory.data() + 8};
        EXPECT_EQ(GetMyProfileStringArray(kSection, kKey, strings, 2, room, file()), 0);
        const std::string expected = room == 4   ? std::string{"abc\0####gh\0#####", 16}
                                     : room == 1 ? std::string{"\0#######\0#######", 16}
                                                 : std::string(16, '#');
        EXPECT_EQ((std::string{memory.data(), memory.size()}), expected) << room;
    }
}

TEST_F(ProfileAccess, StringListsSurviveTheFile) {
    const char* const written[] = {"first", "", " [third] = {x} "};
    EXPECT_EQ(WriteMyProfileStringArray(kSection, kKey, written, 3, file()), 0);
    EXPECT_STREQ(stored(), R"({"first" "" " [third] = {x} "})");
    EXPECT_EQ(SyncProfile(file()), 0);
    FreeProfile(file());

    std::array<std::array<char, 32>, 3> rooms{};
    char* const strings[] = {rooms[0].data(), rooms[1].data(), rooms[2].data()};
    EXPECT_EQ(GetMyProfileStringArray(kSection, kKey, strings, 3, 32, file()), 0);
    for (int i = 0; i < 3; ++i) EXPECT_STREQ(strings[i], written[i]);
}

}  // namespace
