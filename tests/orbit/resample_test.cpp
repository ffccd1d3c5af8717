#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <string>
#include <vector>

#include "orbit/made_orbits.h"
#include "support/diagnostics.h"
#include "support/geometry.h"
#include "support/scenes.h"

// Re-sampled state vectors, the estimate of the model's own error, and the examination of the list.

namespace {

using test::Vec3;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

struct Deviation {
    double position_m = 0.0, velocity_m_s = 0.0;
};
/** Largest distance of the model from the motion over a span of times. */
template <typename Motion>
Deviation worst(GeneralSAROrbit& orbit, double from, double to, const Motion& motion) {
    Deviation deviation;
    for (int i = 0; i <= 997; ++i) {
        const double t = from + i / 997.0 * (to - from);
        const test::Platform truth = motion(t);
        deviation.position_m =
            std::max(deviation.position_m, test::norm(test::position_at(orbit, t) - truth.position));
        deviation.velocity_m_s =
            std::max(deviation.velocity_m_s, test::norm(test::velocity_at(orbit, t) - truth.velocity));
    }
    return deviation;
}

struct Sampling {
    const char* name;
    double eccentricity, spacing_s;
    int count;
    double new_spacing_s;
    int new_count;
};
constexpr Sampling kSamplings[] = {
    {"MinuteToTenSeconds", 0.0, 60.0, 12, 10.0, 67},
    {"MinuteToTenSecondsFiveVectors", 0.0, 60.0, 5, 10.0, 25},
    {"MinuteToTenSecondsSevenVectors", 0.003, 60.0, 7, 10.0, 37},
    {"MinuteEllipse", 0.05, 60.0, 40, 10.0, 235},
    {"HalfMinuteToWhatDoesNotDivide", 0.001, 29.3, 11, 7.0, 43},
    {"SpacingOfItsOwn", 0.001, 9.7, 17, 9.7, 17},
    {"NeverBelowFiveVectors", 0.001, 2.0, 17, 1e6, 5},
};
class Resampled : public testing::TestWithParam<Sampling> {
protected:
    [[nodiscard]] test::Platform motion(double t) const {
        return ellipse_.earth_fixed(t - times_.first_s - 100.0);
    }
    test::Times times_{803457.3, GetParam().spacing_s, GetParam().count};
    test::EllipticOrbit ellipse_{41.3, 12.8, -12.7, GetParam().eccentricity};
};
INSTANTIATE_TEST_SUITE_P(Table, Resampled, testing::ValuesIn(kSamplings),
                         [](const auto& row) { return row.param.name; });

TEST_P(Resampled, FollowsTheTrueOrbit) {
    GeneralSAROrbit orbit;
    test::make_orbit(orbit, times_, [this](double t) { return motion(t); });
    ASSERT_EQ(orbit.SVResample(GetParam().new_spacing_s), 0);
    EXPECT_EQ(orbit.nSV_n, GetParam().new_count);
    EXPECT_EQ(orbit.t0SV_s, times_.first_s);
    EXPECT_NEAR(orbit.dtSV_s * (orbit.nSV_n - 1), times_.last() - times_.first_s, 1e-9);
    const Deviation after = worst(orbit, times_.first_s, times_.last(), [this](double t) { return motion(t); });
    EXPECT_LT(after.position_m, 1e-3);
    EXPECT_LT(after.velocity_m_s, 1e-4);
    for (int i = 0; i < orbit.nSV_n; ++i) {
        const Vec3 truth = motion(orbit.t0SV_s + i * orbit.dtSV_s).velocity;
        const double* v = orbit.vSV_mOs + 3 * static_cast<std::ptrdiff_t>(i);
        EXPECT_LT(test::norm(Vec3{v[0], v[1], v[2]} - truth), 1e-6);
    }
}

// The estimate lies within a third of the true error of the model.
TEST_P(Resampled, ErrorIsEstimatedBefore) {
    GeneralSAROrbit orbit;
    test::make_orbit(orbit, times_, [this](double t) { return motion(t); });
    const double truth =
        worst(orbit, times_.first_s, times_.last(), [this](double t) { return motion(t); }).position_m;
    EXPECT_NEAR(orbit.orbitFitError(), truth, truth / 3.0 + 2e-8);
    if (GetParam().spacing_s == 60.0) {
        EXPECT_GT(orbit.orbitFitError(), 0.1);
    }
    if (GetParam().spacing_s < 10.0) {
        EXPECT_LT(orbit.orbitFitError(), 5e-5);
    }
}

// Where the orbit is roughest in its middle the runs there decide, and only the part of them in use.
TEST(OrbitFitError, SeesARoughMiddle) {
    const test::CircularOrbit circle{41.3, 12.8, -12.7};
    const test::Times times{803457.3, 9.7, 33};
    const auto motion = [&](double t) {
        test::Platform state = circle.earth_fixed(t - times.first_s);
        const double s = (t - times.at(16)) / 45.0;
        state.position = state.position + Vec3{37.0 * std::exp(-s * s), 0.0, 0.0};
        return state;
    };
    GeneralSAROrbit orbit;
    test::make_orbit(orbit, times, motion);
    const double truth = worst(orbit, times.first_s, times.last(), motion).position_m;
    EXPECT_GT(truth, 1e-3);
    EXPECT_NEAR(orbit.orbitFitError(), truth, truth / 3.0);
}

// Velocities that are not the positions' derivative would bend a curve that takes them by 12 cm between two
// vectors.
TEST(SVResample, LeavesWrongVelocitiesAside) {
    const test::CircularOrbit circle{41.3, 12.8, -12.7};
    const test::Times times{803457.3, 60.0, 12};
    const auto motion = [&](double t) { return circle.earth_fixed(t - times.first_s); };
    GeneralSAROrbit orbit;
    test::make_orbit(orbit, times, [&](double t) {
        test::Platform state = motion(t);
        state.velocity = state.velocity + Vec3{0.013, -0.011, 0.008};
        return state;
    });
    ASSERT_EQ(orbit.SVResample(10.0), 0);
    EXPECT_LT(worst(orbit, times.first_s, times.last(), motion).position_m, 1e-3);
}

TEST(SVResample, WritesWhatItMade) {
    const test::CircularOrbit circle{41.3, 12.8, -12.7};
    const test::TemporaryFolder folder;
    GeneralSAROrbit orbit, back;
    test::make_orbit(orbit, {803457.3, 60.0, 7}, [&](double t) { return circle.earth_fixed(t - 803457.3); });
    ASSERT_EQ(orbit.SVResample(7.0), 0);
    ASSERT_EQ(orbit.writehdr(folder.file("orbit.xml").c_str()), 0);
    ASSERT_EQ(back.readhdr(folder.file("orbit.xml").c_str()), 0);
    ASSERT_EQ(back.nSV_n, 53);
    for (int i = 0; i < 3 * 53; ++i) EXPECT_NEAR(back.pSV_m[i], orbit.pSV_m[i], 1e-7);
}

TEST(SVResample, LeavesTheOrbitAsItWasWhenRefused) {
    const test::CircularOrbit circle{41.3, 12.8, -12.7};
    GeneralSAROrbit orbit;
    EXPECT_EQ(orbit.SVResample(10.0), QUO_REFUSED);
    test::make_orbit(orbit, {803457.3, 9.7, 17}, [&](double t) { return circle.earth_fixed(t - 803457.3); });
    const double* positions = orbit.pSV_m;
    const double x = orbit.SVGetPos(803500.0)[0];
    for (const double bad : {0.0, -1.0, kNaN, std::numeric_limits<double>::infinity(), 1e-9, 1e-300})
        EXPECT_EQ(orbit.SVResample(bad), QUO_REFUSED) << bad;
    EXPECT_EQ(orbit.pSV_m, positions);
    EXPECT_EQ(orbit.nSV_n, 17);
    EXPECT_EQ(orbit.dtSV_s, 9.7);
    EXPECT_EQ(orbit.SVGetPos(803500.0)[0], x);
}

// --- SVCheck ----------------------------------------------------------------------------------------------------

std::vector<SVFinding> check(const GeneralSAROrbit& orbit) {
    std::vector<SVFinding> findings;
    EXPECT_EQ(orbit.SVCheck(findings), 0);
    return findings;
}
std::string texts(const std::vector<SVFinding>& findings) {
    std::string all;
    for (const SVFinding& finding : findings) all += std::string{finding.text} + "\n";
    return all;
}

TEST(SVCheck, IsContentWithRealOrbits) {
    for (const test::Scene& scene : test::kScenes) {
        GeneralSAROrbit orbit;
        test::load_orbit(scene, orbit);
        EXPECT_EQ(texts(check(orbit)), "") << scene.name;
        EXPECT_LT(orbit.orbitFitError(), 1e-4) << scene.name;
    }
}

TEST_P(Resampled, CheckIsContentWithAnyGoodOrbit) {
    GeneralSAROrbit orbit;
    test::make_orbit(orbit, times_, [this](double t) { return motion(t); });
    EXPECT_EQ(texts(check(orbit)), "");
    for (int i = 0; i < 3 * orbit.nSV_n; ++i) {  // as text with three decimals would have them
        orbit.pSV_m[i] = std::round(orbit.pSV_m[i] * 1e3) / 1e3;
        orbit.vSV_mOs[i] = std::round(orbit.vSV_mOs[i] * 1e4) / 1e4;
    }
    EXPECT_EQ(texts(check(orbit)), "");
}

// A spacing too wide for the model is not the vectors' fault.
TEST(SVCheck, IsContentWithWideSpacing) {
    const test::EllipticOrbit ellipse{41.3, 12.8, -12.7, 0.002};
    for (const double spacing : {120.0, 240.0, 300.0}) {
        GeneralSAROrbit orbit;
        test::make_orbit(orbit, {803457.3, spacing, 9},
                         [&](double t) { return ellipse.earth_fixed(t - 803957.3); });
        EXPECT_EQ(texts(check(orbit)), "") << spacing;
    }
}

class OneWrongVector : public testing::TestWithParam<int> {
protected:
    OneWrongVector() {
        test::make_orbit(orbit_, {803457.3, 9.7, 13},
                         [this](double t) { return circle_.earth_fixed(t - 803457.3); });
    }
    [[nodiscard]] std::ptrdiff_t at() const { return 3 * static_cast<std::ptrdiff_t>(GetParam()); }
    void expect_finding(SVFinding::Problem problem, double size) {
        const std::vector<SVFinding> findings = check(orbit_);
        ASSERT_EQ(findings.size(), 1U) << texts(findings);
        EXPECT_EQ(findings[0].problem, problem) << findings[0].text;
        EXPECT_EQ(findings[0].index, GetParam());
        EXPECT_NEAR(findings[0].size, size, 1e-3 + 1e-6 * size);
        EXPECT_NE(std::string{findings[0].text}.find("state vector " + std::to_string(GetParam()) + ":"),
                  std::string::npos);
    }
    test::CircularOrbit circle_{41.3, 12.8, -12.7};
    GeneralSAROrbit orbit_;
};
INSTANTIATE_TEST_SUITE_P(At, OneWrongVector, testing::Range(0, 13));

TEST_P(OneWrongVector, PositionIsFound) {
    orbit_.pSV_m[at() + 1] += 8.5;
    expect_finding(SVFinding::kPositionStep, 8.5);
}
TEST_P(OneWrongVector, VelocityIsFound) {
    orbit_.vSV_mOs[at() + 2] -= 0.75;
    expect_finding(SVFinding::kVelocity, 0.75);
}
TEST_P(OneWrongVector, NotANumberIsFound) {
    orbit_.vSV_mOs[at()] = kNaN;
    expect_finding(SVFinding::kNotFinite, 0.0);
}
TEST_P(OneWrongVector, NullPositionIsFound) {
    std::fill_n(orbit_.pSV_m + at(), 3, 0.0);
    expect_finding(SVFinding::kInsideEarth, 0.0);
}
TEST_P(OneWrongVector, DuplicateIsFound) {
    const bool first = GetParam() == 0;  // has no predecessor: its successor is the duplicate
    std::copy_n(orbit_.pSV_m + at() + (first ? 3 : -3), 3, orbit_.pSV_m + at());
    orbit_.pSV_m[at()] += 3.0;  // near enough
    const std::vector<SVFinding> findings = check(orbit_);
    ASSERT_FALSE(findings.empty());
    EXPECT_EQ(findings.back().problem, SVFinding::kDuplicate);
    EXPECT_EQ(findings.back().index, first ? 1 : GetParam());
}

struct AllVelocities {
    const char* name;
    Vec3 (*velocity)(const test::Platform& state);
    double least_m_s, most_m_s;
};
const AllVelocities kAllVelocities[] = {
    {"Biased",
     [](const test::Platform& s) {
         return s.velocity + Vec3{0.012, 0.0, -0.016};
     },
     0.019, 0.021},
    {"Inertial",
     [](const test::Platform& s) {
         return s.velocity + test::cross({0.0, 0.0, test::kEarthRate}, s.position);
     },
     80.0, 520.0},
    {"KilometresPerSecond", [](const test::Platform& s) { return 1e-3 * s.velocity; }, 7e3, 8e3},
};
class WrongVelocities : public testing::TestWithParam<AllVelocities> {};
INSTANTIATE_TEST_SUITE_P(Table, WrongVelocities, testing::ValuesIn(kAllVelocities),
                         [](const auto& row) { return row.param.name; });

TEST_P(WrongVelocities, AreFoundAndMeasured) {
    const test::CircularOrbit circle{41.3, 12.8, -12.7};
    for (const double spacing : {9.7, 60.0}) {
        GeneralSAROrbit orbit;
        test::make_orbit(orbit, {803457.3, spacing, 13}, [&](double t) {
            test::Platform state = circle.earth_fixed(t - 803457.3);
            state.velocity = GetParam().velocity(state);
            return state;
        });
        const std::vector<SVFinding> findings = check(orbit);
        EXPECT_EQ(findings.size(), 13U);
        for (const SVFinding& finding : findings) {
            EXPECT_EQ(finding.problem, SVFinding::kVelocity) << finding.text;
            EXPECT_GT(finding.size, GetParam().least_m_s);
            EXPECT_LT(finding.size, GetParam().most_m_s);
        }
    }
}

TEST(SVCheck, FindsWhatIsWrongWithTheList) {
    const test::CircularOrbit circle{41.3, 12.8, -12.7};
    GeneralSAROrbit orbit;
    EXPECT_EQ(texts(check(orbit)),
              "state vectors: fewer than five 0 vectors\n"
              "state vectors: the times are not finite or do not increase; spacing -999 s\n");
    test::make_orbit(orbit, {803457.3, 9.7, 13}, [&](double t) { return circle.earth_fixed(t - 803457.3); });
    orbit.dtSV_s = 9.71;  // as wrong as every velocity: a thousandth
    EXPECT_GE(check(orbit).size(), 9U);
    orbit.dtSV_s = kNaN;
    const std::vector<SVFinding> findings = check(orbit);
    ASSERT_EQ(findings.size(), 1U);
    EXPECT_EQ(findings[0].problem, SVFinding::kTimes);
    EXPECT_EQ(findings[0].index, -1);
}

}  // namespace
