// SPDX-License-Identifier: Apache-2.0

// `quo convert` of a raster beside `cp` of the same file. Wall clock times of whole programs, the start of the
// process included; a new raster is on the disk when the tool comes back, and a copy where `sync` waited for it.
#include <chrono>
#include <cstdlib>
#include <filesystem>
#include <stdexcept>
#include <string>
#include <vector>

#include "quo_base/datafile.h"
#include "ratio_reporter.h"
#include "temporary_folder.h"

namespace {

using bench::folder;

constexpr int kLines = 4096, kSamples = 8192;

/** A raster of 256 MiB. */
const std::string& raster() {
    static const std::string made = [] {
        std::string name = folder().file("in.ras");
        BufferFile file{name.c_str()};
        file.NrOfLinesPerImage = kLines;
        file.NrOfPixelsPerLine = kSamples;
        file.CellType = FLOAT_COMPLEX;
        const std::vector<fcomplex> line(kSamples, fcomplex{1.25F, -17.3F});
        bool done = file.create() == QUO_OK;
        for (int i = 0; done && i < kLines; ++i) {
            file.writebuffer(line.data(), i, 1, 0, 0);
            done = file.status() == QUO_OK;
        }
        if (!done || file.commit() != QUO_OK) throw std::runtime_error("no raster");
        return name;
    }();
    return made;
}

/** Runs "command IN OUT rest". */
void timed(benchmark::State& state, const char* command, const char* rest) {
    const std::string out = folder().file("out.ras"), line = command + raster() + " " + out + rest;
    for (auto _ : state) {
        std::filesystem::remove(out);
        const auto start = std::chrono::steady_clock::now();
        if (std::system(line.c_str()) != 0) state.SkipWithError("the program failed");
        state.SetIterationTime(std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
    }
}
void job(const char* name, const char* command, const std::string& rest) {
    benchmark::RegisterBenchmark(name, [=](benchmark::State& state) { timed(state, command, rest.c_str()); })
        ->UseManualTime()
        ->Unit(benchmark::kMillisecond);
}

}  // namespace

int main(int argc, char** argv) {
    job("cp", "cp ", "");
    job("cp_sync", "cp ", " && sync " + folder().file("out.ras"));
    job("same", QUO_BENCH_TOOL " convert ", "");
    job("swapped", QUO_BENCH_TOOL " convert ", " --order m --threads 1");
    return bench::run(
        argc, argv,
        {{"convert, as it stands / cp", "same/manual_time", "cp/manual_time", 1.2},
         {"convert, as it stands / cp and sync", "same/manual_time", "cp_sync/manual_time", 1.2},
         {"convert, bytes swapped / cp and sync", "swapped/manual_time", "cp_sync/manual_time", 2.0}});
}
