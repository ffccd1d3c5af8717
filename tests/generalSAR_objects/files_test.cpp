#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <complex>
#include <filesystem>
#include <string>
#include <vector>

#include "annex_files.h"
#include "quo_base/acquisition.h"
#include "quo_base/datafile.h"
#include "support/diagnostics.h"
#include "support/fields.h"
#include "support/full_disk.h"
#include "support/raster.h"

namespace {

using testing::ElementsAre, testing::IsEmpty, testing::Not;

// --- the reference chirp as a raster --------------------------------------------------------------------------

SARPulse_Obj& make_pulse(SARPulse_Obj& pulse) {
    pulse.PulseLength = 37.12e-6;
    pulse.Bandwidth = 15.55e6;
    pulse.PulseSamplingRate = 18.962468e6;
    return pulse;
}

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
    {
        const test::FullDisk full{100};
        EXPECT_EQ(pulse.writeChirp(file.c_str()), 5);
    }
    EXPECT_FALSE(std::filesystem::exists(file + ".hdr"));
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
