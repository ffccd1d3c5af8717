// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <numbers>
#include <utility>
#include <vector>

#include "signallib/fft_transform.h"
#include "signallib/memory_room.h"
#include "signallib/spare_floats.h"

namespace quo {
namespace {

struct Value {
    float re, im;
};
Value sum(Value a, Value b) { return {a.re + b.re, a.im + b.im}; }
Value product(Value a, Value b) { return {a.re * b.re - a.im * b.im, a.re * b.im + a.im * b.re}; }
Value conjugate(Value a) { return {a.re, -a.im}; }
Value scaled(Value a, float by) { return {a.re * by, a.im * by}; }

/** The complex transforms that do the work, side by side in room of their own, as the real ones lie. */
FftGeometry complex_geometry(const FftGeometry& real) {
    constexpr int kGroup = 16, kGroupSamples = 1 << 16;
    const int length = real.length % 2 == 0 ? real.length / 2 : real.length;
    const bool rows = real.stride == 1;
    // Rows that are too long for a cache gain nothing from others beside them.
    const int count = std::min(rows ? std::clamp(kGroupSamples / length, 1, kGroup) : kGroup, real.count);
    return {FftDomain::Complex, length, count, rows ? 1 : count, rows ? length : 1, real.forward, true};
}

/** Real transforms by complex ones: of even lengths, whose samples are taken in pairs, by half as long ones (J. W.
 * Cooley, P. A. W. Lewis, P. D. Welch, "The Fast Fourier Transform Algorithm: Programming Considerations in the
 * Calculation of Sine, Cosine and Laplace Transforms", J. Sound Vib. 12(3), 1970); of odd lengths by ones with
 * imaginary parts of 0. Transforms never mix, so that a weak row keeps its accuracy beside a strong one. */
class PackedReal final : public FftTransform {
public:
    PackedReal(const FftEngine& engine, const FftGeometry& geometry, std::unique_ptr<FftTransform> complex)
        : FftTransform{geometry, complex->geometry().count},
          engine_{engine},
          complex_{std::move(complex)},
          work_{complex_->geometry()},
          floats_{2 * static_cast<std::size_t>(work_.length) * static_cast<std::size_t>(work_.count)},
          rooms_{floats_} {
        const double step = (geometry.forward ? -2.0 : 2.0) * std::numbers::pi / geometry.length;
        for (int k = 0; even() && k <= work_.length / 2; ++k)
            roots_.push_back({static_cast<float>(std::cos(step * k)), static_cast<float>(std::sin(step * k))});
    }
    [[nodiscard]] std::size_t held_bytes() const noexcept override {
        return floats_ * sizeof(float) + complex_->held_bytes();
    }

    bool run(const float* in, float* out, int first, int count, FftFactors factors) noexcept override {
        Floats room = rooms_.take();
        if (!room) note_fft_error(engine_, geometry_.length, {.bytes = floats_ * sizeof(float)});
        bool done = room != nullptr;
        for (int k = first; done && k < first + count; k += block_) {
            const Batch batch{geometry_, work_, room.get(), std::min(block_, geometry_.count - k)};
            const auto offset = k * geometry_.distance;
            if (batch.width < block_) std::fill_n(room.get(), floats_, 0.0F);
            geometry_.forward ? batch.take_samples(in + offset) : take_spectrum(batch, in + offset);
            done = complex_->run_all(room.get(), room.get(), {});
            if (!done) break;
            geometry_.forward ? give_spectrum(batch, out + offset) : batch.give_samples(out + offset);
            multiply_batch(geometry_, out + offset, batch.width, factors);
        }
        rooms_.give_back(std::move(room));
        return done;
    }

private:
    /** Some of the transforms, and the room of their complex ones. */
    struct Batch {
        const FftGeometry &real, &complex;
        float* room;
        int width;

        [[nodiscard]] Value& value(int k, int c) const {
            return reinterpret_cast<Value*>(room)[k * complex.stride + c * complex.distance];
        }
        [[nodiscard]] std::ptrdiff_t at(int k, int c) const { return k * real.stride + c * real.distance; }
        /** `body` with every sample number below `samples` of every transform, as they follow in memory. */
        template <typename Body>
        void each(int samples, const Body& body) const {
            if (real.stride == 1)
                for (int c = 0; c < width; ++c)
                    for (int k = 0; k < samples; ++k) body(k, c);
            else
                for (int k = 0; k < samples; ++k)
                    for (int c = 0; c < width; ++c) body(k, c);
        }

