#ifndef QUO_TOOL_COMMANDS_H
#define QUO_TOOL_COMMANDS_H

#include <CLI/CLI.hpp>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

// What every verb says, and how.
#include "common/blocks.h"
#include "failure.h"
#include "number.h"
#include "shown.h"

namespace tool {

/** What the chosen verb does once the whole command line has been understood; returns the exit status. */
using Job = std::function<int()>;

/** Declares a verb, which sets the job when it is chosen. */
using AddVerb = void(CLI::App& app, Job& job);
AddVerb add_geolocate, add_orbit, add_time, add_tiepoints, add_info, add_validate, add_get, add_set, add_convert,
    add_quicklook, add_footprint, add_vrt, add_spectrum, add_resample, add_derive, add_fit, add_coregister,
    add_config, add_debug_dump, add_import;

/** All of them, in the order in which the help lists them. */
inline constexpr AddVerb* kVerbs[] = {add_import,     add_geolocate, add_orbit,      add_time,     add_tiepoints, add_info,
                                      add_validate,  add_get,        add_set,      add_convert,   add_quicklook,
                                      add_footprint, add_vrt,        add_spectrum, add_resample,  add_derive,
                                      add_fit,       add_coregister, add_config,   add_debug_dump};

/** A verb that is being declared, and its options, which live as long as the verb. */
template <typename Options>
struct Verb {
    CLI::App* command;
    Options& options;
};
template <typename Options>
Verb<Options> add_verb(CLI::App& app, Job& job, const char* name, const char* about, int (*run)(const Options&)) {
    auto options = std::make_shared<Options>();
    CLI::App* command = app.add_subcommand(name, about);
    command->callback([options, run, &job] { job = [options, run] { return run(*options); }; });
    return {command, *options};
}

/** Declares the option --threads of a verb that works in blocks: all processors, unless told. */
inline void add_threads_option(CLI::App& command, int& threads) {
    threads = blocks::all_processors();
    command.add_option("--threads", threads, "Threads to work with; all processors unless told")
        ->check(CLI::Range(1, 1024));
}

}  // namespace tool

#endif
