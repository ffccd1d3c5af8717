// The module that holds FFTW: transforms by its single-precision library, linked into it and hidden. A library of
// its own, because others export functions of the same names, and to keep FFTW's licence out of the core.
#include <fftw3.h>

#include <algorithm>
#include <cstdlib>
#include <cstring>
#include <mutex>
#include <new>
#include <utility>

#include "signallib/fft_engine.h"
#include "signallib/memory_room.h"
#include "signallib/spare_floats.h"

namespace {

using quo::allocate_floats;
using quo::FftBatch;
using quo::FftDomain;
using quo::FftEngine;
using quo::FftFailure;
using quo::FftGeometry;
using quo::Floats;
using quo::MemoryNeed;
using quo::SpareFloats;

/** Ends measuring at very long transforms; the batches that are asked for are measured well within it. */
constexpr double kPlanningSeconds = 10.0;

/** FFTW makes and destroys plans on one thread at a time; it runs them on any number. */
std::mutex planner;

struct Plan {
    Plan() noexcept = default;
    explicit Plan(fftwf_plan plan) noexcept : plan_{plan} {}
    Plan(Plan&& other) noexcept : plan_{std::exchange(other.plan_, nullptr)} {}
    Plan& operator=(Plan&& other) noexcept {
        std::swap(plan_, other.plan_);
        return *this;
    }
    ~Plan() {
        if (!plan_) return;
        const std::lock_guard guard{planner};
        fftwf_destroy_plan(plan_);
    }
    explicit operator bool() const noexcept { return plan_ != nullptr; }
    [[nodiscard]] fftwf_plan get() const noexcept { return plan_; }

private:
    fftwf_plan plan_ = nullptr;
};

/** FFTW ends the process when an allocation of its own fails, while it plans and while it runs: what it may take
 * is looked for before. These bounds were measured, on lengths of all kinds and batches of all shapes: the most
 * that was found is three quarters of them. Great prime factors cost several longer transforms. */
class FftwAppetite {
public:
    explicit FftwAppetite(const FftGeometry& geometry) noexcept
        : one_{2 * sizeof(float) * static_cast<std::size_t>(geometry.length)},
          batch_{one_ * static_cast<std::size_t>(geometry.count)},
          smooth_{is_smooth(geometry.length)} {}

    /** Samples of the whole batch, bytes. */
    [[nodiscard]] std::size_t batch() const noexcept { return batch_; }
    [[nodiscard]] std::size_t planning() const noexcept {
        return (smooth_ ? 3 : 8) * one_ + 3 * buffered() + (std::size_t{1} << 20);
    }
    [[nodiscard]] std::size_t running() const noexcept { return (smooth_ ? 2 : 5) * one_ + 2 * buffered() + 4096; }

private:
    /** No more of a batch than this goes through buffers at once. */
    static constexpr std::size_t kMostBuffered = std::size_t{32} << 20;
    [[nodiscard]] std::size_t buffered() const noexcept { return std::min(batch_, kMostBuffered); }
    static bool is_smooth(int length) noexcept {
        for (const int prime : {2, 3, 5, 7, 11, 13})
            while (length % prime == 0) length /= prime;
        return length == 1;
    }