        void take_samples(const float* in) const {
            const bool even = real.length % 2 == 0;
            each(complex.length, [&](int k, int c) {
                value(k, c) = even ? Value{in[at(2 * k, c)], in[at(2 * k + 1, c)]} : Value{in[at(k, c)], 0.0F};
            });
        }
        void give_samples(float* out) const {
            const bool even = real.length % 2 == 0;
            each(complex.length, [&](int k, int c) {
                const Value z = value(k, c);
                out[at(even ? 2 * k : k, c)] = z.re;
                if (even) out[at(2 * k + 1, c)] = z.im;
            });
        }
        [[nodiscard]] Value bin(const float* packed, int k, int c) const {
            return {packed[at(2 * k - 1, c)], packed[at(2 * k, c)]};
        }
        void set_bin(float* packed, int k, int c, Value bin) const {
            packed[at(2 * k - 1, c)] = bin.re;
            packed[at(2 * k, c)] = bin.im;
        }
    };

    [[nodiscard]] bool even() const noexcept { return geometry_.length % 2 == 0; }

    /** The spectra of the even samples and of the odd ones, which lie in each other, become that of all. */
    void give_spectrum(const Batch& batch, float* out) const noexcept {
        const int length = work_.length;
        batch.each(length / 2 + 1, [&](int k, int c) {
            const Value z = batch.value(k, c);
            if (k == 0) {
                out[batch.at(0, c)] = z.re + z.im;  // the latter is 0 for odd lengths
                if (even()) out[batch.at(geometry_.length - 1, c)] = z.re - z.im;
            } else if (!even()) {
                batch.set_bin(out, k, c, z);
            } else {
                const Value mirror = conjugate(batch.value(length - k, c));
                const Value half = scaled(sum(z, mirror), 0.5F),
                            rest = scaled(sum(z, scaled(mirror, -1.0F)), 0.5F);
                const Value odd = product({rest.im, -rest.re}, roots_[static_cast<std::size_t>(k)]);
                batch.set_bin(out, k, c, sum(half, odd));
                batch.set_bin(out, length - k, c, conjugate(sum(half, scaled(odd, -1.0F))));
            }
        });
    }
    void take_spectrum(const Batch& batch, const float* in) const noexcept {
        const int length = work_.length;
        batch.each(length / 2 + 1, [&](int k, int c) {
            const float first = in[batch.at(0, c)], last = in[batch.at(geometry_.length - 1, c)];
            if (k == 0) {
                batch.value(0, c) = even() ? Value{first + last, first - last} : Value{first, 0.0F};
            } else if (!even()) {
                const Value bin = batch.bin(in, k, c);
                batch.value(k, c) = bin;
                batch.value(length - k, c) = conjugate(bin);
            } else {
                const Value bin = batch.bin(in, k, c), mirror = conjugate(batch.bin(in, length - k, c));
                const Value both = sum(bin, mirror);
                const Value odd = product(sum(bin, scaled(mirror, -1.0F)), roots_[static_cast<std::size_t>(k)]);
                batch.value(k, c) = {both.re - odd.im, both.im + odd.re};
                batch.value(length - k, c) = {both.re + odd.im, odd.re - both.im};
            }
        });
    }

    const FftEngine& engine_;
    std::unique_ptr<FftTransform> complex_;
    FftGeometry work_;
    std::size_t floats_;
    std::vector<Value> roots_;  ///< of the real length, up to a quarter of it
    SpareFloats rooms_;
};

}  // namespace

std::unique_ptr<FftTransform> make_packed_real(FftEngine& engine, const FftGeometry& geometry) {
    std::unique_ptr<FftTransform> complex = make_fft_transform(engine, complex_geometry(geometry));
    if (!complex) return nullptr;
    const FftGeometry& work = complex->geometry();
    const std::size_t bytes =
        2 * sizeof(float) * static_cast<std::size_t>(work.length) * static_cast<std::size_t>(work.count);
    if (!has_room({bytes, bytes})) {
        note_fft_error(engine, geometry.length, {.bytes = bytes});
        return nullptr;
    }
    return std::make_unique<PackedReal>(engine, geometry, std::move(complex));
}

}  // namespace quo
