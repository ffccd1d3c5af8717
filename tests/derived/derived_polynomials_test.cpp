// SPDX-License-Identifier: Apache-2.0
#include <nlohmann/json.hpp>

#include "quo_base/SARpolynomials.h"
#include "quo_base/generalSARorbit.h"
#include "quo_base/roi.h"
#include "support/diagnostics.h"
#include "support/geometry.h"
#include "support/scenes.h"

namespace {

using testing::Each;
using testing::ElementsAreArray;

/** What is known of a derived polynomial at a place of the region. */
struct Place {
    double azimuth_s, range_s, doppler_hz, ground_m;
};

/** The quantities, and the forms that make them. */
enum Quantity { kRate, kIncidence, kLook, kGround, kSlant, kQuantities };
constexpr const char* kUnits[kQuantities] = {"FM rate Hz/s", "incidence deg", "look deg", "ground m", "slant m"};

/** All derived polynomials of a region. */
struct Derived {
    polyFR rate;
    polySL2THETA theta;
    polySL2PHI phi;
    polySL2GR ground;
    polyGR2SL slant;

    [[nodiscard]] std::array<const poly*, kQuantities> all() const {
        return {&rate, &theta, &phi, &ground, &slant};
    }
    [[nodiscard]] std::array<double, kQuantities> at(const Place& place) const {
        std::array<double, kQuantities> values{};
        for (std::size_t q = 0; q < kSlant; ++q)
            all()[q]->EvaluatePoly(place.range_s, place.azimuth_s, &values[q]);
        slant.EvaluatePoly(slant.trg0 + place.ground_m, place.azimuth_s, &values[kSlant]);
        values[kSlant] *= 0.5 * test::kLightSpeed;
        return values;
    }
};

/** One of the six operations, on polynomials of its own. */
struct Operation {
    const char* name;
    bool fine, in_both_times;
    int (*run)(GeneralSAROrbit&, const ROI_Obj*, const polyDC*, Derived&);
};
void PrintTo(const Operation& operation, std::ostream* out) { *out << operation.name; }
const Operation kOperations[] = {
    {"SVGetFRpoly", false, false,
     [](auto& o, auto* r, auto* dc, auto& d) { return o.SVGetFRpoly(r, dc, &d.rate); }},
    {"SVGetFRpoly_v2", true, false,
     [](auto& o, auto* r, auto* dc, auto& d) { return o.SVGetFRpoly_v2(r, dc, &d.rate); }},
    {"SVGetSlantToAnglesPolys", false, false,
     [](auto& o, auto* r, auto* dc, auto& d) { return o.SVGetSlantToAnglesPolys(r, dc, &d.theta, &d.phi); }},
    {"SVGetTimeToAnglesPolys", true, true,
     [](auto& o, auto* r, auto* dc, auto& d) { return o.SVGetTimeToAnglesPolys(r, dc, &d.theta, &d.phi); }},
    {"SVGetGroundToSlantPolys", false, false,
     [](auto& o, auto* r, auto* dc, auto& d) { return o.SVGetGroundToSlantPolys(r, dc, &d.ground, &d.slant); }},
    {"SVGetGroundToTimePolys", true, true,
     [](auto& o, auto* r, auto* dc, auto& d) { return o.SVGetGroundToTimePolys(r, dc, &d.ground, &d.slant); }},
};

/** A real scene, its region and a Doppler, 0 at first. */
struct Product {
    GeneralSAROrbit orbit;
    ROI_Obj roi;
    polyDC dc;
    explicit Product(const test::Scene& scene) {
        test::load_orbit(scene, orbit);
        if (roi.read_roi(scene.path(".xml").c_str(), "ROI")) throw std::runtime_error{"no region"};
        dc.trg0 = roi.FastStartTime;
        dc.taz0 = roi.SlowStartTime;
    }
    [[nodiscard]] double azimuth(double share) const { return roi.SlowStartTime + share * roi.SlowTimeLength; }
    [[nodiscard]] double range(double share) const { return roi.FastStartTime + share * roi.FastTimeLength; }
    [[nodiscard]] double doppler(double azimuth_s, double range_s) const {
        double value_hz = 0.0;
        dc.EvaluatePoly(range_s, azimuth_s, &value_hz);
        return value_hz;
    }
    /** The forms in range alone, or the finer ones. */
    void derive(Derived& derived, bool fine) {
        for (const Operation& operation : kOperations) {
            EXPECT_TRUE(operation.fine != fine || operation.run(orbit, &roi, &dc, derived) == 0) << operation.name;
        }
    }
    std::array<double, kQuantities> truth(const Place& at) {
        GrPtGeometry g{};
        EXPECT_EQ(orbit.SVGetGeometry(at.azimuth_s, at.range_s, at.doppler_hz, &g), 0);
        const double slant_m = 0.5 * test::kLightSpeed * (at.range_s - roi.FastStartTime);
        return {g.fm_rate_hz_s, g.incidence_deg, g.look_deg, at.ground_m, slant_m};
    }
};

// Accelerations, and with them the FM rate, depend a little on the run of state vectors in use, which hangs on the
// calls before.
constexpr double kRateDefect = 1e-8;

class DerivedPolynomials : public testing::TestWithParam<test::Scene> {
protected:
    /** How far the residuals at the very samples are from orthogonal to the terms of a fit, which a least-squares
     * fit makes them: the largest sum of residuals times a term, relative to that of the values. */
    double defect(const Derived& derived, std::size_t quantity, int ranges, int azimuths) {
        std::array<double, 7> sums{}, scales{};
        const std::size_t terms_count = azimuths > 1 ? 7 : 3;
        for (int j = 0; j < azimuths; ++j) {
            const double v = azimuths > 1 ? j / (azimuths - 1.0) : 0.5;
            test::Vec3 before{}, point{};
            Place place{product_.azimuth(v), 0.0, 0.0, 0.0};
            for (int i = 0; i < ranges; ++i) {
                const double u = i / (ranges - 1.0);
                place.range_s = product_.range(u);
                place.doppler_hz = product_.doppler(place.azimuth_s, place.range_s);
                EXPECT_EQ(product_.orbit.sat2earth(place.azimuth_s, place.range_s, place.doppler_hz, point.v), 0);
                if (i > 0) place.ground_m += norm(point - before);  // the sum of the chords
                before = point;
                const double direct = product_.truth(place)[quantity], rest = derived.at(place)[quantity] - direct;
                // A parabola over ground range is orthogonal to powers of the ground range.
                const double w = quantity == kSlant ? place.ground_m / 1e5 : u;
                const double terms[] = {1.0, w, w * w, v, w * v, w * w * w, w * w * w * w};
                for (std::size_t k = 0; k < terms_count; ++k) {
                    sums[k] += rest * terms[k];
                    scales[k] += std::abs(direct * terms[k]);
                }
            }
        }
        double largest = 0.0;
        for (std::size_t k = 0; k < terms_count; ++k) largest = std::max(largest, std::abs(sums[k]) / scales[k]);
        return largest;
    }
    Product product_{GetParam()};
    polyDC& dc_ = product_.dc;
    const ROI_Obj& roi_ = product_.roi;
};
INSTANTIATE_TEST_SUITE_P(Scenes, DerivedPolynomials, testing::ValuesIn(test::kScenes),
                         [](const auto& row) { return row.param.name; });

// What defines the fits, with other sums than theirs. A step too many or too few, a wrong Doppler or azimuth time,
// lost digits or a mixed-up coefficient breaks it.
TEST_P(DerivedPolynomials, LeaveResidualsOrthogonalToTheirTerms) {
    const double doppler_hz = GetParam().doppler_hz;
    const double slopes[7] = {0.3 * doppler_hz, 0.4 * doppler_hz / roi_.FastTimeLength,
                              0.01 * doppler_hz / roi_.SlowTimeLength};
    std::ranges::copy(slopes, dc_.pol);
    dc_.trg0 += 0.37 * roi_.FastTimeLength;
    Derived parabolas, grids;
    product_.derive(parabolas, false);
    product_.derive(grids, true);
    for (const std::size_t q : {kRate, kIncidence, kLook, kGround, kSlant})
        EXPECT_LT(defect(parabolas, q, 10, 1), q == kRate ? kRateDefect : 1e-10) << kUnits[q];
    EXPECT_LT(defect(grids, kRate, 50, 1), kRateDefect);
    for (const std::size_t q : {kIncidence, kLook, kGround})
        EXPECT_LT(defect(grids, q, 100, 50), 1e-10) << kUnits[q];

    for (std::size_t q = 0; q < kQuantities; ++q) {  // they stand around the region
        const poly &parabola = *parabolas.all()[q], &grid = *grids.all()[q];
        const bool both_times = q != kRate;
        EXPECT_EQ(parabola.trg0, roi_.FastStartTime);
        EXPECT_EQ(grid.trg0, both_times ? roi_.FastStartTime : dc_.trg0);
        EXPECT_EQ(grid.taz0, both_times ? roi_.SlowStartTime : 0.0);
        for (const int unused : {2, 3, 5, 6}) EXPECT_EQ(parabola.taz0 + parabola.pol[unused], 0.0);
    }
    // The parabola is one curve, wherever the Doppler polynomial has its origin; only far away digits go.
    const double dc_hz[] = {0.3 * doppler_hz, 0.0, 0.0};
    std::ranges::copy(dc_hz, dc_.pol);
    ASSERT_EQ(product_.orbit.SVGetFRpoly_v2(&roi_, &dc_, &parabolas.rate), 0);
    for (dc_.trg0 = -999.0; dc_.trg0 < 1.0; dc_.trg0 += 999.25) {
        ASSERT_EQ(product_.orbit.SVGetFRpoly_v2(&roi_, &dc_, &grids.rate), 0);
        double near = 0.0, other = 0.0;
        parabolas.rate.EvaluatePoly(product_.range(0.3), 0.0, &near);
        grids.rate.EvaluatePoly(product_.range(0.3), 0.0, &other);
        EXPECT_NEAR(other, near, 1e-9 + 4e-16 * std::abs(grids.rate.pol[4]) * dc_.trg0 * dc_.trg0) << dc_.trg0;
    }
}

// --- against what the missions' own products say ----------------------------------------------------------------

double ascending_powers(const nlohmann::json& c, double x) {
    double sum = 0.0;
    for (std::size_t i = c.size(); i-- > 0;) sum = sum * x + c[i].get<double>();
    return sum;
}

// The scene lies at sea level, so that its product converts ranges on the ellipsoid.
TEST(DerivedFromAProduct, HasTheProductsGroundRange) {
    Product product{test::kScenes[1]};
    polySL2GR ground;
    polyGR2SL slant;
    ASSERT_EQ(product.orbit.SVGetGroundToTimePolys(&product.roi, &product.dc, &ground, &slant), 0);
    std::ifstream stream{test::kScenes[1].path("_facts.json")};
    const double first_s = product.azimuth(0.0), last_s = product.azimuth(1.0);
    int compared = 0;
    const auto facts = nlohmann::json::parse(stream);
    for (const auto& truth : facts.at("ground_slant")) {
        const double azimuth_s = truth.at("t");
        if (azimuth_s < first_s || azimuth_s > last_s) continue;
        ++compared;
        for (int i = 0; i <= 10; ++i) {
            const double slant_m = 0.5 * test::kLightSpeed * product.range(i / 10.0);
            const double ground_m = ascending_powers(truth.at("srgr"), slant_m - truth.at("sr0").get<double>());
            double value = 0.0;
            ground.EvaluatePoly(product.range(i / 10.0), azimuth_s, &value);
            EXPECT_NEAR(value, ground_m, 40.0);
            slant.EvaluatePoly(slant.trg0 + ground_m, azimuth_s, &value);
            EXPECT_NEAR(0.5 * test::kLightSpeed * (slant.trg0 + value), slant_m, 1.5);
        }
    }
    EXPECT_EQ(compared, 25);
}

class DerivedFailures : public testing::TestWithParam<Operation> {
protected:
    [[nodiscard]] int run(const ROI_Obj& roi, const polyDC& dc) {
        return GetParam().run(scene_.orbit, &roi, &dc, derived_);
    }
    /** No output has been touched. */
    void expect_unchanged() const {
        for (const poly* p : derived_.all()) {
            EXPECT_THAT(p->pol, Each(0.0));
            EXPECT_EQ(p->trg0 + p->taz0, -1998.0);
        }
    }

