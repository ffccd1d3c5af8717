// SPDX-License-Identifier: Apache-2.0
#include <memory>
#include <optional>

#include "commands.h"
#include "interrupt.h"
#include "progress.h"
#include "quo_base/mission_import.h"

namespace tool {
namespace {

struct ImportOptions {
    std::string source, raster, swath, polarization, orbit;
    bool link = false, waitbar = false;
};

/** Told of the bytes that are taken over; an exception does not go through the library. */
struct Watch {
    explicit Watch(bool waitbar) : progress{waitbar ? "Importing" : nullptr} {}

    static int step(void* self, std::int64_t done, std::int64_t all) {
        auto& watch = *static_cast<Watch*>(self);
        try {
            watch.progress.step(done, all);
            throw_if_interrupted();
        } catch (const Interrupted& signal) {
            watch.interrupted = signal;
            return 1;
        }
        return 0;
    }

    Progress progress;
    std::optional<Interrupted> interrupted;
};

std::string tie_points_text(const quo_tie_points& ties) {
    const std::string points = " tie points", compared = std::to_string(ties.count);
    if (ties.count == ties.stated) return compared + points;
    return compared + " of " + std::to_string(ties.stated) + points +
           " (the others in no burst, unseen by the orbit, or more than a pixel off)";
}

void show(const ImportOptions& options, const quo_import_result& result) {
    std::string text = shown(options.raster) + ": " + std::to_string(result.lines) + " lines of " +
                       std::to_string(result.samples) + " samples" + (result.linked != 0 ? ", linked" : "") + "\n";
    const quo_tie_points& ties = result.ties;
    if (ties.count > 0)
        text += tie_points_text(ties) + ": lines rms " + fixed(ties.rms_line, 5) + " max " +
                fixed(ties.most_line, 5) + ", samples rms " + fixed(ties.rms_sample, 5) + " max " +
                fixed(ties.most_sample, 5) + ", ground rms " + fixed(ties.rms_ground_m, 4) + " m max " +
                fixed(ties.most_ground_m, 4) + " m\n";
    else
        text += "no tie points that the orbit sees: line times may keep up to 0.13 lines of the range's delay\n";
    print(text);
}

int import_product(const ImportOptions& options) {
    if (options.raster == "-") throw WrongUse("a raster cannot go to standard output");
    note_interrupts();
    quo_import_request request{};
    request.source = options.source.c_str();
    request.raster = options.raster.c_str();
    request.swath = options.swath.c_str();
    request.polarization = options.polarization.c_str();
    request.orbit_file = options.orbit.c_str();
    request.link = options.link ? 1 : 0;
    quo_import_result result{};
    {
        Watch watch{options.waitbar};
        request.progress = Watch::step;
        request.context = &watch;
        const int status = quo_import_sentinel1(&request, &result);
        if (watch.interrupted) throw *watch.interrupted;
        if (status != QUO_OK) throw Failure(result.message);
    }
    show(options, result);
    return kFine;
}

}  // namespace

void add_import(Command& program) {
    auto [command, options] =
        add_verb(program, "import", "Takes over a Sentinel-1 product: SLC or GRD", import_product);
    command.needs("PRODUCT", options.source, "Folder *.SAFE, its manifest, or an annotation file");
    command.needs("OUT", options.raster, "Raster to make, with a header OUT.hdr");
    command.takes("--swath", options.swath, "Swath, such as IW1, where there are several",
                  {.offers = {"IW1", "IW2", "IW3", "EW1", "EW2", "EW3", "EW4", "EW5", "S1", "S2", "S3", "S4", "S5",
                              "S6", "WV1", "WV2"}});
    command.takes("--polarization", options.polarization, "Polarization, such as VV, where there are several",
                  {.offers = {"VV", "VH", "HH", "HV"}});
    command.takes("--orbit", options.orbit, "Orbit file whose vectors take the place of the annotation's");
    command.flag("--link", options.link, "Make OUT a link to the measurement, whose samples are not copied");
    command.flag("--waitbar", options.waitbar, "Tell the progress on standard error, as commands of a waitbar");
}

}  // namespace tool
