#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <numbers>
#include <vector>

#include "quo_base/acquisition.h"
#include "support/diagnostics.h"

namespace {

struct PulseRow {
    const char* name;
    double length_s, bandwidth_hz, rate_hz;
    int samples;
};
constexpr PulseRow kPulses[] = {
    {"Even", 10e-6, 15.3e6, 20e6, 200},
    {"Odd", 37.12e-6, 15.55e6, 18.962468e6, 704},
    {"Single", 1e-6, 0.3e6, 1.2e6, 1},
    {"Two", 1e-6, 0.3e6, 1.6e6, 2},
    {"HalfRoundsUp", 12.5, 0.7, 1.0, 13},
    {"JustBelowHalf", 12.4999, 0.7, 1.0, 12},
    {"FallingFrequency", 10e-6, -15.3e6, 20.3e6, 203},
    {"Long", 100e-6, 300e6, 600e6, 60000},
};

SARPulse_Obj& set(SARPulse_Obj& pulse, double length, double bandwidth, double rate) {
    pulse.PulseLength = length;
    pulse.Bandwidth = bandwidth;
    pulse.PulseSamplingRate = rate;
    return pulse;
}

class Chirp : public testing::TestWithParam<PulseRow> {
protected:
    void SetUp() override {
        const PulseRow& row = GetParam();
        ASSERT_EQ(set(pulse_, row.length_s, row.bandwidth_hz, row.rate_hz).chirpSamples(), row.samples);
        chirp_.assign(static_cast<std::size_t>(row.samples) + 1, kGuard);
        ASSERT_EQ(pulse_.generateChirp(chirp_.data()), 0);
        EXPECT_EQ(chirp_.back(), kGuard) << "written beyond the last sample";
        chirp_.pop_back();
    }
    static constexpr fcomplex kGuard{17.3F, -3.7F};
    SARPulse_Obj pulse_;
    std::vector<fcomplex> chirp_;
};

TEST_P(Chirp, FollowsTheQuadraticPhase) {
    const PulseRow& row = GetParam();
    const double amplitude = std::sqrt(std::abs(row.bandwidth_hz) / row.rate_hz / row.samples);
    for (int n = 0; n < row.samples; ++n) {
        // In half samples from the middle the offset is a whole number: no rounding enters before the last step.
        const double half_steps = 2.0 * n - (row.samples - 1);
        const double turns =
            row.bandwidth_hz / row.length_s * half_steps * half_steps / (8.0 * row.rate_hz * row.rate_hz);
        const double angle = 2.0 * std::numbers::pi * (turns - std::floor(turns));
        const fcomplex sample = chirp_[static_cast<std::size_t>(n)];
        ASSERT_NEAR(sample.real(), amplitude * std::cos(angle), 1e-6 * amplitude) << n;
        ASSERT_NEAR(sample.imag(), amplitude * std::sin(angle), 1e-6 * amplitude) << n;
    }
}

TEST_P(Chirp, IsSymmetric) { EXPECT_EQ(chirp_, std::vector<fcomplex>(chirp_.rbegin(), chirp_.rend())); }

TEST_P(Chirp, HasTheEnergyOfItsBandwidthOverTheSamplingRate) {
    double energy = 0.0;
    for (const fcomplex& sample : chirp_) energy += std::norm(dcomplex{sample});
    const double expected = std::abs(GetParam().bandwidth_hz) / GetParam().rate_hz;
    EXPECT_NEAR(energy, expected, 1e-6 * expected);
}

// The frequency, taken from neighbouring samples, runs from -B/2 to B/2 over the pulse.
TEST_P(Chirp, SweepsItsBandwidth) {
    const PulseRow& row = GetParam();
    for (std::size_t n = 1; n < chirp_.size(); ++n) {
        const double step = std::arg(dcomplex{chirp_[n]} * std::conj(dcomplex{chirp_[n - 1]}));
        const double frequency = step * row.rate_hz / (2.0 * std::numbers::pi);
        const double middle = static_cast<double>(n) - 0.5 * row.samples;  // of the two samples, from the centre
        ASSERT_NEAR(frequency, row.bandwidth_hz / row.length_s * middle / row.rate_hz, 1e-5 * row.rate_hz) << n;
    }
}
INSTANTIATE_TEST_SUITE_P(Pulses, Chirp, testing::ValuesIn(kPulses),
                         [](const auto& row) { return row.param.name; });

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

TEST(ChirpOfABadPulse, IsRefused) {
    const struct {
        const char* name;
        double length, bandwidth, rate;
    } rows[] = {{"no sample", 0.4e-6, 1e6, 1e6},
                {"no length", 0.0, 1e6, 1e6},
                {"negative length", -1e-5, 1e6, 2e7},
                {"negative rate", 1e-5, 1e6, -2e7},
                {"unknown pulse", -999.0, -999.0, -999.0},
                {"more samples than an int counts", 1e6, 1e6, 1e9},
                {"one sample too many", 1.0, 1e6, SARPulse_Obj::kMaxChirpSamples + 1.0},
                {"endless", kInfinity, 1e6, 1e6},
                {"no number as length", kNaN, 1e6, 1e6},
                {"no number as rate", 1e-5, 1e6, kNaN},
                {"no number as bandwidth", 1e-5, kNaN, 2e7},
                {"endless bandwidth", 1e-5, kInfinity, 2e7},
                {"phase beyond all numbers", 1e200, 1e-195, 1e-195},
                {"amplitude beyond a float", 1.0, 1e200, 17.0}};
    const test::Report report;
    std::size_t refused = 0;
    for (const auto& row : rows) {
        SARPulse_Obj pulse;
        set(pulse, row.length, row.bandwidth, row.rate);
        fcomplex sample{17.3F, -3.7F};
        EXPECT_EQ(pulse.chirpSamples(), 0) << row.name;
        EXPECT_EQ(pulse.generateChirp(&sample), 1) << row.name;
        EXPECT_EQ(sample, (fcomplex{17.3F, -3.7F})) << row.name;
        EXPECT_EQ(report.entries("ERROR").size(), ++refused) << row.name;
    }
    SARPulse_Obj good;
    EXPECT_EQ(set(good, 1e-5, 1e6, 2e7).generateChirp(nullptr), 1);
}

TEST(ChirpOfABadPulse, MayHaveTheMostSamplesThatAreAllowed) {
    SARPulse_Obj pulse;
    EXPECT_EQ(set(pulse, 1.0, 1e6, SARPulse_Obj::kMaxChirpSamples).chirpSamples(), SARPulse_Obj::kMaxChirpSamples);
}

TEST(ChirpWithoutBandwidth, IsZero) {
    SARPulse_Obj pulse;
    std::vector<fcomplex> chirp(set(pulse, 17e-6, 0.0, 1e6).chirpSamples() > 0 ? 17 : 0, fcomplex{1.0F, 1.0F});
    ASSERT_EQ(pulse.generateChirp(chirp.data()), 0);
    EXPECT_THAT(chirp, testing::Each(fcomplex{}));
}

// The rate and the energy are described, not used.
TEST(ChirpOfAPulse, IgnoresTheStatedRateAndEnergy) {
    SARPulse_Obj pulse, other;
    set(pulse, 17e-6, 0.3e6, 1e6);
    set(other, 17e-6, 0.3e6, 1e6);
    other.PulseKRate = 5.5e11;
    other.PulseEnergy = 17.3;
    std::vector<fcomplex> a(17), b(17);
    ASSERT_EQ(pulse.generateChirp(a.data()), 0);
    ASSERT_EQ(other.generateChirp(b.data()), 0);
    EXPECT_EQ(a, b);
}

}  // namespace
