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

}  // namespace quo

#endif
