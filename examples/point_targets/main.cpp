// SPDX-License-Identifier: Apache-2.0

// Measures point targets in a focused image: position, resolution, sidelobes, phase.
#include <algorithm>
#include <cstdio>
#include <string>

#include "../common/command_line.h"
#include "../common/session.h"
#include "measure.h"
#include "portrait.h"

namespace {

struct Options {
    std::string image, targets, picture, portrayed;
};

void measure(const Options& options) {
    const auto targets = example::read_targets(options.targets);
    const std::string name = options.portrayed.empty() && !targets.empty() ? targets[0].name : options.portrayed;
    example::Closeup closeup;
    const auto found = example::measure(options.image, targets, name, &closeup);
    example::print_table(stdout, found);
    if (!options.picture.empty()) {
        const auto shown = std::ranges::find(found, name, &example::Measurement::name);
        if (shown == found.end()) throw example::Failure{"no target " + name};
        example::write_file(options.picture, png_of(example::portrait(*shown, closeup)));
    }
    if (!std::all_of(found.begin(), found.end(), example::within_bounds))
        throw example::Failure{"a target is further off than 0.1 samples, 5 % in resolution or 0.1 rad"};
}

}  // namespace

int main(int argc, char** argv) {
    command_line::Program app{"Measures point targets in a focused image"};
    Options options;
    app.needs("image", options.image, "Focused image; its product header is IMAGE.hdr");
    app.needs("targets", options.targets, "Table of targets: name,latitude_deg,longitude_deg,height_m,strength");
    app.takes("--picture", options.picture,
              "Draw the response to a target: from above, both cuts, and figures (PNG)");
    app.takes("--target", options.portrayed, "Which target that is (the first)");
    if (const auto status = app.parse(argc, argv)) return *status;
    example::Files files{{options.image, options.image + ".hdr", options.targets}, {}};
    if (!options.picture.empty())
        files.written.insert(files.written.end(), {options.picture, example::unfinished_name(options.picture)});
    return example::run_program("Point targets", files, options.image + ".targets.report.txt", "", 1,
                                [&] { measure(options); });
}
