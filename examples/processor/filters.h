// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_FILTERS_H
#define QUO_EXAMPLES_FILTERS_H

#include <complex>

#include "quo_base/api.h"

namespace example {

/** A phase along a row, rad: constant + linear * k + quadratic * k^2 at sample k. */
struct RowPhase {
    double constant, linear, quadratic;
};

/** Multiplies sample i of `count` samples by factor * exp(i phase(first + i)). */
void turn(fcomplex* row, int count, int first, double factor, const RowPhase& phase);

/** Weight of a band's frequency: 1 - p + p cos(2 pi f / band) for |f| <= band / 2, else 0; p = 0 is flat. */
double band_weight(double frequency, double band, double hamming);

/** a * b, without what the language asks for where parts are infinite: that takes most of the time. */
template <typename T>
std::complex<T> product(const std::complex<T>& a, const std::complex<T>& b) {
    return {a.real() * b.real() - a.imag() * b.imag(), a.real() * b.imag() + a.imag() * b.real()};
}

}  // namespace example

#endif
