// SPDX-License-Identifier: Apache-2.0
#include "quo_base/fft.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <span>

#include "signallib/engines.h"
#include "signallib/own_fft/fft_plans.h"

namespace {

using test::Exact;
using test::relative_error;
using test::Samples;

constexpr fcomplex kUntouched{3.7F, -1.3F};

/** The bound that fft.h states for a forward transform's error. */
double bound(int n) { return 2e-7 * std::max(1.0, std::log2(n)); }

using Fft = test::WithEngine;

/** Forward or backward. */
void expect_within_bound(int first, int last, int step) {
    for (int n = first; n <= last; n += step) {
        if (!quo::is_own_fft_length(n) && n % 13 != 0 && n < 2100) continue;  // where all are like each other
        const auto size = static_cast<std::size_t>(n),
                   shift = 1 - size % 2;  // even ones start between two vectors
        const bool forward = n % 3 != 0;
        const Samples x = test::noise(size);
        Samples in(shift), out(shift + size);
        in.insert(in.end(), x.begin(), x.end());
        ASSERT_EQ(fft_c(n, n, 1, 1, forward ? 1 : -2, 0, in.data() + shift, out.data() + shift), 0) << n;
        ASSERT_LE(relative_error(std::span{out}.subspan(shift), test::exact_dft(x, forward)), bound(n)) << n;
    }
}

// Sanitizers and the stand-in have seen enough after fewer.
#ifdef __SANITIZE_ADDRESS__
constexpr int kStep = 31;
#else
constexpr int kStep = 1;
#endif
TEST_P(Fft, EveryLengthUpTo2100IsWithinTheBound) { expect_within_bound(2, fast_ ? 2100 : 200, fast_ ? kStep : 5); }
TEST_P(Fft, LongLengthsAreWithinTheBound) {
    for (const int n : {4099, 5760, 46656, 65598, 65625, 117649, 120050, 1 << 20, 1 << 22})
        if (fast_ && (n < 1 << 20 || (kStep == 1 && *GetParam().name == 'A'))) expect_within_bound(n, n, 1);
}

/** An image larger than the part that is transformed. */
struct Shape {
    int n, nfft, m, mfft;
};
// Columns of 4096 rows, whole pages apart, go through MKL's tile.
constexpr Shape kShapes[] = {{9, 7, 11, 10},     {16, 16, 6, 6},        {80, 69, 300, 289},
                             {5, 3, 4098, 4096}, {512, 66, 4097, 4096}, {5, 1, 6, 6},
                             {2049, 2049, 3, 2}, {70, 33, 20, 1},       {1, 1, 12, 12}};

/** The plain way: one row or column after the other, each by itself. */
Samples one_by_one(const Shape& s, Samples image, bool rows) {
    const int length = rows ? s.nfft : s.mfft, count = rows ? s.mfft : s.nfft;
    Samples x(static_cast<std::size_t>(length));
    for (int t = 0; t < count; ++t) {
        const auto at = [&](int k) -> fcomplex& {
            return image[static_cast<std::size_t>(rows ? t * s.n + k : k * s.n + t)];
        };
        for (int k = 0; k < length; ++k) x[static_cast<std::size_t>(k)] = at(k);
        EXPECT_EQ(fft_c(length, length, 1, 1, 1, 0, x.data(), x.data()), 0);
        for (int k = 0; k < length; ++k) at(k) = x[static_cast<std::size_t>(k)];
    }
    return image;
}

TEST_P(Fft, RowsAndColumnsTransformTheirPartOfTheImageOnly) {
    for (const Shape& s : kShapes) {
        if (!fast_ && s.n * s.m > 1000) continue;
        SCOPED_TRACE(testing::Message() << s.nfft << " of " << s.n << " by " << s.mfft << " of " << s.m);
        const Samples in = test::noise(static_cast<std::size_t>(s.n * s.m));
        for (const auto& [along, down] : {std::pair{1, 0}, {0, 1}, {1, 1}}) {
            Samples expected = along == 1 ? one_by_one(s, in, true) : in;
            if (down == 1) expected = one_by_one(s, expected, false);
            Samples inside = in, apart(in.size(), kUntouched);
            ASSERT_EQ(fft_c(s.n, s.nfft, s.m, s.mfft, along, down, inside.data(), inside.data()), 0);
            EXPECT_LE(relative_error(inside, expected), bound(s.nfft * s.mfft + 1));
            ASSERT_EQ(fft_c(s.n, s.nfft, s.m, s.mfft, along, down, in.data(), apart.data()), 0);
            const bool skipped = (along == 0 || s.nfft == 1) && (down == 0 || s.mfft == 1);
            for (int k = 0; k < s.n * s.m; ++k)
                if (skipped || k % s.n >= s.nfft || k / s.n >= s.mfft) {
                    ASSERT_EQ(apart[static_cast<std::size_t>(k)], kUntouched) << k;
                    expected[static_cast<std::size_t>(k)] = kUntouched;
                }
            EXPECT_LE(relative_error(apart, expected), bound(s.nfft * s.mfft + 1));
        }
    }
}

TEST_P(Fft, InverseDirectionsNormaliseAsTheirCodesSay) {
    constexpr int n = 7, m = 10;
    const Samples in = test::noise(n * m);
    for (const int rows : {0, -1, -2})
        for (const int cols : {0, -1, -2}) {
            Samples work = in, expected = in;
            ASSERT_EQ(fft_c(n, n, m, m, rows != 0, cols != 0, work.data(), work.data()), 0);
            ASSERT_EQ(fft_c(n, n, m, m, rows, cols, work.data(), work.data()), 0);
            for (fcomplex& sample : expected) sample *= (rows == -2 ? 7.0F : 1.0F) * (cols == -2 ? 10.0F : 1.0F);
            EXPECT_LE(relative_error(work, expected), 5e-7) << rows << " " << cols;
        }
    // Both axes normalised: 1 / nfft is divided by mfft before anything is multiplied.
    Samples scaled(in.size()), plain(in.size());
    ASSERT_EQ(fft_c(n, n, m, m, -1, -1, in.data(), scaled.data()), 0);
    ASSERT_EQ(fft_c(n, n, m, m, -2, -2, in.data(), plain.data()), 0);
    for (fcomplex& sample : plain) sample = {sample.real() * (1.0F / 7 / 10), sample.imag() * (1.0F / 7 / 10)};
    EXPECT_EQ(scaled, plain);
}

/** Real values along one axis of an image, their packed spectrum by the defining sum, and back. */
TEST_P(Fft, RealSpectraArePackedAndComeBack) {
    constexpr int kOther = 19, kSpare = 2;
    for (const int length : {2, 3, 4, 5, 8, 15, 36, 45})
        for (const bool rows : {true, false}) {
            SCOPED_TRACE(testing::Message() << length << (rows ? " along rows" : " down columns"));
            const int nfft = rows ? length : kOther, mfft = rows ? kOther : length, n = nfft + kSpare,
                      m = mfft + kSpare;
            std::vector<float> in(static_cast<std::size_t>(n * m)), packed(in.size(), -999.0F);
            std::ranges::transform(test::noise(in.size()), in.begin(), [](fcomplex z) { return z.real(); });
            ASSERT_EQ(fft_r(n, nfft, m, mfft, rows, !rows, in.data(), packed.data()), 0);
            for (int t = 0; t < kOther; ++t) {
                const auto at = [&](int k) { return static_cast<std::size_t>(rows ? t * n + k : k * n + t); };
                Samples x, got;
                for (int k = 0; k < length; ++k) x.emplace_back(in[at(k)]);
                for (int k = 0; k < length; ++k) got.emplace_back(packed[at(k)]);
                const Exact bins = test::exact_dft(x);
                Exact expected{bins[0].real()};
                for (std::size_t k = 1; k < x.size(); ++k)
                    expected.emplace_back(k % 2 == 1 ? bins[(k + 1) / 2].real() : bins[k / 2].imag());
                ASSERT_LE(relative_error(got, expected), bound(length));
            }
            EXPECT_EQ(std::ranges::count(packed, -999.0F), n * m - nfft * mfft);
            ASSERT_EQ(fft_r(n, nfft, m, mfft, -static_cast<int>(rows), -static_cast<int>(!rows), packed.data(),
                            packed.data()),
                      0);
            for (std::size_t k = 0; k < in.size(); ++k)
                if (packed[k] != -999.0F) {
                    ASSERT_NEAR(packed[k], in[k], 2e-6F);
                }
        }
}

INSTANTIATE_TEST_SUITE_P(Engines, Fft, testing::ValuesIn(test::kEngines), testing::PrintToStringParamName());

// ---- Lengths, halves and memory ----

TEST(Genpow, AgreesWithTrialDivision) {
    const auto smooth = [](int n) {
        for (const int p : {2, 3, 5})
            while (n % p == 0) n /= p;
        return n == 1;
    };
    for (const int step : {1, 2, 3, 8, 13})
        for (int n = 5400; n < 5800; n += 7) {
            if (n % 13 == 0) continue;  // with a step of 13 there is none
            int expected = n;
            while (!smooth(expected)) expected += step;
            if (expected == 5625)
                for (expected = 5626; !smooth(expected);) expected += step;
            ASSERT_EQ(genpow(n, step), expected) << n << " " << step;
        }
}

TEST(Fftshift, MovesSampleZeroToTheMiddleAndBack) {
    for (int n = 1; n < 10; ++n) {
        Samples ramp, rows;
        for (int k = 0; k < 3 * n; ++k) ramp.emplace_back(static_cast<float>(k));
        rows = ramp;
        EXPECT_EQ(fftshift(rows.data(), n, 3), n / 2);
        for (int k = 0; k < 3 * n; ++k)
            EXPECT_EQ(rows[static_cast<std::size_t>(k / n * n + (k + n / 2) % n)],
                      ramp[static_cast<std::size_t>(k)]);
        EXPECT_EQ(ifftshift(rows.data(), n, 3), n / 2);
        EXPECT_EQ(rows, ramp);
    }
    EXPECT_EQ(fftshift(nullptr, 4, 1) + fftshift(nullptr, 0, 1), 2);
    EXPECT_EQ(ifftshift(nullptr, 4, -1) + ifftshift(nullptr, -4, 1), 2);
}

TEST(FftMalloc, GivesAlignedBlocksAndRefusesWhatCannotBe) {
    for (const std::size_t bytes : {0, 1, 17, 1000003}) {
        auto* const block = static_cast<unsigned char*>(fft_malloc(bytes));
        auto* const zeros = static_cast<unsigned char*>(fft_calloc(bytes, 3));
        EXPECT_EQ((reinterpret_cast<std::uintptr_t>(block) | reinterpret_cast<std::uintptr_t>(zeros)) % 16, 0U);
        std::fill_n(block, bytes, static_cast<unsigned char>(0xA5));  // the sanitizer looks at the ends
        EXPECT_EQ(std::count(zeros, zeros + 3 * bytes, 0), static_cast<std::ptrdiff_t>(3 * bytes));
        for (void* each : {block, zeros}) fft_free(each);
    }
    fft_free(nullptr);
    EXPECT_FALSE(fft_malloc(SIZE_MAX - 3) || fft_calloc(SIZE_MAX / 2, 3));
    errno = 0;
}

}  // namespace
