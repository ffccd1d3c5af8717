#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <vector>

#include "quo_base/Coregist.h"
#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/generalSARorbit.h"
#include "quo_base/roi.h"
#include "support/geometry.h"
#include "support/scenes.h"

// Coregistration of a real scene with a pass repeated beside it, from geometry alone.

namespace {

using test::Vec3;

/** How the second pass differs from the first, and how far the mapping may stay from the geometry. */
struct Repeat {
    const char* name;
    std::size_t scene;
    double across_m, up_m;              ///< baseline at the first state vector
    double across_m_s, up_m_s;          ///< and its growth
    double late_s;                      ///< the second pass reaches the same place so much later
    double range_bound, azimuth_bound;  ///< residuals in the slave's samples and lines
};
void PrintTo(const Repeat& repeat, std::ostream* out) { *out << repeat.name; }

const Repeat kRepeats[] = {
    {"SamePass", 0, 0.0, 0.0, 0.0, 0.0, 0.0, 1e-6, 3e-4},
    {"ParallelBaseline", 0, 310.0, -170.0, 0.0, 0.0, 950400.37, 0.03, 3e-4},
    {"CrossingBaseline", 0, 240.0, 90.0, 0.4, -0.15, 950400.37, 0.12, 1e-3},
    {"ParallelBaselineWideSwath", 1, -280.0, 140.0, 0.0, 0.0, -950399.81, 0.3, 3e-4},
};

/** A point seen by both passes. */
struct Match {
    double range_s, azimuth_s, slave_range_s, slave_azimuth_s;
};

class Coregistration : public testing::TestWithParam<Repeat> {
protected:
    Coregistration() {
        const test::Scene& scene = test::kScenes[GetParam().scene];
        test::load_orbit(scene, master_orbit_);
        test::load_orbit(scene, slave_orbit_);
        if (master_.read_roi(scene.path(".xml").c_str(), "ROI")) throw std::runtime_error{"no region"};
        move_slave();
        // The slave's image begins elsewhere and has a slightly different line rate.
        slave_.SetFastAxe(master_.FastStartTime - 217.3 * master_.FastTimeDelta, master_.FastTimeDelta,
                          master_.Samples + 400);
        slave_.SetSlowAxe(master_.SlowStartTime + GetParam().late_s - 0.43, master_.SlowTimeDelta * 1.0003,
                          master_.Lines + 300);
        find_matches();
    }

    void move_slave() {
        const Repeat& repeat = GetParam();
        for (int i = 0; i < slave_orbit_.nSV_n; ++i) {
            double* p = slave_orbit_.pSV_m + 3 * i;
            const double* v = slave_orbit_.vSV_mOs + 3 * i;
            const Vec3 up = unit(Vec3{p[0], p[1], p[2]}), across = unit(cross(Vec3{v[0], v[1], v[2]}, up));
            const double t = i * slave_orbit_.dtSV_s;
            const Vec3 shift =
                (repeat.across_m + repeat.across_m_s * t) * across + (repeat.up_m + repeat.up_m_s * t) * up;
            for (std::size_t axis = 0; axis < 3; ++axis) p[axis] += shift[axis];
        }
        slave_orbit_.t0SV_s += repeat.late_s;
        if (slave_orbit_.computeApproximateSV()) throw std::runtime_error{"no orbit"};
    }

    void find_matches() {
        for (int j = 0; j < 25; ++j) {
            for (int i = 0; i < 40; ++i) {
                Match match{master_.FastStartTime + i / 39.0 * master_.FastTimeLength,
                            master_.SlowStartTime + j / 24.0 * master_.SlowTimeLength, 0.0, 0.0};
                Vec3 ground{};
                if (master_orbit_.sat2earth(match.azimuth_s, match.range_s, ground.v) ||
                    slave_orbit_.earth2sat(ground.v, &match.slave_azimuth_s, &match.slave_range_s))
                    throw std::runtime_error{"a point is not seen"};
                matches_.push_back(match);
            }
        }
    }

