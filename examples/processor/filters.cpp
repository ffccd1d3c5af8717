// SPDX-License-Identifier: Apache-2.0
#include "filters.h"

#include <cmath>
#include <numbers>

namespace example {

// A quadratic phase has a second difference that is constant, so that each factor follows from an earlier one by
// two products. Several recurrences run beside each other, so that none waits for another's last product.
void turn(fcomplex* row, int count, int first, double factor, const RowPhase& phase) {
    constexpr int kLanes = 4;
    dcomplex turned[kLanes], step[kLanes];
    for (int lane = 0; lane < kLanes; ++lane) {
        const double k = first + lane;
        turned[lane] = std::polar(factor, phase.constant + (phase.linear + phase.quadratic * k) * k);
        step[lane] = std::polar(1.0, kLanes * (phase.linear + phase.quadratic * (2.0 * k + kLanes)));
    }
    const dcomplex growth = std::polar(1.0, 2.0 * kLanes * kLanes * phase.quadratic);
    for (int sample = 0; sample < count; sample += kLanes) {
        for (int lane = 0; lane < kLanes && sample + lane < count; ++lane) {
            fcomplex& value = row[sample + lane];
            value = product(value, fcomplex{turned[lane]});
            turned[lane] = product(turned[lane], step[lane]);
            step[lane] = product(step[lane], growth);
        }
    }
}

double band_weight(double frequency, double band, double hamming) {
    if (std::abs(frequency) > 0.5 * band) return 0.0;
    return 1.0 - hamming + hamming * std::cos(2.0 * std::numbers::pi * frequency / band);
}

}  // namespace example
