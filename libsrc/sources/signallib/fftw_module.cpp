// The module that holds FFTW: transforms by its single-precision library, linked into it and hidden. A library of
// its own, because others export functions of the same names, and to keep FFTW's licence out of the core.
#include <fftw3.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <new>
#include <utility>

#include "signallib/fft_engine.h"

namespace {

using quo::FftBatch;
using quo::FftDomain;
using quo::FftEngine;
using quo::FftGeometry;

/** Ends measuring at very long transforms; the batches that are asked for are measured well within it. */
constexpr double kPlanningSeconds = 10.0;
constexpr std::size_t kAlignment = 64;

struct Plan {
    Plan() noexcept = default;
    explicit Plan(fftwf_plan plan) noexcept : plan_{plan} {}
    Plan(Plan&& other) noexcept : plan_{std::exchange(other.plan_, nullptr)} {}
    Plan& operator=(Plan&& other) noexcept {
        std::swap(plan_, other.plan_);
        return *this;
    }
    ~Plan() {
        if (plan_) fftwf_destroy_plan(plan_);
    }
    explicit operator bool() const noexcept { return plan_ != nullptr; }
    [[nodiscard]] fftwf_plan get() const noexcept { return plan_; }

private:
    fftwf_plan plan_ = nullptr;
};

struct Free {
    void operator()(float* block) const noexcept { std::free(block); }
};
using Floats = std::unique_ptr<float, Free>;

/** Memory that is not touched: of a strided batch only the pages in use come into being. */
Floats allocate(std::size_t floats) noexcept {
    std::size_t bytes = 0;
    if (__builtin_mul_overflow(floats, sizeof(float), &bytes) ||
        __builtin_add_overflow(bytes, kAlignment - 1, &bytes))
        return nullptr;
    return Floats{static_cast<float*>(std::aligned_alloc(kAlignment, bytes / kAlignment * kAlignment))};
}

/** Measured on scratch memory, since measuring overwrites it. Estimating instead would cost a strided batch a
 * factor of ten. */
Plan measure(const FftGeometry& geometry, unsigned flags) noexcept {
    const auto last = (geometry.length - 1) * geometry.stride + (geometry.count - 1) * geometry.distance;
    const auto floats = 2 * (static_cast<std::size_t>(last) + 1);
    const Floats in = allocate(floats);
    const Floats apart = geometry.in_place ? nullptr : allocate(floats);
    if (!in || (!geometry.in_place && !apart)) return {};
    auto* const from = reinterpret_cast<fftwf_complex*>(in.get());
    auto* const to = geometry.in_place ? from : reinterpret_cast<fftwf_complex*>(apart.get());
    const fftwf_iodim64 transform{geometry.length, geometry.stride, geometry.stride};
    const fftwf_iodim64 batch{geometry.count, geometry.distance, geometry.distance};
    fftwf_set_timelimit(kPlanningSeconds);
    return Plan{fftwf_plan_guru64_dft(1, &transform, 1, &batch, from, to,
                                      geometry.forward ? FFTW_FORWARD : FFTW_BACKWARD, FFTW_MEASURE | flags)};
}

class ComplexBatch final : public FftBatch {
public:
    explicit ComplexBatch(const FftGeometry& geometry) noexcept
        : geometry_{geometry}, aligned_{measure(geometry, 0)} {}
    [[nodiscard]] bool ready() const noexcept { return static_cast<bool>(aligned_); }

    bool run(const float* in, float* out) noexcept override {
        float* const from = const_cast<float*>(in);  // kept by transforms that are not in place
        const bool aligned = fftwf_alignment_of(from) == 0 && fftwf_alignment_of(out) == 0;
        // Few callers need the slower plan for samples that start between two vectors: it is made for the first.
        if (!aligned && !unaligned_) unaligned_ = measure(geometry_, FFTW_UNALIGNED);
        const Plan& plan = aligned ? aligned_ : unaligned_;
        if (!plan) return false;
        fftwf_execute_dft(plan.get(), reinterpret_cast<fftwf_complex*>(from),
                          reinterpret_cast<fftwf_complex*>(out));
        return true;
    }

private:
    FftGeometry geometry_;
    Plan aligned_, unaligned_;
};

/** Real transforms pass through aligned buffers: samples on one side, a half spectrum of length / 2 + 1 complex
 * values on the other, which FFTW does not pack. */
class RealBatch final : public FftBatch {
public:
    explicit RealBatch(const FftGeometry& geometry) noexcept
        : geometry_{geometry},
          length_{static_cast<std::size_t>(geometry.length)},
          pitch_{(length_ + 2 + 15) / 16 * 16},
          group_{geometry.stride == 1 ? 1 : std::min(kGroup, geometry.count)},
          samples_{allocate(pitch_ * static_cast<std::size_t>(group_))},
          spectrum_{allocate(pitch_)} {
        if (samples_ && spectrum_) plan_ = measure_one();
    }
    [[nodiscard]] bool ready() const noexcept { return static_cast<bool>(plan_); }

