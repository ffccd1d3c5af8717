#include "quo_base/interp.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cmath>

#include "signallib/engines.h"
#include "support/diagnostics.h"

namespace {

using test::Exact;
using test::relative_error;
using test::Samples;

constexpr const char* kSource = R"(..\..\..\binsrc\cutover\sources\interp)";
constexpr double kPi = std::numbers::pi;

/** A sum of tones, whole numbers of periods per `period` samples: band-limited and known anywhere. */
struct Tones {
    struct Tone {
        double cycles, phase;
    };
    double period;
    std::vector<Tone> tones;

    [[nodiscard]] dcomplex at(double t) const {
        dcomplex sum{};
        for (const Tone& tone : tones) sum += std::polar(1.0, 2.0 * kPi * tone.cycles * t / period + tone.phase);
        return sum;
    }
};

class Resampling : public test::WithEngine {
protected:
    interp interp_;
};

TEST_P(Resampling, MeetsBandLimitedRowsAndColumns) {
    for (const auto& [n, m] : {std::pair{15, 31}, {16, 24}, {16, 17}, {21, 60}}) {
        // Below the Nyquist bin of even lengths.
        const Tones signal{static_cast<double>(n), {{0, 0.3}, {3, 1.1}, {-4, 2.0}, {7, -0.7}, {-7, 0.1}}};
        for (const bool along : {true, false}) {
            SCOPED_TRACE(testing::Message() << n << " to " << m << (along ? " along" : " down"));
            constexpr int kOther = 37;  // more than a block of rows for the longest
            const auto image = [&](int length) {
                Samples samples(static_cast<std::size_t>(length * kOther));
                for (int k = 0; k < length; ++k)
                    for (int row = 0; row < kOther; ++row)
                        samples[static_cast<std::size_t>(along ? row * length + k : k * kOther + row)] =
                            fcomplex{signal.at(static_cast<double>(k) * n / length) * (1.0 + 0.1 * row)};
                return samples;
            };
            Samples in = image(n), out(static_cast<std::size_t>(m * kOther));
            ASSERT_EQ(interp_.interpft(in.data(), along ? n : kOther, along ? kOther : n, along ? m : kOther,
                                       along ? kOther : m, out.data()),
                      0);
            EXPECT_LE(relative_error(out, image(m)), 1e-6);
            Samples spectrum = image(n);
            const int nx = along ? n : kOther, ny = along ? kOther : n;
            ASSERT_EQ(fft_c(nx, nx, ny, ny, along, !along, spectrum.data(), spectrum.data()), 0);
            EXPECT_LE(relative_error(in, spectrum), 5e-7) << "the input is overwritten";
        }
    }
}

// The Nyquist bin alone, 1, -1, 1, -1: a whole bin gives exp(i pi k N / M), a bin halved and mirrored the cosine.
TEST_P(Resampling, NyquistBinIsHalvedOncePerRowInTheFirstRowOnly) {
    constexpr int n = 4, m = 8;
    for (const int rows : {1, 2, 5}) {
        Samples in, out(static_cast<std::size_t>(m * rows));
        for (int k = 0; k < n * rows; ++k) in.emplace_back(k % 2 == 0 ? 1.0F : -1.0F);
        ASSERT_EQ(interp_.interpft(in.data(), n, rows, m, rows, out.data()), 0);
        Exact expected;
        for (int row = 0; row < rows; ++row)
            for (int k = 0; k < m; ++k)
                expected.push_back(row == 0 ? 2.0 * std::pow(0.5, rows) * std::cos(kPi * k / 2.0)
                                            : std::polar(1.0, kPi * k / 2.0));
        EXPECT_LE(relative_error(out, expected), 5e-7) << rows;
    }
    // Once down every column.
    constexpr int columns = 3;
    Samples in, out(m * columns);
    Exact expected;
    for (int k = 0; k < n * columns; ++k) in.emplace_back(k / columns % 2 == 0 ? 1.0F : -1.0F);
    for (int k = 0; k < m * columns; ++k) expected.emplace_back(std::cos(kPi * (k / columns) / 2.0));
    ASSERT_EQ(interp_.interpft(in.data(), columns, n, columns, m, out.data()), 0);
    EXPECT_LE(relative_error(out, expected), 5e-7);
    const fcomplex one{1.7F, -0.3F};
    in = {one};
    out.resize(m);
    ASSERT_EQ(interp_.interpft(in.data(), 1, 1, m, 1, out.data()), 0);
    EXPECT_LE(relative_error(out, Samples(m, one)), 5e-7) << "a single sample";
}

INSTANTIATE_TEST_SUITE_P(Engines, Resampling, testing::ValuesIn(test::kEngines),
                         [](const auto& row) { return row.param.name; });

class Interp : public testing::Test {
protected:
    test::Engine engine_{"fftw"};
    interp interp_;
    Samples in_ = test::noise(64), out_ = Samples(256, fcomplex{-999.0F});
};

TEST_F(Interp, CopiesEqualSizesAndKeepsItsPlansForMany) {
    EXPECT_EQ(interp_.interpft(in_.data(), 8, 8, 8, 8, out_.data()), 0);
    EXPECT_TRUE(std::equal(in_.begin(), in_.end(), out_.begin()));
    ASSERT_EQ(interp_.setplans(8, 8, 16, 8), 0);
    Samples again = in_, twice(128);
    ASSERT_EQ(interp_.interpft_p(in_.data(), out_.data()), 0);
    ASSERT_EQ(interp_.interpft_p(again.data(), twice.data()), 0);
    EXPECT_TRUE(std::equal(twice.begin(), twice.end(), out_.begin()));
    EXPECT_EQ(interp_.destroyplans(), 0);
    EXPECT_EQ(interp_.destroyplans(), 0);
    EXPECT_EQ(interp_.interpft_p(in_.data(), out_.data()), 1) << "sizes that need the plans";
    // The sizes went with the plans, so that equal ones were no longer copied.
    ASSERT_EQ(interp_.setplans(8, 8, 8, 8), 0);
    EXPECT_EQ(interp_.destroyplans(), 0);
    std::fill(out_.begin(), out_.end(), fcomplex{});
    EXPECT_EQ(interp_.interpft_p(in_.data(), out_.data()), 0);
    EXPECT_TRUE(std::equal(in_.begin(), in_.end(), out_.begin()));
}

TEST_F(Interp, RefusesWithoutWritingAndSaysSo) {
    const test::Report report;
    const Samples before = in_;
    struct Row {
        int nx, ny, mx, my;
    };
    const Row sizes[] = {
        {8, 8, 16, 16}, {8, 8, 4, 8}, {0, 8, 0, 8}, {8, -8, 16, -8}, {INT_MAX, INT_MAX, INT_MAX, INT_MAX}};
    for (const auto& [nx, ny, mx, my] : sizes)
        EXPECT_EQ(interp_.interpft(in_.data(), nx, ny, mx, my, out_.data()), 1);
    EXPECT_EQ(interp_.interpft(nullptr, 8, 8, 16, 8, out_.data()), 1);
    EXPECT_EQ(interp_.interpft_p(in_.data(), out_.data()), 1) << "no plans";
    ASSERT_EQ(interp_.setplans(8, 8, 16, 8), 0);
    interp_.resetplans();
    EXPECT_EQ(interp_.interpft_p(in_.data(), out_.data()), 1) << "sizes forgotten";
    EXPECT_EQ(interp_.interp_lin(in_.data(), 8, 8, 16, 16, out_.data()), 1);
    EXPECT_EQ(interp_.interp_lin(in_.data(), 1, INT_MAX, INT_MAX, INT_MAX, out_.data()), 1);
    EXPECT_EQ(in_, before);
    EXPECT_EQ(out_, Samples(256, fcomplex{-999.0F}));
    const auto errors = report.entries("ERROR"), calls = report.entries("ERROR_CALL_TREE");
    ASSERT_EQ(errors.size(), 10U);
    EXPECT_EQ(errors.front().file, kSource);
    EXPECT_EQ(errors.front().function, "interp::setplans");
    EXPECT_EQ(errors.back().function, "interp::interp_lin(fcomplex)");
    ASSERT_EQ(calls.size(), 6U);
    EXPECT_EQ(calls.front().function, "interp::interpft");
    const test::Engine none{"fftw", "", "/nowhere/fftw.so"};
    EXPECT_EQ(interp_.interpft(in_.data(), 8, 8, 16, 8, out_.data()), 4);
    EXPECT_EQ(interp_.interpft(in_.data(), 8, 8, 8, 16, out_.data()), 5);
    EXPECT_EQ(report.entries("ERROR_CALL_TREE").size(), 10U);
}

TEST_F(Interp, LinearRowsAndColumnsHoldTheLast) {
    const float rows[] = {0.0F, 1.0F, 2.0F};
    float down[6] = {};
    ASSERT_EQ(interp_.interp_lin(rows, 1, 3, 1, 6, down), 0);
    EXPECT_EQ((std::vector<float>(down, down + 6)), (std::vector<float>{0.0F, 0.5F, 1.0F, 1.5F, 2.0F, 2.0F}));

    const double two_rows[] = {1.0, 4.0, 10.0, -2.0};
    double along[14];
    std::fill_n(along, 14, -999.0);  // 7 of 2 is no multiple: the factor is 3, and the seventh stays
    ASSERT_EQ(interp_.interp_lin(two_rows, 2, 2, 7, 2, along), 0);
    EXPECT_EQ((std::vector<double>(along, along + 14)),
              (std::vector<double>{1, 2, 3, 4, 4, 4, -999, 10, 6, 2, -2, -2, -2, -999}));

    const Samples samples{{0.0F, 8.0F}, {4.0F, 0.0F}};
    Samples grown(8);
    ASSERT_EQ(interp_.interp_lin(samples.data(), 2, 1, 8, 1, grown.data()), 0);
    EXPECT_EQ(grown, (Samples{{0, 8}, {1, 6}, {2, 4}, {3, 2}, {4, 0}, {4, 0}, {4, 0}, {4, 0}}));

    for (const auto& [nx, ny] : {std::pair{1, 2}, {3, 1}, {2, 2}, {3, 3}})
        EXPECT_EQ(interp_.interp_lin(rows, 3, 3, nx, ny, down), 0) << "nothing grows";
    EXPECT_EQ(interp_.interp_lin(static_cast<const float*>(nullptr), 0, -1, 0, -1, down), 0) << "not looked at";
    EXPECT_EQ(down[1], 0.5F);
}

// ---- Interpolation at any position ----

/** Noise of tones spread over part of the band along one axis; the other axis has one low tone. */
Tones band(double fraction, double centre = 0.0) {
    Tones signal{1.0, {}};
    for (int k = 0; k < 23; ++k) {
        const double f = centre + 0.5 * fraction * (2.0 * k / 22.0 - 1.0);
        signal.tones.push_back({f, std::fmod(2.399963 * k * k, 2.0 * kPi)});
    }
    return signal;
}

struct Scene {
    Scene(const Tones& x, const Tones& y) : x_{x}, y_{y}, image(static_cast<std::size_t>(nx * ny)) {
        for (int j = 0; j < ny; ++j)
            for (int i = 0; i < nx; ++i) image[static_cast<std::size_t>(j * nx + i)] = fcomplex{at(i, j)};
    }
    [[nodiscard]] dcomplex at(double x, double y) const { return x_.at(x) * y_.at(y); }

