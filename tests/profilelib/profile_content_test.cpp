#include "profilelib/profile_content.h"

#include <gtest/gtest.h>

#include <random>
#include <string>
#include <string_view>

#include "profile_property.h"
#include "support/diagnostics.h"

namespace {

using quo::ProfileContent;
using namespace std::string_view_literals;

/** What the lists that everything else is compared with must show too. */
struct Line {
    std::string_view text, section, key;
    const char* value;  // null: not there
};
constexpr Line kLines[] = {
    {"[s]\n   k j   =   a=b  c   ", "s", "k j", "a=b  c"},
    {"[s]\nk\t= 1\r\n", "s", "k\t", "1\r"},
    {"[s]\nk = 1\n\nj = 2\n", "s", "j", nullptr},
    {"[s]\n# note\n\nj = 2\n", "s", "# note\n\nj", "2"},
    {"[s]\nk = 1\n\n\n[t]\nj = 2\n", "t", "j", "2"},
    {"[s]\n = k = 1\nabc[t]=1\nj = 2\n", "t", "j", "2"},
    {"k = 1\n=\nnote [ a[=\nb ] x = 1 [t]\nk = 2\n", "a[=\nb", "k", "2"},
    {"[s]\nk = 1\n[t\nj = 2\n", "t\nj = 2", "j", nullptr},
    {"[s]\nx = 1\n[t]\nx = 3\n[s]\ny = 2\ny = 4", "s", "y", "4"},
    {"[s]\nx = 1\n[t]\nx = 3\n[s]\ny = 2\ny = 4", "s", "x", "1"},
    {"\0[s\0cd]\nk \0cd = ab \0cd\nj = 1\n"sv, "s", "k", "ab"},
};

TEST(ProfileContent, FollowsItsGrammar) {
    for (const Line& line : kLines) {
        ProfileContent content;
        content.parse(std::string{line.text});
        EXPECT_STREQ(content.find(line.section, line.key), line.value) << line.text;
        EXPECT_EQ(property::ListModel{line.text}.get(line.section, line.key).value_or("none"),
                  line.value ? line.value : "none");
    }
}

TEST(ProfileContent, MeetsTheFuzzersPropertyOnSeedsAndNoise) {
    for (const auto& seed : std::filesystem::directory_iterator{QUO_PROFILE_SEEDS}) {
        const std::string text = test::read_text(seed.path());
        EXPECT_EQ(property::content_breach(text) + property::value_breach(text), "") << seed.path();
    }
    constexpr std::string_view kAlphabets[] = {"[]= \nab"sv, "[]]==  \n\n\t\r\0ab"sv, "[a]\n=\n=b\n"sv,
                                               "{} \"\t\n1.e-x"sv};
    std::mt19937 random{20240611};
    for (int round = 0; round < 8000; ++round) {
        const std::string_view alphabet = kAlphabets[round % 4];
        std::string text(random() % 150, '\0');
        for (char& c : text)
            c = round % 5 == 0 ? static_cast<char>(random() % 256) : alphabet[random() % alphabet.size()];
        ASSERT_EQ(property::content_breach(text) + property::value_breach(text), "")
            << testing::PrintToString(text);
    }
}

// A value may be set to itself, or to a part of itself: it must be copied before the old one goes.
TEST(ProfileContent, SetsAKeyToItsOwnValue) {
    const std::string value = "a text that is too long to be stored within a string object";
    ProfileContent content;
    content.set("s", "k", value);
    EXPECT_EQ(content.set("s", "k", content.find("s", "k") + 7), value.substr(7));
}

// Lists alone would take minutes here: a thousand times the walk of a small file for each of a hundred thousand
// keys.
TEST(ProfileContent, AnswersEveryKeyOfALargeFile) {
    constexpr int kKeys = 100000;
    const auto value = [](int i) { return std::to_string(7 * i) + std::string(80, 'x'); };
    std::string text;
    for (int i = 0; i < kKeys; ++i)
        text += (i % 5 == 0 ? "[s]\nkey" : "key") + std::to_string(i) + " = " + value(i) + "\n";
    ProfileContent content;
    content.parse(text);
    for (int i = 0; i < kKeys; ++i) ASSERT_EQ(content.find("s", "key" + std::to_string(i)), value(i));
    for (int i = kKeys - 1; i >= 5; i -= 5) content.erase_section("s");
    EXPECT_EQ(content.find("s", "key5"), nullptr);
    EXPECT_NE(content.find("s", "key4"), nullptr);
}

}  // namespace
