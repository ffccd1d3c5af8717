// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_SESSION_H
#define QUO_TESTS_SUPPORT_SESSION_H

#include <iomanip>

#include "support/diagnostics.h"

namespace test {

/** @file
 * Scripts of sessions: calls and what they answer.
 *
 *   == title               begins a session
 *   == title for 1 2 17    begins one that runs with each of the values, which "@" stands for
 *   $ call words = result  carries out a call, whose result may be left out
 *   | line                 that the call tells or writes to the error stream, and there are no others
 *   # text                 is for the reader
 *
 * A line that ends in "\" has no line feed. Words may be quoted; "(null)" is none, "x*17" seventeen times x. */

/** The words of a call, its name first. */
class Words {
public:
    explicit Words(const std::string& line) {
        std::istringstream stream{line};
        for (std::string word; stream >> std::quoted(word);)
            words_.push_back(word.size() > 2 && word[1] == '*' ? std::string(std::stoul(word.substr(2)), word[0])
                                                               : word);
    }
    /** The n-th word, from 0 on. */
    [[nodiscard]] const char* text(std::size_t n, const char* otherwise = nullptr) const {
        if (n >= words_.size()) return otherwise;
        return words_[n] == "(null)" ? nullptr : words_[n].c_str();
    }
    [[nodiscard]] std::int64_t number(std::size_t n, const char* otherwise = "1") const {
        return std::stoll(text(n, otherwise));
    }
    [[nodiscard]] int whole(std::size_t n, const char* otherwise = "1") const {
        return static_cast<int>(number(n, otherwise));
    }

private:
    std::vector<std::string> words_;
};

/** The sessions of a script, those with a value by "title_value". */
inline std::vector<std::string> sessions_of(const char* script) {
    std::vector<std::string> all;
    std::istringstream lines{read_text(script)};
    for (std::string line, word; std::getline(lines, line);) {
        if (!line.starts_with("== ")) continue;
        std::istringstream words{line.substr(3)};
        std::string title;
        words >> title;
        if (!(words >> word)) all.push_back(title);
        while (words >> word) all.push_back(title + "_" + word);
    }
    return all;
}

/** Runs a session. */
template <typename Call>
void run_session(const char* script, const std::string& session, Call call) {
    const std::size_t cut = session.find('_');
    const std::string start = "== " + session.substr(0, cut),
                      value = cut == session.npos ? "" : session.substr(cut + 1);
    std::istringstream lines{read_text(script)};
    std::string line, told, wanted;
    while (std::getline(lines, line) && line != start && !line.starts_with(start + " ")) {
    }
    while (std::getline(lines, line) && !line.starts_with("== ")) {
        for (std::size_t at = 0; !value.empty() && (at = line.find('@')) != line.npos;) line.replace(at, 1, value);
        if (line.empty() || line[0] == '#') continue;
        if (line[0] == '|') {
            wanted += line.ends_with('\\') ? line.substr(2, line.size() - 3) : line.erase(0, 2) + "\n";
            continue;
        }
        ASSERT_TRUE(line.starts_with("$ ")) << line;
        EXPECT_EQ(told, std::exchange(wanted, "")) << "before " << line;
        told.clear();
        const std::size_t equals = line.rfind(" = ");
        const Words words{line.substr(2, equals - 2)};
        CapturedStderr echo;
        const std::int64_t result = call(words, told);
        told.insert(0, echo.text());
        if (equals != line.npos) {
            EXPECT_EQ(std::to_string(result), line.substr(equals + 3)) << line;
        }
    }
    EXPECT_EQ(told, wanted);
}

}  // namespace test

#endif
