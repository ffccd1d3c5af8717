// SPDX-License-Identifier: Apache-2.0

// A small range-Doppler processor for stripmap data.
#include <algorithm>
#include <cstdio>
#include <string>

#include "../common/command_line.h"
#include "../common/session.h"
#include "focus.h"

namespace {

void print_profile(const example::Stopwatch& watch) {
    // Threads that work at the same time take more seconds together than pass.
    double total_s = 0.0, rest_s = watch.total();
    for (std::size_t work = 0; work < example::kWorks; ++work) total_s += watch.seconds(work);
    rest_s = std::max(0.0, rest_s - total_s);
    total_s += rest_s;
    const auto print = [=](const char* name, double seconds) {
        std::printf("  %-20s %8.3f s %6.1f %%\n", name, seconds, 100.0 * seconds / total_s);
    };
    for (std::size_t work = 0; work < example::kWorks; ++work)
        print(example::kWorkNames[work], watch.seconds(work));
    print("the rest", rest_s);
}

}  // namespace

int main(int argc, char** argv) {
    command_line::Program app{"Focuses stripmap data into a single-look complex image"};
    example::FocusJob job;
    std::string configuration;
    bool verbose = false;
    app.needs("raw", job.raw, "Raw raster; its product header is RAW.hdr");
    app.needs("image", job.image, "Image to make, with the header IMAGE.hdr");
    app.takes("--configuration", configuration, "File with AzimuthConf and generalProcessingConf");
    app.takes("--height", job.height_m, "Mean height of the scene above the ellipsoid, m");
    app.threads(job.threads);
    app.flag("--waitbar", job.waitbar, "Tell the progress as commands of a waitbar, on standard error");
    app.flag("--verbose", verbose, "Print what the time went into");
    if (const auto status = app.parse(argc, argv)) return *status;

    AzimuthConf azimuth;
    generalProcessingConf processing;
    const std::string report = job.image + ".report.txt", log = job.image + ".log.txt";
    const example::Files files{{job.raw, job.raw + ".hdr", configuration},
                               {job.image, job.image + ".hdr", example::compressed_raster(job)}};
    return example::run_program("Processor", files, report, log, processing.ReportLevel, [&] {
        if (!configuration.empty()) {
            azimuth.readpar(configuration.c_str(), 1);
            processing.readpar(configuration.c_str(), 1);
        }
        const example::FocusResult result = example::focus(job, azimuth, processing);
        std::printf("%s: %d lines of %d samples, focused in blocks of %d by %d\n", job.image.c_str(), result.lines,
                    result.samples, result.block_lines, result.block_samples);
        if (verbose || processing.Verbose != 0) print_profile(result.stopwatch);
        quo_add_log(("focused " + job.raw + " into " + job.image).c_str());
    });
}
