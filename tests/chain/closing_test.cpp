// SPDX-License-Identifier: Apache-2.0
#include <regex>

#include "common/session.h"
#include "common/targets.h"
#include "echo_simulator/echoes.h"
#include "point_targets/measure.h"
#include "processor/focus.h"
#include "quo_base/acquisition.h"
#include "support/diagnostics.h"
#include "support/scenes.h"

namespace {

using example::Measurement;
using example::Target;

/** Nine targets, three by three, around a place of a scene. */
struct Acquisition {
    const char* name;
    int scene;  // of test::kScenes
    int look_sign;
    double azimuth_s, range_s;  // of the middle target
    double lines, samples;      // between neighbours
    double height_m;            // of the middle targets
    void (*set)(example::EchoJob&);
};
void PrintTo(const Acquisition& acquisition, std::ostream* out) { *out << acquisition.name; }

// The Doppler centroid at the nearest target is 0, a whole PRF backwards, and a part of it.
constexpr Acquisition kAcquisitions[] = {
    {"RightZeroDoppler", 0, +1, 1167930370.3, 0.0055231, 517.3, 411.7, 61.7,
     [](auto& job) {
         job.cell_type = SHORT_COMPLEX, job.big_endian = true, job.line_prefix = 17, job.noise = 3.0;
     }},
    {"LeftSquintedBackward", 0, -1, 1167930370.3, 0.0055231, 517.3, 411.7, 0.0,
     [](auto& job) {
         job.big_endian = true, job.line_prefix = 3, job.noise = 3.0;
         job.doppler_hz = -1717.128973878037, job.doppler_slope_hz_s = -2.7e6;
     }},
    {"AirborneLeftSquinted", 2, -1, 869150210.3, 1.013e-4, 131.3, 107.9, 0.0,
     [](auto& job) { job.prf_hz = 103.7, job.beam_bandwidth_hz = 81.3, job.doppler_hz = 0.37 * 103.7; }},
};

std::vector<Target> nine_targets(const Acquisition& row, const example::EchoJob& job) {
    GeneralSAROrbit orbit;
    test::load_orbit(test::kScenes[row.scene], orbit);
    orbit.setLookSign(row.look_sign);
    SamplingConstants_Obj sampling;
    EXPECT_EQ(sampling.readhdr(test::kScenes[row.scene].path(".xml").c_str()), 0);
    const double line_s = row.lines / (job.prf_hz > 0.0 ? job.prf_hz : sampling.prf_hz);
    std::vector<Target> targets;
    for (int i = 0; i < 9; ++i) {
        const int line = i / 3 - 1, sample = i % 3 - 1;
        Target target{"target " + std::to_string(i), 0.0, 0.0, line == 0 ? row.height_m : 0.0,
                      300.0 + 17.3 * sample};
        EXPECT_EQ(
            orbit.SVGetLatLon(row.azimuth_s + line * line_s, row.range_s + sample * row.samples / sampling.frg_hz,
                              &target.place.latitude_deg, &target.place.longitude_deg),
            0);
        targets.push_back(target);
    }
    return targets;
}

class Chain : public testing::TestWithParam<Acquisition> {};
INSTANTIATE_TEST_SUITE_P(Acquisitions, Chain, testing::ValuesIn(kAcquisitions),
                         [](const auto& row) { return row.param.name; });

// Everything meets here: a wrong sign, origin, unit, byte order or ambiguity anywhere in the library or the
// examples moves, widens or turns the responses. Theory: a flat band gives sidelobes of -13.26 dB, and -10.2 dB
// altogether.
TEST_P(Chain, FocusesTargetsWhereTheyAre) {
    const test::TemporaryFolder folder;
    const std::string report = folder.file("report.txt"), image = folder.file("image");
    example::EchoJob echoes{test::kScenes[GetParam().scene].path(".xml"), folder.file("raw"), {}};
    echoes.look_sign = GetParam().look_sign;
    GetParam().set(echoes);
    echoes.targets = nine_targets(GetParam(), echoes);
    AzimuthConf azimuth;
    azimuth.LinesInBlock = 2048;
    azimuth.SamplesInBlock = 512;
    azimuth.AzimuthOverlap = 0;
    azimuth.RangeOverlap = 16;
    std::vector<Measurement> found;
    test::CapturedStderr captured;
    {
        const example::Session session{"Closing test", report, ""};
        example::simulate_echoes(echoes);
        example::focus({echoes.raster, image, 0.0, false}, azimuth, generalProcessingConf{});
        found = example::measure(image, echoes.targets);
    }
    EXPECT_THAT(test::read_text(report) + captured.text(), testing::Not(testing::ContainsRegex("ERROR|MEMORY")));
    example::print_table(stdout, found);
    ASSERT_EQ(found.size(), 9U);
    for (const Measurement& target : found) {
        SCOPED_TRACE(target.name);
        EXPECT_TRUE(example::within_bounds(target) && target.ground_m < 1.0);
        EXPECT_NEAR(target.strength_db, 0.0, 0.3);
        for (const example::Response& response : {target.azimuth, target.range}) {
            EXPECT_NEAR(response.side_lobe_db, -13.26, 0.5);
            EXPECT_NEAR(response.integrated_db, -10.2, 0.5);
        }
    }
}

/** A small raster: two targets, a narrow beam, a short pulse, noise. */
class SmallRaster : public testing::Test {
protected:
    void SetUp() override {
        echoes_.targets = {{"south", 41.2037614, 11.6878159, 0.0, 300.0},
                           {"north", 41.2537614, 11.6678159, 0.0, 300.0}};
        echoes_.beam_bandwidth_hz = 513.7;
        echoes_.pulse_s = 2.1e-6;
        echoes_.doppler_hz = -713.9;
        echoes_.noise = 10.0;
        example::simulate_echoes(echoes_);
        azimuth_.AzimuthOverlap = 0;
    }
    example::FocusResult focus(const char* image, bool waitbar = false) {
        return example::focus({echoes_.raster, folder_.file(image), 0.0, waitbar}, azimuth_, processing_);
    }
    std::vector<fcomplex> pixels(const char* image, const example::FocusResult& size) {
        std::vector<fcomplex> values(std::size_t(size.lines) * std::size_t(size.samples));
        BufferFile raster{folder_.file(image).c_str()};
        EXPECT_EQ(raster.readhdr(), 0);
        raster.open(BufferFile::READ);
        raster.readbuffer(values.data(), 0, size.lines, 0, 0);
        return values;
    }