    test::Report report_;
    Product scene_{test::kScenes[2]};
    Derived derived_;
};
INSTANTIATE_TEST_SUITE_P(All, DerivedFailures, testing::ValuesIn(kOperations),
                         [](const auto& row) { return row.param.name; });

TEST_P(DerivedFailures, LeaveTheOutputsAndSaySo) {
    struct Defect {
        int status;
        void (*spoil)(ROI_Obj&, polyDC&);
        bool in_both_times = false;  // of the forms in both times only
    };
    constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
    for (const auto& [status, spoil, in_both_times] :
         {Defect{1, [](auto&roi, auto&) { roi.FastStartTime = kNaN; }},
          Defect{1, [](auto&roi, auto&) { roi.SlowStartTime = kNaN; }},
          Defect{10, [](auto&roi, auto&) { roi.FastTimeLength = 0.1; }},  // beyond the horizon
          Defect{1, [](auto&, auto&dc) { dc.pol[0] = kNaN; }}, Defect{10, [](auto&, auto&dc) { dc.pol[0] = 1e6; }},
          Defect{10, [](auto&roi, auto&) { roi.FastTimeLength = 0.0; }, true},
          Defect{10, [](auto&roi, auto&) { roi.SlowTimeLength = 0.0; }, true}}) {
        if (in_both_times && !GetParam().in_both_times) continue;
        ROI_Obj roi;
        polyDC dc;
        scene_.roi.clone(&roi);
        spoil(roi, dc);
        EXPECT_EQ(run(roi, dc), status);
        EXPECT_EQ(report_.entries().back().function, std::string{"GeneralSAROrbit::"} + GetParam().name);
    }
    EXPECT_EQ(GetParam().run(scene_.orbit, nullptr, &scene_.dc, derived_), 1);
    EXPECT_EQ(GetParam().run(scene_.orbit, &scene_.roi, nullptr, derived_), 1);
    GeneralSAROrbit empty;
    EXPECT_EQ(GetParam().run(empty, &scene_.roi, &scene_.dc, derived_), 1);
    expect_unchanged();
}

// Ten times the same range time: a singular system, of which the mean remains.
TEST_P(DerivedFailures, ARegionWithoutExtentGivesNoNaN) {
    if (GetParam().in_both_times) return;
    test::CapturedStderr captured;
    scene_.roi.FastTimeLength = 0.0;
    ASSERT_EQ(run(scene_.roi, scene_.dc), 0);
    EXPECT_THAT(captured.text(), testing::HasSubstr("Singular Matrix"));
    const auto direct = scene_.truth({scene_.azimuth(0.5), scene_.range(0.0), 0.0, 0.0});
    for (const std::size_t q : {kRate, kIncidence, kLook}) {
        const poly& constant = *derived_.all()[q];
        if (constant.taz0 == -999.0) continue;  // of another operation
        EXPECT_NEAR(constant.pol[0], direct[q], 1e-12 * std::abs(direct[q]));
        EXPECT_EQ(std::abs(constant.pol[1]) + std::abs(constant.pol[4]), 0.0);
    }
}

TEST_P(DerivedFailures, EveryAllocationMayFail) {
    test::fail_every_allocation([&] {
        const int status = run(scene_.roi, scene_.dc);
        if (status) expect_unchanged();
        return status;
    });
}

TEST(DerivedOutputs, NullOutputsAreSkipped) {
    Product scene{test::kScenes[2]};
    auto& [orbit, roi, dc] = scene;
    for (const bool fine : {false, true}) {
        Derived both, one;
        scene.derive(both, fine);
        const auto angles =
            fine ? &GeneralSAROrbit::SVGetTimeToAnglesPolys : &GeneralSAROrbit::SVGetSlantToAnglesPolys;
        const auto ground =
            fine ? &GeneralSAROrbit::SVGetGroundToTimePolys : &GeneralSAROrbit::SVGetGroundToSlantPolys;
        ASSERT_EQ((orbit.*angles)(&roi, &dc, nullptr, &one.phi) + (orbit.*angles)(&roi, &dc, &one.theta, nullptr),
                  0);
        ASSERT_EQ(
            (orbit.*ground)(&roi, &dc, nullptr, &one.slant) + (orbit.*ground)(&roi, &dc, &one.ground, nullptr), 0);
        for (const std::size_t q : {kIncidence, kLook, kGround, kSlant})
            EXPECT_THAT(one.all()[q]->pol, ElementsAreArray(both.all()[q]->pol)) << kUnits[q];
    }
    EXPECT_EQ(orbit.SVGetFRpoly(&roi, &dc, nullptr), 0);
}

}  // namespace
