// SPDX-License-Identifier: Apache-2.0
#include "orbit/made_orbits.h"
#include "support/diagnostics.h"
#include "support/fields.h"
#include "support/geometry.h"
#include "support/scenes.h"

// Re-sampled state vectors, the estimate of the model's own error, and the examination of the list.

namespace {

using test::Vec3;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

/** Largest distances of the model from the motion over its span: positions, and velocities. */
template <typename Motion>
std::pair<double, double> worst(GeneralSAROrbit& orbit, const Motion& motion) {
    double position_m = 0.0, velocity_m_s = 0.0;
    for (int i = 0; i <= 997; ++i) {
        const double t = orbit.t0SV_s + i / 997.0 * (orbit.nSV_n - 1) * orbit.dtSV_s;
        const test::Platform truth = motion(t);
        position_m = std::max(position_m, test::norm(test::position_at(orbit, t) - truth.position));
        velocity_m_s = std::max(velocity_m_s, test::norm(test::velocity_at(orbit, t) - truth.velocity));
    }
    return {position_m, velocity_m_s};
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
    double eccentricity, spacing_s;
    int count;
    double new_spacing_s;
    int new_count;
};

// Also where the new spacing does not divide the old one or is the same; there are never fewer than five vectors.
TEST(SVResample, FollowsTheTrueOrbit) {
    for (const Sampling& row : {Sampling{0.0, 60.0, 5, 10.0, 25}, Sampling{0.05, 60.0, 40, 10.0, 235},
                                Sampling{0.001, 29.3, 11, 7.0, 43}, Sampling{0.001, 9.7, 17, 9.7, 17},
                                Sampling{0.001, 2.0, 17, 1e6, 5}}) {
        SCOPED_TRACE(testing::Message() << row.count << " vectors " << row.spacing_s << " s apart");
        const test::Times times{803457.3, row.spacing_s, row.count};
        const auto motion = [&](double t) {
            return test::elliptic_orbit({41.3, 12.8, -12.7}, row.eccentricity, t - times.first_s - 100.0);
        };
        GeneralSAROrbit orbit;
        test::make_orbit(orbit, times, motion);
        EXPECT_EQ(texts(check(orbit)), "");
        // The estimate of the model's own error lies within a third of the truth.
        const double before = worst(orbit, motion).first;
        EXPECT_NEAR(orbit.orbitFitError(), before, before / 3.0 + 2e-8);
        EXPECT_EQ(orbit.orbitFitError() > 0.1, row.spacing_s == 60.0);

        ASSERT_EQ(orbit.SVResample(row.new_spacing_s), 0);
        EXPECT_TRUE(orbit.nSV_n == row.new_count && orbit.element(0)->count == 3 * row.new_count);
        EXPECT_EQ(orbit.t0SV_s, times.first_s);
        EXPECT_NEAR(orbit.dtSV_s * (orbit.nSV_n - 1), times.last() - times.first_s, 1e-9);
        const auto [position_m, velocity_m_s] = worst(orbit, motion);
        EXPECT_LT(position_m, 1e-3);
        EXPECT_LT(velocity_m_s, 1e-4);
        EXPECT_EQ(texts(check(orbit)), "");          // its velocities are the derivative
        for (int i = 0; i < 3 * orbit.nSV_n; ++i) {  // as text with three decimals would have them
            orbit.pSV_m[i] = std::round(orbit.pSV_m[i] * 1e3) / 1e3;
            orbit.vSV_mOs[i] = std::round(orbit.vSV_mOs[i] * 1e4) / 1e4;
        }
        EXPECT_EQ(texts(check(orbit)), "");
    }
}

// Where the orbit is roughest in its middle the runs there decide, and only the part of them in use.
TEST(OrbitFitError, SeesARoughMiddle) {
    const test::Flight flight{{803457.3, 9.7, 33}};
    const auto motion = [&](double t) {
        test::Platform state = flight.state(t);
        state.position[0] += 37.0 * std::exp(-std::pow((t - flight.times.at(16)) / 45.0, 2.0));
        return state;
    };
    GeneralSAROrbit orbit;
    test::make_orbit(orbit, flight.times, motion);
    const double truth = worst(orbit, motion).first;
    EXPECT_GT(truth, 1e-3);
    EXPECT_NEAR(orbit.orbitFitError(), truth, truth / 3.0);
}

TEST(SVResample, LeavesTheOrbitAsItWasWhenRefused) {
    EXPECT_EQ(GeneralSAROrbit{}.SVResample(10.0), QUO_REFUSED);
    test::Flight flight{{803457.3, 9.7, 17}};
    GeneralSAROrbit& orbit = flight.orbit;
    const double* positions = orbit.pSV_m;
    const double x = orbit.SVGetPos(803500.0)[0];
    // 1e-6 once asked for 155 million vectors.
    for (const double bad : {0.0, kNaN, std::numeric_limits<double>::infinity(), 1e-6, 1e-300})
        EXPECT_EQ(orbit.SVResample(bad), QUO_REFUSED) << bad;
    double times[17];
    std::iota(times, times + 17, 0.0);
    for (const double bad : {kNaN, times[5], times[3]}) {
        times[6] = bad;
        EXPECT_EQ(orbit.SVResample(5.0, times), QUO_REFUSED) << bad;
    }
    EXPECT_TRUE(orbit.pSV_m == positions && orbit.nSV_n == 17 && orbit.dtSV_s == 9.7);
    EXPECT_EQ(orbit.SVGetPos(803500.0)[0], x);
}

// --- precise vectors --------------------------------------------------------------------------------------------

/** A real satellite's vectors, 10 s apart, some of which an orbit gets while the others judge it. */
class PreciseOrbit : public testing::Test {
protected:
    PreciseOrbit() {
        for (const auto& cells : test::read_table("orbits/s1a_20230823_precise.csv"))
            if (cells[0] != "time_s")
                std::ranges::transform(cells, states_.emplace_back().begin(),
                                       [](auto& cell) { return std::stod(cell); });
    }
    /** Every so-manieth vector, as many as the numbers list. */
    void give(GeneralSAROrbit& orbit, std::size_t every, const std::vector<std::size_t>& numbers) const {
        ASSERT_EQ(orbit.SVCreate(0.0, 10.0 * static_cast<double>(every), static_cast<int>(numbers.size())), 0);
        for (std::size_t i = 0; i < numbers.size(); ++i) {
            std::copy_n(&states_.at(every * numbers[i])[1], 3, orbit.pSV_m + 3 * i);
            std::copy_n(&states_.at(every * numbers[i])[4], 3, orbit.vSV_mOs + 3 * i);
        }
        ASSERT_EQ(orbit.computeApproximateSV(), 0);
    }
    /** Largest distance of the model from the vectors up to its end. */
    double error_m(GeneralSAROrbit& orbit) const {
        double worst_m = 0.0;
        for (std::size_t i = 0; 10.0 * double(i) < orbit.dtSV_s * (orbit.nSV_n - 1) + 1e-6; ++i)
            worst_m = std::max(worst_m, test::norm(test::position_at(orbit, 10.0 * double(i)) -
                                                   Vec3{states_[i][1], states_[i][2], states_[i][3]}));
        return worst_m;
    }
    static std::vector<std::size_t> first(std::size_t count) {
        std::vector<std::size_t> numbers(count);
        std::iota(numbers.begin(), numbers.end(), std::size_t{0});
        return numbers;
    }

