#include "quorelxmllib/xml_text.h"

#include "support/prelude.h"

namespace {

using quo::is_field_path;
using quo::xml_text;

TEST(XmlText, IsUtf8OrRefused) {
    constexpr const char* kTexts[][2] = {
        {"ERS-2 <frame> & \"track\" \t\r\n", "ERS-2 <frame> & \"track\" \t\r\n"},
        {"\xC3\xA8\xE2\x82\xAC\xF0\x9F\x9B\xB0\xEF\xBF\xBD", "\xC3\xA8\xE2\x82\xAC\xF0\x9F\x9B\xB0\xEF\xBF\xBD"},
        {"Universit\xE0", "Universit\xC3\xA0"},                                // Latin-1
        {"\xE2\x82", "\xC3\xA2\xC2\x82"},                                      // a sequence cut short
        {"a\x80z", "a\xC2\x80z"},                                              // a continuation on its own
        {"\xC0\xAF", "\xC3\x80\xC2\xAF"},                                      // an overlong slash
        {"\xED\xA0\x80", "\xC3\xAD\xC2\xA0\xC2\x80"},                          // a surrogate
        {"\xF4\x90\x80\x80", "\xC3\xB4\xC2\x90\xC2\x80\xC2\x80"},              // beyond Unicode
        {"\xF8\x88\x80\x80\x80", "\xC3\xB8\xC2\x88\xC2\x80\xC2\x80\xC2\x80"},  // five bytes
    };
    for (const auto& [text, stored] : kTexts) EXPECT_EQ(xml_text(text), stored);
    for (const char* refused : {"a\x07", "\x1B[0m", "\xEF\xBF\xBF"}) EXPECT_FALSE(xml_text(refused));
    EXPECT_TRUE(xml_text(std::string(9'999'999, 'x')) && !xml_text(std::string(10'000'000, 'x')));
    EXPECT_FALSE(xml_text(std::string(5'000'000, '\xE0'))) << "grows to twice its length";
}

TEST(FieldPath, HoldsElementNamesOnly) {
    for (const char* path : {"fc_hz", "Sec/Arr/val", "PolySAR/DopplerRate-2", "_a.b", "Gr\xC3\xB6\xC3\x9F/e"})
        EXPECT_TRUE(is_field_path(path)) << path;
    for (const char* path : {"", "/a", "a/", "a//b", "a b", "1a", "-a", "p:a", "a[1]", "*", "..", "@Number",
                             "a\"b", "<a>", "Universit\xE0"})
        EXPECT_FALSE(is_field_path(path)) << path;
    std::string deep = "a";
    for (int level = 1; level < 250; ++level) deep += "/a";
    EXPECT_TRUE(is_field_path(deep) && !is_field_path(deep + "/a"));
    EXPECT_TRUE(is_field_path(std::string(511, 'a')) && !is_field_path(std::string(512, 'a')));
}

}  // namespace
