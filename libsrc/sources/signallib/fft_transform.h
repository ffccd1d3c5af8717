// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_FFT_TRANSFORM_H
#define QUO_FFT_TRANSFORM_H

#include <cstddef>
#include <memory>

#include "signallib/fft_engine.h"

namespace quo {

/** What every float of a result is multiplied by, one after the other, each product rounded. */
struct FftFactors {
    float first = 1.0F, second = 1.0F;
};

/** A batch cut into blocks for the cache, made ready by an engine: rows a few at a time, columns in groups or
 * through a tile. Results are multiplied while they are still in the cache. Any number of threads may run it at a
 * time, on different data. */
class FftTransform {
public:
    FftTransform(const FftTransform&) = delete;
    FftTransform& operator=(const FftTransform&) = delete;
    virtual ~FftTransform() = default;

    /** Runs the transforms [first, first + count) of the batch; `in` and `out` belong to transform 0. `first` is a
     * multiple of block(); so is `count`, unless it reaches the last transform. False when the engine failed. */
    virtual bool run(const float* in, float* out, int first, int count, FftFactors factors) noexcept = 0;
    bool run_all(const float* in, float* out, FftFactors factors) noexcept {
        return run(in, out, 0, geometry_.count, factors);
    }

    [[nodiscard]] const FftGeometry& geometry() const noexcept { return geometry_; }
    /** Transforms that are run together. */
    [[nodiscard]] int block() const noexcept { return block_; }
    /** Memory that it holds on to, bytes. */
    [[nodiscard]] virtual std::size_t held_bytes() const noexcept = 0;

protected:
    FftTransform(const FftGeometry& geometry, int block) noexcept : geometry_{geometry}, block_{block} {}

    FftGeometry geometry_;
    int block_;
};

/** Null when the engine refuses or memory is short. */
[[nodiscard]] std::unique_ptr<FftTransform> make_fft_transform(FftEngine& engine, const FftGeometry& geometry);

/** Multiplies `rows` rows of `floats` floats, `pitch` floats apart. */
void multiply_rows(float* data, std::ptrdiff_t rows, std::ptrdiff_t floats, std::ptrdiff_t pitch,
                   FftFactors factors) noexcept;

/** The same for `count` transforms of a batch. */
void multiply_batch(const FftGeometry& batch, float* data, int count, FftFactors factors) noexcept;

/** Real transforms by an engine that does complex ones only. */
[[nodiscard]] std::unique_ptr<FftTransform> make_packed_real(FftEngine& engine, const FftGeometry& geometry);

}  // namespace quo

#endif
