// SPDX-License-Identifier: Apache-2.0
// What every transform is held against, apart from the tests so that it can be optimised: it takes most of their
// time.
#include <algorithm>
#include <complex>
#include <cstddef>
#include <numbers>

#include "signallib/engines.h"

namespace test {

Exact direct(const fcomplex* x, int n, int m, double w, double a) {
    Exact out(static_cast<std::size_t>(m));
    for (int k = 0; k < m; ++k)
        for (int j = 0; j < n; ++j)
            out[static_cast<std::size_t>(k)] += dcomplex{x[j]} * std::polar(1.0, -j * (a - k * w));
    return out;
}

namespace {

// Without a look for infinities, which the library's own product takes.
dcomplex times(dcomplex a, dcomplex b) {
    return {a.real() * b.real() - a.imag() * b.imag(), a.real() * b.imag() + a.imag() * b.real()};
}

}  // namespace

// Of a prime length by the definition, else by transforms of a prime factor.
Exact exact_dft(const Exact& x) {
    const std::size_t n = x.size();
    std::size_t p = 2;
    while (p * p <= n && n % p != 0) ++p;
    if (p * p > n) p = n;
    Exact roots, out(n);
    for (std::size_t k = 0; k < n; ++k)
        roots.push_back(
            std::polar(1.0, -2.0 * std::numbers::pi * static_cast<double>(k) / static_cast<double>(n)));
    for (std::size_t j = 0; j < p; ++j) {
        Exact part;
        for (std::size_t k = j; k < n; k += p) part.push_back(x[k]);
        if (p < n) part = exact_dft(part);
        for (std::size_t k = 0, e = 0; k < n; ++k, e = (e + j) % n)
            out[k] += times(part[k % part.size()], roots[e]);
    }
    return out;
}
Exact exact_dft(const Samples& x, bool forward) {
    Exact samples(x.begin(), x.end());
    if (!forward) std::reverse(samples.begin() + 1, samples.end());
    return exact_dft(samples);
}

}  // namespace test
