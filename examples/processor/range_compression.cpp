#include "range_compression.h"

#include <algorithm>
#include <cmath>
#include <complex>

#include "filters.h"

namespace example {
namespace {

std::vector<fcomplex> replica_of(const SARPulse_Obj& pulse, int samples) {
    std::vector<fcomplex> replica(static_cast<std::size_t>(pulse.chirpSamples()));
    if (replica.empty() || replica.size() > static_cast<std::size_t>(samples))
        throw Failure{"the header's pulse is no pulse, or longer than a line"};
    require(pulse.generateChirp(replica.data()), "the replica");
    return replica;
}

/** Transforms of a line's own length do: what wraps around ends up in the samples that are cut off. */
int transform_length(int samples) { return genpow(samples, 1); }

}  // namespace

RangeCompression::RangeCompression(const SARPulse_Obj& pulse, const AzimuthConf& conf, int samples,
                                   int lines_in_block)
    : samples_{samples - pulse.chirpSamples() + 1},
      delay_s_{0.5 * (pulse.chirpSamples() - 1) / pulse.PulseSamplingRate},
      block_{lines_in_block, transform_length(samples)},
      filter_{1, transform_length(samples)},
      forward_{block_.lines(), block_.samples(), +1, 0},
      inverse_{block_.lines(), block_.samples(), -2, 0} {
    prepare_filter(replica_of(pulse, samples), pulse, conf);
}

/** The conjugate spectrum of the replica, with the band's weights and all factors: that of the inverse transform,
 * and the gains of correlation and weights. */
void RangeCompression::prepare_filter(const std::vector<fcomplex>& replica, const SARPulse_Obj& pulse,
                                      const AzimuthConf& conf) {
    const int length = filter_.samples();
    std::copy(replica.begin(), replica.end(), filter_.data());
    Transform{1, length, +1, 0}.run(filter_);

    const double band_hz =
        conf.RangeLookBandwidth > 0.0F ? static_cast<double>(conf.RangeLookBandwidth) : pulse.PulseSamplingRate;
    double gain = 0.0, energy = 0.0, weighted = 0.0;
    for (const fcomplex sample : replica) gain += static_cast<double>(std::abs(sample));
    std::vector<double> weights(static_cast<std::size_t>(length));
    for (int k = 0; k < length; ++k) {
        const double frequency_hz = (2 * k < length ? k : k - length) * pulse.PulseSamplingRate / length;
        double& weight = weights[static_cast<std::size_t>(k)];
        weight = conf.RangeLookBandwidth > 0.0F || conf.RangeWindowHammingParameter > 0.0F
                     ? band_weight(frequency_hz, std::min(band_hz, std::abs(pulse.Bandwidth)),
                                   static_cast<double>(conf.RangeWindowHammingParameter))
                     : 1.0;
        energy += static_cast<double>(std::norm(filter_.data()[k]));
        weighted += weight * static_cast<double>(std::norm(filter_.data()[k]));
    }
    const double scale = energy / (weighted * gain * length);
    for (int k = 0; k < length; ++k)
        filter_.data()[k] =
            std::conj(filter_.data()[k]) * static_cast<float>(scale * weights[static_cast<std::size_t>(k)]);
}

void RangeCompression::filter() {
    const auto* by = reinterpret_cast<const float*>(filter_.data());
    for (int line = 0; line < block_.lines(); ++line) {
        auto* parts = reinterpret_cast<float*>(block_.line(line));
        for (int k = 0; k < 2 * block_.samples(); k += 2) {
            const float real = parts[k] * by[k] - parts[k + 1] * by[k + 1];
            parts[k + 1] = parts[k] * by[k + 1] + parts[k + 1] * by[k];
            parts[k] = real;
        }
    }
}

}  // namespace example
