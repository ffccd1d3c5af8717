// SPDX-License-Identifier: Apache-2.0
#include "quo_base/acquisition.h"

#include "quo_base/datafile.h"
#include "support/diagnostics.h"
#include "support/fields.h"

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
    } rows[] = {{10e-6, 15.3e6, 20e6, 200}, {1e-6, 0.3e6, 1.2e6, 1},       {12.5, 0.7, 1.0, 13},
                {12.4999, 0.7, 1.0, 12},    {10e-6, -15.3e6, 20.3e6, 203}, {100e-6, 300e6, 600e6, 60000},
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

TEST(WriteChirp, WritesTheChirpAsOneLineOfComplexFloats) {
    const test::Report report;
    const std::string file = report.file("chirp"), unmade = report.file("unmade");
    SARPulse_Obj pulse;
    set(pulse, 37.12e-6, 15.55e6, 18.962468e6);
    ASSERT_EQ(pulse.writeChirp(file.c_str()), 0);
    std::vector<fcomplex> chirp(704);
    ASSERT_EQ(pulse.generateChirp(chirp.data()), 0);
    EXPECT_EQ(test::read_text(file),
              std::string(reinterpret_cast<const char*>(chirp.data()), 704 * sizeof(fcomplex)));
    DataFile raster;
    ASSERT_EQ(raster.read_hdr(file.c_str()), 0);
    EXPECT_THAT((std::vector<std::int64_t>{raster.NrOfPixelsPerLine, raster.NrOfLinesPerImage, raster.CellType,
                                           raster.ByteOrder, raster.HeaderOffset, raster.RowPrefix}),
                testing::ElementsAre(704, 1, FLOAT_COMPLEX, 0, 0, 0));

    EXPECT_EQ(SARPulse_Obj{}.writeChirp(unmade.c_str()), 1);
    EXPECT_FALSE(std::filesystem::exists(unmade));
    EXPECT_EQ(pulse.writeChirp(report.file("no_such_folder/chirp").c_str()), 9);
    EXPECT_EQ(pulse.writeChirp(std::string(512, 'n').c_str()), 1);
}

}  // namespace
