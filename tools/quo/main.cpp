#include <algorithm>
#include <cstdio>
#include <filesystem>
#include <new>
#include <string>
#include <string_view>

#include "commands.h"
#include "document.h"
#include "failure.h"
#include "interrupt.h"

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
std::string header_name(const std::string& name) {
    if (name.ends_with(".hdr") || !is_file(name + ".hdr")) return name;
    return is_file(name) && tool::Document::in(name) ? name : name + ".hdr";
}
std::string raster_name(const std::string& name) {
    return name.ends_with(".hdr") && !is_file(name + ".hdr") ? name.substr(0, name.size() - 4) : name;
}

// What an argument is called tells what it names, in every verb.
void take_either_name(CLI::App& app) {
    constexpr std::string_view kHeaders[] = {"HEADER", "MASTER", "SLAVE", "header"}, kRasters[] = {"RASTER", "IN"};
    for (CLI::App* verb : app.get_subcommands({})) {
        for (CLI::Option* option : verb->get_options()) {
            const std::string name = option->get_single_name();
            if (std::ranges::find(kHeaders, name) != std::end(kHeaders)) option->transform(header_name);
            if (std::ranges::find(kRasters, name) != std::end(kRasters)) option->transform(raster_name);
        }
    }
}

const CLI::App* chosen_verb(const CLI::App& app) {
    const auto chosen = app.get_subcommands();
    return chosen.empty() ? nullptr : chosen.front();
}

std::string verbs_of(const CLI::App& app) {
    std::string names;
    for (const CLI::App* verb : app.get_subcommands([](const CLI::App*) { return true; }))
        names += (names.empty() ? "" : ", ") + verb->get_name();
    return names;
}

/** What is wrong with the command line, and where the user finds help on it. */
std::string wrong_use(const CLI::App& app, const std::string& what, const char* first_word) {
    const CLI::App* verb = chosen_verb(app);
    const std::string_view word = first_word != nullptr ? first_word : "";
    if (!verb && !word.starts_with('-'))
        return (word.empty() ? "no verb" : "no verb " + std::string{word}) + "; there are " + verbs_of(app);
    std::string help = "quo";
    for (; verb; verb = chosen_verb(*verb)) help += " " + verb->get_name();
    return what + " (see " + help + " --help)";
}

int run(int argc, char** argv) {
    CLI::App app{kAbout, "quo"};
    app.footer(kFooter);
    app.set_version_flag("--version", "quo " QUO_TOOL_VERSION);
    app.require_subcommand(1);
    tool::Job job;
    for (const auto add : tool::kVerbs) add(app, job);
    take_either_name(app);
    try {
        app.parse(argc, argv);
        return job();
    } catch (const CLI::ParseError& error) {
        if (error.get_exit_code() == static_cast<int>(CLI::ExitCodes::Success)) return app.exit(error);
        throw tool::WrongUse(wrong_use(app, error.what(), argc > 1 ? argv[1] : nullptr));
    } catch (const tool::WrongUse& wrong) {
        throw tool::WrongUse(wrong_use(app, wrong.what(), argc > 1 ? argv[1] : nullptr));
    }
}

}  // namespace

int main(int argc, char** argv) {
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
