#include <gmock/gmock.h>

#include <cmath>
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
    {"RightSquintedForward", 1, +1, 1133090050.7, 0.0056817, 517.3, 411.7, 0, 0, 1.0, 3.1e6, FLOAT_COMPLEX, true,
     0, 0.0, 0.0},
    {"LeftZeroDoppler", 1, -1, 1133090050.7, 0.0056817, 517.3, 411.7, 0, 0, 0.0, 0.0, FLOAT_COMPLEX, false, 3, 0.0,
     0.0},
    {"LeftSquintedBackward", 0, -1, 1167930370.3, 0.0055231, 517.3, 411.7, 0, 0, -1.0, -2.7e6, SHORT_COMPLEX,
     false, 0, 3.0, 0.0},
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
                                        &target.latitude_deg, &target.longitude_deg),
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

}  // namespace
