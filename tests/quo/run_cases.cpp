// SPDX-License-Identifier: Apache-2.0

// Runs the transcripts of cases/: what a user types, and what the tool answers.
//
//   == title          begins a case, in a fresh folder where its commands run
//   $ command         for the shell, continued by lines "> ..."; $scenes, $docs and $data are folders of the
//   sources,
//                     and "try" in place of "quo" tells a status other than 0 as "[1]"
//   | line            on standard output; every line is told, and there are no others
//   ! line            the same on standard error
//   ? status          of the exit, where it is not 0
//   # text            is for the reader
//
// Runs the documentation's pages too, each as one case: the blocks with lines "$ command", which goes on after a
// backslash. The lines below are what it writes, standard error behind standard output. A status of 1, which
// findings give, shows by what is said.
//
// In an expected line "..." stands for any text, alone on a line for any lines, and 17.3~0.1 for any number that
// is no further from 17.3 than 0.1.
#include <gtest/gtest.h>

#include <charconv>
#include <cmath>
#include <filesystem>
#include <map>

#include "tool.h"

namespace {

using Lines = std::vector<std::string>;

struct Step {
    std::size_t line;
    std::string command;
    int status = 0;
    std::map<char, Lines> streams;  // by the sign in front of their lines
};
struct Case {
    std::string title;
    std::vector<Step> steps;
    bool page = false;
};

Lines lines_of(const std::string& text) {
    Lines lines;
    std::istringstream stream{text};
    for (std::string line; std::getline(stream, line);) lines.push_back(line);
    return lines;
}

void take_line(std::vector<Case>& cases, const std::string& line, std::size_t number) {
    const std::string rest = line.size() > 2 ? line.substr(2) : "";
    if (line.empty() || line[0] == '#') return;
    if (line[0] == '=') return cases.push_back({line.substr(3), {}});
    auto& steps = cases.at(cases.size() - 1).steps;
    if (line[0] == '$') return steps.push_back({number, rest, 0, {}});
    Step& step = steps.at(steps.size() - 1);
    if (line[0] == '>') {
        step.command += "\n" + rest;
    } else if (line[0] == '?') {
        step.status = std::stoi(rest);
    } else if (line[0] == '|' || line[0] == '!') {
        step.streams[line[0]].push_back(rest);
    } else {
        throw std::runtime_error("no line of a transcript: " + line);
    }
}

std::vector<Case> cases_in(const std::string& file) {
    std::vector<Case> cases;
    std::size_t number = 0;
    for (const std::string& line : lines_of(test::read_text(file))) take_line(cases, line, ++number);
    return cases;
}

std::vector<Case> page_in(const std::string& file) {
    std::vector<Case> cases{{.title = file, .steps = {}, .page = true}};
    auto& steps = cases[0].steps;
    bool block = false, typed = false, continued = false;
    std::size_t number = 0;
    for (const std::string& line : lines_of(test::read_text(file))) {
        ++number;
        if (line.starts_with("```")) {
            block = !block;
            typed = false;
        } else if (block && (continued || line.starts_with("$ "))) {
            typed = true;
            if (continued) {
                steps.back().command += "\n" + line;
            } else {
                steps.push_back({number, line.substr(2), 0, {}});
            }
            continued = line.ends_with('\\');
        } else if (typed) {
            steps.back().streams['|'].push_back(line);
        }
    }
    return cases;
}

/** Takes the number off the start of a text, if there is one. */
bool take_number(std::string_view& text, double& value) {
    const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), value);
    if (error != std::errc{}) return false;
    text.remove_prefix(static_cast<std::size_t>(end - text.data()));
    return true;
}

bool matches(std::string_view pattern, std::string_view text) {
    for (; !pattern.empty(); pattern.remove_prefix(1), text.remove_prefix(1)) {
        if (pattern.starts_with("...")) {
            for (std::size_t skipped = 0; skipped <= text.size(); ++skipped)
                if (matches(pattern.substr(3), text.substr(skipped))) return true;
            return false;
        }
        double expected = 0.0, tolerance = 0.0, found = 0.0;
        std::string_view rest = pattern;
        if (take_number(rest, expected) && rest.starts_with('~')) {
            rest.remove_prefix(1);
            const bool near = take_number(rest, tolerance) && take_number(text, found) &&
                              std::abs(found - expected) <= tolerance;
            return near && matches(rest, text);
        }
        if (text.empty() || pattern[0] != text[0]) return false;
    }
    return text.empty();
}

