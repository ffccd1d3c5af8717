#include <gmock/gmock.h>

#include <cmath>
#include <complex>
#include <regex>
#include <string>
#include <vector>

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
    double prf_hz, beam_hz;     // 0: the scene's
    double centroid_prf;        // Doppler centroid at the nearest target, PRFs
    double slope_hz_s;
    int cell_type;
    bool big_endian;
    int line_prefix;
    double noise;
    double height_m;  // of the middle targets
};

std::ostream& operator<<(std::ostream& out, const Acquisition& acquisition) { return out << acquisition.name; }

constexpr Acquisition kAcquisitions[] = {
    {"RightZeroDoppler", 0, +1, 1167930370.3, 0.0055231, 517.3, 411.7, 0, 0, 0.0, 0.0, SHORT_COMPLEX, true, 17,
     3.0, 61.7},
    {"LeftSquintedBackward", 0, -1, 1167930370.3, 0.0055231, 517.3, 411.7, 0, 0, -1.0, -2.7e6, FLOAT_COMPLEX, true,
     3, 3.0, 0.0},
    {"AirborneLeftSquinted", 2, -1, 869150210.3, 1.013e-4, 131.3, 107.9, 103.7, 81.3, 0.37, 0.0, FLOAT_COMPLEX,
     false, 0, 0.0, 0.0},
};

double given_or(double given, double otherwise) { return given > 0.0 ? given : otherwise; }

std::vector<Target> nine_targets(const Acquisition& row, const std::string& scene) {
    GeneralSAROrbit orbit;
    test::load_orbit(test::kScenes[row.scene], orbit);
    orbit.setLookSign(row.look_sign);
    SamplingConstants_Obj sampling;
    EXPECT_EQ(sampling.readhdr(scene.c_str()), 0);
    const double line_s = row.lines / given_or(row.prf_hz, sampling.prf_hz),
                 sample_s = row.samples / sampling.frg_hz;
    std::vector<Target> targets;
    for (const int line : {-1, 0, 1}) {
        for (const int sample : {-1, 0, 1}) {
            Target target{"target " + std::to_string(targets.size()), 0.0, 0.0, line == 0 ? row.height_m : 0.0,
                          300.0 + 17.3 * sample};
            EXPECT_EQ(orbit.SVGetLatLon(row.azimuth_s + line * line_s, row.range_s + sample * sample_s,
                                        &target.place.latitude_deg, &target.place.longitude_deg),
                      0);
            targets.push_back(target);
        }
    }
    return targets;
}

class Chain : public testing::TestWithParam<Acquisition> {
protected:
    /** Simulates, focuses and measures, and returns what stood in the report and on standard error. */
    std::string run(std::vector<Measurement>& found) {
        const Acquisition& row = GetParam();
        const std::string scene = test::kScenes[row.scene].path(".xml"), report = folder_.file("report.txt");
        example::EchoJob echoes{scene, folder_.file("raw"), nine_targets(row, scene)};
        echoes.look_sign = row.look_sign;
        echoes.prf_hz = row.prf_hz;
        echoes.beam_bandwidth_hz = row.beam_hz;
        echoes.doppler_hz = row.centroid_prf * given_or(row.prf_hz, 1717.128973878037);
        echoes.doppler_slope_hz_s = row.slope_hz_s;
        echoes.noise = row.noise;
        echoes.cell_type = row.cell_type;
        echoes.big_endian = row.big_endian;
        echoes.line_prefix = row.line_prefix;
        AzimuthConf azimuth;
        azimuth.LinesInBlock = 2048;
        azimuth.SamplesInBlock = 512;
        azimuth.AzimuthOverlap = 0;
        azimuth.RangeOverlap = 16;

        test::CapturedStderr captured;
        {
            const example::Session session{"Closing test", report, ""};
            example::simulate_echoes(echoes);
            example::focus({echoes.raster, folder_.file("image"), 0.0, false}, azimuth, generalProcessingConf{});
            found = example::measure(folder_.file("image"), echoes.targets);
        }
        return test::read_text(report) + captured.text();
    }

private:
    test::TemporaryFolder folder_;
};

// Everything meets here: a wrong sign, origin, unit, byte order or ambiguity anywhere in the library or the
// examples moves, widens or turns the responses. Theory: a flat band gives sidelobes of -13.26 dB, and -10.2 dB
// altogether.
TEST_P(Chain, FocusesTargetsWhereTheyAre) {
    std::vector<Measurement> found;
    const std::string told = run(found);
    example::print_table(stdout, found);
    ASSERT_EQ(found.size(), 9U);
    for (const Measurement& target : found) {
        EXPECT_TRUE(example::within_bounds(target)) << target.name;
        EXPECT_LT(target.ground_m, 1.0) << target.name;
        EXPECT_NEAR(target.strength_db, 0.0, 0.3) << target.name;
        for (const example::Response& response : {target.azimuth, target.range}) {
            EXPECT_NEAR(response.side_lobe_db, -13.26, 0.5) << target.name;
            EXPECT_NEAR(response.integrated_db, -10.2, 0.5) << target.name;
        }
    }
    EXPECT_THAT(told, testing::Not(testing::HasSubstr("ERROR")));
    EXPECT_THAT(told, testing::Not(testing::HasSubstr("MEMORY")));
}
INSTANTIATE_TEST_SUITE_P(Acquisitions, Chain, testing::ValuesIn(kAcquisitions),
                         [](const auto& row) { return row.param.name; });

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
        std::vector<fcomplex> values(static_cast<std::size_t>(size.lines) *
                                     static_cast<std::size_t>(size.samples));
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
    ASSERT_EQ(cut.lines, whole.lines);
    ASSERT_EQ(cut.samples, whole.samples);
    ASSERT_LT(2 * cut.block_lines, whole.block_lines);
    ASSERT_LT(2 * cut.block_samples, whole.block_samples);
    const std::vector<fcomplex> one = pixels("whole", whole), many = pixels("cut", cut);
    double power = 0.0, difference = 0.0;
    for (std::size_t i = 0; i < one.size(); ++i) {
        power += static_cast<double>(std::norm(one[i]));
        difference += static_cast<double>(std::norm(many[i] - one[i]));
    }
    EXPECT_LT(difference, 1e-3 * power);
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
    struct Fault {
        const char *name, *element, *text;
    };
    constexpr Fault kFaults[] = {{"longer than the file", "NrOfLinesPerImage", "1000000000"},
                                 {"other than the region", "Lines", "7"},
                                 {"no PRF", "prf_hz", "-999"},
                                 {"a pulse without length", "PulseLength", "0"},
                                 {"a pulse longer than the line", "PulseLength", "0.01"},
                                 {"no Doppler polynomials", "ndc", "0"},
                                 {"a beam wider than the PRF", "Baz_hz", "1800"}};
    for (const Fault& fault : kFaults) {
        const std::regex element{std::string{"<"} + fault.element + ">[^<]*<"};
        ASSERT_TRUE(std::regex_search(good, element)) << fault.element;
        test::write_text(
            header, std::regex_replace(good, element, std::string{"<"} + fault.element + ">" + fault.text + "<"));
        EXPECT_THROW(focus("refused"), example::Failure) << fault.name;
    }
    test::write_text(header, good);
    processing_.Memory = 0;
    EXPECT_THROW(focus("refused"), example::Failure);
}

}  // namespace
