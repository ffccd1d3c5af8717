// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ARRAY_KERNELS_H
#define QUO_ARRAY_KERNELS_H

#include <cstdint>

#include "generalSAR/orbit_arrays/orbit_run.h"

/* Geolocation of many points at once, in blocks of fixed size. A kernel works on packs of neighbouring points,
 * whose lanes never mix, and every lane does what the single point's formulas do: a point's bits hang neither on
 * its neighbours nor on the width of the pack. Points that need more than Newton's method from the first guess are
 * left to the caller, who solves them one by one.
 *
 * Nothing here reports, allocates or keeps anything. */

namespace quo {

/** What the kernels know of an orbit: every point takes the run that an orbit takes for it that was just made,
 * whose run in use is `fresh`. */
struct OrbitView {
    const OrbitRun* runs;
    RunTimes times;
    RunInUse fresh;
    StraightFlight mean;  // from the first vector to the last
    double lambda_m, side;
};

/** Points of a block, a multiple of every pack's width. Inputs are filled up to that with any of the points. */
inline constexpr int kBlockPoints = 64;
using BlockNumbers = double[kBlockPoints];

/** What is known of a ground point: the rows of a block's results. */
enum GroundValue : std::uint8_t { kX, kY, kZ, kLatitude, kLongitude, kHeight, kIncidence, kLook, kFmRate, kSpeed };
inline constexpr int kGroundValues = 10;

/** Image samples and what they show. x, y, z are always made, the others where they are wanted. */
struct ForwardBlock {
    alignas(64) BlockNumbers t_s, range_s, doppler_hz, height_m;
    alignas(64) BlockNumbers result[kGroundValues];
    alignas(64) std::int64_t solved[kBlockPoints];  // not 0 where the results stand
    bool with_heights;                              // or else height_m is not looked at, and the heights are 0
    bool want_place, want_angles, want_rate, want_speed;
};

/** Ground points and when they are seen. */
struct InverseBlock {
    alignas(64) BlockNumbers x_m, y_m, z_m, doppler_hz;
    alignas(64) BlockNumbers t_s, range_s;
    alignas(64) std::int64_t solved[kBlockPoints];
};

/** The kernels for one width of pack. `count` is the number of points, at most kBlockPoints. True where all of
 * them are solved. */
struct ArrayKernels {
    int width;
    bool (*forward)(const OrbitView& orbit, int count, ForwardBlock& block) noexcept;
    bool (*inverse)(const OrbitView& orbit, int count, InverseBlock& block) noexcept;
};

/** The widest kernels for at most so many lanes that were built and that the processor's level has. */
const ArrayKernels& array_kernels(int widest = 8) noexcept;

}  // namespace quo

#endif
