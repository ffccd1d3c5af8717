#ifndef QUO_TOOL_COMMANDS_H
#define QUO_TOOL_COMMANDS_H

#include <CLI/CLI.hpp>
#include <functional>

namespace tool {

/** What the chosen subcommand does once the whole command line has been understood; returns the exit status. Every
 * add_... function declares one subcommand, which sets the job when it is chosen. */
using Job = std::function<int()>;

void add_geolocate(CLI::App& app, Job& job);
void add_orbit(CLI::App& app, Job& job);
void add_time(CLI::App& app, Job& job);
void add_tiepoints(CLI::App& app, Job& job);
void add_info(CLI::App& app, Job& job);
void add_validate(CLI::App& app, Job& job);
void add_get(CLI::App& app, Job& job);
void add_set(CLI::App& app, Job& job);
void add_convert(CLI::App& app, Job& job);
void add_quicklook(CLI::App& app, Job& job);
void add_footprint(CLI::App& app, Job& job);
void add_vrt(CLI::App& app, Job& job);
void add_spectrum(CLI::App& app, Job& job);
void add_resample(CLI::App& app, Job& job);
void add_derive(CLI::App& app, Job& job);
void add_fit(CLI::App& app, Job& job);
void add_coregister(CLI::App& app, Job& job);
void add_config(CLI::App& app, Job& job);
void add_debug_dump(CLI::App& app, Job& job);

}  // namespace tool

#endif
