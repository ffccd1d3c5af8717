#include "quo_base/acquisition.h"

#include <cmath>
#include <complex>
#include <filesystem>
#include <limits>
#include <numbers>
#include <string>
#include <vector>

#include "annex_files.h"
#include "quo_base/datafile.h"
#include "support/header_object_suite.h"
#include "support/raster.h"

namespace {

using test::real, test::text;
using testing::ElementsAre, testing::IsEmpty, testing::Not;

struct Sampling : test::HeaderCase {
    using Object = SamplingConstants_Obj;
    static constexpr const char* kSection = "SamplingConstants";
    static constexpr test::FieldRow kRows[] = {
        real("fc_hz").keyed("CarrierFrequency"),
        real("frg_hz").keyed("SamplingRate"),
        real("Brg_hz").keyed("RangeBandWidth"),
        real("Trg_s").keyed("RangeTSamplingStep"),
        real("prf_hz").keyed("PRF"),
        real("pri_s").keyed("PRI"),
        real("Baz_hz").keyed("AzimuthBandwidth"),
        real("brf_hz").keyed("BRF"),
        real("bri_s").keyed("BRI"),
        real("lambda_m").keyed("WaveLength"),
    };
};
struct Pulse : test::HeaderCase {
    using Object = SARPulse_Obj;
    static constexpr const char* kSection = "Pulse";
    static constexpr test::FieldRow kRows[] = {
        real("PulseLength"), real("Bandwidth"), real("PulseKRate"), real("PulseEnergy"), real("PulseSamplingRate"),
    };
};
struct Attitude : test::HeaderCase {
    using Object = SensorAttitude_Obj;
    static constexpr const char* kSection = "SensorAttitude";
    static constexpr test::FieldRow kRows[] = {
        real("Eq_speed"),      real("Eq_distance"),       real("Mean_DC"),     real("SquintAngle"),
        real("AntennaLength"), real("DroopGain", 0.0, 8), real("Temperature"),
    };
};
struct Windows : test::HeaderCase {
    using Object = SpectralWindows_Obj;
    static constexpr const char* kSection = "SpectralWindows";
    static constexpr test::FieldRow kRows[] = {
        text("AzMatchedFilterType"), text("RgMatchedFilterType"), real("RgMatchedFilterCoef"),
        real("AzMatchedFilterCoef"), real("RgLookBandwidth"),     real("AzLookBandwidth"),
    };
};
constexpr test::FieldRow count(const char* name, double value) {
    return test::whole(name, value, 0.0, 2147483647.0);
}
struct QuickLook : test::HeaderCase {
    using Object = QuickLook_Obj;
    static constexpr const char* kSection = "QuickLook";
    static constexpr bool kFallsBack = false, kReadAlwaysSays0 = true;
    static constexpr test::FieldRow kRows[] = {
        count("QL_FirstSample", 0), count("QL_Samples", 0),   count("QL_FirstLine", 0),
        count("QL_Lines", 0),       count("QL_AzimuthML", 1), count("QL_RangeML", 1),
    };
    static std::vector<std::string> not_cloned() { return {"QL_AzimuthML", "QL_RangeML"}; }
};
using Cases = testing::Types<Sampling, Pulse, Attitude, Windows, QuickLook>;
}  // namespace
namespace test {
INSTANTIATE_TYPED_TEST_SUITE_P(Acquisition, HeaderObject, Cases, CaseName);
}
namespace {

// A text longer than its member must not run into the next one.
TEST(AcquisitionObjects, CutLongTextsToTheirMembers) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("windows.par"), longest(511, 'w');
    test::write_text(file, "[SpectralWindows]\nAzMatchedFilterType = " + longest +
                               "xyz\nRgMatchedFilterType = HAMMING\nRgMatchedFilterCoef = 0.75\n"
                               "AzMatchedFilterCoef = 0.54\nRgLookBandwidth = 17.5\nAzLookBandwidth = 1378.25\n");
    SpectralWindows_Obj windows;
    EXPECT_EQ(windows.readhdr(file.c_str()), 0);
    EXPECT_EQ(windows.AzMatchedFilterType, longest);
    EXPECT_STREQ(windows.RgMatchedFilterType, "HAMMING");
}

// --- the reference chirp ----------------------------------------------------------------------------------------

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

// --- the reference chirp as a raster --------------------------------------------------------------------------

SARPulse_Obj& make_pulse(SARPulse_Obj& pulse) { return set(pulse, 37.12e-6, 15.55e6, 18.962468e6); }

