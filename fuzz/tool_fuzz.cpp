// SPDX-License-Identifier: Apache-2.0
/* Command lines and dumps of any bytes, as the tool takes them. The first line is split at its tabs into the words
 * of a command line, "@" among them standing for a file that holds the rest. Jobs of verbs that only read are
 * done. */

#include <cstdio>
#include <vector>

#include "bytes.h"
#include "commands.h"

namespace {

using property::require;

/** What the tool complains of is heard by nobody meanwhile. */
class Silence {
public:
    Silence() { stderr = null_; }
    ~Silence() { stderr = kept_; }
    Silence(const Silence&) = delete;
    Silence& operator=(const Silence&) = delete;

private:
    static inline std::FILE* const null_ = std::fopen("/dev/null", "w");
    std::FILE* const kept_ = stderr;
};

/** Options of every kind, none of them a verb of the tool. */
struct Kinds {
    int within = 3, word = 0;
    double real = 0.5;
    std::vector<double> three;
    std::string member, text;
    bool given = false;
};
void declare(command_line::Command verb, Kinds& kinds) {
    verb.takes("--within", kinds.within, "", {.within = {{2, 7}}});
    verb.takes("--word", kinds.word, "", {.words = {{"zero", 0}, {"one", 1}}});
    verb.takes("--real", kinds.real, "", {.excludes = "--within"});
    verb.takes("--three", kinds.three, "", {.values = 3});
    verb.takes("--member", kinds.member, "", {.one_of = {"red", "green"}});
    verb.takes("--text", kinds.text, "", {.defect = [](const std::string& text) {
                   return std::string{text.find('=') == text.npos ? "" : "has an equals sign"};
               }});
    verb.flag("--given", kinds.given, "");
}
void check(const Kinds& kinds) {
    require(kinds.within >= 2 && kinds.within <= 7, "a number is within its bounds");
    require(kinds.real == 0.5 || kinds.within == 3, "options that exclude each other are not both given");
    require(kinds.three.size() % 3 == 0, "values come as many as they are to be");
    require(kinds.member.empty() || kinds.member == "red" || kinds.member == "green", "a word is one of a list");
    require(kinds.text.find('=') == kinds.text.npos, "a text has no defect");
}

/** What the words lead to: the tool's exit status. */
int quietly(command_line::Program& program, std::vector<std::string>& words) {
    std::vector<char*> argv;
    for (std::string& word : words) argv.push_back(word.data());
    argv.push_back(nullptr);
    const Silence silence;
    std::string defect;
    const auto status = program.parse(static_cast<int>(words.size()), argv.data(), &defect);
    if (!defect.empty()) return tool::kWrongUse;
    try {
        return status ? *status : program.run();
    } catch (const tool::WrongUse&) {
        return tool::kWrongUse;
    } catch (const tool::Failure&) {
        return tool::kFindings;
    }
}
int outcome(std::vector<std::string> words) {
    Kinds kinds;
    bool taken = false;
    command_line::Program program{"", "tool"};
    tool::add_debug_dump(program);
    tool::add_time(program);
    declare(program.verb("kinds", "", [&taken] { return taken = true, tool::kFine; }), kinds);
    const int status = quietly(program, words);
    if (taken) check(kinds);
    return status;
}

/** Whether the bytes are those of a whole dump, and of nothing else. */
bool is_dump(property::Bytes bytes) {
    constexpr std::int64_t kSizes[] = {4, 8, 8, 16, 2, 1};
    if (bytes.rest().size() < 12) return false;
    const auto type = bytes.number<std::int32_t>(), first = bytes.number<std::int32_t>(),
               second = bytes.number<std::int32_t>();
    if (type < 0 || type > 5 || first < 0 || second < 0) return false;
    const auto there = static_cast<std::int64_t>(bytes.rest().size());
    return there % kSizes[type] == 0 && there / kSizes[type] == std::int64_t{first} * second;
}

}  // namespace

extern "C" int LLVMFuzzerInitialize(int* /*argc*/, char*** /*argv*/) {
    return std::freopen("/dev/null", "w", stdout) ? 0 : 1;  // results and help
}

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    property::Bytes bytes{{reinterpret_cast<const char*>(data), size}};
    property::Bytes line{bytes.take_until('\n')};
    const property::MemoryFile file{bytes.rest(), "tool"};
    std::vector<std::string> words{"tool"};
    while (!line.empty()) {
        words.emplace_back(line.take_until('\t'));
        if (words.back() == "@") words.back() = file.name();
    }
    outcome(words);
    require((outcome({"tool", "debug-dump", file.name()}) == tool::kFine) == is_dump(bytes),
            "whole dumps are fine, and only those");
    return 0;
}
