// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_LETTERS_H
#define QUO_LETTERS_H

#include <string>

namespace quo {

/** The text with its letters of ASCII in lower case, whatever the locale. */
inline std::string lower(std::string text) {
    for (char& c : text)
        if (c >= 'A' && c <= 'Z') c = static_cast<char>(c - 'A' + 'a');
    return text;
}

/** The same in upper case. */
inline std::string upper(std::string text) {
    for (char& c : text)
        if (c >= 'a' && c <= 'z') c = static_cast<char>(c - 'a' + 'A');
    return text;
}

/** The texts one after another, with something in between. */
template <typename Texts>
std::string joined(const Texts& texts, const char* between = ", ") {
    std::string all;
    for (const auto& text : texts) all.append(all.empty() ? "" : between).append(text);
    return all;
}

}  // namespace quo

#endif
