// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_ESCAPES_H
#define QUO_TESTS_SUPPORT_ESCAPES_H

#include "support/prelude.h"

namespace test {

/** The shortest text that tells a number from any other of its type. */
template <typename Number>
std::string digits(Number value) {
    char buffer[40];
    return {buffer, std::to_chars(buffer, std::end(buffer), value).ptr};
}

/** A text of a table, with \n, \r, \t, \0 and \\ as in C. */
inline std::string unescaped(const std::string& text) {
    constexpr std::string_view kLetters = "nrt0\\", kBytes{"\n\r\t\0\\", 5};
    std::string bytes;
    for (std::size_t i = 0; i < text.size(); ++i)
        bytes += text[i] == '\\' ? kBytes[kLetters.find(text[++i])] : text[i];
    return bytes;
}

}  // namespace test

#endif
