// SPDX-License-Identifier: Apache-2.0
#include <cstdlib>
#include <exception>
#include <filesystem>
#include <new>
#include <span>
#include <string>
#include <string_view>

#include "commands.h"
#include "document.h"
#include "examples.h"
#include "failure.h"
#include "interrupt.h"
#include "sarutillib/ground/letters.h"

namespace {

constexpr const char* kAbout =
    "Products of synthetic aperture radar: what their headers say, where they lie, and their rasters.\n"
    "Times are seconds since 1 January 1985 without leap seconds, range times are two-way.";
constexpr const char* kFooter =
    "Exit status: 0 fine; 1 a job that failed, rows without a solution, or findings; 2 wrong use.\n";

bool is_file(const std::string& name) {
    std::error_code error;
    return std::filesystem::is_regular_file(name, error);
}

// A product is known by either of its names. A file that is a header itself is the one that is meant, even with
// another one beside it.
std::string header_name(std::string name) {
    if (name.ends_with(".hdr") || !is_file(name + ".hdr")) return name;
    return is_file(name) && tool::Document::in(name) ? name : name + ".hdr";
}
std::string raster_name(std::string name) {
    return name.ends_with(".hdr") && !is_file(name + ".hdr") ? name.substr(0, name.size() - 4) : name;
}

// What an argument is called tells what it names, in every verb.
constexpr std::string_view kHeaders[] = {"HEADER", "MASTER", "SLAVE", "header"}, kRasters[] = {"RASTER", "IN"};

/** Says what is wrong with the command line, and where the user finds help on it. */
std::string wrong_use(const command_line::Program& program, const std::string& what,
                      std::span<const char* const> words) {
    std::string help = "quo";
    for (const std::string& verb : program.given()) help += " " + verb;
    const std::string verbs = quo::joined(program.verbs());
    const std::size_t next = program.given().size() + 1;
    const std::string_view word = next < words.size() ? words[next] : "";
    if (verbs.empty() || word.starts_with('-')) return what + " (see " + help + " --help)";
    return (word.empty() ? "no verb" : "no verb " + std::string{word}) + "; there are " + verbs +
           (help == "quo" ? "" : " (see " + help + " --help)");
}

int run(int argc, char** argv) {
    command_line::Program program{kAbout, "quo"};
    program.details(kFooter);
    program.version("quo " QUO_TOOL_VERSION);
    for (const auto add : tool::kVerbs) add(program);
    for (const auto& [verb, lines] : tool::kExamples) program.examples(verb, lines);
    program.change(kHeaders, header_name);
    program.change(kRasters, raster_name);
    try {
        std::string defect;
        const auto status = program.parse(argc, argv, &defect);
        if (!defect.empty()) throw tool::WrongUse(defect);
        return status ? *status : program.run();
    } catch (const tool::WrongUse& wrong) {
        throw tool::WrongUse(wrong_use(program, wrong.what(), {argv, static_cast<std::size_t>(argc)}));
    }
}

/** For destructors that take memory, such as those of JSON values, where there is none. */
[[noreturn]] void end_without_memory() {
    try {
        if (const auto thrown = std::current_exception()) std::rethrow_exception(thrown);
    } catch (const std::bad_alloc&) {
        tool::complain("out of memory");
        std::_Exit(tool::kFindings);
    } catch (...) {
        std::abort();
    }
    std::abort();
}

}  // namespace

int main(int argc, char** argv) {
    std::set_terminate(end_without_memory);
    try {
        return run(argc, argv);
    } catch (const tool::Interrupted& interrupted) {
        tool::end_by(interrupted.signal);
    } catch (const tool::WrongUse& wrong) {
        tool::complain(wrong.what());
        return tool::kWrongUse;
    } catch (const std::bad_alloc&) {
        tool::complain("out of memory");
    } catch (const std::exception& failure) {
        tool::complain(failure.what());
    }
    return tool::kFindings;
}
