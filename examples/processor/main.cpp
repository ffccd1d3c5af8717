// A small range-Doppler processor for stripmap data.
#include <CLI/CLI.hpp>
#include <cstdio>
#include <string>

#include "../common/session.h"
#include "focus.h"

namespace {

void print_profile(const example::FocusResult& result) {
    using example::Work;
    const example::Stopwatch& watch = result.stopwatch;
    struct Row {
        const char* name;
        Work work;
    };
    constexpr Row kRows[] = {{"planning transforms", Work::kPlanning},
                             {"reading", Work::kReading},
                             {"writing", Work::kWriting},
                             {"transforms", Work::kTransforms},
                             {"filters", Work::kFilters}};
    const double total_s = watch.total();
    double rest_s = total_s;
    for (const Row& row : kRows) {
        rest_s -= watch.seconds(row.work);
        std::printf("  %-20s %8.3f s %6.1f %%\n", row.name, watch.seconds(row.work),
                    100.0 * watch.seconds(row.work) / total_s);
    }
    std::printf("  %-20s %8.3f s %6.1f %%\n", "the rest", rest_s, 100.0 * rest_s / total_s);
}

void run(const example::FocusJob& job, const AzimuthConf& azimuth, const generalProcessingConf& processing) {
    const example::FocusResult result = example::focus(job, azimuth, processing);
    std::printf("%s: %d lines of %d samples, focused in blocks of %d by %d\n", job.image.c_str(), result.lines,
                result.samples, result.block_lines, result.block_samples);
    if (processing.Verbose != 0) print_profile(result);
}

}  // namespace

int main(int argc, char** argv) {
    CLI::App app{"Focuses stripmap data into a single-look complex image"};
    example::FocusJob job;
    std::string configuration;
    bool verbose = false;
    app.add_option("raw", job.raw, "Raw raster; its product header is RAW.hdr")->required();
    app.add_option("image", job.image, "Image to make, with the header IMAGE.hdr")->required();
    app.add_option("--configuration", configuration, "File with AzimuthConf and generalProcessingConf");
    app.add_option("--height", job.height_m, "Mean height of the scene above the ellipsoid, m");
    app.add_flag("--waitbar", job.waitbar, "Tell the progress as commands of a waitbar, on standard error");
    app.add_flag("--verbose", verbose, "Print what the time went into");
    CLI11_PARSE(app, argc, argv);

    AzimuthConf azimuth;
    generalProcessingConf processing;
    const std::string report = job.image + ".report.txt", log = job.image + ".log.txt";
    const std::string compressed = example::compressed_raster(job);
    const example::Files files{{job.raw, job.raw + ".hdr", configuration},
                               {job.image, job.image + ".hdr", compressed}};
    return example::run_program("Processor", files, report, log, processing.ReportLevel, [&] {
        if (!configuration.empty()) {
            azimuth.readpar(configuration.c_str(), 1);
            processing.readpar(configuration.c_str(), 1);
        }
        if (verbose) processing.Verbose = 1;
        run(job, azimuth, processing);
        quo_add_log(("focused " + job.raw + " into " + job.image).c_str());
    });
}
