// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_FFT_KERNELS_H
#define QUO_FFT_KERNELS_H

#include <cstddef>
#include <cstdint>

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

/** A transform in one step, or in two of about the square root of its length each: step 1 over samples
 * `second.length` apart, whose results are turned, step 2 over neighbours. Along a row the lanes are neighbours in
 * step 1, results that are neighbours in step 2. */
struct FftSteps {
    ShortFft first, second;                        ///< the second has no passes where one step is enough
    const FftRoot* outer = nullptr;                ///< of columns: first.length for each sample of `second`
    const float* turns = nullptr;                  ///< of rows: a slot for each result of each pack of lanes
    std::ptrdiff_t pitch = 0;                      ///< of columns: slots from one transform of step 2 to the next
    std::ptrdiff_t tile = 0, stage = 0, work = 0;  ///< floats of room

    [[nodiscard]] bool two() const { return second.passes > 0; }
    [[nodiscard]] std::ptrdiff_t room() const { return tile + stage + work; }
};

/** An image: floats from row to row, and how many rows or columns are transformed. */
struct FftImage {
    const float* in;
    float* out;
    std::ptrdiff_t step;
    int count;
};

/** Columns; long rows; short rows, one a lane. */
enum class FftWay : std::uint8_t { Columns, Rows, ShortRows };

/** The kernels for one width of vector. That for short rows is null where fewer lanes are as fast. */
struct FftKernels {
    using Kernel = void (*)(const FftSteps& fft, const FftImage& image, float* room) noexcept;
    Kernel kernels[3];

    [[nodiscard]] Kernel of(FftWay way) const { return kernels[static_cast<std::size_t>(way)]; }
};

/** Packs of lanes that columns are moved in together. */
inline constexpr int kStripPacks = 2;

/** The kernels for so many lanes: 4, 8 or 16; null where they were not built or this processor does not run them.
 */
const FftKernels* fft_kernels(int lanes) noexcept;

}  // namespace quo

#endif
