// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_ECHOES_H
#define QUO_EXAMPLES_ECHOES_H

#include <cstdint>
#include <string>
#include <vector>

#include "../common/targets.h"
#include "quo_base/datafile.h"

namespace example {

/** What raw data is to be made, and how. What is 0 is taken from the scene's header; a header of a focused or
 * ground product does not tell everything, so the rest follows what stripmap sensors do: a bandwidth of 0.85 of
 * the range sampling rate, a beam that spans 0.8 of the PRF, a pulse of 10 us. */
struct EchoJob {
    std::string scene;            // product header: orbit, wavelength, sampling
    std::string raster;           // raw raster to make; its header is "<raster>.hdr"
    std::vector<Target> targets;  // at least one

    int look_sign = 0;                // 1 right, -1 left
    double prf_hz = 0.0;              // lines per second
    double sampling_hz = 0.0;         // range sampling rate
    double bandwidth_hz = 0.0;        // of the pulse, a rising chirp
    double beam_bandwidth_hz = 0.0;   // Doppler band that the antenna sees a target in
    double pulse_s = 10.0e-6;         // length of the pulse
    double doppler_hz = 0.0;          // Doppler centroid at the nearest target's range
    double doppler_slope_hz_s = 0.0;  // its change with range time

    double noise = 0.0;  // standard deviation of real and of imaginary part
    std::uint64_t seed = 1;
    int cell_type = FLOAT_COMPLEX;  // or SHORT_COMPLEX
    bool big_endian = false;
    int line_prefix = 0;  // bytes before each line
};

/** Size of the raster that was made. */
struct EchoRaster {
    int lines, samples;
};

/** Makes the raw data that a sensor in the scene's orbit would record of the targets, and its product header.
 *
 * Stop-and-go: the platform stands still while a pulse is under way. The line of azimuth time t holds, for every
 * target that the antenna sees then, the pulse delayed by 2 R(t) / c, with the phase -4 pi R(t) / lambda, where
 * R(t) is the distance of the platform on its orbit from the target. Nothing is approximated beyond that: the
 * chirp is evaluated at the exact delay, which lies between the samples. The antenna's beam is flat and ends
 * sharply, at half its bandwidth from the Doppler centroid. Every line begins with its number, in as many bytes as
 * the prefix has room for.
 *
 * The raster has room for the echoes of all targets and a margin around them that a focused image of each target
 * needs for its sidelobes. Throws Failure. */
EchoRaster simulate_echoes(const EchoJob& job);

}  // namespace example

#endif
