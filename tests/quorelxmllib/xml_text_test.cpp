#include "quorelxmllib/xml_text.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using quo::is_field_path;
using quo::quoted_text;
using quo::xml_text;

struct TextCase {
    const char *name, *text;
    const char* stored;  // null: refused
};
constexpr TextCase kTexts[] = {
    {"Plain", "ERS-2 <frame> & \"track\"", "ERS-2 <frame> & \"track\""},
    {"Empty", "", ""},
    {"WhiteSpace", " \t\r\n", " \t\r\n"},
    {"TwoThreeFourByteCharacters", "\xC3\xA8\xE2\x82\xAC\xF0\x9F\x9B\xB0", "\xC3\xA8\xE2\x82\xAC\xF0\x9F\x9B\xB0"},
    {"Latin1Byte", "Universit\xE0", "Universit\xC3\xA0"},
    {"Latin1AtTheEndAndCutSequence", "\xE2\x82", "\xC3\xA2\xC2\x82"},
    {"StrayContinuation", "a\x80z", "a\xC2\x80z"},
    {"OverlongSlash", "\xC0\xAF", "\xC3\x80\xC2\xAF"},
    {"Surrogate", "\xED\xA0\x80", "\xC3\xAD\xC2\xA0\xC2\x80"},
    {"BeyondUnicode", "\xF4\x90\x80\x80", "\xC3\xB4\xC2\x90\xC2\x80\xC2\x80"},
    {"FiveByteLead", "\xF8\x88\x80\x80\x80", "\xC3\xB8\xC2\x88\xC2\x80\xC2\x80\xC2\x80"},
    {"Bell", "a\x07", nullptr},
    {"Escape", "\x1B[0m", nullptr},
    {"NonCharacter", "\xEF\xBF\xBF", nullptr},
    {"ReplacementCharacter", "\xEF\xBF\xBD", "\xEF\xBF\xBD"},
};
class XmlText : public testing::TestWithParam<TextCase> {};

TEST_P(XmlText, IsUtf8OrRefused) {
    const auto stored = xml_text(GetParam().text);
    ASSERT_EQ(stored.has_value(), GetParam().stored != nullptr);
    if (stored) {
        EXPECT_EQ(*stored, GetParam().stored);
    }
}
INSTANTIATE_TEST_SUITE_P(Texts, XmlText, testing::ValuesIn(kTexts),
                         [](const auto& row) { return row.param.name; });

TEST(XmlTextLength, EndsWhereReadersStop) {
    std::string text;
    text.resize(9'999'999, 'x');
    EXPECT_TRUE(xml_text(text));
    EXPECT_FALSE(xml_text(text += 'x'));
    text.assign(5'000'000, '\xE0');
    EXPECT_FALSE(xml_text(text)) << "grows to twice its length";
}

struct PathCase {
    const char* path;
    bool accepted;
};
constexpr PathCase kPaths[] = {
    {"fc_hz", true},
    {"Sec/Arr/val", true},
    {"PolySAR/DopplerRate-2", true},
    {"_a.b", true},
    {"Gr\xC3\xB6\xC3\x9F"
     "e",
     true},
    {"", false},
    {"/a", false},
    {"a/", false},
    {"a//b", false},
    {"a b", false},
    {"1a", false},
    {"-a", false},
    {"p:a", false},
    {"a[1]", false},
    {"*", false},
    {"..", false},
    {"@Number", false},
    {"a\"b", false},
    {"<a>", false},
    {"Universit\xE0", false},
};

TEST(FieldPath, HoldsElementNamesOnly) {
    for (const PathCase& row : kPaths) EXPECT_EQ(is_field_path(row.path), row.accepted) << row.path;
}

TEST(FieldPath, EndsWhereReadersStop) {
    std::string deep = "a";
    for (int level = 1; level < 250; ++level) deep += "/a";
    EXPECT_TRUE(is_field_path(deep));
    EXPECT_FALSE(is_field_path(deep + "/a"));
    EXPECT_TRUE(is_field_path(std::string(511, 'a')));
    EXPECT_FALSE(is_field_path(std::string(512, 'a')));
}

TEST(QuotedText, CannotLeaveItsInstruction) {
    EXPECT_EQ(quoted_text("style.xsl"), "style.xsl");
    EXPECT_EQ(quoted_text("a\"?><b&"), "a&quot;?&gt;&lt;b&amp;");
}

}  // namespace