    std::size_t one_, batch_;
    bool smooth_;
};

/** False where memory is short, which `why` then tells. */
bool has_room_for(const MemoryNeed& need, FftFailure& why) noexcept {
    if (quo::has_room(need)) return true;
    why.bytes = need.touched;
    return false;
}

/** Measured on scratch memory, since measuring overwrites it. Estimating instead would cost a strided batch a
 * factor of ten. */
Plan measure(const FftGeometry& geometry, unsigned flags, FftFailure& why) noexcept {
    const auto last = (geometry.length - 1) * geometry.stride + (geometry.count - 1) * geometry.distance;
    const auto floats = 2 * (static_cast<std::size_t>(last) + 1);
    const FftwAppetite fftw{geometry};
    const std::size_t scratches = geometry.in_place ? 1 : 2;
    const MemoryNeed need{scratches * floats * sizeof(float) + fftw.planning(),
                          scratches * fftw.batch() + fftw.planning()};
    if (!has_room_for(need, why)) return {};
    const Floats in = allocate_floats(floats);
    const Floats apart = geometry.in_place ? nullptr : allocate_floats(floats);
    if (!in || (!geometry.in_place && !apart)) {
        why.bytes = need.touched;
        return {};
    }
    auto* const from = reinterpret_cast<fftwf_complex*>(in.get());
    auto* const to = geometry.in_place ? from : reinterpret_cast<fftwf_complex*>(apart.get());
    const fftwf_iodim64 transform{geometry.length, geometry.stride, geometry.stride};
    const fftwf_iodim64 batch{geometry.count, geometry.distance, geometry.distance};
    const std::lock_guard guard{planner};
    fftwf_set_timelimit(kPlanningSeconds);
    return Plan{fftwf_plan_guru64_dft(1, &transform, 1, &batch, from, to,
                                      geometry.forward ? FFTW_FORWARD : FFTW_BACKWARD, FFTW_MEASURE | flags)};
}

class ComplexBatch final : public FftBatch {
public:
    ComplexBatch(const FftGeometry& geometry, FftFailure& why) noexcept
        : geometry_{geometry}, running_{FftwAppetite{geometry}.running()}, aligned_{measure(geometry, 0, why)} {}
    [[nodiscard]] bool ready() const noexcept { return static_cast<bool>(aligned_); }

    bool run(const float* in, float* out, FftFailure& why) noexcept override {
        float* const from = const_cast<float*>(in);  // kept by transforms that are not in place
        const bool aligned = fftwf_alignment_of(from) == 0 && fftwf_alignment_of(out) == 0;
        // Few callers need the slower plan for samples that start between two vectors: it is made for the first.
        const Plan& plan = aligned ? aligned_ : unaligned(why);
        if (!plan || !has_room_for({running_, running_}, why)) return false;
        fftwf_execute_dft(plan.get(), reinterpret_cast<fftwf_complex*>(from),
                          reinterpret_cast<fftwf_complex*>(out));
        return true;
    }

private:
    const Plan& unaligned(FftFailure& why) noexcept {
        const std::lock_guard guard{making_unaligned_};
        if (!unaligned_) unaligned_ = measure(geometry_, FFTW_UNALIGNED, why);
        return unaligned_;
    }

    FftGeometry geometry_;
    std::size_t running_;
    std::mutex making_unaligned_;
    Plan aligned_, unaligned_;
};

/** Real transforms pass through aligned room: rows of samples, and behind them a half spectrum of length / 2 + 1
 * complex values, which FFTW does not pack. */
class RealBatch final : public FftBatch {
public:
    RealBatch(const FftGeometry& geometry, FftFailure& why) noexcept
        : geometry_{geometry},
          length_{static_cast<std::size_t>(geometry.length)},
          pitch_{(length_ + 2 + 15) / 16 * 16},
          group_{geometry.stride == 1 ? 1 : std::min(kGroup, geometry.count)},
          room_{has_room_for(all_memory(), why) ? floats() : 0} {
        if (why.bytes != 0) return;
        Floats room = room_.take();
        if (room) plan_ = measure_one(room.get());
        if (!room) why.bytes = all_memory().touched;
        room_.give_back(std::move(room));
    }
    [[nodiscard]] bool ready() const noexcept { return static_cast<bool>(plan_); }

    bool run(const float* in, float* out, FftFailure& why) noexcept override {
        const std::size_t running = appetite().running();
        if (!has_room_for({running, running}, why)) return false;
        Floats room = room_.take();
        if (!room) why.bytes = floats() * sizeof(float);
        for (int first = 0; room && first < geometry_.count; first += group_) {
            const int width = std::min(group_, geometry_.count - first);
            const auto offset = first * geometry_.distance;
            gather(in + offset, width, room.get());
            for (int k = 0; k < width; ++k) transform(row(room.get(), k), row(room.get(), group_));
            scatter(room.get(), width, out + offset);
        }
        const bool done = room != nullptr;
        room_.give_back(std::move(room));
        return done;
    }

private:
    static constexpr int kGroup = 16;  // a cache line of neighbouring columns

