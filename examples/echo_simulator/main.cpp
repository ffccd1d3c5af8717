// Makes raw radar data of point targets as a sensor in a real orbit would record it.
#include <CLI/CLI.hpp>
#include <cstdio>
#include <map>
#include <string>

#include "../common/session.h"
#include "echoes.h"

namespace {

void add_options(CLI::App& app, example::EchoJob& job, std::string& targets) {
    app.add_option("scene", job.scene, "Product header with the orbit and the sampling")->required();
    app.add_option("targets", targets, "Table of targets: name,latitude_deg,longitude_deg,height_m,strength")
        ->required();
    app.add_option("raster", job.raster, "Raw raster to make")->required();
    app.add_option("--look", job.look_sign, "Look side, instead of the scene's")
        ->transform(CLI::Transformer(std::map<std::string, int>{{"right", 1}, {"left", -1}}));
    app.add_option("--prf", job.prf_hz, "Pulse repetition frequency, Hz, instead of the scene's");
    app.add_option("--sampling", job.sampling_hz, "Range sampling rate, Hz, instead of the scene's");
    app.add_option("--bandwidth", job.bandwidth_hz, "Bandwidth of the pulse, Hz");
    app.add_option("--beam", job.beam_bandwidth_hz, "Doppler bandwidth of the beam, Hz");
    app.add_option("--pulse", job.pulse_s, "Length of the pulse, s");
    app.add_option("--doppler", job.doppler_hz, "Doppler centroid at the nearest target, Hz");
    app.add_option("--doppler-slope", job.doppler_slope_hz_s, "Its change with range time, Hz/s");
    app.add_option("--noise", job.noise, "Standard deviation of the noise, in each part");
    app.add_option("--seed", job.seed, "Seed of the noise");
    app.add_option("--type", job.cell_type, "Cell type of the raster")
        ->transform(
            CLI::Transformer(std::map<std::string, int>{{"short", SHORT_COMPLEX}, {"float", FLOAT_COMPLEX}}));
    app.add_flag("--big-endian", job.big_endian, "Write the most significant byte first");
    app.add_option("--prefix", job.line_prefix, "Bytes before each line");
}

}  // namespace

int main(int argc, char** argv) {
    CLI::App app{"Makes raw radar data of point targets as a sensor in a real orbit would record it"};
    example::EchoJob job;
    std::string targets;
    add_options(app, job, targets);
    CLI11_PARSE(app, argc, argv);
    const example::Files files{{job.scene, targets}, {job.raster, job.raster + ".hdr"}};
    return example::run_program("Echo simulator", files, job.raster + ".report.txt", "", 1, [&] {
        job.targets = example::read_targets(targets);
        const example::EchoRaster raster = example::simulate_echoes(job);
        std::printf("%s: echoes of %zu targets in %d lines of %d samples\n", job.raster.c_str(),
                    job.targets.size(), raster.lines, raster.samples);
    });
}