    static constexpr int nx = 128, ny = 112;
    Tones x_, y_;
    Samples image;
};

/** Positions clear of the borders. */
std::vector<double> positions(int count, double first, double last) {
    std::vector<double> all;
    for (int k = 0; k < count; ++k) all.push_back(first + (last - first) * std::fmod(0.6180339887 * (k + 1), 1.0));
    return all;
}

TEST(Interp2, MeetsBandLimitedImagesWithinTheStatedError) {
    const Tones slow{1.0, {{0.05, 0.0}}};
    struct Row {
        Scene scene;
        bool between_columns, between_rows;
        double limit;
    };
    for (const double fraction : {0.8, 0.6}) {
        for (const auto& [scene, between_columns, between_rows, limit] :
             {Row{{band(fraction), slow}, true, false, 2e-5},
              {{slow, band(fraction)}, false, true, 2e-5},
              // Each axis adds its own error: what is promised of one was once said of both.
              {{band(fraction), band(fraction)}, true, true, 3e-5}}) {
            auto x = positions(300, 16, 111), y = positions(300, 95, 16);
            if (!between_columns) std::ranges::transform(x, x.begin(), [](double at) { return std::floor(at); });
            if (!between_rows) std::ranges::transform(y, y.begin(), [](double at) { return std::floor(at); });
            Samples out(300);
            Exact expected;
            for (std::size_t k = 0; k < 300; ++k) expected.push_back(scene.at(x[k], y[k]));
            interp2D interpolator;
            const fcomplex* const image = scene.image.data();
            ASSERT_EQ(interpolator.interp2(image, scene.nx, scene.ny, x.data(), y.data(), 300, out.data()), 0);
            const double error = relative_error(out, expected);
            EXPECT_LE(error, limit) << fraction;
            EXPECT_GT(error, limit / 5.0) << "the error that interp.h states is far too large";
        }
    }
}

TEST(Interp2, LowpassKeepsTheNarrowBandAndStopsTheRest) {
    const Tones still{1.0, {{0.0, 0.4}}};
    const auto x = positions(200, 48, 79), y = positions(200, 48, 63);
    interp2D interpolator;
    const auto error_of = [&](const Tones& along, double passed) {
        const Scene scene{along, still};
        Samples out(200);
        Exact expected;
        double size = 0.0;
        for (std::size_t k = 0; k < 200; ++k) {
            expected.push_back(passed * scene.at(x[k], y[k]));
            size += std::norm(scene.at(x[k], y[k]));
        }
        const fcomplex* const image = scene.image.data();
        EXPECT_EQ(interpolator.interp2(image, scene.nx, scene.ny, x.data(), y.data(), 200, out.data(), 3), 0);
        double error = 0.0;
        for (std::size_t k = 0; k < 200; ++k) error += std::norm(dcomplex{out[k]} - expected[k]);
        return std::sqrt(error / size);
    };
    EXPECT_LE(error_of(band(0.8 / 3.0), 1.0), 2e-5);
    EXPECT_LE(error_of(Tones{1.0, {{0.5 / 3.0, 0.2}}}, 0.5), 1e-3) << "-6 dB at the edge";
    // 91 dB, which falls short of the 95 that were once promised from 1.2 on, and then 95 dB.
    for (const auto& [beyond, most] : {std::pair{1.2, 2.8e-5}, {1.218, 2.8e-5}, {1.36, 1.8e-5}, {2.7, 1.8e-5}})
        EXPECT_LE(error_of(Tones{1.0, {{beyond * 0.5 / 3.0, 0.2}}}, 0.0), most) << beyond;
}

TEST(Interp2, AxesGiveWhatSinglePositionsGive) {
    const Scene scene{band(0.7), band(0.7, 0.05)};
    const std::vector<double> x{0.0, 3.3, 40.25, 127.0, 127.1, -0.01}, y{0.0, 7.9, 110.99, 111.0, NAN};
    std::vector<double> all_x, all_y;
    for (const double row : y)
        for (const double column : x) {
            all_x.push_back(column);
            all_y.push_back(row);
        }
    for (const int lowpass : {1, 2}) {
        Samples grid(30), single(30);
        interp2D a, b;
        ASSERT_EQ(
            a.interp2(scene.image.data(), scene.nx, scene.ny, x.data(), 6, y.data(), 5, grid.data(), lowpass), 0);
        ASSERT_EQ(b.interp2(scene.image.data(), scene.nx, scene.ny, all_x.data(), all_y.data(), 30, single.data(),
                            lowpass),
                  0);
        EXPECT_LE(relative_error(grid, single), 1e-6);
        for (const std::size_t outside : {4, 5, 10, 24, 29}) {
            EXPECT_EQ(grid[outside], fcomplex{});
            EXPECT_EQ(single[outside], fcomplex{});
        }
    }
}

TEST(Interp2, MeetsSamplesAndConstantsUpToTheBorders) {
    interp2D interpolator;
    const std::vector<double> x{0.0, 0.4, 2.0, 3.9, 4.0}, y{0.0, 1.7, 2.0, 0.1, 1.0}, columns{0, 1, 2, 3, 4},
        rows{0, 1, 2};
    const Samples constant(15, fcomplex{2.5F, -1.0F}), image = test::noise(15);
    Samples out(5), same(15);
    ASSERT_EQ(interpolator.interp2(constant.data(), 5, 3, x.data(), y.data(), 5, out.data()), 0);
    EXPECT_LE(relative_error(out, Samples(5, constant[0])), 1e-6);
    ASSERT_EQ(interpolator.interp2(image.data(), 5, 3, columns.data(), 5, rows.data(), 3, same.data()), 0);
    EXPECT_LE(relative_error(same, image), 1e-6);
}

TEST(Interp2, RefusesAndSurvivesShortMemory) {
    const test::Report report;
    const Samples image = test::noise(15);
    const double at[] = {1.0, 2.0};
    Samples out(4, fcomplex{-999.0F});
    interp2D p;
    struct Row {
        int nx, ny, count, lowpass;
    };
    const Row rows[] = {{0, 3, 2, 1}, {5, -3, 2, 1}, {5, 3, -1, 1},
                        {5, 3, 2, 0}, {5, 3, 2, 65}, {5, 3, INT_MAX, 1}};
    for (const auto& [nx, ny, count, lowpass] : rows) {
        EXPECT_EQ(p.interp2(image.data(), nx, ny, at, count, at, count, out.data(), lowpass), 1);
        if (count == INT_MAX) continue;  // only the axes multiply
        EXPECT_EQ(p.interp2(image.data(), nx, ny, at, at, count, out.data(), lowpass), 1);
    }
    EXPECT_EQ(p.interp2(nullptr, 5, 3, at, at, 2, out.data()), 1);
    EXPECT_EQ(p.interp2(image.data(), 5, 3, at, nullptr, 2, out.data(), 1), 1);
    EXPECT_EQ(p.interp2(image.data(), 5, 3, at, 0, at, 2, out.data()), 1);
    EXPECT_EQ(p.interp2(image.data(), 5, 3, at, at, 0, out.data()), 0);
    EXPECT_EQ(out, Samples(4, fcomplex{-999.0F}));
    set_flg_report(0);
    test::fail_every_allocation([&] { return p.interp2(image.data(), 5, 3, at, 2, at, 2, out.data()); });
    test::fail_every_allocation([&] { return p.interp2(image.data(), 5, 3, at, at, 2, out.data()); });
    set_flg_report(1);
}

// ---- Phase ramps ----

TEST(DemodulationPhase, MakesASignalOfItsPhaseConstantAndBack) {
    const test::Report report;
    constexpr int nx = 300, ny = 3;
    const demodulationPhase law{0.731, -0.0123, 17.3};
    Samples data(nx * ny);
    for (int k = 0; k < nx * ny; ++k) {
        const double t = k % nx - 17.3;
        data[static_cast<std::size_t>(k)] = fcomplex{std::polar(2.0, 0.731 * t - 0.0123 * t * t)};
    }
    const Samples original = data;
    ASSERT_EQ(law.applyDemodPhase(data.data(), nx, ny), 0);
    EXPECT_LE(relative_error(data, Samples(nx * ny, fcomplex{2.0F})), 2e-7);
    ASSERT_EQ(law.applyModPhase(data.data(), nx, ny), 0);
    EXPECT_LE(relative_error(data, original), 2e-7);
    EXPECT_NEAR(law.getDemodPhase(20.3), 3.0 * 0.731 - 9.0 * 0.0123, 1e-14);
    EXPECT_EQ(law.applyModPhase(nullptr, nx, ny) + law.applyDemodPhase(data.data(), 0, ny), 2);
    EXPECT_EQ(law.applyDemodPhase(data.data(), nx, -1) + law.applyDemodPhase(data.data(), INT_MAX, INT_MAX), 2);
    set_flg_report(0);
    test::fail_every_allocation([&] { return law.applyDemodPhase(data.data(), nx, ny); });
    set_flg_report(1);
}

}  // namespace