TEST(WriteChirp, WritesTheChirpAsOneLineOfComplexFloats) {
    const test::TemporaryFolder folder;
    const std::string file = folder.file("chirp");
    SARPulse_Obj pulse;
    make_pulse(pulse);
    ASSERT_EQ(pulse.writeChirp(file.c_str()), 0);

    std::vector<fcomplex> chirp(704);
    ASSERT_EQ(pulse.generateChirp(chirp.data()), 0);
    std::string bytes;
    for (const fcomplex& sample : chirp) {
        test::append_bytes(bytes, sample.real(), false);
        test::append_bytes(bytes, sample.imag(), false);
    }
    EXPECT_EQ(test::read_text(file), bytes);

    DataFile raster;
    ASSERT_EQ(raster.read_hdr(file.c_str()), 0);
    EXPECT_THAT((std::vector<std::int64_t>{raster.NrOfPixelsPerLine, raster.NrOfLinesPerImage, raster.CellType,
                                           raster.ByteOrder, raster.HeaderOffset, raster.RowPrefix}),
                ElementsAre(704, 1, FLOAT_COMPLEX, 0, 0, 0));
}

TEST(WriteChirp, PassesOnWhatFails) {
    const test::Report report;
    const std::string nowhere = report.file("no_such_folder/chirp"), unmade = report.file("unmade");
    SARPulse_Obj pulse, unknown;
    EXPECT_EQ(unknown.writeChirp(unmade.c_str()), 1);
    EXPECT_FALSE(std::filesystem::exists(unmade));
    EXPECT_EQ(make_pulse(pulse).writeChirp(nowhere.c_str()), 9);
    EXPECT_EQ(pulse.writeChirp(std::string(512, 'n').c_str()), 1);
    EXPECT_THAT(report.messages("ERROR"), Not(IsEmpty()));
    EXPECT_GE(report.entries("ERROR_CALL_TREE").size(), 3U);
    const std::string file = report.file("chirp");
    test::fail_every_allocation([&] { return pulse.writeChirp(file.c_str()); });
}

// --- droop gains ----------------------------------------------------------------------------------------------

constexpr std::size_t kData = 171648, kRecords = 171232;

float temperature(int swath) { return -17.25F - static_cast<float>(swath); }
double gain(int swath, int i) { return 1.0 + 0.0625 * i + 17.3 * swath; }

std::string droop_data() {
    std::string data(kRecords, 'x');
    for (int swath = 0; swath < 5; ++swath) {
        test::append_bytes(data, temperature(swath), true);
        for (int i = 0; i < 8; ++i) test::append_bytes(data, gain(swath, i), true);
    }
    data.resize(kData, 'y');
    return data;
}

class DroopGain : public testing::Test {
protected:
    int load(const std::string& content, int swath) {
        test::write_text(file_, content);
        return attitude_.getDroopGain(file_.c_str(), swath);
    }
    void expect_unchanged() { EXPECT_THAT(test::differing_fields(attitude_, same_), IsEmpty()); }
    void SetUp() override {
        test::fill_fields(attitude_);
        test::fill_fields(same_);
    }

    const test::Report report_;
    const std::string file_ = report_.file("annex");
    SensorAttitude_Obj attitude_, same_;
};

TEST_F(DroopGain, AreThoseOfTheSwath) {
    for (const std::size_t offset : {1625U, 2017U}) {
        for (int swath = 0; swath < 5; ++swath) {
            SCOPED_TRACE(swath);
            ASSERT_EQ(load(test::annex_file(offset, droop_data()), swath), 0);
            EXPECT_EQ(attitude_.Temperature, static_cast<double>(temperature(swath)));
            for (int i = 0; i < 8; ++i) EXPECT_EQ(attitude_.DroopGain[i], gain(swath, i));
            EXPECT_THAT(test::differing_fields(attitude_, same_), ElementsAre("DroopGain", "Temperature"));
        }
    }
}

TEST_F(DroopGain, StayForASwathThatTheFileDoesNotHave) {
    for (const int swath : {-1, 5, 2147483647, -2147483647}) {
        EXPECT_EQ(load(test::annex_file(1625, droop_data()), swath), 0);
        expect_unchanged();
    }
}

TEST_F(DroopGain, RefuseBadOffsets) {
    std::size_t entries = 0;
    for (const test::BadOffset& row : test::kBadOffsets) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(load(test::annex_file(row.offset_text, 1625, droop_data()), 2), row.status);
        expect_unchanged();
        EXPECT_GT(report_.entries("ERROR_CALL_TREE").size(), entries);
        entries = report_.entries("ERROR_CALL_TREE").size();
    }
}

TEST_F(DroopGain, RefuseAFileThatIsCutAnywhereAndALackOfMemory) {
    const std::string whole = test::annex_file(1700, droop_data());
    for (const std::size_t length : {0U, 1U, 1246U, 1247U, 1624U, 1625U, 1699U, 1700U, 172931U, 173347U}) {
        SCOPED_TRACE(length);
        EXPECT_EQ(load(whole.substr(0, length), 0), 4);
        expect_unchanged();
    }
    EXPECT_EQ(attitude_.getDroopGain(report_.file("missing").c_str(), 0), 9);
    EXPECT_EQ(attitude_.getDroopGain(nullptr, 0), 9);
    expect_unchanged();
    test::write_text(file_, whole);
    test::fail_every_allocation([&] { return attitude_.getDroopGain(file_.c_str(), 3); });
}

}  // namespace
