// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_FFT_ENGINE_H
#define QUO_FFT_ENGINE_H

#include <array>
#include <cstddef>
#include <memory>
#include <string_view>

namespace quo {

enum class FftDomain { Complex, Real };

/** A batch of one-dimensional single-precision transforms. Strides and distances count samples: pairs of floats of
 * complex data, floats of real data. They are the same for input and output. */
struct FftGeometry {
    FftDomain domain = FftDomain::Complex;
    int length = 1;               ///< samples of a transform
    int count = 1;                ///< transforms
    std::ptrdiff_t stride = 1;    ///< from one sample of a transform to the next
    std::ptrdiff_t distance = 1;  ///< from one transform to the next
    bool forward = true;          ///< exponent sign -1; real data: from samples to the packed spectrum
    bool in_place = true;

    bool operator==(const FftGeometry&) const = default;
};

/** Floats of a sample. */
constexpr std::ptrdiff_t floats_of(FftDomain domain) { return domain == FftDomain::Complex ? 2 : 1; }

/** Why an engine could not do what it was asked for. */
struct FftFailure {
    std::size_t bytes = 0;  ///< memory that was needed and is not there; 0 for another cause
    long code = 0;          ///< what the engine's library answered; 0 where it gives no reason
};

/** A batch made ready by an engine. */
class FftBatch {
public:
    FftBatch() = default;
    FftBatch(const FftBatch&) = delete;
    FftBatch& operator=(const FftBatch&) = delete;
    virtual ~FftBatch() = default;

    /** Transforms unscaled, from `in` to `out`: the same for a batch in place, apart otherwise, aligned as floats
     * at least. False when the engine failed, which fills `why`. Any number of threads may run a batch at a time.
     */
    virtual bool run(const float* in, float* out, FftFailure& why) noexcept = 0;
    /** Memory that it holds on to between runs, bytes. */
    [[nodiscard]] virtual std::size_t held_bytes() const noexcept { return 0; }
};

/** What computes the transforms. Lives until the process ends. */
class FftEngine {
public:
    FftEngine() = default;
    FftEngine(const FftEngine&) = delete;
    FftEngine& operator=(const FftEngine&) = delete;
    virtual ~FftEngine() = default;

    [[nodiscard]] virtual const char* name() const noexcept = 0;
    /** Whether transforms of a length are its business. */
    [[nodiscard]] virtual bool takes(int length) const noexcept { return length > 0; }
    /** Whether it transforms real data by itself. */
    [[nodiscard]] virtual bool takes_real() const noexcept { return false; }
    /** Whether columns are faster through a tile of neighbouring ones. */
    [[nodiscard]] virtual bool wants_tile(const FftGeometry& columns) const noexcept {
        return columns.length == 0;
    }
    /** Null when the batch cannot be had, which fills `why`. Where it measures, it does so on memory of its own.
     * Any thread may ask. */
    [[nodiscard]] virtual std::unique_ptr<FftBatch> make(const FftGeometry& geometry,
                                                         FftFailure& why) noexcept = 0;
};

// ---- The FFTW engine: a module of its own, which alone holds FFTW ----

/** The module's only exported function. Null for another version of the interface than its own. */
using FftwEntry = FftEngine* (*)(int interface_version);
inline constexpr int kFftInterfaceVersion = 4;
inline constexpr const char* kFftwEntryName = "quo_base_fftw_engine";

/** Loads the module: from `file`, or where that is null from the folder of this library, quo_base/ below it first.
 * Null when it cannot be loaded. */
[[nodiscard]] FftEngine* load_fftw_engine(const char* file) noexcept;

// ---- The MKL engine ----

/** Loads MKL: from `file`, or where that is null by its usual names. Null when it cannot be loaded. */
[[nodiscard]] FftEngine* load_mkl_engine(const char* file) noexcept;

// ---- Our own engine ----

/** Takes lengths without a prime factor above 7. Null without memory. */
[[nodiscard]] FftEngine* load_own_engine() noexcept;

// ---- The choice ----

/** Which engine to try first, and which next; null ends the list. */
using EngineOrder = std::array<FftEngine* (*)(), 3>;
/** `choice` is the value of QUO_FFT_ENGINE; anything but "mkl", "fftw" and "quo" counts as "auto". */
[[nodiscard]] EngineOrder engine_order(std::string_view choice, bool makers_processor) noexcept;

/** The engine of the process for transforms of a length, chosen at the first call: one for lengths that our own
 * engine takes, one for others. Null where none can be loaded. As long as there is none, each call tries again. */
[[nodiscard]] FftEngine* fft_engine(int length) noexcept;

/** What fft_engine_error() tells this thread: nothing, that no engine can be loaded, or why `engine` could not do
 * with transforms of a length. */
void forget_fft_error() noexcept;
void note_no_fft_engine() noexcept;
void note_fft_error(const FftEngine& engine, int length, const FftFailure& why) noexcept;
[[nodiscard]] const char* fft_error() noexcept;

/** Lets the next plan choose anew. Plans at hand keep their engine. For tests. */
void forget_fft_engine() noexcept;

}  // namespace quo

#endif
