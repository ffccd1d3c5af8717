#include "quo_base/fft.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cmath>

#include "signallib/engines.h"

namespace {

using test::Exact;
using test::relative_error;
using test::root;
using test::Samples;

/** The bound that fft.h states for a forward transform's error. */
double bound(int n) { return 2e-7 * std::max(1.0, std::log2(n)); }

/** Splits off factors until a prime is left, whose transform is taken from the definition. In double precision. */
Exact transform(const Exact& x) {
    const std::size_t n = x.size();
    std::size_t p = 2;
    while (p * p <= n && n % p != 0) ++p;
    if (n % p != 0) p = n;
    if (n == 1) return x;
    Exact roots(n);
    for (std::size_t k = 0; k < n; ++k) roots[k] = root(k, n);
    Exact y(n);
    for (std::size_t part = 0; part < p; ++part) {
        Exact slice(n / p);
        for (std::size_t k = 0; k < slice.size(); ++k) slice[k] = x[k * p + part];
        slice = transform(slice);
        for (std::size_t k = 0, turn = 0; k < n; ++k, turn += part) y[k] += roots[turn % n] * slice[k % (n / p)];
    }
    return y;
}

/** Error of a spectrum against the defining sum: at every bin, or at some 60 bins of a long one. */
double spectrum_error(const Samples& x, const Samples& spectrum) {
    const std::size_t n = x.size(), step = n / 2000 * 32 + 1;
    Exact roots(n), expected;
    Samples got;
    for (std::size_t k = 0; k < n; ++k) roots[k] = root(k, n);
    for (std::size_t bin = 0; bin < n; bin += step) {
        dcomplex sum{};
        for (std::size_t k = 0; k < n; ++k) sum += dcomplex{x[k]} * roots[k * bin % n];
        expected.push_back(sum);
        got.push_back(spectrum[bin]);
    }
    return relative_error(got, expected);
}

using Fft = test::WithEngine;

void expect_within_bound(int first, int last, int step) {
    for (int n = first; n <= last; n += step) {
        const auto size = static_cast<std::size_t>(n),
                   shift = 1 - size % 2;  // even ones start between two vectors
        const Samples x = test::noise(size);
        Samples in(shift), out(shift + size);
        in.insert(in.end(), x.begin(), x.end());
        ASSERT_EQ(fft_c(n, n, 1, 1, 1, 0, in.data() + shift, out.data() + shift), 0) << n;
        const Samples y = n == 1 ? x : Samples(out.end() - n, out.end());  // a length of 1 is skipped
        ASSERT_LE(spectrum_error(x, y), bound(n)) << n;
    }
}

// Measuring so many lengths takes FFTW a while, hence the parts; sanitizers have seen enough after fewer.
#ifdef __SANITIZE_ADDRESS__
constexpr int kStep = 16;
#else
constexpr int kStep = 1;
#endif
TEST_P(Fft, EveryLengthUpTo256IsWithinTheBound) { expect_within_bound(1, 256, kStep); }
TEST_P(Fft, EveryLengthUpTo512IsWithinTheBound) { expect_within_bound(257, 512, kStep); }
TEST_P(Fft, LongLengthsAreWithinTheBound) {
    // The stand-in takes the definition as it stands, so that long transforms would take minutes.
    if (std::string_view{GetParam().name} == "DftiStandIn") return expect_within_bound(1080, 1080, 1);
    for (const int n : {1080, 4096, 4099, 5760, 65537}) expect_within_bound(n, n, 1);
}

/** An image larger than the part that is transformed. Long columns go through tiles of 64: with FFTW those of 289
 * rows and more here, with MKL those of 4096. */
struct Shape {
    int n, nfft, m, mfft;
};
constexpr Shape kShapes[] = {{9, 7, 11, 10},     {16, 16, 6, 6},       {80, 69, 300, 289},
                             {5, 3, 4098, 4096}, {67, 66, 4097, 4096}, {5, 1, 6, 6},
                             {2049, 2049, 3, 2}, {70, 33, 20, 1},      {1, 1, 12, 12}};

/** The plain way: one row or column after the other. */
Samples expected_image(const Shape& s, const Samples& in, bool rows) {
    Samples out = in;
    const int length = rows ? s.nfft : s.mfft, count = rows ? s.mfft : s.nfft;
    for (int t = 0; t < count; ++t) {
        const auto at = [&](int k) { return static_cast<std::size_t>(rows ? t * s.n + k : k * s.n + t); };
        Exact x;
        for (int k = 0; k < length; ++k) x.emplace_back(in[at(k)]);
        x = transform(x);
        for (int k = 0; k < length; ++k) out[at(k)] = fcomplex{x[static_cast<std::size_t>(k)]};
    }
    return out;
}

TEST_P(Fft, RowsAndColumnsTransformTheirPartOfTheImageOnly) {
    for (const Shape& s : kShapes) {
        if (std::string_view{GetParam().name} == "DftiStandIn" && s.n * s.m > 1000) continue;
        SCOPED_TRACE(testing::Message() << s.nfft << " of " << s.n << " by " << s.mfft << " of " << s.m);
        const Samples in = test::noise(static_cast<std::size_t>(s.n * s.m));
        const Samples rows = expected_image(s, in, true), columns = expected_image(s, in, false);
        const Samples both = expected_image(s, rows, false);
        for (const auto& [dir_rows, dir_cols, expected] :
             {std::tuple{1, 0, &rows}, std::tuple{0, 1, &columns}, std::tuple{1, 1, &both}}) {
            Samples inside = in, apart(in.size(), fcomplex{-999.0F});
            ASSERT_EQ(fft_c(s.n, s.nfft, s.m, s.mfft, dir_rows, dir_cols, inside.data(), inside.data()), 0);
            EXPECT_LE(relative_error(inside, *expected), bound(s.nfft * s.mfft + 1));
            ASSERT_EQ(fft_c(s.n, s.nfft, s.m, s.mfft, dir_rows, dir_cols, in.data(), apart.data()), 0);
            // In place and apart may be planned differently, so that they agree to rounding only.
            const bool skipped = (dir_rows == 0 || s.nfft == 1) && (dir_cols == 0 || s.mfft == 1);
            Samples taken_apart, taken_inside;
            for (int row = 0; row < s.m; ++row)
                for (int k = 0; k < s.n; ++k) {
                    const auto at = static_cast<std::size_t>(row * s.n + k);
                    if (!skipped && row < s.mfft && k < s.nfft) {
                        taken_apart.push_back(apart[at]);
                        taken_inside.push_back(inside[at]);
                    } else {
                        ASSERT_EQ(apart[at], fcomplex{-999.0F}) << row << " " << k;
                    }
                }
            EXPECT_LE(relative_error(taken_apart, taken_inside), bound(s.nfft * s.mfft + 1));
        }
    }
}

TEST_P(Fft, InverseDirectionsNormaliseAsTheirCodesSay) {
    constexpr int n = 7, m = 10;
    struct Row {
        int rows, cols;
        float factor;
    };
    const Row codes[] = {{-1, 0, 1.0F},  {-2, 0, 7.0F},  {0, -1, 1.0F},   {0, -2, 10.0F},
                         {-1, -1, 1.0F}, {-2, -1, 7.0F}, {-1, -2, 10.0F}, {-2, -2, 70.0F}};
    const Samples in = test::noise(n * m);
    for (const auto& [rows, cols, factor] : codes) {
        Samples work = in, expected = in;
        ASSERT_EQ(fft_c(n, n, m, m, rows != 0, cols != 0, work.data(), work.data()), 0);
        ASSERT_EQ(fft_c(n, n, m, m, rows, cols, work.data(), work.data()), 0);
        for (fcomplex& sample : expected) sample *= factor;
        EXPECT_LE(relative_error(work, expected), 5e-7) << rows << " " << cols;
    }
    // Both axes normalised: 1 / nfft is divided by mfft before anything is multiplied.
    Samples scaled(in.size()), plain(in.size());
    ASSERT_EQ(fft_c(n, n, m, m, -1, -1, in.data(), scaled.data()), 0);
    ASSERT_EQ(fft_c(n, n, m, m, -2, -2, in.data(), plain.data()), 0);
    for (fcomplex& sample : plain) sample = {sample.real() * (1.0F / 7 / 10), sample.imag() * (1.0F / 7 / 10)};
    EXPECT_EQ(scaled, plain);
}

// ---- Real data ----

/** Real values along one axis of an image, their packed spectrum from the complex one, and back. */
TEST_P(Fft, RealSpectraArePackedAndComeBack) {
    for (const int length : {2, 3, 4, 5, 8, 15, 36, 45}) {
        for (const bool rows : {true, false}) {
            SCOPED_TRACE(testing::Message() << length << (rows ? " along rows" : " down columns"));
            constexpr int other = 19, spare = 2;
            const int n = (rows ? length : other) + spare, m = (rows ? other : length) + spare;
            const int nfft = n - spare, mfft = m - spare;
            std::vector<float> in;
            for (const fcomplex& sample : test::noise(static_cast<std::size_t>(n * m)))
                in.push_back(sample.real());
            std::vector<float> packed(in.size(), -999.0F);
            ASSERT_EQ(fft_r(n, nfft, m, mfft, rows ? 1 : 0, rows ? 0 : 1, in.data(), packed.data()), 0);
            for (int t = 0; t < other; ++t) {
                const auto at = [&](int k) { return static_cast<std::size_t>(rows ? t * n + k : k * n + t); };
                Exact x, expected;
                Samples got;
                for (int k = 0; k < length; ++k) x.emplace_back(in[at(k)]);
                x = transform(x);
                for (int k = 0; k < length; ++k) {
                    const dcomplex bin = x[static_cast<std::size_t>((k + 1) / 2)];
                    expected.emplace_back(k % 2 == 1 || k == 0 ? bin.real() : bin.imag());
                    got.emplace_back(packed[at(k)]);
                }
                ASSERT_LE(relative_error(got, expected), bound(length));
            }
            EXPECT_EQ(std::count(packed.begin(), packed.end(), -999.0F), n * m - nfft * mfft);
            ASSERT_EQ(fft_r(n, nfft, m, mfft, rows ? -1 : 0, rows ? 0 : -1, packed.data(), packed.data()), 0);
            for (int row = 0; row < mfft; ++row)
                for (int k = 0; k < nfft; ++k) {
                    const auto at = static_cast<std::size_t>(row * n + k);
                    ASSERT_NEAR(packed[at], in[at], 2e-6F);
                }
        }
    }
}

INSTANTIATE_TEST_SUITE_P(Engines, Fft, testing::ValuesIn(test::kEngines),
                         [](const auto& row) { return row.param.name; });

// ---- Arguments and the life of plans ----

class FftPlans : public testing::Test {
protected:
    test::Engine engine_{"fftw"};
    Samples data_ = test::noise(64), before_ = data_;
};

TEST_F(FftPlans, OfImpossibleGeometriesAreRefusedAndNothingIsWritten) {
    constexpr int kLeast = INT_MIN, kMost = INT_MAX;  // the images of these fill more than an address space
    struct Row {
        int status, n, nfft, m, mfft, rows, cols;
    };
    const Row geometries[] = {{1, 0, 0, 4, 4, 1, 1},      {1, -8, 4, 4, 4, 1, 1},        {1, 8, 8, 0, 0, 1, 1},
                              {1, 8, 8, kLeast, 1, 1, 1}, {1, kMost, 4, kMost, 4, 1, 1}, {2, 8, 9, 4, 4, 1, 0},
                              {2, 8, 0, 4, 4, 1, 0},      {3, 8, 8, 4, 5, 0, 1},         {3, 8, 8, 4, -1, 0, 1},
                              {4, 8, 8, 4, 4, 2, 0},      {4, 8, 8, 4, 4, kLeast, 0},    {5, 8, 8, 4, 4, 1, -3}};
    for (const Row& a : geometries) {
        SCOPED_TRACE(&a - geometries);
        FftPlan plan{nullptr, 41, 42, 43, 44, nullptr, 45, 46, 47, 48};
        EXPECT_EQ(fft_makep_c(&plan, a.n, a.nfft, a.m, a.mfft, a.rows, a.cols, 1), a.status);
        EXPECT_EQ(fft_makep_r(&plan, a.n, a.nfft, a.m, a.mfft, a.rows, a.cols, 1), a.status);
        EXPECT_EQ(fft_c(a.n, a.nfft, a.m, a.mfft, a.rows, a.cols, data_.data(), data_.data()), a.status);
        EXPECT_EQ(plan.rows, nullptr);
        EXPECT_EQ(plan.n + plan.column_direction, 41 + 48);
        EXPECT_EQ(data_, before_);
    }
}

TEST_F(FftPlans, RecordWhatWasAskedFor) {
    FftPlan plan{};
    ASSERT_EQ(fft_makep_c(&plan, 8, 8, 4, 4, 0, 0, 1), 0);
    EXPECT_EQ(plan.rows, nullptr);
    EXPECT_EQ(plan.columns, nullptr);
    EXPECT_EQ(pfft_c(&plan, data_.data(), data_.data()) + fft_destp_c(&plan), 0);
    EXPECT_EQ(data_, before_);
    ASSERT_EQ(fft_makep_c(&plan, 8, 6, 4, 3, -1, -2, 1), 0);
    EXPECT_TRUE(plan.rows && plan.columns);
    EXPECT_EQ((std::vector{plan.n, plan.nfft, plan.m, plan.mfft, plan.normalise_rows, plan.row_direction,
                           plan.normalise_columns, plan.column_direction}),
              (std::vector{8, 6, 4, 3, 1, -1, 0, -1}));
    EXPECT_EQ(fft_destp_c(&plan), 0);
    EXPECT_EQ(fft_makep_r(&plan, 8, 8, 4, 4, 1, 1, 1), 5) << "one axis per plan of real data";
}

TEST_F(FftPlans, ThatWereReleasedCopiedOrMadeUpAreRefused) {
    FftPlan plan{};
    ASSERT_EQ(fft_makep_c(&plan, 8, 8, 8, 8, 1, 1, 1), 0);
    FftPlan copy = plan, longer = plan;
    longer.nfft = 7;  // no longer what the handle stands for
    EXPECT_EQ(pfft_c(&longer, data_.data(), data_.data()), 1);
    EXPECT_EQ(fft_destp_c(&plan), 0);
    EXPECT_EQ(fft_destp_c(&plan), 0) << "a record of zeros holds nothing to release";
    FftPlan next{};
    ASSERT_EQ(fft_makep_c(&next, 8, 8, 8, 8, 1, 1, 1), 0);  // must not revive the old handles
    for (FftPlan* stale : {&plan, &copy}) EXPECT_EQ(pfft_c(stale, data_.data(), data_.data()), 1);
    EXPECT_EQ(fft_destp_c(&copy), 1);
    FftPlan made_up{reinterpret_cast<FftEnginePlan*>(&copy), 8, 8, 0, 1, nullptr, 8, 8, 0, 0};
    EXPECT_EQ(pfft_c(&made_up, data_.data(), data_.data()), 1);
    EXPECT_EQ(fft_destp_c(&made_up), 1);
    EXPECT_EQ(pfft_c(nullptr, data_.data(), data_.data()), 1);
    EXPECT_EQ(fft_destp_c(nullptr), 1);
    EXPECT_EQ(data_, before_);
    EXPECT_EQ(pfft_c(&next, data_.data(), data_.data()), 0);
    EXPECT_EQ(fft_destp_c(&next), 0);
}

TEST_F(FftPlans, RefuseBuffersThatDoNotFitThem) {
    FftPlan inside{}, apart{}, real{};
    ASSERT_EQ(fft_makep_c(&inside, 8, 8, 4, 4, 1, 0, 1), 0);
    ASSERT_EQ(fft_makep_c(&apart, 8, 8, 4, 4, 0, 1, 0), 0);
    ASSERT_EQ(fft_makep_r(&real, 8, 8, 4, 4, 1, 0, 1), 0);
    fcomplex* const data = data_.data();
    EXPECT_EQ(pfft_c(&inside, data, data + 32), 1);
    EXPECT_EQ(pfft_c(&inside, nullptr, nullptr), 1);
    EXPECT_EQ(pfft_c(&apart, data, data), 1);
    EXPECT_EQ(pfft_c(&apart, data, data + 31), 1);
    EXPECT_EQ(pfft_c(&apart, data + 31, data), 1);
    EXPECT_EQ(pfft_c(&apart, data, nullptr), 1);
    EXPECT_EQ(pfft_c(&real, data, data), 1) << "made for real data";
    EXPECT_EQ(pfft_r(&inside, reinterpret_cast<float*>(data), reinterpret_cast<float*>(data)), 1);
    EXPECT_EQ(data_, before_);
    EXPECT_EQ(pfft_c(&apart, data, data + 32), 0);
    for (FftPlan* plan : {&inside, &apart, &real}) EXPECT_EQ(fft_destp_c(plan), 0);
}

// ---- Lengths and halves ----

TEST(Genpow, GivesZeroWhereThereIsNone) {
    struct Row {
        int n, step, length;
    };
    const Row rows[] = {{7, 7, 0},       {0, 1, 0},       {-3, 1, 0},
                        {1000, 0, 1000}, {1001, 0, 0},    {1001, -1, 0},
                        {5625, 0, 0},    {INT_MAX, 1, 0}, {2123366400, 1, 2123366400}};
    for (const auto& [n, step, length] : rows) EXPECT_EQ(genpow(n, step), length) << n << " " << step;
}

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
    const auto ramp = [](int n) {
        Samples row;
        for (int k = 0; k < n; ++k) row.emplace_back(static_cast<float>(k));
        return row;
    };
    Samples five = ramp(5);
    EXPECT_EQ(fftshift(five.data(), 5, 1), 2);
    EXPECT_EQ(five, (Samples{3.0F, 4.0F, 0.0F, 1.0F, 2.0F}));
    for (int n = 1; n < 10; ++n) {
        Samples rows = ramp(3 * n);
        EXPECT_EQ(fftshift(rows.data(), n, 3), n / 2);
        EXPECT_EQ(rows[static_cast<std::size_t>(n + n / 2)], fcomplex{static_cast<float>(n)});
        EXPECT_EQ(ifftshift(rows.data(), n, 3), n / 2);
        EXPECT_EQ(rows, ramp(3 * n));
    }
    EXPECT_EQ(fftshift(nullptr, 4, 1), 2);
    EXPECT_EQ(fftshift(five.data(), 0, 1), 0);
    EXPECT_EQ(ifftshift(five.data(), -4, 1), 0);
    EXPECT_EQ(ifftshift(five.data(), 4, -1), 2);
}

TEST(FftMalloc, GivesAlignedBlocksAndRefusesWhatCannotBe) {
    for (const std::size_t bytes : {0, 1, 17, 1000003}) {
        auto* const block = static_cast<unsigned char*>(fft_malloc(bytes));
        EXPECT_EQ(reinterpret_cast<std::uintptr_t>(block) % 16, 0U);
        std::fill_n(block, bytes, static_cast<unsigned char>(0xA5));  // the sanitizer looks at the ends
        fft_free(block);
        auto* const zeros = static_cast<unsigned char*>(fft_calloc(bytes, 3));
        EXPECT_EQ(std::count(zeros, zeros + 3 * bytes, 0), static_cast<std::ptrdiff_t>(3 * bytes));
        fft_free(zeros);
    }
    fft_free(nullptr);
    EXPECT_FALSE(fft_malloc(SIZE_MAX - 3) || fft_calloc(SIZE_MAX / 2, 3));
    errno = 0;
}

}  // namespace