bool match(const Lines& patterns, std::size_t i, const Lines& lines, std::size_t k) {
    if (i == patterns.size()) return k == lines.size();
    if (patterns[i] == "..." && match(patterns, i + 1, lines, k)) return true;
    if (k == lines.size() || !matches(patterns[i], lines[k])) return false;
    return match(patterns, patterns[i] == "..." ? i : i + 1, lines, k + 1);
}

void expect_stream(const Step& step, char sign, const std::string& text) {
    const auto expected = step.streams.find(sign);
    const Lines lines = lines_of(text);
    if (match(expected == step.streams.end() ? Lines{} : expected->second, 0, lines, 0)) return;
    std::string found;
    for (const std::string& line : lines) found += std::string{sign} + " " + line + "\n";
    ADD_FAILURE() << "found\n" << found;
}

/** What every command of a transcript finds defined. */
std::string names() {
    const auto folder_of = [](const char* program) {
        return std::filesystem::path{program}.parent_path().string();
    };
    return "PATH='" + folder_of(QUO_TOOL) + "':'" + folder_of(QUO_MAKE_HEADER) + "':'" +
           folder_of(QUO_COMPLETE_PRODUCT) +
           "':'" QUO_BUILD R"(/examples/chain':"$PATH")"
           "\nscenes='" QUO_TEST_DATA "/scenes' data='" +
           QUO_TEST_DATA "/quo' docs='" QUO_DOCS "'\n" + R"(try() { quo "$@" || echo "[$?]"; })" + "\n";
}

/** What the book has its readers type first, the folders apart. */
std::string names_of_pages() {
    for (const std::string& line : lines_of(test::read_text(QUO_DOCS "/README.md")))
        if (line.starts_with("export PATH="))
            return "sources='" QUO_DOCS "/..' build='" QUO_BUILD "'\n" + line + "\n";
    throw std::runtime_error("the book does not say what PATH has to be");
}

class Transcript : public testing::TestWithParam<std::filesystem::path> {};

TEST_P(Transcript, Holds) {
    const auto cases = (GetParam().extension() == ".md" ? page_in : cases_in)(GetParam().string());
    ASSERT_FALSE(cases.empty());
    for (const Case& one : cases) {
        const test::TemporaryFolder folder;
        const std::string beginning =
            "cd '" + folder.path().string() + "'\n" + (one.page ? names_of_pages() : names());
        for (const Step& step : one.steps) {
            SCOPED_TRACE(one.title + ", line " + std::to_string(step.line) + "\n$ " + step.command);
            const test::Finished run = test::Child{"/bin/sh", {"-c", beginning + step.command}}.wait();
            if (one.page) {
                EXPECT_TRUE(run.exit_status == 0 || run.exit_status == 1) << run.exit_status;
                expect_stream(step, '|', run.out + run.err);
                continue;
            }
            EXPECT_EQ(run.exit_status, step.status);
            expect_stream(step, '|', run.out);
            expect_stream(step, '!', run.err);
        }
    }
}

using Files = std::vector<std::filesystem::path>;

Files files_in(const char* path) {
    const std::filesystem::directory_iterator folder{path};
    return {begin(folder), end(folder)};
}

Files pages() {
    Files all = files_in(QUO_DOCS);
    std::erase_if(all, [](const auto& file) { return file.extension() != ".md"; });
    return all;
}

/** None with the sanitizers: pages do jobs of full size, and load the library into programs without them. */
Files pages_to_run() {
    if (!QUO_RUN_PAGES) return {};
    Files all = pages();
    all.emplace_back(QUO_DOCS "/../README.md");
    std::erase_if(all, [](const auto& file) { return page_in(file.string())[0].steps.empty(); });
    return all;
}

std::string name(const testing::TestParamInfo<std::filesystem::path>& file) { return file.param.stem().string(); }
INSTANTIATE_TEST_SUITE_P(Cases, Transcript, testing::ValuesIn(files_in(QUO_CASES)), name);
INSTANTIATE_TEST_SUITE_P(Pages, Transcript, testing::ValuesIn(pages_to_run()), name);

TEST(Book, ListsItsPages) {
    const std::string book = test::read_text(QUO_DOCS "/README.md");
    for (const auto& page : pages()) {
        const std::string title = lines_of(test::read_text(page.string())).at(0).substr(2);
        const std::string link = "[" + title + "](" + page.filename().string() + ")";
        EXPECT_TRUE(page.stem() == "README" || book.find(link) != book.npos) << link;
    }
}

}  // namespace
