// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_FFT_KERNELS_H
#define QUO_FFT_KERNELS_H

#include <cstddef>

/* Transforms whose lengths have no prime factor above 7, several side by side in the lanes of a vector, so that
 * butterflies need no shuffles. One step of a transform stands in a slot: so many complex values as there are
 * lanes, either interleaved as in an image, or split into real parts and imaginary parts. Addresses and steps
 * count floats, of which a slot has twice as many as there are lanes.
 *
 * Kernels neither allocate nor keep anything: plans and room are the caller's. */

namespace quo {

struct FftRoot {
    float re, im;
};

/** One pass over a transform: butterflies of `radix` values, `stride * count` apart. */
struct FftPass {
    int radix, count, stride;
    const FftRoot* roots;  ///< radix - 1 for each of `count`: what the results are turned by; unused for one
};

/** A transform as passes between two buffers, each pass leaving the results that belong together side by side. */
struct ShortFft {
    static constexpr int kMostPasses = 16;
    int length = 1;
    int passes = 0;
    FftPass pass[kMostPasses] = {};
    bool backward = false;
};

/** A transform down the lanes, in one step, or in two of about the square root of its length each: step 1 over
 * samples `second.length` apart, turned by `outer` (first.length for each sample of `second`), step 2 over
 * neighbours. */
struct LaneFft {
    ShortFft first, second;  ///< the second has no passes where one step is enough
    const FftRoot* outer = nullptr;
    std::ptrdiff_t pitch = 0;                      ///< slots from one transform of step 2 to the next
    std::ptrdiff_t tile = 0, stage = 0, work = 0;  ///< floats of room

    [[nodiscard]] bool two_steps() const { return second.passes > 0; }
};

/** A transform along a row: its lanes are neighbours in step 1, results that are neighbours in step 2. */
struct RowFft {
    ShortFft first, second;
    const float* turns = nullptr;  ///< of step 1, a slot for each result of each pack of lanes
    std::ptrdiff_t pitch = 0;      ///< floats from one result of step 1 to the next
    std::ptrdiff_t tile = 0;       ///< floats
};

/** Columns of images: from one sample to the next, and how many columns. */
struct FftColumns {
    const float* in;
    float* out;
    std::ptrdiff_t step;
    int count;
};

/** Rows of images: from one row to the next, and how many rows. */
struct FftRows {
    const float* in;
    float* out;
    std::ptrdiff_t distance;
    int count;
};

/** The kernels for one width of vector. */
struct FftKernels {
    int width;  ///< lanes
    void (*columns)(const LaneFft& fft, const FftColumns& columns, float* room) noexcept;
    void (*rows)(const RowFft& fft, const FftRows& rows, float* room) noexcept;
    /** Short rows, as many at a time as there are lanes. Null where fewer lanes are as fast. */
    void (*short_rows)(const LaneFft& fft, const FftRows& rows, float* room) noexcept;
};

/** Packs of lanes that columns are moved in together. */
inline constexpr int kStripPacks = 2;

/** The kernels for so many lanes: 4, 8 or 16; null where they were not built or this processor does not run them.
 */
const FftKernels* fft_kernels(int lanes) noexcept;

}  // namespace quo

#endif
