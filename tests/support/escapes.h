#ifndef QUO_TESTS_SUPPORT_ESCAPES_H
#define QUO_TESTS_SUPPORT_ESCAPES_H

#include <string>
#include <string_view>

namespace test {

/** A text of a table, with \n, \r, \t and \0 as in C. */
inline std::string unescaped(const std::string& text) {
    constexpr std::string_view kLetters = "nrt0", kBytes{"\n\r\t\0", 4};
    std::string bytes;
    for (std::size_t i = 0; i < text.size(); ++i)
        bytes += text[i] == '\\' ? kBytes[kLetters.find(text[++i])] : text[i];
    return bytes;
}

}  // namespace test

#endif
