#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <fstream>
#include <functional>
#include <limits>
#include <numeric>
#include <sstream>
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
    Resampled() { test::make_orbit(orbit_, times_, motion_); }
    [[nodiscard]] Deviation deviation() { return worst(orbit_, times_.first_s, times_.last(), motion_); }

    test::Times times_{803457.3, GetParam().spacing_s, GetParam().count};
    test::EllipticOrbit ellipse_{41.3, 12.8, -12.7, GetParam().eccentricity};
    std::function<test::Platform(double)> motion_ = [this](double t) {
        return ellipse_.earth_fixed(t - times_.first_s - 100.0);
    };
    GeneralSAROrbit orbit_;
};
INSTANTIATE_TEST_SUITE_P(Table, Resampled, testing::ValuesIn(kSamplings),
                         [](const auto& row) { return row.param.name; });

TEST_P(Resampled, FollowsTheTrueOrbit) {
    // The estimate of the model's own error lies within a third of the truth.
    const double before = deviation().position_m;
    EXPECT_NEAR(orbit_.orbitFitError(), before, before / 3.0 + 2e-8);
    if (GetParam().spacing_s == 60.0) {
        EXPECT_GT(orbit_.orbitFitError(), 0.1);
    }
    if (GetParam().spacing_s < 10.0) {
        EXPECT_LT(orbit_.orbitFitError(), 5e-5);
    }

    ASSERT_EQ(orbit_.SVResample(GetParam().new_spacing_s), 0);
    EXPECT_EQ(orbit_.nSV_n, GetParam().new_count);
    EXPECT_EQ(orbit_.t0SV_s, times_.first_s);
    EXPECT_NEAR(orbit_.dtSV_s * (orbit_.nSV_n - 1), times_.last() - times_.first_s, 1e-9);
    EXPECT_LT(deviation().position_m, 1e-3);
    EXPECT_LT(deviation().velocity_m_s, 1e-4);
    for (int i = 0; i < orbit_.nSV_n; ++i) {
        const double* v = orbit_.vSV_mOs + 3 * static_cast<std::ptrdiff_t>(i);
        const Vec3 truth = motion_(orbit_.t0SV_s + i * orbit_.dtSV_s).velocity;
        EXPECT_LT(test::norm(Vec3{v[0], v[1], v[2]} - truth), 1e-6);
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
    test::Flight flight{{803457.3, 60.0, 12}};
    for (int i = 0; i < 36; ++i) flight.orbit.vSV_mOs[i] += 0.013 - 0.002 * (i % 3);
    ASSERT_EQ(flight.orbit.SVResample(10.0), 0);
    const auto motion = [&](double t) { return flight.state(t); };
    EXPECT_LT(worst(flight.orbit, flight.times.first_s, flight.times.last(), motion).position_m, 1e-3);
}

TEST(SVResample, WritesWhatItMade) {
    const test::TemporaryFolder folder;
    test::Flight flight{{803457.3, 60.0, 7}};
    GeneralSAROrbit back;
    ASSERT_EQ(flight.orbit.SVResample(7.0), 0);
    ASSERT_EQ(flight.orbit.writehdr(folder.file("orbit.xml").c_str()), 0);
    ASSERT_EQ(back.readhdr(folder.file("orbit.xml").c_str()), 0);
    ASSERT_EQ(back.nSV_n, 53);
    for (int i = 0; i < 3 * 53; ++i) EXPECT_NEAR(back.pSV_m[i], flight.orbit.pSV_m[i], 1e-7);
}

TEST(SVResample, LeavesTheOrbitAsItWasWhenRefused) {
    EXPECT_EQ(GeneralSAROrbit{}.SVResample(10.0), QUO_REFUSED);
    test::Flight flight{{803457.3, 9.7, 17}};
    GeneralSAROrbit& orbit = flight.orbit;
    const double* positions = orbit.pSV_m;
    const double x = orbit.SVGetPos(803500.0)[0];
    // 1e-6 once asked for 155 million vectors.
    for (const double bad : {0.0, -1.0, kNaN, std::numeric_limits<double>::infinity(), 1e-6, 1e-9, 1e-300})
        EXPECT_EQ(orbit.SVResample(bad), QUO_REFUSED) << bad;
    std::vector<double> times(17);
    for (std::size_t i = 0; i < 17; ++i) times[i] = 9.7 * static_cast<double>(i);
    for (const double bad : {kNaN, times[5], times[3], -std::numeric_limits<double>::infinity()}) {
        std::vector<double> wrong = times;
        wrong[6] = bad;
        EXPECT_EQ(orbit.SVResample(5.0, wrong.data()), QUO_REFUSED) << bad;
    }
    EXPECT_TRUE(orbit.pSV_m == positions && orbit.nSV_n == 17 && orbit.dtSV_s == 9.7);
    EXPECT_EQ(orbit.SVGetPos(803500.0)[0], x);
}

// --- precise vectors --------------------------------------------------------------------------------------------

/** A real satellite's vectors, 10 s apart, some of which an orbit gets while the others judge it. */
class PreciseOrbit : public testing::Test {
protected:
    struct State {
        double values[6];
    };
    PreciseOrbit() {
        std::ifstream file{std::string{QUO_TEST_DATA} + "/orbits/s1a_20230823_precise.csv"};
        for (std::string line; std::getline(file, line);) {
            State state{};
            double time_s = 0.0;
            std::ranges::replace(line, ',', ' ');
            std::istringstream cells{line};
            if (!(cells >> time_s)) continue;
            for (double& value : state.values) cells >> value;
            states_.push_back(state);
        }
        errno = 0;
    }
    /** Every so-manieth vector, as many as the numbers list. */
    void give(GeneralSAROrbit& orbit, std::size_t every, const std::vector<std::size_t>& numbers) const {
        ASSERT_EQ(orbit.SVCreate(0.0, 10.0 * static_cast<double>(every), static_cast<int>(numbers.size())), 0);
        for (std::size_t i = 0; i < numbers.size(); ++i) {
            std::copy_n(states_.at(every * numbers[i]).values, 3, orbit.pSV_m + 3 * i);
            std::copy_n(states_.at(every * numbers[i]).values + 3, 3, orbit.vSV_mOs + 3 * i);
        }
        ASSERT_EQ(orbit.computeApproximateSV(), 0);
    }
    /** Largest distance of the model from the vectors up to its end. */
    double error_m(GeneralSAROrbit& orbit) const {
        double worst_m = 0.0;
        for (std::size_t i = 0; static_cast<double>(i) * 10.0 <= orbit.dtSV_s * (orbit.nSV_n - 1) + 1e-6; ++i) {
            const auto& [x, y, z, vx, vy, vz] = states_.at(i).values;
            const Vec3 p = test::position_at(orbit, static_cast<double>(i) * 10.0);
            worst_m = std::max(worst_m, test::norm(p - Vec3{x, y, z}));
        }
        return worst_m;
    }
    static std::vector<std::size_t> first(std::size_t count) {
        std::vector<std::size_t> numbers(count);
        std::iota(numbers.begin(), numbers.end(), std::size_t{0});
        return numbers;
    }

    std::vector<State> states_;
};

// It was the positions alone that were taken at every one of these spacings: 2 mm off at 60 s, 22 mm at 90 s, 68
// mm at 120 s, and the estimate said 0.2 mm.
TEST_F(PreciseOrbit, IsMetBetweenItsVectorsAndTheEstimateKnowsHowWell) {
    const struct {
        std::size_t every, count;
        double within_m;
    } rows[] = {{2, 73, 0.1e-3}, {6, 25, 0.5e-3}, {6, 5, 0.5e-3}, {9, 17, 0.62e-3}, {12, 13, 1.3e-3}};
    for (const auto& [every, count, within_m] : rows) {
        SCOPED_TRACE(testing::Message() << count << " vectors " << 10 * every << " s apart");
        GeneralSAROrbit orbit, copy;
        give(orbit, every, first(count));
        ASSERT_EQ(orbit.SVResample(10.0), 0);
        const double truth_m = error_m(orbit);
        EXPECT_LT(truth_m, within_m);
        EXPECT_GT(orbit.orbitFitError(), truth_m / 3.0);
        EXPECT_LT(orbit.orbitFitError(), 5.0 * std::max(truth_m, 3e-5));
        ASSERT_EQ(orbit.clone(&copy), 0);
        EXPECT_EQ(copy.orbitFitError(), orbit.orbitFitError());
    }
}

// A vector that stands 1 us beside its place is 7.6 mm off there.
TEST_F(PreciseOrbit, TakesEachVectorAtItsOwnTime) {
    GeneralSAROrbit even, own;
    for (GeneralSAROrbit* orbit : {&even, &own}) give(*orbit, 6, first(17));
    std::vector<double> times(17);
    for (std::size_t i = 0; i < 17; ++i) {
        const double late_s = i == 0 ? 0.0 : 1e-6 * (i % 2 ? 1.0 : -1.0);
        times[i] = 60.0 * static_cast<double>(i) + late_s;
        for (std::size_t axis = 0; axis < 3; ++axis)
            for (GeneralSAROrbit* orbit : {&even, &own})
                orbit->pSV_m[3 * i + axis] += late_s * states_[6 * i].values[3 + axis];
    }
    ASSERT_EQ(even.SVResample(10.0), 0);
    ASSERT_EQ(own.SVResample(10.0, times.data()), 0);
    EXPECT_GT(error_m(even), 7e-3);
    EXPECT_GT(even.orbitFitError(), error_m(even) / 4.0);  // by the positions, which contradict each other
    EXPECT_LT(error_m(own), 0.6e-3);
}

// Vectors in a row as they are found in files: a missing one shifted all that follow, by 41 km and without a word.
TEST_F(PreciseOrbit, WithAnUnevenListIsNamedAndNotResampled) {
    const struct {
        const char* name;
        std::vector<std::size_t> numbers;
        SVFinding::Problem problem;
        std::int32_t index;
        double size;
    } rows[] = {
        {"OneMissing", {0, 1, 2, 3, 4, 5, 6, 7, 9, 10, 11, 12}, SVFinding::kGap, 8, 1.0},
        {"FirstStep", {0, 3, 4, 5, 6, 7, 8, 9}, SVFinding::kGap, 1, 2.0},
        {"LastStep", {0, 1, 2, 3, 4, 5, 6, 8}, SVFinding::kGap, 7, 1.0},
        {"Repeated", {0, 1, 2, 3, 4, 4, 5, 6, 7}, SVFinding::kDuplicate, 5, 0.0},
        {"Swapped", {0, 1, 2, 4, 3, 5, 6, 7, 8}, SVFinding::kOrder, 4, 1.0},
    };
    for (const std::size_t every : {1U, 6U}) {
        for (const auto& row : rows) {
            SCOPED_TRACE(testing::Message() << row.name << " of vectors " << 10 * every << " s apart");
            GeneralSAROrbit orbit;
            give(orbit, every, row.numbers);
            const std::vector<SVFinding> findings = check(orbit);
            ASSERT_EQ(findings.size(), 1U) << texts(findings);
            EXPECT_EQ(findings[0].problem, row.problem) << findings[0].text;
            EXPECT_EQ(findings[0].index, row.index);
            EXPECT_NEAR(findings[0].size, row.size, 1e-2);

            const test::Report report;
            EXPECT_EQ(orbit.SVResample(5.0), QUO_REFUSED);
            EXPECT_EQ(report.messages("ERROR").back(), findings[0].text);
            if (row.problem != SVFinding::kGap) continue;
            std::vector<double> times;
            for (const std::size_t number : row.numbers)
                times.push_back(10.0 * static_cast<double>(every * number));
            ASSERT_EQ(orbit.SVResample(5.0, times.data()), 0);
            EXPECT_LT(error_m(orbit), every == 1 ? 5e-3 : 0.1);
        }
    }
}

// With five vectors the velocities tell the model's error. What is wrong with all of them alike is none: it made
// 70 mm of 0.03.
TEST_F(PreciseOrbit, OfFiveVectorsKeepsItsErrorWithVelocitiesOfAnotherFrame) {
    GeneralSAROrbit orbit;
    give(orbit, 1, first(5));
    const double before_m = orbit.orbitFitError();
    EXPECT_LT(before_m, 5e-5);
    for (int i = 0; i < 15; ++i) orbit.vSV_mOs[i] += 0.013 - 0.002 * (i % 3) + 1e-4 * i;
    EXPECT_NEAR(orbit.orbitFitError(), before_m, 1e-8);
}

// --- SVCheck ----------------------------------------------------------------------------------------------------

TEST(SVCheck, IsContentWithRealOrbits) {
    for (const test::Scene& scene : test::kScenes) {
        GeneralSAROrbit orbit;
        test::load_orbit(scene, orbit);
        EXPECT_EQ(texts(check(orbit)), "") << scene.name;
        EXPECT_LT(orbit.orbitFitError(), 1e-4) << scene.name;
    }
}

TEST_P(Resampled, CheckIsContentWithAnyGoodOrbit) {
    EXPECT_EQ(texts(check(orbit_)), "");
    for (int i = 0; i < 3 * orbit_.nSV_n; ++i) {  // as text with three decimals would have them
        orbit_.pSV_m[i] = std::round(orbit_.pSV_m[i] * 1e3) / 1e3;
        orbit_.vSV_mOs[i] = std::round(orbit_.vSV_mOs[i] * 1e4) / 1e4;
    }
    EXPECT_EQ(texts(check(orbit_)), "");
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

/** One way to spoil a vector: its positions, its velocities. */
struct Spoilt {
    void (*spoil)(double* position, double* velocity);
    SVFinding::Problem problem;
    double size;
};
const Spoilt kSpoilt[] = {
    {[](auto* p, auto*) { p[1] += 8.5; }, SVFinding::kPositionStep, 8.5},
    {[](auto*, auto* v) { v[2] -= 0.75; }, SVFinding::kVelocity, 0.75},
    {[](auto*, auto* v) { v[0] = kNaN; }, SVFinding::kNotFinite, 0.0},
    {[](auto* p, auto*) { std::fill_n(p, 3, 0.0); }, SVFinding::kInsideEarth, 0.0},
};

TEST(SVCheck, FindsOneWrongVector) {
    for (int index = 0; index < 13; ++index) {
        const std::ptrdiff_t at = 3 * static_cast<std::ptrdiff_t>(index);
        for (const Spoilt& row : kSpoilt) {
            test::Flight flight{{803457.3, 9.7, 13}};
            row.spoil(flight.orbit.pSV_m + at, flight.orbit.vSV_mOs + at);
            const std::vector<SVFinding> findings = check(flight.orbit);
            ASSERT_EQ(findings.size(), 1U) << texts(findings);
            EXPECT_EQ(findings[0].problem, row.problem) << findings[0].text;
            EXPECT_EQ(findings[0].index, index);
            EXPECT_NEAR(findings[0].size, row.size, 1e-3 + 1e-6 * row.size);
            EXPECT_NE(texts(findings).find("state vector " + std::to_string(index) + ":"), std::string::npos);
        }
        const bool first = index == 0;  // has no predecessor: its successor is the duplicate
        test::Flight flight{{803457.3, 9.7, 13}};
        double* const p = flight.orbit.pSV_m + at;
        std::copy_n(p + (first ? 3 : -3), 3, p);
        p[0] += 3.0;  // near enough
        const std::vector<SVFinding> findings = check(flight.orbit);
        ASSERT_FALSE(findings.empty());
        EXPECT_EQ(findings.back().problem, SVFinding::kDuplicate);
        EXPECT_EQ(findings.back().index, first ? 1 : index);
    }
}

struct AllVelocities {
    Vec3 (*velocity)(const test::Platform& state);
    double least_m_s, most_m_s;
};
const AllVelocities kAllVelocities[] = {
    {[](const test::Platform& s) {
         return s.velocity + Vec3{0.012, 0.0, -0.016};
     },
     0.019, 0.021},
    {[](const test::Platform& s) {
         return s.velocity + test::cross({0.0, 0.0, test::kEarthRate}, s.position);
     },
     80.0, 520.0},                                                          // inertial
    {[](const test::Platform& s) { return 1e-3 * s.velocity; }, 7e3, 8e3},  // kilometres per second
};

TEST(SVCheck, FindsAndMeasuresWrongVelocities) {
    for (const AllVelocities& row : kAllVelocities)
        for (const double spacing : {9.7, 60.0}) {
            const test::CircularOrbit circle{41.3, 12.8, -12.7};
            GeneralSAROrbit orbit;
            test::make_orbit(orbit, {803457.3, spacing, 13}, [&](double t) {
                test::Platform state = circle.earth_fixed(t - 803457.3);
                state.velocity = row.velocity(state);
                return state;
            });
            const std::vector<SVFinding> findings = check(orbit);
            EXPECT_EQ(findings.size(), 13U);
            for (const SVFinding& finding : findings) {
                EXPECT_EQ(finding.problem, SVFinding::kVelocity) << finding.text;
                EXPECT_TRUE(finding.size > row.least_m_s && finding.size < row.most_m_s) << finding.size;
            }
        }
}

TEST(SVCheck, FindsWhatIsWrongWithTheList) {
    EXPECT_EQ(texts(check(GeneralSAROrbit{})),
              "state vectors: fewer than five 0 vectors\n"
              "state vectors: the times are not finite or do not increase; spacing -999 s\n");
    test::Flight flight{{803457.3, 9.7, 13}};
    flight.orbit.dtSV_s = 9.71;  // as wrong as every velocity: a thousandth
    EXPECT_GE(check(flight.orbit).size(), 9U);
    flight.orbit.dtSV_s = kNaN;
    const std::vector<SVFinding> findings = check(flight.orbit);
    ASSERT_EQ(findings.size(), 1U);
    EXPECT_EQ(findings[0].problem, SVFinding::kTimes);
    EXPECT_EQ(findings[0].index, -1);
}

}  // namespace
