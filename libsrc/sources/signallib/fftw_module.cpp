// SPDX-License-Identifier: Apache-2.0

// The module that holds FFTW: transforms by its single-precision library, linked into it and hidden. A library of
// its own, because others export functions of the same names, and to keep FFTW's licence out of the core.
#include <fftw3.h>

#include <algorithm>
#include <cstdlib>
#include <mutex>
#include <new>
#include <string_view>
#include <utility>

#include "signallib/fft_engine.h"
#include "signallib/memory_room.h"
#include "signallib/spare_floats.h"

namespace {

// For whoever finds the module alone: strings libquo_base_fftw.so
[[gnu::used]] constexpr char kLicence[] =
    "This module contains FFTW, Copyright (c) 2003, 2007-14 Matteo Frigo, Massachusetts Institute of Technology, "
    "and is under the GNU General Public License, version 3 or later.";

using quo::FftBatch;
using quo::FftEngine;
using quo::FftFailure;
using quo::FftGeometry;
using quo::Floats;
using quo::SpareFloats;

/** Ends measuring at very long transforms; others are measured well within it. */
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
 * for one transform is looked for before. These bounds were measured, on lengths of all kinds: the most that was
 * found is three quarters of them. Great prime factors cost several longer transforms. */
class FftwAppetite {
public:
    explicit FftwAppetite(int length) noexcept
        : one_{2 * sizeof(float) * static_cast<std::size_t>(length)}, smooth_{is_smooth(length)} {}

    [[nodiscard]] std::size_t planning() const noexcept {
        return (smooth_ ? 3 : 8) * one_ + 3 * buffered() + (std::size_t{1} << 20);
    }
    [[nodiscard]] std::size_t running() const noexcept { return (smooth_ ? 2 : 5) * one_ + 2 * buffered() + 4096; }

private:
    /** No more of a transform than this goes through buffers at once. */
    static constexpr std::size_t kMostBuffered = std::size_t{32} << 20;
    [[nodiscard]] std::size_t buffered() const noexcept { return std::min(one_, kMostBuffered); }
    static bool is_smooth(int length) noexcept {
        for (const int prime : {2, 3, 5, 7, 11, 13})
            while (length % prime == 0) length /= prime;
        return length == 1;
    }

    std::size_t one_;
    bool smooth_;
};

/** False where memory is short, which `why` then tells. */
bool has_room_for(std::size_t bytes, FftFailure& why) noexcept {
    if (quo::has_room({bytes, bytes})) return true;
    why.bytes = bytes;
    return false;
}

/** Estimated plans are the same in every run; measured ones are for those who ask for them. */
unsigned planning() noexcept {
    const char* wanted = secure_getenv("QUO_FFT_PLANNING");
    return wanted && std::string_view{wanted} == "measure" ? FFTW_MEASURE : FFTW_ESTIMATE;
}

/** Transforms pass through aligned room, one after the other on neighbouring samples, for which estimating does
 * well: a row by itself, columns as many at a time as a cache line has samples. */
class Batch final : public FftBatch {
public:
    Batch(const FftGeometry& geometry, FftFailure& why) noexcept
        : geometry_{geometry},
          length_{static_cast<std::size_t>(geometry.length)},
          pitch_{(length_ + 15) / 16 * 16},
          group_{geometry.stride == 1 ? 1 : std::min(kGroup, geometry.count)},
          room_{has_room_for(all_bytes(), why) ? floats() : 0} {
        if (why.bytes != 0) return;
        Floats room = room_.take();
        if (room) plan_ = plan(room.get());
        if (!room) why.bytes = all_bytes();
        room_.give_back(std::move(room));
    }
    [[nodiscard]] bool ready() const noexcept { return static_cast<bool>(plan_); }

    bool run(const float* in, float* out, FftFailure& why) noexcept override {
        if (!has_room_for(FftwAppetite{geometry_.length}.running(), why)) return false;
        Floats room = room_.take();
        if (!room) why.bytes = floats() * sizeof(float);
        for (int first = 0; room && first < geometry_.count; first += group_) {
            const int width = std::min(group_, geometry_.count - first);
            const auto offset = 2 * first * geometry_.distance;
            move(in + offset, geometry_.stride, geometry_.distance, room.get(), 1, pitch(), width);
            for (int k = 0; k < width; ++k) {
                auto* const row = reinterpret_cast<fftwf_complex*>(room.get() + 2 * k * pitch());
                fftwf_execute_dft(plan_.get(), row, row);
            }
            move(room.get(), 1, pitch(), out + offset, geometry_.stride, geometry_.distance, width);
        }
        const bool done = room != nullptr;
        room_.give_back(std::move(room));
        return done;
    }

    [[nodiscard]] std::size_t held_bytes() const noexcept override { return floats() * sizeof(float); }

private:
    static constexpr int kGroup = 8;

    [[nodiscard]] std::ptrdiff_t pitch() const noexcept { return static_cast<std::ptrdiff_t>(pitch_); }
    [[nodiscard]] std::size_t floats() const noexcept { return 2 * pitch_ * static_cast<std::size_t>(group_); }
    [[nodiscard]] std::size_t all_bytes() const noexcept {
        return floats() * sizeof(float) + FftwAppetite{geometry_.length}.planning();
    }

    [[nodiscard]] Plan plan(float* room) const noexcept {
        auto* const row = reinterpret_cast<fftwf_complex*>(room);
        const std::lock_guard guard{planner};
        fftwf_set_timelimit(kPlanningSeconds);
        return Plan{fftwf_plan_dft_1d(geometry_.length, row, row, geometry_.forward ? FFTW_FORWARD : FFTW_BACKWARD,
                                      planning())};
    }
    /** `width` transforms from one layout to another. */
    void move(const float* from, std::ptrdiff_t from_stride, std::ptrdiff_t from_distance, float* to,
              std::ptrdiff_t to_stride, std::ptrdiff_t to_distance, int width) const noexcept {
        if (width == 1 && from_stride == 1 && to_stride == 1) return void(std::copy_n(from, 2 * length_, to));
        for (std::size_t i = 0; i < length_; ++i, from += 2 * from_stride, to += 2 * to_stride)
            for (int k = 0; k < width; ++k) std::copy_n(from + 2 * k * from_distance, 2, to + 2 * k * to_distance);
    }

    FftGeometry geometry_;
    std::size_t length_, pitch_;
    int group_;
    SpareFloats room_;
    Plan plan_;
};

class FftwEngine final : public FftEngine {
public:
    [[nodiscard]] const char* name() const noexcept override { return "fftw"; }
    [[nodiscard]] std::unique_ptr<FftBatch> make(const FftGeometry& geometry, FftFailure& why) noexcept override {
        std::unique_ptr<Batch> batch{new (std::nothrow) Batch{geometry, why}};
        if (!batch) why.bytes = sizeof(Batch);
        if (!batch || !batch->ready()) return nullptr;
        return batch;
    }
};

}  // namespace

extern "C" __attribute__((visibility("default"))) FftEngine* quo_base_fftw_engine(int interface_version) {
    static FftwEngine engine;
    return interface_version == quo::kFftInterfaceVersion ? &engine : nullptr;
}
