// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_COMMANDS_H
#define QUO_TOOL_COMMANDS_H

#include <memory>
#include <utility>

// What every verb says, and how.
#include "common/blocks.h"
#include "common/command_line.h"
#include "failure.h"
#include "number.h"
#include "shown.h"

namespace tool {

using command_line::Command;

/** Declares a verb. */
using AddVerb = void(Command& program);
AddVerb add_geolocate, add_orbit, add_time, add_tiepoints, add_info, add_validate, add_get, add_set, add_convert,
    add_quicklook, add_footprint, add_stac, add_vrt, add_spectrum, add_resample, add_derive, add_fit,
    add_coregister, add_config, add_debug_dump, add_import;

/** All of them, in the order in which the help lists them. */
inline constexpr AddVerb* kVerbs[] = {
    add_import,   add_geolocate, add_orbit,   add_time,      add_tiepoints,  add_info,   add_validate,
    add_get,      add_set,       add_convert, add_quicklook, add_footprint,  add_stac,   add_vrt,
    add_spectrum, add_resample,  add_derive,  add_fit,       add_coregister, add_config, add_debug_dump};

/** A verb that is being declared, and its options, which live as long as the program. */
template <typename Options>
using Verb = std::pair<Command, Options&>;
template <typename Options>
Verb<Options> add_verb(Command& program, const char* name, const char* about, int (*run)(const Options&)) {
    auto options = std::make_shared<Options>();
    return {program.verb(name, about, [options, run] { return run(*options); }), *options};
}

/** Declares what all verbs offer that work in blocks and take their time. */
template <typename Options>
void add_block_options(Command& command, Options& options) {
    command.flag("--waitbar", options.waitbar, "Tell the progress on standard error, as commands of a waitbar");
    command.threads(options.threads);
}

}  // namespace tool

#endif
