#include "filters.h"

#include <cmath>
#include <complex>
#include <numbers>

namespace example {
namespace {

constexpr int kLanes = 4;  // independent recurrences, so that none waits for another's last product

/** Complex numbers in lanes: parts in arrays of their own, which compilers turn into vector instructions. */
struct Lanes {
    double real[kLanes], imaginary[kLanes];

    void set(int lane, double radius, double angle) {
        real[lane] = radius * std::cos(angle);
        imaginary[lane] = radius * std::sin(angle);
    }
    void multiply(const Lanes& by) {
        for (int lane = 0; lane < kLanes; ++lane) {
            const double product = real[lane] * by.real[lane] - imaginary[lane] * by.imaginary[lane];
            imaginary[lane] = real[lane] * by.imaginary[lane] + imaginary[lane] * by.real[lane];
            real[lane] = product;
        }
    }
};

/** The factor of every kLanes-th sample: a quadratic phase has a second difference that is constant, so that each
 * factor follows from the last by two products. */
struct Recurrence {
    Recurrence(int first, double factor, const RowPhase& phase) {
        for (int lane = 0; lane < kLanes; ++lane) {
            const double k = first + lane;
            turned.set(lane, factor, phase.constant + (phase.linear + phase.quadratic * k) * k);
            step.set(lane, 1.0, kLanes * (phase.linear + phase.quadratic * (2.0 * k + kLanes)));
            growth.set(lane, 1.0, 2.0 * kLanes * kLanes * phase.quadratic);
        }
    }
    void advance() {
        turned.multiply(step);
        step.multiply(growth);
    }
    Lanes turned, step, growth;
};

void multiply(fcomplex* samples, int count, const Lanes& by) {
    auto* parts = reinterpret_cast<float*>(samples);
    for (int lane = 0; lane < count; ++lane) {
        const auto real = static_cast<float>(by.real[lane]), imaginary = static_cast<float>(by.imaginary[lane]);
        const float product = parts[2 * lane] * real - parts[2 * lane + 1] * imaginary;
        parts[2 * lane + 1] = parts[2 * lane] * imaginary + parts[2 * lane + 1] * real;
        parts[2 * lane] = product;
    }
}

}  // namespace

void turn(fcomplex* row, int count, int first, double factor, const RowPhase& phase) {
    Recurrence recurrence{first, factor, phase};
    int sample = 0;
    for (; sample + kLanes <= count; sample += kLanes) {
        multiply(row + sample, kLanes, recurrence.turned);
        recurrence.advance();
    }
    multiply(row + sample, count - sample, recurrence.turned);
}

double band_weight(double frequency, double band, double hamming) {
    if (std::abs(frequency) > 0.5 * band) return 0.0;
    return 1.0 - hamming + hamming * std::cos(2.0 * std::numbers::pi * frequency / band);
}

}  // namespace example
