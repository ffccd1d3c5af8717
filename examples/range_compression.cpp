// SPDX-License-Identifier: Apache-2.0

// Compresses the echo of a point target and compares the result with theory.
#include <algorithm>
#include <cmath>
#include <cstdio>
#include <numbers>
#include <vector>

#include "quo_base/acquisition.h"
#include "quo_base/fft.h"

using Line = std::vector<fcomplex>;
constexpr int kSamples = 8192;         // of a range line
constexpr double kDelay = 2345.37;     // of the echo, in samples
constexpr int kFine = 100;             // places looked at from one sample to the next
constexpr int kZoom = 16 * kFine + 1;  // 8 samples to either side of the peak

bool transform(Line& line, int direction) {
    return fft_c(kSamples, kSamples, 1, 1, direction, 0, line.data(), line.data()) == 0;
}

std::vector<double> magnitudes(const Line& line) {
    std::vector<double> all(line.size());
    std::transform(line.begin(), line.end(), all.begin(), [](fcomplex value) { return std::abs(value); });
    return all;
}
int largest(const std::vector<double>& values) {
    return static_cast<int>(std::max_element(values.begin(), values.end()) - values.begin());
}

// Where the magnitude, from place to place in one direction, falls to `level` for the first time.
double crossing(const std::vector<double>& magnitude, int from, int step, double level) {
    int k = from;
    while (magnitude[k + step] > level) k += step;
    return k + step * (magnitude[k] - level) / (magnitude[k] - magnitude[k + step]);
}

int main() {
    SARPulse_Obj pulse;
    pulse.PulseLength = 37.1e-6;
    pulse.Bandwidth = 56.5e6;
    pulse.PulseSamplingRate = 64.3e6;
    Line chirp(kSamples), echo;
    if (pulse.generateChirp(chirp.data()) != 0 || !transform(chirp, +1)) return 1;

    // The echo is the chirp, late by a part of a sample as well: a ramp over the frequencies.
    echo = chirp;
    for (int k = 0; k < kSamples; ++k) {
        const int frequency = k < kSamples / 2 ? k : k - kSamples;
        echo[k] *= fcomplex(std::polar(1.0, -2.0 * std::numbers::pi * frequency * kDelay / kSamples));
    }
    if (!transform(echo, -1)) return 1;  // what the receiver records

    // The matched filter: the compressed echo, and its sample with the highest peak.
    if (!transform(echo, +1)) return 1;
    for (int k = 0; k < kSamples; ++k) echo[k] *= std::conj(chirp[k]);
    Line spectrum = echo;
    if (!transform(echo, -1)) return 1;
    const double start = largest(magnitudes(echo)) - 8.0;

    // Around the peak at a fine step: the chirp-z transform of the spectrum, from the lowest frequency up.
    fftshift(spectrum.data(), kSamples, 1);
    const double step = 2.0 * std::numbers::pi / kSamples;
    Line zoomed(kZoom);
    if (czt_c(spectrum.data(), kSamples, zoomed.data(), kZoom, step / kFine, -step * start, 1) != 0) return 1;

    const std::vector<double> magnitude = magnitudes(zoomed);
    const int top = largest(magnitude);
    const double half_power = magnitude[top] / std::numbers::sqrt2;
    const double width = crossing(magnitude, top, 1, half_power) - crossing(magnitude, top, -1, half_power);
    int valley = top;  // where the main lobe ends
    while (magnitude[valley + 1] < magnitude[valley]) ++valley;
    const double side_lobe = *std::max_element(magnitude.begin() + valley, magnitude.end());
    std::printf("                          measured   theory\n");
    std::printf("peak position, samples    %8.2f %8.2f\n", start + top / double{kFine}, kDelay);
    std::printf("resolution (-3 dB), ns    %8.2f %8.2f\n", width / kFine / pulse.PulseSamplingRate * 1e9,
                0.8859 / pulse.Bandwidth * 1e9);
    std::printf("peak to side lobe, dB     %8.2f %8.2f\n", 20.0 * std::log10(side_lobe / magnitude[top]), -13.26);
}
