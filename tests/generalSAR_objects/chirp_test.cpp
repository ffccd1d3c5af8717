#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <numbers>
#include <vector>

#include "quo_base/acquisition.h"
#include "support/diagnostics.h"

namespace {

SARPulse_Obj& set(SARPulse_Obj& pulse, double length, double bandwidth, double rate) {
    pulse.PulseLength = length;
    pulse.Bandwidth = bandwidth;
    pulse.PulseSamplingRate = rate;
    return pulse;
}

constexpr fcomplex kGuard{17.3F, -3.7F};

TEST(Chirp, FollowsTheQuadraticPhase) {
    const struct {
        double length_s, bandwidth_hz, rate_hz;
        int samples;
    } rows[] = {{10e-6, 15.3e6, 20e6, 200},    {37.12e-6, 15.55e6, 18.962468e6, 704},
                {1e-6, 0.3e6, 1.2e6, 1},       {1e-6, 0.3e6, 1.6e6, 2},
                {12.5, 0.7, 1.0, 13},          {12.4999, 0.7, 1.0, 12},
                {10e-6, -15.3e6, 20.3e6, 203}, {100e-6, 300e6, 600e6, 60000},
                {17e-6, 0.0, 1e6, 17}};
    for (const auto& row : rows) {
        SCOPED_TRACE(row.samples);
        SARPulse_Obj pulse;
        pulse.PulseKRate = 5.5e11;  // described, not used
        pulse.PulseEnergy = 17.3;
        ASSERT_EQ(set(pulse, row.length_s, row.bandwidth_hz, row.rate_hz).chirpSamples(), row.samples);
        std::vector<fcomplex> chirp(static_cast<std::size_t>(row.samples) + 1, kGuard);
        ASSERT_EQ(pulse.generateChirp(chirp.data()), 0);
        EXPECT_EQ(chirp.back(), kGuard) << "written beyond the last sample";
        chirp.pop_back();
        EXPECT_EQ(chirp, std::vector<fcomplex>(chirp.rbegin(), chirp.rend())) << "symmetric to the last bit";
        const double amplitude = std::sqrt(std::abs(row.bandwidth_hz) / row.rate_hz / row.samples);
        for (int n = 0; n < row.samples; ++n) {
            // In half samples from the middle the offset is a whole number: no rounding enters before the last
            // step.
            const double half_steps = 2.0 * n - (row.samples - 1);
            const double turns =
                row.bandwidth_hz / row.length_s * half_steps * half_steps / (8.0 * row.rate_hz * row.rate_hz);
            const double angle = 2.0 * std::numbers::pi * (turns - std::floor(turns));
            const fcomplex sample = chirp[static_cast<std::size_t>(n)];
            ASSERT_NEAR(sample.real(), amplitude * std::cos(angle), 1e-6 * amplitude) << n;
            ASSERT_NEAR(sample.imag(), amplitude * std::sin(angle), 1e-6 * amplitude) << n;
        }
    }
}

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
        fcomplex sample = kGuard;
        EXPECT_EQ(pulse.chirpSamples(), 0) << row.name;
        EXPECT_EQ(pulse.generateChirp(&sample), 1) << row.name;
        EXPECT_EQ(sample, kGuard) << row.name;
        EXPECT_EQ(report.entries("ERROR").size(), ++refused) << row.name;
    }
    SARPulse_Obj good;
    EXPECT_EQ(set(good, 1e-5, 1e6, 2e7).generateChirp(nullptr), 1);
    constexpr int kMost = SARPulse_Obj::kMaxChirpSamples;
    EXPECT_EQ(set(good, 1.0, 1e6, kMost).chirpSamples(), kMost);
}

}  // namespace