    test::TemporaryFolder folder_;
    example::EchoJob echoes_{test::kScenes[0].path(".xml"), folder_.file("raw"), {}};
    AzimuthConf azimuth_;
    generalProcessingConf processing_;
};

// Blocks overlap by whole apertures, so that an image does not show where they met: not in noise either, which has
// no margins as a target has.
TEST_F(SmallRaster, DoesNotShowItsBlocks) {
    const example::FocusResult whole = focus("whole");
    azimuth_.LinesInBlock = azimuth_.SamplesInBlock = 1;
    azimuth_.RangeOverlap = 16;
    test::CapturedStderr captured;
    const example::FocusResult cut = focus("cut", true);
    EXPECT_THAT(captured.text(), testing::MatchesRegex("USE_WAITBAR\nSET_TITLE: Focusing\n(SET_WAITBAR: .*\n)+"
                                                       "CLOSE_WAITBAR\n"));
    ASSERT_TRUE(cut.lines == whole.lines && cut.samples == whole.samples);
    ASSERT_TRUE(2 * cut.block_lines < whole.block_lines && 2 * cut.block_samples < whole.block_samples);
    const std::vector<fcomplex> one = pixels("whole", whole), many = pixels("cut", cut);
    double power = 0.0, difference = 0.0;
    for (std::size_t i = 0; i < one.size(); ++i) {
        power += static_cast<double>(std::norm(one[i]));
        difference += static_cast<double>(std::norm(many[i] - one[i]));
    }
    EXPECT_LT(difference, 1e-3 * power);
}

// In a raster or in memory, by one thread or three: what stands between the two steps changes no bit of the image.
TEST_F(SmallRaster, IsTheSameWithItsDataInMemory) {
    focus("by_raster");
    processing_.Flag_incore = 1;
    example::focus({echoes_.raster, folder_.file("in_core"), 0.0, false, 3}, azimuth_, processing_);
    EXPECT_EQ(test::read_text(folder_.file("in_core")), test::read_text(folder_.file("by_raster")));
    EXPECT_FALSE(std::filesystem::exists(folder_.file("in_core.rc")));
}

// Hamming's weights cost resolution, half as much again, and take the sidelobes away. Amplitudes stay.
TEST_F(SmallRaster, TradesResolutionForSidelobes) {
    azimuth_.AzimuthWindowHammingParameter = azimuth_.RangeWindowHammingParameter = 0.46F;
    focus("weighted");
    for (const Measurement& target : example::measure(folder_.file("weighted"), echoes_.targets)) {
        EXPECT_NEAR(target.strength_db, 0.0, 0.5) << target.name;
        for (const example::Response& response : {target.azimuth, target.range}) {
            EXPECT_NEAR(response.shift, 0.0, 0.1) << target.name;
            EXPECT_NEAR(response.resolution / response.theory, 1.47, 0.1) << target.name;
            EXPECT_LT(response.side_lobe_db, -30.0) << target.name;
        }
    }
}

TEST_F(SmallRaster, IsRefusedWhereItCannotBeFocused) {
    const std::string header = echoes_.raster + ".hdr", good = test::read_text(header);
    // Longer than the file, other than the region, no PRF, a pulse of no length or longer than the line, no
    // Doppler polynomials, a beam wider than the PRF.
    using Fault = std::pair<std::string, const char*>;
    for (const auto& [name, text] :
         {Fault{"NrOfLinesPerImage", "1000000000"}, Fault{"Lines", "7"}, Fault{"prf_hz", "-999"},
          Fault{"PulseLength", "0"}, Fault{"PulseLength", "0.01"}, Fault{"ndc", "0"}, Fault{"Baz_hz", "1800"}}) {
        const std::regex element{"<" + name + ">[^<]*<"};
        ASSERT_TRUE(std::regex_search(good, element)) << name;
        test::write_text(header, std::regex_replace(good, element, "<" + name + ">" + text + "<"));
        EXPECT_THROW(focus("refused"), example::Failure) << name << ' ' << text;
    }
    test::write_text(header, good);
    processing_.Memory = 0;
    EXPECT_THROW(focus("refused"), example::Failure);
}

}  // namespace