    bool run(const float* in, float* out) noexcept override {
        for (int first = 0; first < geometry_.count; first += group_) {
            const int width = std::min(group_, geometry_.count - first);
            const auto offset = first * geometry_.distance;
            gather(in + offset, width);
            for (int k = 0; k < width; ++k) transform(row(k));
            scatter(out + offset, width);
        }
        return true;
    }

private:
    static constexpr int kGroup = 16;  // a cache line of neighbouring columns

    [[nodiscard]] Plan measure_one() noexcept {
        auto* const half = reinterpret_cast<fftwf_complex*>(spectrum_.get());
        fftwf_set_timelimit(kPlanningSeconds);
        return Plan{geometry_.forward
                        ? fftwf_plan_dft_r2c_1d(geometry_.length, samples_.get(), half, FFTW_MEASURE)
                        : fftwf_plan_dft_c2r_1d(geometry_.length, half, samples_.get(), FFTW_MEASURE)};
    }
    [[nodiscard]] float* row(int k) const noexcept {
        return samples_.get() + static_cast<std::size_t>(k) * pitch_;
    }

    void gather(const float* in, int width) noexcept {
        if (geometry_.stride == 1 && width == 1) return void(std::copy_n(in, length_, row(0)));
        for (std::size_t i = 0; i < length_; ++i)
            for (int k = 0; k < width; ++k)
                row(k)[i] = in[static_cast<std::ptrdiff_t>(i) * geometry_.stride + k * geometry_.distance];
    }
    void scatter(float* out, int width) const noexcept {
        if (geometry_.stride == 1 && width == 1) return void(std::copy_n(row(0), length_, out));
        for (std::size_t i = 0; i < length_; ++i)
            for (int k = 0; k < width; ++k)
                out[static_cast<std::ptrdiff_t>(i) * geometry_.stride + k * geometry_.distance] = row(k)[i];
    }

    /** One transform within a row of `samples_`: the packed spectrum leaves out the imaginary parts that are 0. */
    void transform(float* packed) noexcept {
        float* const half = spectrum_.get();
        if (geometry_.forward) {
            fftwf_execute_dft_r2c(plan_.get(), packed, reinterpret_cast<fftwf_complex*>(half));
            packed[0] = half[0];
            std::copy_n(half + 2, length_ - 1, packed + 1);
        } else {
            half[0] = packed[0];
            half[1] = 0.0F;
            std::copy_n(packed + 1, length_ - 1, half + 2);
            half[length_ + 1] = 0.0F;  // of the middle of an even spectrum; unused otherwise
            fftwf_execute_dft_c2r(plan_.get(), reinterpret_cast<fftwf_complex*>(half), packed);
        }
    }

    FftGeometry geometry_;
    std::size_t length_, pitch_;
    int group_;
    Floats samples_, spectrum_;
    Plan plan_;
};

template <typename Batch>
std::unique_ptr<FftBatch> make_batch(const FftGeometry& geometry) noexcept {
    std::unique_ptr<Batch> batch{new (std::nothrow) Batch{geometry}};
    if (!batch || !batch->ready()) return nullptr;
    return batch;
}

class FftwEngine final : public FftEngine {
public:
    [[nodiscard]] const char* name() const noexcept override { return "fftw"; }
    // Shorter columns fit the cache as they lie.
    [[nodiscard]] int tiled_from() const noexcept override { return 256; }
    [[nodiscard]] std::unique_ptr<FftBatch> make(const FftGeometry& geometry) noexcept override {
        return geometry.domain == FftDomain::Real ? make_batch<RealBatch>(geometry)
                                                  : make_batch<ComplexBatch>(geometry);
    }
};

}  // namespace

extern "C" __attribute__((visibility("default"))) FftEngine* quo_base_fftw_engine(int interface_version) {
    static FftwEngine engine;
    return interface_version == quo::kFftInterfaceVersion ? &engine : nullptr;
}
