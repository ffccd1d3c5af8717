// SPDX-License-Identifier: Apache-2.0
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
    std::fill(std::copy(replica.begin(), replica.end(), filter_.data()), filter_.data() + length, fcomplex{});
    Transform{1, length, +1, 0}.run(filter_);

    const auto hamming = static_cast<double>(conf.RangeWindowHammingParameter);
    const auto look_hz = static_cast<double>(conf.RangeLookBandwidth);
    const double band_hz = std::min(look_hz > 0.0 ? look_hz : pulse.PulseSamplingRate, std::abs(pulse.Bandwidth));
    const auto weight = [&](int k) {
        const double frequency_hz = (2 * k < length ? k : k - length) * pulse.PulseSamplingRate / length;
        return look_hz > 0.0 || hamming > 0.0 ? band_weight(frequency_hz, band_hz, hamming) : 1.0;
    };
    double gain = 0.0, energy = 0.0, weighted = 0.0;
    for (const fcomplex sample : replica) gain += static_cast<double>(std::abs(sample));
    for (int k = 0; k < length; ++k) {
        const auto power = static_cast<double>(std::norm(filter_.data()[k]));
        energy += power;
        weighted += weight(k) * power;
    }
    const double scale = energy / (weighted * gain * length);
    for (int k = 0; k < length; ++k)
        filter_.data()[k] = std::conj(filter_.data()[k]) * static_cast<float>(scale * weight(k));
}

void RangeCompression::filter() {
    for (int line = 0; line < block_.lines(); ++line)
        std::transform(block_.line(line), block_.line(line) + block_.samples(), filter_.data(), block_.line(line),
                       product<float>);
}

void RangeCompression::compress(Stopwatch& watch) {
    watch.time(kTransforms, [this] { forward_.run(block_); });
    watch.time(kFilters, [this] { filter(); });
    watch.time(kTransforms, [this] { inverse_.run(block_); });
}

}  // namespace example
