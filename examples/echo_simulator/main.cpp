// SPDX-License-Identifier: Apache-2.0

// Makes raw radar data of point targets as a sensor in a real orbit would record it.
#include <cstdio>
#include <string>

#include "../common/command_line.h"
#include "../common/session.h"
#include "echoes.h"

namespace {

void add_options(command_line::Program& app, example::EchoJob& job, std::string& targets) {
    app.needs("scene", job.scene, "Product header with the orbit and the sampling");
    app.needs("targets", targets, "Table of targets: name,latitude_deg,longitude_deg,height_m,strength");
    app.needs("raster", job.raster, "Raw raster to make");
    app.takes("--look", job.look_sign, "Look side, instead of the scene's",
              {.words = {{"right", 1}, {"left", -1}}});
    app.takes("--prf", job.prf_hz, "Pulse repetition frequency, Hz, instead of the scene's");
    app.takes("--sampling", job.sampling_hz, "Range sampling rate, Hz, instead of the scene's");
    app.takes("--bandwidth", job.bandwidth_hz, "Bandwidth of the pulse, Hz");
    app.takes("--beam", job.beam_bandwidth_hz, "Doppler bandwidth of the beam, Hz");
    app.takes("--pulse", job.pulse_s, "Length of the pulse, s");
    app.takes("--doppler", job.doppler_hz, "Doppler centroid at the nearest target, Hz");
    app.takes("--doppler-slope", job.doppler_slope_hz_s, "Its change with range time, Hz/s");
    app.takes("--noise", job.noise, "Standard deviation of the noise, in each part");
    app.takes("--seed", job.seed, "Seed of the noise");
    app.takes("--type", job.cell_type, "Cell type of the raster",
              {.words = {{"short", SHORT_COMPLEX}, {"float", FLOAT_COMPLEX}}});
    app.flag("--big-endian", job.big_endian, "Write the most significant byte first");
    app.takes("--prefix", job.line_prefix, "Bytes before each line");
}

}  // namespace

int main(int argc, char** argv) {
    command_line::Program app{"Makes raw radar data of point targets as a sensor in a real orbit would record it"};
    example::EchoJob job;
    std::string targets;
    add_options(app, job, targets);
    if (const auto status = app.parse(argc, argv)) return *status;
    const example::Files files{{job.scene, targets}, {job.raster, job.raster + ".hdr"}};
    return example::run_program("Echo simulator", files, job.raster + ".report.txt", "", 1, [&] {
        job.targets = example::read_targets(targets);
        const example::EchoRaster raster = example::simulate_echoes(job);
        std::printf("%s: echoes of %zu targets in %d lines of %d samples\n", job.raster.c_str(),
                    job.targets.size(), raster.lines, raster.samples);
    });
}