    /** Fits one of the two polynomials of the time form to `value` of the matches. */
    template <typename Value>
    void fit(double (&c)[4], const Value& value) {
        const double half_range = 0.5 * master_.FastTimeLength, half_azimuth = 0.5 * master_.SlowTimeLength;
        std::vector<double> design, right;
        const double middle = value(matches_[matches_.size() / 2]);
        for (const Match& m : matches_) {
            const double u = (m.range_s - fit_.trg0) / half_range, v = (m.azimuth_s - fit_.taz0) / half_azimuth;
            design.insert(design.end(), {u * u, u, v, 1.0});
            right.push_back(value(m) - middle);
        }
        double x[4];
        LsqSummary summary{};
        ASSERT_EQ(lsq_fit(design.data(), static_cast<int>(right.size()), 4, right.data(), x, &summary), 0);
        ASSERT_EQ(summary.rank, 4);
        EXPECT_LT(summary.condition, 10.0);
        c[0] = x[0] / (half_range * half_range);
        c[1] = x[1] / half_range;
        c[2] = x[2] / half_azimuth;
        c[3] = x[3] + middle;
    }
    void make_mapping() {
        fit_.trg0 = master_.GetCenter().FastTime;
        fit_.taz0 = master_.GetCenter().SlowTime;
        fit(fit_.RgFit, [](const Match& m) { return m.slave_range_s; });
        fit(fit_.AzFit, [](const Match& m) { return m.slave_azimuth_s; });
        fit_.init();
    }

    GeneralSAROrbit master_orbit_, slave_orbit_;
    ROI_Obj master_, slave_;
    std::vector<Match> matches_;
    Coregist fit_;
};
INSTANTIATE_TEST_SUITE_P(Passes, Coregistration, testing::ValuesIn(kRepeats),
                         [](const auto& row) { return row.param.name; });

// Both forms follow the geometry, and the way back from the slave's times is as good as the way there.
TEST_P(Coregistration, FollowsTheGeometryInBothForms) {
    make_mapping();
    ASSERT_EQ(matches_.size(), 1000U);
    const auto verdict = [&](const char* form, const auto& range_s, const auto& azimuth_s) {
        double range_worst = 0.0, azimuth_worst = 0.0;
        for (const Match& m : matches_) {
            range_worst = std::max(range_worst, std::abs(range_s(m) - m.slave_range_s) / slave_.FastTimeDelta);
            azimuth_worst =
                std::max(azimuth_worst, std::abs(azimuth_s(m) - m.slave_azimuth_s) / slave_.SlowTimeDelta);
        }
        EXPECT_LT(range_worst, GetParam().range_bound) << form;
        EXPECT_LT(azimuth_worst, GetParam().azimuth_bound) << form;
    };
    const auto range_s = [&](const Match& m) { return fit_.evaluateSLtimeRange(m.range_s, m.azimuth_s); };
    const auto azimuth_s = [&](const Match& m) { return fit_.evaluateSLtimeAzimuth(m.range_s, m.azimuth_s); };
    verdict("time", range_s, azimuth_s);
    ASSERT_EQ(fit_.Time2Samples(&master_, &slave_), 0);
    const auto in_samples = [&](const double* c, const Match& m) {
        const double ds = (m.range_s - master_.FastStartTime) / master_.FastTimeDelta - fit_.Rg_Samples_Origin;
        const double dl = (m.azimuth_s - master_.SlowStartTime) / master_.SlowTimeDelta - fit_.Az_Samples_Origin;
        return (c[0] * ds + c[1]) * ds + c[2] * dl + c[3];
    };
    verdict(
        "samples",
        [&](const Match& m) {
            return slave_.FastStartTime + in_samples(fit_.Rg_Fit_Coeff, m) * slave_.FastTimeDelta;
        },
        [&](const Match& m) {
            return slave_.SlowStartTime + in_samples(fit_.Az_Fit_Coeff, m) * slave_.SlowTimeDelta;
        });
    ASSERT_EQ(fit_.ConvertPolys(&master_, &slave_), 0);
    verdict("back", range_s, azimuth_s);

    for (const Match& m : matches_) {
        Match back = m;
        ASSERT_EQ(fit_.evaluateMAtime(m.slave_range_s, m.slave_azimuth_s, &back.range_s, &back.azimuth_s), 0);
        EXPECT_NEAR(back.range_s, m.range_s, 1.1 * GetParam().range_bound * master_.FastTimeDelta);
        EXPECT_NEAR(back.azimuth_s, m.azimuth_s, 1.1 * GetParam().azimuth_bound * master_.SlowTimeDelta);
        EXPECT_NEAR(range_s(back), m.slave_range_s, 1e-15);
        EXPECT_NEAR(azimuth_s(back), m.slave_azimuth_s, 5e-7);
    }
}

}  // namespace
