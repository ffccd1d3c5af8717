// SPDX-License-Identifier: Apache-2.0
#include "echoes.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstring>
#include <limits>
#include <numbers>
#include <random>

#include "../common/session.h"
#include "quo_base/generalSAR.h"

namespace example {
namespace {

constexpr double kPi = std::numbers::pi;
constexpr double kImageMargin = 100.0;  // lines and samples that the image shows around the targets
constexpr int kLinesInBlock = 256;

/** A target as the sensor sees it. */
struct Sight {
    quo::Vec3 position;
    double strength;
    double doppler_hz;             // at the centre of the beam
    double first_s, last_s;        // times at which the target enters and leaves the beam
    double nearest_s, farthest_s;  // range times in between, and at zero Doppler
};

double given_or(double given, double otherwise) { return given > 0.0 ? given : otherwise; }

/** Reads what an orbit needs. A scene has no raster, so that GSread() would report a side file without its
 * section.
 */
void read_scene(const std::string& scene, GeneralSAR& product) {
    for (GeneralSAR_Base* part : std::initializer_list<GeneralSAR_Base*>{
             &product.samplingConstants, &product.dataSetInfo, &product.stateVectors, &product.orbit})
        require(part->readhdr(scene.c_str()), scene + ": cannot be read");
    require(product.orbit.setLambda(product.samplingConstants.lambda_m), scene + ": no wavelength");
}

void set_sampling(const EchoJob& job, GeneralSAR& product) {
    SamplingConstants_Obj& sampling = product.samplingConstants;
    sampling.prf_hz = given_or(job.prf_hz, sampling.prf_hz);
    sampling.frg_hz = given_or(job.sampling_hz, sampling.frg_hz);
    if (!(sampling.prf_hz > 0.0 && sampling.frg_hz > 0.0))
        throw Failure{job.scene + ": PRF or range sampling rate is missing"};
    sampling.Brg_hz = given_or(job.bandwidth_hz, given_or(sampling.Brg_hz, 0.85 * sampling.frg_hz));
    sampling.Baz_hz = given_or(job.beam_bandwidth_hz, given_or(sampling.Baz_hz, 0.8 * sampling.prf_hz));
    sampling.pri_s = 1.0 / sampling.prf_hz;
    sampling.Trg_s = 1.0 / sampling.frg_hz;
    sampling.fc_hz = quo::kLightSpeed / sampling.lambda_m;
    product.pulse.PulseLength = job.pulse_s;
    product.pulse.Bandwidth = sampling.Brg_hz;
    product.pulse.PulseKRate = sampling.Brg_hz / job.pulse_s;
    product.pulse.PulseSamplingRate = sampling.frg_hz;
}

Sight see(const Target& target, const polyDC* centroid, double beam_hz, GeneralSAROrbit& orbit) {
    Sight sight{quo::from_geodetic(target.place), target.strength, 0.0, 0.0, 0.0, 0.0, 0.0};
    double xyz[3];
    quo::store(sight.position, xyz);
    double zero_doppler_s = 0.0, tau_s = 0.0;
    require(orbit.earth2sat(xyz, &zero_doppler_s, &tau_s), target.name + " is not seen");
    if (centroid != nullptr) centroid->EvaluatePoly(tau_s, zero_doppler_s, &sight.doppler_hz);
    sight.nearest_s = sight.farthest_s = tau_s;
    const auto edge = [&](double doppler_hz, double& azimuth_s) {
        require(orbit.earth2sat(xyz, &azimuth_s, &tau_s, doppler_hz),
                target.name + " is not seen with a Doppler of " + std::to_string(doppler_hz) + " Hz");
        sight.farthest_s = std::max(sight.farthest_s, tau_s);
    };
    edge(sight.doppler_hz + 0.5 * beam_hz, sight.first_s);
    edge(sight.doppler_hz - 0.5 * beam_hz, sight.last_s);
    return sight;
}

/** The targets as they are seen, with the Doppler centroid in place in the product. */
std::vector<Sight> see_all(const EchoJob& job, GeneralSAR& product) {
    std::vector<double> ranges_s;
    for (const Target& target : job.targets)
        ranges_s.push_back(see(target, nullptr, 0.0, product.orbit).nearest_s);

    require(product.polynomials.CreatePolys(1, 0), "the Doppler polynomial");
    polyDC& centroid = product.polynomials.DC[0];
    centroid.trg0 = *std::min_element(ranges_s.begin(), ranges_s.end());
    centroid.taz0 = product.orbit.t0SV_s;
    centroid.pol[0] = job.doppler_hz;
    centroid.pol[1] = job.doppler_slope_hz_s;

    std::vector<Sight> sights;
    for (const Target& target : job.targets)
        sights.push_back(see(target, &centroid, product.samplingConstants.Baz_hz, product.orbit));
    return sights;
}

/** The smallest region that holds all echoes, and the margins. */
void set_region(const std::vector<Sight>& sights, const EchoJob& job, GeneralSAR& product) {
    constexpr double kFar = std::numeric_limits<double>::infinity();
    double first_s = kFar, last_s = -kFar, near_s = kFar, far_s = -kFar;
    for (const Sight& sight : sights) {
        first_s = std::min(first_s, sight.first_s);
        last_s = std::max(last_s, sight.last_s);
        near_s = std::min(near_s, sight.nearest_s);
        far_s = std::max(far_s, sight.farthest_s);
    }
    const double line_s = product.samplingConstants.pri_s, sample_s = product.samplingConstants.Trg_s;
    first_s -= kImageMargin * line_s;
    near_s -= kImageMargin * sample_s + 0.5 * job.pulse_s;
    far_s += kImageMargin * sample_s + 0.5 * job.pulse_s;
    const double lines = std::ceil((last_s - first_s) / line_s + kImageMargin);
    const double samples = std::ceil((far_s - near_s) / sample_s);
    if (!(lines * samples < 4e9)) throw Failure{"the targets lie too far apart for one raster"};
    product.roi.Roi.SetSlowAxe(first_s, line_s, static_cast<int>(lines));
    product.roi.Roi.SetFastAxe(near_s, sample_s, static_cast<int>(samples));
}

void set_data_set(GeneralSAR& product, int look_sign) {
    DataSetInfo_Obj& info = product.dataSetInfo;
    if (look_sign != 0) info.LookDirection = look_sign;
    product.orbit.setLookSign(info.LookDirection);
    info.SetImageType(DataSetInfo_Obj::dsRawData);
    info.SetAcqMode(DataSetInfo_Obj::dsStripmap);
    info.SetProjection(DataSetInfo_Obj::dsSlantRange);
    info.SetUnitType(DataSetInfo_Obj::dsVoltComplex);
}

void set_raster(const EchoJob& job, GeneralSAR& product) {
    BufferFile& raster = product.bufferFile;
    raster.setFilename(job.raster.c_str());
    raster.setLines(product.roi.Roi.Lines);
    raster.setSamples(product.roi.Roi.Samples);
    raster.setRowPrefix(job.line_prefix);
    raster.setType(job.cell_type);
    raster.HeaderOffset = 0;
    raster.ByteOrder = job.big_endian ? 1 : 0;
}

/** Writes the product's header with nothing but what describes raw data. */
void write_header(const EchoJob& job, GeneralSAR& product) {
    constexpr GSObject kDescribed[] = {gsBufferFile,   gsDataSetInfo, gsPulse, gsOrbit,
                                       gsStateVectors, gsPolySAR,     gsRoi,   gsSamplingConstants};
    for (int object = 0; object < GeneralSAR::kObjects; ++object) product.GSdisable(static_cast<GSObject>(object));
    for (const GSObject object : kDescribed) product.GSenable(object);
    write_product(product, job.raster + ".hdr");
}

/** Adds the pulse, delayed by `delay` samples, to a line. */
void add_echo(fcomplex* line, int samples, double delay, double strength, double phase,
              const SARPulse_Obj& pulse) {
    const double rate = kPi * pulse.Bandwidth / pulse.PulseLength;  // rad/s^2
    const double half = 0.5 * pulse.PulseLength * pulse.PulseSamplingRate;
    const int first = std::max(0, static_cast<int>(std::ceil(delay - half)));
    const int last = std::min(samples - 1, static_cast<int>(std::floor(delay + half)));
    for (int sample = first; sample <= last; ++sample) {
        const double time_s = (sample - delay) / pulse.PulseSamplingRate;
        line[sample] += fcomplex{std::polar(strength, rate * time_s * time_s + phase)};
    }
}

/** Fills one line with the echoes that arrive in it. */
void fill_line(fcomplex* line, double azimuth_s, const std::vector<Sight>& sights, GeneralSAR& product) {
    double platform[3], velocity[3];
    require(product.orbit.SVGetPos(azimuth_s, platform), "the orbit's position");
    require(product.orbit.SVGetVel(azimuth_s, velocity), "the orbit's velocity");
    const SamplingConstants_Obj& sampling = product.samplingConstants;
    for (const Sight& sight : sights) {
        const quo::Vec3 sightline = sight.position - quo::load(platform);
        const double range_m = norm(sightline);
        const double doppler_hz = 2.0 / sampling.lambda_m * dot(quo::load(velocity), sightline) / range_m;
        if (std::abs(doppler_hz - sight.doppler_hz) > 0.5 * sampling.Baz_hz) continue;
        const double delay = (2.0 * range_m / quo::kLightSpeed - product.roi.Roi.FastStartTime) * sampling.frg_hz;
        add_echo(line, product.roi.Roi.Samples, delay, sight.strength, -4.0 * kPi * range_m / sampling.lambda_m,
                 product.pulse);
    }
}

/** Noise of the receiver, the same for the same seed. */
class Noise {
public:
    Noise(double deviation, std::uint64_t seed) : deviation_{deviation}, generator_{seed} {}
    void add(std::vector<fcomplex>& block) {
        if (deviation_ <= 0.0) return;
        for (fcomplex& sample : block) {
            const double real = deviation_ * normal_(generator_), imaginary = deviation_ * normal_(generator_);
            sample += fcomplex{static_cast<float>(real), static_cast<float>(imaginary)};
        }
    }

private:
    double deviation_;
    std::mt19937_64 generator_;
    std::normal_distribution<double> normal_;
};

/** Line prefixes that hold the lines' numbers, little-endian. */
std::vector<char> number_lines(int first_line, int lines, int bytes) {
    std::vector<char> prefixes(static_cast<std::size_t>(lines) * static_cast<std::size_t>(bytes));
    for (int line = 0; line < lines; ++line) {
        const std::int32_t number = first_line + line;
        std::memcpy(prefixes.data() + static_cast<std::size_t>(line) * static_cast<std::size_t>(bytes), &number,
                    std::min(sizeof number, static_cast<std::size_t>(bytes)));
    }
    return prefixes;
}

void write_raster(const EchoJob& job, const std::vector<Sight>& sights, GeneralSAR& product) {
    BufferFile& raster = product.bufferFile;
    const auto samples = static_cast<std::size_t>(product.roi.Roi.Samples);
    Noise noise{job.noise, job.seed};
    raster.open(BufferFile::WRITE);
    if (!raster.is_open()) throw Failure{job.raster + ": cannot be written"};
    for (int first = 0; first < product.roi.Roi.Lines; first += kLinesInBlock) {
        const int lines = std::min(kLinesInBlock, product.roi.Roi.Lines - first);
        std::vector<fcomplex> block(static_cast<std::size_t>(lines) * samples);
        for (int line = 0; line < lines; ++line)
            fill_line(block.data() + static_cast<std::size_t>(line) * samples,
                      product.roi.Roi.SlowStartTime + (first + line) * product.roi.Roi.SlowTimeDelta, sights,
                      product);
        noise.add(block);
        if (job.line_prefix > 0)
            raster.writeprefix(number_lines(first, lines, job.line_prefix).data(), first, lines);
        raster.writebuffer(block.data(), first, lines, 0, 0);
    }
    raster.close();
}

}  // namespace

EchoRaster simulate_echoes(const EchoJob& job) {
    if (job.targets.empty()) throw Failure{"no targets"};
    GeneralSAR product;
    read_scene(job.scene, product);
    set_data_set(product, job.look_sign);
    set_sampling(job, product);
    const std::vector<Sight> sights = see_all(job, product);
    set_region(sights, job, product);
    set_raster(job, product);
    write_header(job, product);
    write_raster(job, sights, product);
    return {product.roi.Roi.Lines, product.roi.Roi.Samples};
}

}  // namespace example
