#include "quorelxmllib/xml_text.h"

#include <gtest/gtest.h>

#include <string>

namespace {

using quo::is_field_path;
using quo::quoted_text;
using quo::xml_text;

struct TextCase {
    const char* text;
    const char* stored;  // null: refused
};
constexpr TextCase kTexts[] = {
    {"ERS-2 <frame> & \"track\"", "ERS-2 <frame> & \"track\""},
    {"", ""},
    {" \t\r\n", " \t\r\n"},
    {"\xC3\xA8\xE2\x82\xAC\xF0\x9F\x9B\xB0", "\xC3\xA8\xE2\x82\xAC\xF0\x9F\x9B\xB0"},
    {"Universit\xE0", "Universit\xC3\xA0"},                                // Latin-1
    {"\xE2\x82", "\xC3\xA2\xC2\x82"},                                      // a sequence cut short
    {"a\x80z", "a\xC2\x80z"},                                              // a continuation on its own
    {"\xC0\xAF", "\xC3\x80\xC2\xAF"},                                      // an overlong slash
    {"\xED\xA0\x80", "\xC3\xAD\xC2\xA0\xC2\x80"},                          // a surrogate
    {"\xF4\x90\x80\x80", "\xC3\xB4\xC2\x90\xC2\x80\xC2\x80"},              // beyond Unicode
    {"\xF8\x88\x80\x80\x80", "\xC3\xB8\xC2\x88\xC2\x80\xC2\x80\xC2\x80"},  // five bytes
    {"\xEF\xBF\xBD", "\xEF\xBF\xBD"},
    {"a\x07", nullptr},
    {"\x1B[0m", nullptr},
    {"\xEF\xBF\xBF", nullptr},
};

TEST(XmlText, IsUtf8OrRefused) {
    for (const TextCase& row : kTexts) {
        const auto stored = xml_text(row.text);
        ASSERT_EQ(stored.has_value(), row.stored != nullptr) << row.text;
        EXPECT_EQ(stored.value_or(""), row.stored ? row.stored : "");
    }
}

TEST(XmlTextLength, EndsWhereReadersStop) {
    std::string text;
    text.resize(9'999'999, 'x');
    EXPECT_TRUE(xml_text(text));
    EXPECT_FALSE(xml_text(text += 'x'));
    text.assign(5'000'000, '\xE0');
    EXPECT_FALSE(xml_text(text)) << "grows to twice its length";
}

TEST(FieldPath, HoldsElementNamesOnly) {
    for (const char* path : {"fc_hz", "Sec/Arr/val", "PolySAR/DopplerRate-2", "_a.b", "Gr\xC3\xB6\xC3\x9F/e"})
        EXPECT_TRUE(is_field_path(path)) << path;
    for (const char* path : {"", "/a", "a/", "a//b", "a b", "1a", "-a", "p:a", "a[1]", "*", "..", "@Number",
                             "a\"b", "<a>", "Universit\xE0"})
        EXPECT_FALSE(is_field_path(path)) << path;
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
