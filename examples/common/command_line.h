// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_COMMAND_LINE_H
#define QUO_EXAMPLES_COMMAND_LINE_H

#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace CLI {
class App;
}

/** Command lines. Only command_line.cpp includes CLI11, which takes longer to compile than most programs do. */
namespace command_line {

/** What is done once the whole command line has been understood; returns the exit status. */
using Job = std::function<int()>;

/** What else holds for an option. */
struct Rules {
    bool required = false;
    bool shows_default = false;      // in the help
    int values = 0;                  // how many it takes, where that is not one or any number
    const char* excludes = nullptr;  // another option
    std::vector<std::string> one_of = {};
    std::map<std::string, int> words = {};                     // that stand for numbers
    std::optional<std::pair<int, int>> within = std::nullopt;  // both included
    std::string (*defect)(const std::string&) = nullptr;       // of a text; empty where it is fine
};

/** A program, or a verb of one, whose options are declared one after the other. */
class Command {
public:
    /** Declares an option, such as "-o,--output", or an argument, whose name begins with no dash. The value stands
     * as it is unless the option is given, and must last as long as the command. It is a text, an int, a
     * std::uint64_t, a double, an optional double, or a vector of texts or doubles. */
    template <typename T>
    void takes(const char* name, T& value, const char* about, const Rules& rules = {});
    /** The same for one that must be given. */
    template <typename T>
    void needs(const char* name, T& value, const char* about, Rules rules = {}) {
        rules.required = true;
        takes(name, value, about, rules);
    }
    void flag(const char* name, bool& value, const char* about);
    /** Declares --threads: all processors, unless told. */
    void threads(int& value);

    /** What the help says at its end. */
    void details(const char* text);
    /** Options of which exactly one is to be given. */
    Command either(const char* title);
    /** Declares a verb, of which exactly one is to be given; one without a job has verbs of its own. */
    Command verb(const char* name, const char* about, Job job = {});

protected:
    Command(std::shared_ptr<CLI::App> app, std::shared_ptr<Job> job);

    std::shared_ptr<CLI::App> app_;  // a verb's keeps the whole program's alive
    std::shared_ptr<Job> job_;       // that of the verb that was given
};

/** A whole program. */
class Program : public Command {
public:
    explicit Program(const char* about, const char* name = "");

    /** Declares --version. */
    void version(const char* text);
    /** Shows examples of a verb at the end of its help, lines as they are typed. */
    void examples(const char* verb, const std::string& lines);
    /** Puts what `changed` makes of it in the place of each value of a verb's options of these names. */
    void change(std::span<const std::string_view> names, std::string (*changed)(std::string));

    /** Reads the command line. Returns nothing where the program is to do its job, else the exit status: help has
     * been printed, or what is wrong. With a `defect`, that receives what is wrong instead. */
    std::optional<int> parse(int argc, char** argv, std::string* defect = nullptr);
    /** Does the job of the verb that was given. */
    [[nodiscard]] int run() const { return (*job_)(); }

    /** The verbs that there are, and the one that was given with its own. */
    [[nodiscard]] std::vector<std::string> verbs() const;
    [[nodiscard]] std::vector<std::string> given() const;
};

}  // namespace command_line

#endif
