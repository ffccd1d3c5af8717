#include <cstdio>
#include <new>

#include "commands.h"
#include "failure.h"
#include "interrupt.h"

namespace {

constexpr const char* kAbout =
    "Products of synthetic aperture radar: what their headers say, where they lie, and their rasters.\n"
    "Times are seconds since 1 January 1985 without leap seconds, range times are two-way.";
constexpr const char* kFooter =
    "Exit status: 0 fine; 1 a job that failed, rows without a solution, or findings; 2 wrong use.\n";

int run(int argc, char** argv) {
    CLI::App app{kAbout, "quo"};
    app.footer(kFooter);
    app.set_version_flag("--version", "quo " QUO_TOOL_VERSION);
    app.require_subcommand(1);
    tool::Job job;
    tool::add_geolocate(app, job);
    tool::add_orbit(app, job);
    tool::add_time(app, job);
    tool::add_tiepoints(app, job);
    tool::add_info(app, job);
    tool::add_validate(app, job);
    tool::add_get(app, job);
    tool::add_set(app, job);
    tool::add_convert(app, job);
    tool::add_quicklook(app, job);
    tool::add_footprint(app, job);
    tool::add_vrt(app, job);
    tool::add_spectrum(app, job);
    tool::add_resample(app, job);
    tool::add_derive(app, job);
    tool::add_fit(app, job);
    tool::add_coregister(app, job);
    tool::add_config(app, job);
    tool::add_debug_dump(app, job);
    try {
        app.parse(argc, argv);
    } catch (const CLI::ParseError& error) {
        if (error.get_exit_code() == static_cast<int>(CLI::ExitCodes::Success)) return app.exit(error);
        throw tool::WrongUse(error.what());
    }
    return job();
}

}  // namespace

int main(int argc, char** argv) {
    try {
        return run(argc, argv);
    } catch (const tool::Interrupted& interrupted) {
        tool::end_by(interrupted.signal);
    } catch (const tool::WrongUse& wrong) {
        tool::complain(std::string{wrong.what()} + " (see quo --help)");
        return tool::kWrongUse;
    } catch (const std::bad_alloc&) {
        tool::complain("out of memory");
    } catch (const std::exception& failure) {
        tool::complain(failure.what());
    }
    return tool::kFindings;
}
