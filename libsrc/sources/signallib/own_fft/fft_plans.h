// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_FFT_PLANS_H
#define QUO_FFT_PLANS_H

#include <compare>
#include <cstddef>
#include <vector>

#include "signallib/fft_engine.h"
#include "signallib/own_fft/fft_kernels.h"
#include "signallib/spare_floats.h"

namespace quo {

/** What tables are made for. */
struct FftKind {
    FftWay way = FftWay::Columns;
    int length = 2;
    bool forward = true;
    int lanes = 4;

    auto operator<=>(const FftKind&) const = default;  // NOLINT(modernize-use-nullptr): of the compiler's own 0
};

/** Whether a length has no prime factor above 7. */
[[nodiscard]] bool is_own_fft_length(int length) noexcept;

/** The way and the lanes that take the fewest operations; no more lanes than `widest`. Throws std::bad_alloc. */
[[nodiscard]] FftKind choose_fft(const FftGeometry& geometry, int widest = 16);

/** How a transform is taken apart, and the roots that it takes. They are computed in double precision and never
 * change, so that any number of plans and threads share them. */
class FftTables {
public:
    explicit FftTables(const FftKind& kind);
    FftTables(const FftTables&) = delete;
    FftTables& operator=(const FftTables&) = delete;

    /** Floats that a run works in. */
    [[nodiscard]] std::size_t room() const noexcept { return static_cast<std::size_t>(fft_.room()); }
    /** Bytes of the tables and of that room. */
    [[nodiscard]] std::size_t bytes() const noexcept;
    /** Transforms `count` rows or columns; `pitch` floats lie between rows of the image. */
    void run(const float* in, float* out, std::ptrdiff_t pitch, int count, float* room) const noexcept;

private:
    [[nodiscard]] const FftRoot* keep(std::vector<FftRoot> roots);
    [[nodiscard]] ShortFft take_apart(int length);
    void lay_out_rows();
    void lay_out_columns();

    FftKind kind_;
    const FftKernels* kernels_;
    std::vector<std::vector<FftRoot>> roots_;
    Floats turns_;            ///< in whole lines of the cache: half of all loads would cross them otherwise
    std::size_t turned_ = 0;  ///< floats of them
    FftSteps fft_;
};

/** Bytes that the tables and the room of one run take. */
[[nodiscard]] std::size_t fft_bytes(const FftKind& kind) noexcept;

}  // namespace quo

#endif
