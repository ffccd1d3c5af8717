// SPDX-License-Identifier: Apache-2.0
#include "command_line.h"

#include <CLI/CLI.hpp>
#include <algorithm>
#include <cstdint>
#include <utility>

#include "blocks.h"

namespace command_line {
Command::Command(std::shared_ptr<CLI::App> app, std::shared_ptr<Job> job)
    : app_{std::move(app)}, job_{std::move(job)} {}

template <typename T>
void Command::takes(const char* name, T& value, const char* about, const Rules& rules) {
    CLI::Option* option = app_->add_option(name, value, about)->required(rules.required);
    if (rules.shows_default) option->capture_default_str();
    if (rules.values > 0) option->expected(rules.values);
    if (rules.excludes) option->excludes(app_->get_option(rules.excludes));
    if (!rules.one_of.empty()) option->check(CLI::IsMember(rules.one_of));
    if (!rules.words.empty()) option->transform(CLI::Transformer(rules.words));
    if (rules.within) option->check(CLI::Range(rules.within->first, rules.within->second));
    if (rules.defect) option->check(rules.defect);
}
template void Command::takes(const char*, int&, const char*, const Rules&);
template void Command::takes(const char*, std::uint64_t&, const char*, const Rules&);
template void Command::takes(const char*, double&, const char*, const Rules&);
template void Command::takes(const char*, std::optional<double>&, const char*, const Rules&);
template void Command::takes(const char*, std::string&, const char*, const Rules&);
template void Command::takes(const char*, std::vector<std::string>&, const char*, const Rules&);
template void Command::takes(const char*, std::vector<double>&, const char*, const Rules&);

void Command::flag(const char* name, bool& value, const char* about) { app_->add_flag(name, value, about); }

void Command::threads(int& value) {
    value = blocks::all_processors();
    takes("--threads", value, "Threads to work with; all processors unless told", {.within = {{1, 1024}}});
}

void Command::details(const char* text) { app_->footer(text); }

Command Command::either(const char* title) {
    CLI::App* group = app_->add_option_group(title)->require_option(1);
    return {{app_, group}, job_};
}

Command Command::verb(const char* name, const char* about, Job job) {
    app_->require_subcommand(1);
    CLI::App* command = app_->add_subcommand(name, about);
    if (job) command->callback([chosen = job_, job = std::move(job)] { *chosen = job; });
    return {{app_, command}, job_};
}

Program::Program(const char* about, const char* name)
    : Command{std::make_shared<CLI::App>(about, name), std::make_shared<Job>()} {}

void Program::version(const char* text) { app_->set_version_flag("--version", text); }

void Program::examples(const char* verb, const std::string& lines) {
    CLI::App* const app = app_->get_subcommand(verb);
    app->footer(app->get_footer() + "\nExamples:\n" + lines);
}

void Program::change(std::span<const std::string_view> names, std::string (*changed)(std::string)) {
    for (CLI::App* verb : app_->get_subcommands({}))
        for (CLI::Option* option : verb->get_options())
            if (std::ranges::find(names, option->get_single_name()) != names.end()) option->transform(changed);
}

std::optional<int> Program::parse(int argc, char** argv, std::string* defect) {
    try {
        app_->parse(argc, argv);
        return std::nullopt;
    } catch (const CLI::ParseError& error) {
        if (!defect || error.get_exit_code() == static_cast<int>(CLI::ExitCodes::Success))
            return app_->exit(error);
        *defect = error.what();
        return error.get_exit_code();
    }
}

std::vector<std::string> Program::verbs() const {
    std::vector<std::string> names;
    for (const CLI::App* verb : app_->get_subcommands({})) names.push_back(verb->get_name());
    return names;
}

std::vector<std::string> Program::given() const {
    std::vector<std::string> names;
    for (auto chosen = app_->get_subcommands(); !chosen.empty(); chosen = chosen.front()->get_subcommands())
        names.push_back(chosen.front()->get_name());
    return names;
}

}  // namespace command_line
