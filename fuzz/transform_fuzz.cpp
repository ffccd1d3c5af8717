// SPDX-License-Identifier: Apache-2.0
/* Transforms of any shape against the sum that defines them, in double precision. */

#include <cmath>
#include <complex>
#include <cstdlib>
#include <numbers>
#include <vector>

#include "bytes.h"
#include "quo_base/fft.h"

namespace {

using property::require;
using Wide = std::complex<double>;

struct Shape {
    int n, nfft, m, mfft, rows, columns;
    [[nodiscard]] std::size_t size() const { return static_cast<std::size_t>(n) * static_cast<std::size_t>(m); }
};

/** Transforms `length` values, `stride` apart. */
void transform(Wide* first, int length, int stride, int direction) {
    if (direction == 0 || length == 1) return;
    std::vector<Wide> sums(static_cast<std::size_t>(length));
    const double turn = (direction > 0 ? -2.0 : 2.0) * std::numbers::pi / length;
    for (int k = 0; k < length; ++k)
        for (int j = 0; j < length; ++j)
            sums[static_cast<std::size_t>(k)] +=
                first[std::ptrdiff_t{j} * stride] *
                std::polar(1.0, turn * static_cast<double>(std::int64_t{j} * k % length));
    for (int k = 0; k < length; ++k)
        first[std::ptrdiff_t{k} * stride] =
            sums[static_cast<std::size_t>(k)] / (direction == -1 ? double(length) : 1.0);
}

void check(const Shape& s, std::vector<fcomplex> image) {
    std::vector<Wide> sums;
    double power = 0.0;
    for (const fcomplex& value : image) sums.emplace_back(value.real(), value.imag());
    for (int row = 0; row < s.m; ++row)
        transform(sums.data() + std::ptrdiff_t{row} * s.n, s.nfft, 1, row < s.mfft ? s.rows : 0);
    for (int column = 0; column < s.nfft; ++column) transform(sums.data() + column, s.mfft, s.n, s.columns);

    const int status = fft_c(s.n, s.nfft, s.m, s.mfft, s.rows, s.columns, image.data(), image.data());
    require(status == 0, "a shape within the rules is transformed");
    double off = 0.0;
    for (std::size_t i = 0; i < sums.size(); ++i) {
        off += std::norm(Wide{image[i].real(), image[i].imag()} - sums[i]);
        power += std::norm(sums[i]);
    }
    require(off <= 1e-11 * power, "the transform is that of the sum");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    setenv("QUO_FFTW_MODULE", QUO_FUZZ_FFTW_MODULE, 1);
    property::Bytes bytes{{reinterpret_cast<const char*>(data), size}};
    Shape s{};
    s.n = bytes.between(1, 130);
    s.nfft = bytes.between(1, s.n);
    s.m = bytes.between(1, 40);
    s.mfft = bytes.between(1, s.m);
    constexpr int kDirections[] = {0, 1, -1, -2};
    s.rows = kDirections[bytes.between(0, 3)];
    s.columns = kDirections[bytes.between(0, 3)];
    std::vector<fcomplex> image(s.size());
    std::uint32_t seed = bytes.number<std::uint32_t>();
    for (fcomplex& value : image) {
        seed = seed * 1664525U + 1013904223U;
        value = {static_cast<float>(seed >> 8U) * 0x1p-24F - 0.5F,
                 static_cast<float>(bytes.number<std::int8_t>())};
    }
    check(s, image);

    // Shapes of any numbers are made and released, or refused.
    FftPlan plan{};
    const int wild[] = {bytes.number<int>(), bytes.number<int>(), bytes.number<int>(), bytes.number<int>()};
    if (fft_makep_c(&plan, wild[0], wild[1] % 4096, wild[2], wild[3] % 4096, s.rows, s.columns, 1) == 0)
        require(fft_destp_c(&plan) == 0, "a plan that was made is released");
    return 0;
}
