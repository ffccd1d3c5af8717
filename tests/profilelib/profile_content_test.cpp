#include "profilelib/profile_content.h"

#include <gtest/gtest.h>

#include <set>
#include <string>
#include <string_view>

#include "list_model.h"

namespace {

using quo::ProfileContent;
using test::Dice;
using test::ListModel;
using namespace std::string_view_literals;

/** The text that is written back. */
std::string text_of(const ProfileContent& content) {
    std::string text;
    content.write([&text](std::string_view piece) { return text += piece, true; });
    return text;
}

struct Line {
    const char* name;
    std::string_view text;
    std::string_view section, key;
    const char* value;  // null: not there
};
constexpr Line kLines[] = {
    {"EmptyValueAtTheEnd", "[s]\nk=", "s", "k", ""},
    {"BlanksAreTrimmed", "[s]\n   k   =   a  b   \n", "s", "k", "a  b"},
    {"SplitsAtTheFirstEquals", "[s]\nk=a=b \n", "s", "k", "a=b"},
    {"BlankInsideAKeyName", "[s]\nk j = 1\n", "s", "k j", "1"},
    {"TabStaysInAKeyName", "[s]\nk\t= 1\n", "s", "k\t", "1"},
    {"TabIsNotTrimmedFromAKeyName", "[s]\nk\t= 1\n", "s", "k", nullptr},
    {"TabStaysInAValue", "[s]\nk =\t1\t\n", "s", "k", "\t1\t"},
    {"CarriageReturnStaysInAValue", "[s]\r\nk = 1\r\n", "s", "k", "1\r"},
    {"EmptyLineHidesTheNextKey", "[s]\nk = 1\n\nj = 2\n", "s", "j", nullptr},
    {"EmptyLineJoinsTheNextKeyName", "[s]\nk = 1\n\nj = 2\n", "s", "\nj", "2"},
    {"LineWithoutEqualsJoinsTheNextKeyName", "[s]\n# note\nj = 2\n", "s", "# note\nj", "2"},
    {"EmptyLinesBeforeAHeaderAreHarmless", "[s]\nk = 1\n\n\n[t]\nj = 2\n", "t", "j", "2"},
    {"LineStartingWithEqualsIsSkipped", "[s]\n = k = 1\nj = 2\n", "s", "j", "2"},
    {"BracketInAKeyNameOpensASection", "[s]\nabc[t]=1\nj = 2\n", "t", "j", "2"},
    {"BracketEqualsAndLineFeedInASectionName", "[a[=\nb]\nk = 1\n", "a[=\nb", "k", "1"},
    {"SectionNameIsTrimmedOfBlanksOnly", "[  \ta b  ]\nk = 1\n", "\ta b", "k", "1"},
    {"RestOfTheHeaderLineIsSkipped", "[s] x = 1 [t]\nk = 2\n", "s", "k", "2"},
    {"KeyBehindAHeaderIsSkipped", "[s] x = 1\nk = 2\n", "s", "x", nullptr},
    {"TextBeforeTheFirstHeaderIsSkipped", "k = 1\n\n=\nnote [s]\nj = 2\n", "s", "j", "2"},
    {"UnclosedBracketHoldsNothing", "[s]\nk = 1\n[t\nj = 2\n", "t\nj = 2", "j", nullptr},
    {"NamesAreCaseSensitive", "[s]\nk = 1\n", "S", "k", nullptr},
    {"LookUpDoesNotTrim", "[s]\nk = 1\n", "s", "k ", nullptr},
    {"LaterKeyWins", "[s]\nk = 1\nk = 2\n", "s", "k", "2"},
    {"LaterSectionWins", "[s]\nx = 1\n[t]\nx = 3\n[s]\nx = 2\n", "s", "x", "2"},
    {"EarlierSectionAnswersWhatTheLaterLacks", "[s]\nx = 1\n[s]\ny = 2\n", "s", "x", "1"},
    {"NulEndsNamesAndValues", "\0[s\0cd]\nk \0cd = ab \0cd\nj = 1\n"sv, "s", "k", "ab"},
};
class ProfileGrammar : public testing::TestWithParam<Line> {};

TEST_P(ProfileGrammar, Holds) {
    const Line& line = GetParam();
    ProfileContent content;
    content.parse(std::string{line.text});
    EXPECT_STREQ(content.find(line.section, line.key), line.value);
}
INSTANTIATE_TEST_SUITE_P(Lines, ProfileGrammar, testing::ValuesIn(kLines),
                         [](const auto& row) { return std::string{row.param.name}; });

/** A change to a file's content, and what is written back. */
struct Change {
    std::string_view before;
    void (*change)(ProfileContent& content);
    std::string_view after;
};
constexpr Change kChanges[] = {
    {"skipped\n[b] skipped\n z=1\n  a =  2 \n\n\n[a]\nm=\n=skipped\n[open\nk = 1\n",
     [](ProfileContent& c) { c.set("b", "n", "3"), c.set("c", "o", "4"), c.set("b", "z", "5"); },
     "\n[b]\nz = 5\na = 2\nn = 3\n\n[a]\nm = \n\n[c]\no = 4\n"},
    // Deliberate: a key is written into the last section of its name, also when an earlier one holds it.
    {"[s]\nx = 1\n[s]\ny = 2\n", [](ProfileContent& c) { c.set("s", "x", "3"); },
     "\n[s]\nx = 1\n\n[s]\ny = 2\nx = 3\n"},
    // Deliberate: a key is deleted from the last section of its name only.
    {"[s]\nx = 1\n[s]\nx = 2\nx = 3\n", [](ProfileContent& c) { c.erase_key("s", "x"); },
     "\n[s]\nx = 1\n\n[s]\nx = 2\n"},
    {"[s]\nx = 1\n[s]\nx = 2\n", [](ProfileContent& c) { c.erase_key("s", "x"), c.erase_key("s", "x"); },
     "\n[s]\nx = 1\n\n[s]\n"},
    {"[s]\nx = 1\n[t]\n[s]\nx = 3\nz = 4\n", [](ProfileContent& c) { c.erase_section("s"); },
     "\n[s]\nx = 1\n\n[t]\n"},
};

TEST(ProfileContent, IsWrittenInFileOrderWithNewEntriesLast) {
    for (const Change& row : kChanges) {
        ProfileContent content;
        content.parse(std::string{row.before});
        row.change(content);
        EXPECT_EQ(text_of(content), row.after);
    }
}

// A value may be set to itself, or to a part of itself: it must be copied before the old one goes.
TEST(ProfileContent, SetsAKeyToItsOwnValue) {
    const std::string value = "a text that is too long to be stored within a string object";
    ProfileContent content;
    content.set("s", "k", value);
    EXPECT_EQ(content.set("s", "k", content.find("s", "k")), value);
    EXPECT_EQ(content.set("s", "k", content.find("s", "k") + 7), value.substr(7));
}

/** Every name that stands in the model, and one that does not, must be answered alike. */
void expect_same(ProfileContent& content, const ListModel& model) {
    ASSERT_EQ(text_of(content), model.text());
    std::set<std::string> sections{"none"}, keys{"none"};
    for (const auto& section : model.sections) {
        if (section.name) sections.insert(*section.name);
        for (const auto& key : section.keys) keys.insert(key.name);
    }
    for (const auto& section : sections)
        for (const auto& key : keys) {
            const char* const found = content.find(section, key);
            ASSERT_EQ(found ? std::optional<std::string>{found} : std::nullopt, model.get(section, key))
                << "[" << section << "] " << key;
        }
}

// What is written also reads back as the same content, but for a NUL byte that left an empty name.
TEST(ProfileContent, ReadsNoiseAsTheCharacterMachineDoes) {
    constexpr std::string_view kAlphabets[] = {"[]= \nab"sv, "[]]==  \n\n\t\r\0ab"sv, "[a]\n=\n=b\n"sv};
    Dice dice{20240611};
    for (int round = 0; round < 6000; ++round) {
        const std::string text =
            round % 4 == 3 ? "[s]\n" + dice.bytes(300) : dice.text(kAlphabets[round % 4], 120);
        ProfileContent content, again;
        content.parse(text);
        expect_same(content, ListModel{text});
        again.parse(text_of(content));
        EXPECT_TRUE(text_of(again) == text_of(content) || text.find('\0') != text.npos);
        if (HasFailure()) FAIL() << "in round " << round << " on: " << testing::PrintToString(text);
    }
}

// Lists alone would take minutes here: a thousand times the walk of a small file for each of a hundred thousand
// keys.
TEST(ProfileContent, AnswersEveryKeyOfALargeFile) {
    constexpr int kKeys = 100000;
    std::string text;
    for (int i = 0; i < kKeys; ++i) {
        if (i % 5 == 0) text += "[s]\n";
        text += "key" + std::to_string(i) + " = " + std::to_string(7 * i) + std::string(80, 'x') + "\n";
    }
    ProfileContent content;
    content.parse(text);
    for (int i = 0; i < kKeys; ++i)
        ASSERT_EQ(content.find("s", "key" + std::to_string(i)), std::to_string(7 * i) + std::string(80, 'x'));
    EXPECT_EQ(content.find("s", "key100000"), nullptr);
    for (int i = kKeys - 1; i >= 5; i -= 5) content.erase_section("s");
    EXPECT_EQ(content.find("s", "key5"), nullptr);
    EXPECT_NE(content.find("s", "key4"), nullptr);
}

TEST(ProfileContent, HoldsAKeyNameOfAMegabyte) {
    const std::string key(1 << 20, 'k'), value(1 << 20, 'v');
    ProfileContent content;
    content.parse("[s]\n" + key + "=" + value);
    EXPECT_EQ(content.find("s", key), value);
    EXPECT_EQ(text_of(content), "\n[s]\n" + key + " = " + value + "\n");
}

}  // namespace
