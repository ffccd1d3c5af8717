// Measures point targets in a focused image: position, resolution, sidelobes, phase.
#include <algorithm>
#include <cstdio>
#include <string>

#include "../common/command_line.h"
#include "../common/session.h"
#include "measure.h"

int main(int argc, char** argv) {
    command_line::Program app{"Measures point targets in a focused image"};
    std::string image, targets;
    app.needs("image", image, "Focused image; its product header is IMAGE.hdr");
    app.needs("targets", targets, "Table of targets: name,latitude_deg,longitude_deg,height_m,strength");
    if (const auto status = app.parse(argc, argv)) return *status;
    const example::Files files{{image, image + ".hdr", targets}, {}};
    return example::run_program("Point targets", files, image + ".targets.report.txt", "", 1, [&] {
        const auto found = example::measure(image, example::read_targets(targets));
        example::print_table(stdout, found);
        if (!std::all_of(found.begin(), found.end(), example::within_bounds))
            throw example::Failure{"a target is further off than 0.1 samples, 5 % in resolution or 0.1 rad"};
    });
}