    /** Of one transform at a time. */
    [[nodiscard]] FftwAppetite appetite() const noexcept {
        FftGeometry one = geometry_;
        one.count = 1;
        return FftwAppetite{one};
    }
    [[nodiscard]] std::size_t floats() const noexcept { return pitch_ * (static_cast<std::size_t>(group_) + 1); }
    [[nodiscard]] MemoryNeed all_memory() const noexcept {
        const std::size_t need = floats() * sizeof(float) + appetite().planning();
        return {need, need};
    }

    [[nodiscard]] Plan measure_one(float* room) const noexcept {
        auto* const half = reinterpret_cast<fftwf_complex*>(row(room, group_));
        const std::lock_guard guard{planner};
        fftwf_set_timelimit(kPlanningSeconds);
        return Plan{geometry_.forward ? fftwf_plan_dft_r2c_1d(geometry_.length, room, half, FFTW_MEASURE)
                                      : fftwf_plan_dft_c2r_1d(geometry_.length, half, room, FFTW_MEASURE)};
    }
    /** The row behind those of the group is the half spectrum. */
    [[nodiscard]] float* row(float* room, int k) const noexcept {
        return room + static_cast<std::size_t>(k) * pitch_;
    }

    void gather(const float* in, int width, float* room) const noexcept {
        if (geometry_.stride == 1 && width == 1) return void(std::copy_n(in, length_, room));
        for (std::size_t i = 0; i < length_; ++i)
            for (int k = 0; k < width; ++k)
                row(room, k)[i] = in[static_cast<std::ptrdiff_t>(i) * geometry_.stride + k * geometry_.distance];
    }
    void scatter(float* room, int width, float* out) const noexcept {
        if (geometry_.stride == 1 && width == 1) return void(std::copy_n(room, length_, out));
        for (std::size_t i = 0; i < length_; ++i)
            for (int k = 0; k < width; ++k)
                out[static_cast<std::ptrdiff_t>(i) * geometry_.stride + k * geometry_.distance] = row(room, k)[i];
    }

    /** One transform within a row: the packed spectrum leaves out the imaginary parts that are 0. */
    void transform(float* packed, float* half) const noexcept {
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
    SpareFloats room_;
    Plan plan_;
};

template <typename Batch>
std::unique_ptr<FftBatch> make_batch(const FftGeometry& geometry, FftFailure& why) noexcept {
    std::unique_ptr<Batch> batch{new (std::nothrow) Batch{geometry, why}};
    if (!batch) why.bytes = sizeof(Batch);
    if (!batch || !batch->ready()) return nullptr;
    return batch;
}

class FftwEngine final : public FftEngine {
public:
    [[nodiscard]] const char* name() const noexcept override { return "fftw"; }
    [[nodiscard]] bool takes_real() const noexcept override { return true; }
    // Shorter columns fit the cache as they lie.
    [[nodiscard]] bool wants_tile(const FftGeometry& columns) const noexcept override {
        return columns.length >= 256;
    }
    [[nodiscard]] std::unique_ptr<FftBatch> make(const FftGeometry& geometry, FftFailure& why) noexcept override {
        return geometry.domain == FftDomain::Real ? make_batch<RealBatch>(geometry, why)
                                                  : make_batch<ComplexBatch>(geometry, why);
    }
};

}  // namespace

extern "C" __attribute__((visibility("default"))) FftEngine* quo_base_fftw_engine(int interface_version) {
    static FftwEngine engine;
    return interface_version == quo::kFftInterfaceVersion ? &engine : nullptr;
}