    std::vector<std::array<double, 7>> states_;  // time, position, velocity
};

// It was the positions alone that were taken at every one of these spacings: 2 mm off at 60 s, 22 mm at 90 s, 68
// mm at 120 s, and the estimate said 0.2 mm.
TEST_F(PreciseOrbit, IsMetBetweenItsVectorsAndTheEstimateKnowsHowWell) {
    struct Row {
        std::size_t every, count;
        double within_m;
    };
    for (const auto& [every, count, within_m] :
         {Row{2, 73, 0.1e-3}, Row{6, 25, 0.5e-3}, Row{6, 5, 0.5e-3}, Row{9, 17, 0.62e-3}, Row{12, 13, 1.3e-3}}) {
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

// A vector that stands 1 us beside its place is 7.6 mm off there: the positions contradict each other.
TEST_F(PreciseOrbit, TellsTheErrorOfVectorsBesideTheirPlaces) {
    GeneralSAROrbit orbit;
    give(orbit, 6, first(17));
    for (int i = 0; i < 51; ++i) orbit.pSV_m[i] += (i / 3 % 2 ? 1e-6 : -1e-6) * orbit.vSV_mOs[i];
    ASSERT_EQ(orbit.SVResample(10.0), 0);
    EXPECT_GT(error_m(orbit), 7e-3);
    EXPECT_GT(orbit.orbitFitError(), error_m(orbit) / 4.0);
}

// Vectors in a row as they are found in files: a missing one shifted all that follow, by 41 km and without a word.
TEST_F(PreciseOrbit, WithAnUnevenListIsNamedAndNotResampled) {
    struct Row {
        SVFinding::Problem problem;
        std::int32_t index;
        double size;
        std::vector<std::size_t> numbers;
    };
    for (const Row& row : {Row{SVFinding::kGap, 8, 1.0, {0, 1, 2, 3, 4, 5, 6, 7, 9, 10, 11, 12}},
                           Row{SVFinding::kGap, 1, 2.0, {0, 3, 4, 5, 6, 7, 8, 9}},
                           Row{SVFinding::kGap, 7, 1.0, {0, 1, 2, 3, 4, 5, 6, 8}},
                           Row{SVFinding::kDuplicate, 5, 0.0, {0, 1, 2, 3, 4, 4, 5, 6, 7}},
                           Row{SVFinding::kOrder, 4, 1.0, {0, 1, 2, 4, 3, 5, 6, 7, 8}}})
        for (const std::size_t every : {1U, 6U}) {
            GeneralSAROrbit orbit;
            give(orbit, every, row.numbers);
            const std::vector<SVFinding> findings = check(orbit);
            ASSERT_EQ(findings.size(), 1U) << texts(findings) << " 10 s times " << every;
            EXPECT_TRUE(findings[0].problem == row.problem && findings[0].index == row.index) << findings[0].text;
            EXPECT_NEAR(findings[0].size, row.size, 1e-2);

            const test::Report report;
            EXPECT_EQ(orbit.SVResample(5.0), QUO_REFUSED);
            EXPECT_EQ(report.messages("ERROR").back(), findings[0].text);
            if (row.problem != SVFinding::kGap) continue;
            std::vector<double> times(row.numbers.begin(), row.numbers.end());
            for (double& time : times) time *= 10.0 * static_cast<double>(every);
            ASSERT_EQ(orbit.SVResample(5.0, times.data()), 0);
            EXPECT_LT(error_m(orbit), every == 1 ? 5e-3 : 0.1);
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
    // A curve that takes them would bend by 12 cm between two vectors a minute apart.
    give(orbit, 6, first(12));
    for (int i = 0; i < 36; ++i) orbit.vSV_mOs[i] += 0.013 - 0.002 * (i % 3);
    ASSERT_EQ(orbit.SVResample(10.0), 0);
    EXPECT_LT(error_m(orbit), 3e-3);
}

// --- SVCheck ----------------------------------------------------------------------------------------------------

TEST(SVCheck, IsContentWithRealOrbitsAndWithWideSpacing) {
    for (const test::Scene& scene : test::kScenes) {
        GeneralSAROrbit orbit;
        test::load_orbit(scene, orbit);
        EXPECT_EQ(texts(check(orbit)), "") << scene.name;
        EXPECT_LT(orbit.orbitFitError(), 1e-4) << scene.name;
    }
    EXPECT_EQ(texts(check(test::Flight{{803457.3, 300.0, 9}}.orbit)), "");  // no fault of the vectors
}

/** One way to spoil a vector: its positions, its velocities. */
struct Spoilt {
    void (*spoil)(double* position, double* velocity);
    SVFinding::Problem problem;
    double size;
};
const Spoilt kSpoilt[] = {
    {[](auto* p, auto*) { p[1] += 8.5; }, SVFinding::kPositionStep, 8.5},
    // Half a spacing on: neither step to it tells how many vectors are missing.
    {[](auto* p, auto*) { p[2] += 29317.0; }, SVFinding::kPositionStep, 29317.0},
    {[](auto*, auto* v) { v[2] -= 0.75; }, SVFinding::kVelocity, 0.75},
    {[](auto*, auto* v) { v[0] = kNaN; }, SVFinding::kNotFinite, 0.0},
    {[](auto* p, auto*) { std::fill_n(p, 3, 0.0); }, SVFinding::kInsideEarth, 0.0},
    // Near enough to its predecessor, which the first has not.
    {[](auto* p, auto*) { std::copy_n(p - 3, 3, p), p[0] += 3.0; }, SVFinding::kDuplicate, 3.0},
};

TEST(SVCheck, FindsOneWrongVector) {
    for (int index = 0; index < 13; ++index) {
        for (const Spoilt& row : kSpoilt) {
            const bool duplicate = row.problem == SVFinding::kDuplicate;  // whose neighbours look odd as well
            if (duplicate && index == 0) continue;
            test::Flight flight{{803457.3, 9.7, 13}};
            row.spoil(flight.orbit.pSV_m + 3 * std::ptrdiff_t{index},
                      flight.orbit.vSV_mOs + 3 * std::ptrdiff_t{index});
            const std::vector<SVFinding> findings = check(flight.orbit);
            ASSERT_TRUE(findings.size() == 1 || (duplicate && !findings.empty())) << texts(findings);
            EXPECT_EQ(findings.back().problem, row.problem) << findings.back().text;
            EXPECT_EQ(findings.back().index, index);
            EXPECT_NEAR(findings.back().size, row.size, 1e-3 + 1e-6 * row.size);
            EXPECT_NE(texts(findings).find("state vector " + std::to_string(index) + ":"), std::string::npos);
        }
    }
    test::Flight flight{{803457.3, 9.7, 13}};  // the first has no predecessor: its successor is the duplicate
    std::copy_n(flight.orbit.pSV_m + 3, 3, flight.orbit.pSV_m);
    flight.orbit.pSV_m[0] += 3.0;
    EXPECT_EQ(check(flight.orbit).back().problem, SVFinding::kDuplicate);
    EXPECT_EQ(check(flight.orbit).back().index, 1);
}

TEST(SVCheck, FindsWhatIsWrongWithTheList) {
    EXPECT_EQ(texts(check(GeneralSAROrbit{})),
              "state vectors: fewer than five 0 vectors\n"
              "state vectors: the times are not finite or do not increase; spacing -999 s\n");
    test::Flight flight{{803457.3, 60.0, 13}};
    for (int i = 0; i < 39; ++i) flight.orbit.vSV_mOs[i] += 0.012 * (i % 3 - 1);
    const std::vector<SVFinding> wrong = check(flight.orbit);
    EXPECT_EQ(wrong.size(), 13U);
    for (const SVFinding& finding : wrong) {
        EXPECT_EQ(finding.problem, SVFinding::kVelocity) << finding.text;
        EXPECT_NEAR(finding.size, 0.012 * std::sqrt(2.0), 1e-3);
    }
    flight.orbit.dtSV_s = kNaN;
    EXPECT_EQ(texts(check(flight.orbit)),
              "state vectors: the times are not finite or do not increase; spacing nan s\n");
}

}  // namespace
