// SPDX-License-Identifier: Apache-2.0
#include "profilelib/profile_content.h"

#include "profile_property.h"
#include "support/diagnostics.h"
#include "support/escapes.h"

namespace {

using quo::ProfileContent;
using namespace std::string_view_literals;

// What the lists that everything else is compared with must show too.
TEST(ProfileContent, FollowsItsGrammar) {
    for (const auto& row : test::read_table("profile/grammar.txt", '|')) {
        const std::string text = test::unescaped(row[0]), section = test::unescaped(row[1]),
                          key = test::unescaped(row[2]);
        const auto value = row.size() > 3 ? std::optional{test::unescaped(row[3])} : std::nullopt;
        ProfileContent content;
        content.parse(std::string{text});
        EXPECT_STREQ(content.find(section, key), value ? value->c_str() : nullptr) << row[0];
        EXPECT_EQ(property::ListModel{text}.get(section, key), value) << row[0];
    }
}

TEST(ProfileContent, MeetsTheFuzzersPropertyOnNoise) {
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
