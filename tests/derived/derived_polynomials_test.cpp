#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <fstream>
#include <limits>
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

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

/** All derived polynomials of a region, in range alone or in both times. */
struct Derived {
    polyFR rate;
    polySL2THETA theta;
    polySL2PHI phi;
    polySL2GR ground;
    polyGR2SL slant;

    void range_forms(GeneralSAROrbit& orbit, const ROI_Obj& roi, const polyDC& dc) {
        ASSERT_EQ(orbit.SVGetFRpoly(&roi, &dc, &rate), 0);
        ASSERT_EQ(orbit.SVGetSlantToAnglesPolys(&roi, &dc, &theta, &phi), 0);
        ASSERT_EQ(orbit.SVGetGroundToSlantPolys(&roi, &dc, &ground, &slant), 0);
    }
    void grid_forms(GeneralSAROrbit& orbit, const ROI_Obj& roi, const polyDC& dc) {
        ASSERT_EQ(orbit.SVGetFRpoly_v2(&roi, &dc, &rate), 0);
        ASSERT_EQ(orbit.SVGetTimeToAnglesPolys(&roi, &dc, &theta, &phi), 0);
        ASSERT_EQ(orbit.SVGetGroundToTimePolys(&roi, &dc, &ground, &slant), 0);
    }
    [[nodiscard]] std::array<double, kQuantities> at(const Place& place) const {
        std::array<double, kQuantities> values{};
        rate.EvaluatePoly(place.range_s, place.azimuth_s, &values[kRate]);
        theta.EvaluatePoly(place.range_s, place.azimuth_s, &values[kIncidence]);
        phi.EvaluatePoly(place.range_s, place.azimuth_s, &values[kLook]);
        ground.EvaluatePoly(place.range_s, place.azimuth_s, &values[kGround]);
        slant.EvaluatePoly(slant.trg0 + place.ground_m, place.azimuth_s, &values[kSlant]);
        values[kSlant] *= 0.5 * test::kLightSpeed;
        return values;
    }
};

/** A real scene, and how far the polynomials may stay from the geometry, as their
 * documentation says: parabolas at the middle azimuth time, then the forms in both times. */
struct Region {
    const char* name;
    std::size_t scene;
    double parabolas[kQuantities], grids[kQuantities];
};
void PrintTo(const Region& region, std::ostream* out) { *out << region.name; }
const Region kRegions[] = {
    {"SatelliteSubSwath", 0, {0.04, 0.008, 0.008, 80.0, 12.0}, {0.04, 0.0006, 0.0006, 5.0, 0.7}},
    {"SatelliteSwath", 1, {0.8, 0.1, 0.1, 900.0, 200.0}, {0.8, 0.005, 0.005, 40.0, 1.5}},
    {"Aircraft", 2, {0.0025, 0.13, 0.13, 27.0, 1.8}, {0.0025, 0.009, 0.009, 2.0, 0.007}},
};

// Accelerations, and with them the FM rate, depend a little on the run of state vectors in use, which hangs on the
// calls before.
constexpr double kRateDefect = 1e-8;

class DerivedPolynomials : public testing::TestWithParam<Region> {
protected:
    DerivedPolynomials() {
        const test::Scene& scene = test::kScenes[GetParam().scene];
        test::load_orbit(scene, orbit_);
        if (roi_.read_roi(scene.path(".xml").c_str(), "ROI")) throw std::runtime_error{"no region"};
        dc_.trg0 = roi_.FastStartTime;
        dc_.taz0 = roi_.SlowStartTime;
    }

    /** Ground range by many short chords. */
    double ground_range(double azimuth_s, double range_s) {
        constexpr int kChords = 400;
        test::Vec3 before{}, point{};
        double sum_m = 0.0;
        for (int i = 0; i <= kChords; ++i) {
            const double r = roi_.FastStartTime + (range_s - roi_.FastStartTime) * i / kChords;
            EXPECT_EQ(orbit_.sat2earth(azimuth_s, r, doppler(azimuth_s, r), point.v), 0);
            if (i > 0) sum_m += norm(point - before);
            before = point;
        }
        return sum_m;
    }
    double doppler(double azimuth_s, double range_s) const {
        double value_hz = 0.0;
        dc_.EvaluatePoly(range_s, azimuth_s, &value_hz);
        return value_hz;
    }
    std::array<double, kQuantities> truth(const Place& place) {
        std::array<double, kQuantities> values{};
        EXPECT_EQ(orbit_.SVGetFR(place.azimuth_s, place.range_s, place.doppler_hz, &values[kRate]), 0);
        EXPECT_EQ(orbit_.SVGetAngles(place.azimuth_s, place.range_s, place.doppler_hz, &values[kIncidence],
                                     &values[kLook]),
                  0);
        values[kGround] = place.ground_m;
        values[kSlant] = 0.5 * test::kLightSpeed * (place.range_s - roi_.FastStartTime);
        return values;
    }
    /** Largest differences at places between the samples, at azimuth times `from` to `to` of the region. */
    std::array<double, kQuantities> residuals(const Derived& derived, double from, double to) {
        std::array<double, kQuantities> largest{};
        for (const double along : {from, from + 0.31 * (to - from), from + 0.77 * (to - from), to}) {
            for (int i = 0; i <= 16; ++i) {
                const double azimuth_s = roi_.SlowStartTime + along * roi_.SlowTimeLength;
                const double range_s = roi_.FastStartTime + i / 16.0 * roi_.FastTimeLength;
                const Place place{azimuth_s, range_s, doppler(azimuth_s, range_s),
                                  ground_range(azimuth_s, range_s)};
                const auto fitted = derived.at(place), direct = truth(place);
                for (int q = 0; q < kQuantities; ++q)
                    largest[q] = std::max(largest[q], std::abs(fitted[q] - direct[q]));
            }
        }
        return largest;
    }
    void expect_below(const char* form, const std::array<double, kQuantities>& largest,
                      const double (&bounds)[kQuantities]) {
        for (int q = 0; q < kQuantities; ++q) {
            std::printf("%-18s %-10s %-14s %10.3g (bound %g)\n", GetParam().name, form, kUnits[q], largest[q],
                        bounds[q]);
            EXPECT_LT(largest[q], bounds[q]) << form << ", " << kUnits[q];
        }
    }

    GeneralSAROrbit orbit_;
    ROI_Obj roi_;
    polyDC dc_;
};
INSTANTIATE_TEST_SUITE_P(Scenes, DerivedPolynomials, testing::ValuesIn(kRegions),
                         [](const auto& row) { return row.param.name; });

TEST_P(DerivedPolynomials, StayWithinTheirBounds) {
    Derived parabolas, grids;
    parabolas.range_forms(orbit_, roi_, dc_);
    grids.grid_forms(orbit_, roi_, dc_);
    expect_below("parabola", residuals(parabolas, 0.5, 0.5), GetParam().parabolas);
    // The rate of the second form has no azimuth term either.
    auto largest = residuals(grids, 0.0, 1.0);
    largest[kRate] = residuals(grids, 0.5, 0.5)[kRate];
    expect_below("grid", largest, GetParam().grids);
}

/** Sums of residuals times basis functions, which a least-squares fit makes vanish, against the sums of their
 * magnitudes. */
template <std::size_t Terms>
class NormalEquations {
public:
    void add(double residual, double magnitude, const std::array<double, Terms>& terms) {
        for (std::size_t k = 0; k < Terms; ++k) {
            sums_[k] += residual * terms[k];
            scales_[k] += std::abs(magnitude * terms[k]);
        }
    }
    /** The largest of the sums, relative to the values that were fitted. */
    [[nodiscard]] double defect() const {
        double largest = 0.0;
        for (std::size_t k = 0; k < Terms; ++k) largest = std::max(largest, std::abs(sums_[k]) / scales_[k]);
        return largest;
    }

private:
    std::array<double, Terms> sums_{}, scales_{};
};

// What defines the fits, with other sums than theirs: the residuals at the very samples are orthogonal to every
// term. A step too many or too few, a wrong Doppler or azimuth time, lost digits or a mixed-up coefficient breaks
// it.
TEST_P(DerivedPolynomials, LeaveResidualsOrthogonalToTheirTerms) {
    const double doppler_hz = test::kScenes[GetParam().scene].doppler_hz;
    const double slopes[7] = {0.3 * doppler_hz, 0.4 * doppler_hz / roi_.FastTimeLength,
                              0.01 * doppler_hz / roi_.SlowTimeLength};
    std::ranges::copy(slopes, dc_.pol);
    dc_.trg0 += 0.37 * roi_.FastTimeLength;
    Derived parabolas, grids;
    parabolas.range_forms(orbit_, roi_, dc_);
    grids.grid_forms(orbit_, roi_, dc_);

    const auto check = [&](const Derived& derived, int ranges, int azimuths, double first_line) {
        std::array<NormalEquations<7>, kQuantities> sums;
        for (int j = 0; j < azimuths; ++j) {
            const double v = azimuths > 1 ? j / (azimuths - 1.0) : first_line;
            const double azimuth_s = roi_.SlowStartTime + v * roi_.SlowTimeLength;
            test::Vec3 before{};
            double ground_m = 0.0;
            for (int i = 0; i < ranges; ++i) {
                const double u = i / (ranges - 1.0), range_s = roi_.FastStartTime + u * roi_.FastTimeLength;
                const double hz = doppler(azimuth_s, range_s);
                test::Vec3 point{};
                ASSERT_EQ(orbit_.sat2earth(azimuth_s, range_s, hz, point.v), 0);
                if (i > 0) ground_m += norm(point - before);
                before = point;
                const Place place{azimuth_s, range_s, hz, ground_m};
                const auto fitted = derived.at(place), direct = truth(place);
                // A parabola over ground range is orthogonal to powers of the ground range.
                for (int q = 0; q < kQuantities; ++q) {
                    const double w = q == kSlant ? ground_m / 1e5 : u;
                    const bool grid = azimuths > 1;
                    const std::array<double, 7> terms{1.0,
                                                      w,
                                                      w * w,
                                                      grid ? v : 1.0,
                                                      grid ? w * v : 1.0,
                                                      grid ? w * w * w : 1.0,
                                                      grid ? w * w * w * w : 1.0};
                    sums[q].add(fitted[q] - direct[q], direct[q], terms);
                }
            }
        }
        for (int q = 0; q < kQuantities; ++q) {
            if (azimuths > 1 && (q == kRate || q == kSlant)) continue;  // no azimuth terms; other samples
            EXPECT_LT(sums[q].defect(), q == kRate ? kRateDefect : 1e-10) << kUnits[q];
        }
    };
    check(parabolas, 10, 1, 0.5);
    check(grids, 100, 50, 0.0);

    NormalEquations<3> fine_rate;
    for (int i = 0; i < 50; ++i) {
        const double u = i / 49.0, range_s = roi_.FastStartTime + u * roi_.FastTimeLength;
        const double azimuth_s = roi_.SlowStartTime + 0.5 * roi_.SlowTimeLength;
        double direct = 0.0, fitted = 0.0;
        ASSERT_EQ(orbit_.SVGetFR(azimuth_s, range_s, doppler(azimuth_s, range_s), &direct), 0);
        grids.rate.EvaluatePoly(range_s, -1e9, &fitted);
        fine_rate.add(fitted - direct, direct, {1.0, u, u * u});
    }
    EXPECT_LT(fine_rate.defect(), kRateDefect);
}

TEST_P(DerivedPolynomials, StandAroundTheRegion) {
    Derived parabolas, grids;
    dc_.trg0 -= 1e-4;
    parabolas.range_forms(orbit_, roi_, dc_);
    grids.grid_forms(orbit_, roi_, dc_);
    for (const poly* p : {static_cast<poly*>(&parabolas.rate), static_cast<poly*>(&parabolas.theta),
                          static_cast<poly*>(&parabolas.slant), static_cast<poly*>(&grids.rate)}) {
        EXPECT_EQ(p->trg0, p == &grids.rate ? dc_.trg0 : roi_.FastStartTime);
        EXPECT_EQ(p->taz0, 0.0);
        for (const int unused : {2, 3, 5, 6}) EXPECT_EQ(p->pol[unused], 0.0);
    }
    for (const poly* p : {static_cast<poly*>(&grids.theta), static_cast<poly*>(&grids.phi),
                          static_cast<poly*>(&grids.ground), static_cast<poly*>(&grids.slant)}) {
        EXPECT_EQ(p->trg0, roi_.FastStartTime);
        EXPECT_EQ(p->taz0, roi_.SlowStartTime);
    }
}

// The parabola is one curve, wherever the Doppler polynomial has its origin; only far away digits go.
TEST_P(DerivedPolynomials, OriginOfTheDopplerDoesNotMatter) {
    polyFR near;
    ASSERT_EQ(orbit_.SVGetFRpoly_v2(&roi_, &dc_, &near), 0);
    for (const double origin_s : {0.0, roi_.FastStartTime * 3.0, 0.25, -999.0}) {
        polyFR other;
        dc_.trg0 = origin_s;
        ASSERT_EQ(orbit_.SVGetFRpoly_v2(&roi_, &dc_, &other), 0);
        for (const double u : {0.0, 0.3, 1.0}) {
            const double range_s = roi_.FastStartTime + u * roi_.FastTimeLength;
            double a = 0.0, b = 0.0;
            near.EvaluatePoly(range_s, 0.0, &a);
            other.EvaluatePoly(range_s, 0.0, &b);
            EXPECT_NEAR(b, a, 1e-9 + 4e-16 * std::abs(other.pol[4]) * origin_s * origin_s) << origin_s;
        }
    }
}

// --- against what the missions' own products say
// ------------------------------------------------------------------

nlohmann::json facts_of(const test::Scene& scene) {
    std::ifstream stream{scene.path("_facts.json")};
    return nlohmann::json::parse(stream);
}

/** The entry of a list in azimuth time that is nearest to a time. */
nlohmann::json nearest(const nlohmann::json& list, double azimuth_s) {
    return *std::ranges::min_element(list, {}, [azimuth_s](const auto& entry) {
        return std::abs(entry.at("t").template get<double>() - azimuth_s);
    });
}
double ascending_powers(const nlohmann::json& c, double x) {
    double sum = 0.0;
    for (std::size_t i = c.size(); i-- > 0;) sum = sum * x + c[i].get<double>();
    return sum;
}

struct Product {
    GeneralSAROrbit orbit;
    ROI_Obj roi;
    polyDC dc;
    explicit Product(const test::Scene& scene) {
        test::load_orbit(scene, orbit);
        if (roi.read_roi(scene.path(".xml").c_str(), "ROI")) throw std::runtime_error{"no region"};
    }
    [[nodiscard]] double azimuth(double share) const { return roi.SlowStartTime + share * roi.SlowTimeLength; }
    [[nodiscard]] double range(double share) const { return roi.FastStartTime + share * roi.FastTimeLength; }
};

TEST(DerivedFromAProduct, HasTheProductsFmRate) {
    Product product{test::kScenes[0]};
    polyFR rate;
    ASSERT_EQ(product.orbit.SVGetFRpoly(&product.roi, &product.dc, &rate), 0);
    const auto truth = nearest(facts_of(test::kScenes[0]).at("fm_rate"), product.azimuth(0.5));
    for (int i = 0; i <= 10; ++i) {
        double value = 0.0;
        rate.EvaluatePoly(product.range(i / 10.0), 0.0, &value);
        EXPECT_NEAR(value,
                    ascending_powers(truth.at("coeffs"), product.range(i / 10.0) - truth.at("t0").get<double>()),
                    0.3);
    }
}

// The scene lies at sea level, so that its product converts ranges on the ellipsoid.
TEST(DerivedFromAProduct, HasTheProductsGroundRange) {
    Product product{test::kScenes[1]};
    polySL2GR ground;
    polyGR2SL slant;
    ASSERT_EQ(product.orbit.SVGetGroundToTimePolys(&product.roi, &product.dc, &ground, &slant), 0);
    const auto list = facts_of(test::kScenes[1]).at("ground_slant");
    for (const double along : {0.1, 0.5, 0.9}) {
        const auto truth = nearest(list, product.azimuth(along));
        const double azimuth_s = truth.at("t");
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
}

// --- failures
// -----------------------------------------------------------------------------------------------------

/** One of the six operations, on polynomials of its own. */
struct Operation {
    const char* name;
    bool in_both_times;
    int (*run)(GeneralSAROrbit&, const ROI_Obj*, const polyDC*, Derived&);
};
const Operation kOperations[] = {
    {"SVGetFRpoly", false,
     [](auto& o, auto* roi, auto* dc, Derived& d) { return o.SVGetFRpoly(roi, dc, &d.rate); }},
    {"SVGetFRpoly_v2", false,
     [](auto& o, auto* roi, auto* dc, Derived& d) { return o.SVGetFRpoly_v2(roi, dc, &d.rate); }},
    {"SVGetSlantToAnglesPolys", false,
     [](auto& o, auto* roi, auto* dc, Derived& d) {
         return o.SVGetSlantToAnglesPolys(roi, dc, &d.theta, &d.phi);
     }},
    {"SVGetTimeToAnglesPolys", true,
     [](auto& o, auto* roi, auto* dc, Derived& d) { return o.SVGetTimeToAnglesPolys(roi, dc, &d.theta, &d.phi); }},
    {"SVGetGroundToSlantPolys", false,
     [](auto& o, auto* roi, auto* dc, Derived& d) {
         return o.SVGetGroundToSlantPolys(roi, dc, &d.ground, &d.slant);
     }},
    {"SVGetGroundToTimePolys", true,
     [](auto& o, auto* roi, auto* dc, Derived& d) {
         return o.SVGetGroundToTimePolys(roi, dc, &d.ground, &d.slant);
     }},
};
void PrintTo(const Operation& operation, std::ostream* out) { *out << operation.name; }

class DerivedFailures : public testing::TestWithParam<Operation> {
protected:
    [[nodiscard]] int run(const ROI_Obj& roi, const polyDC& dc) {
        return GetParam().run(scene_.orbit, &roi, &dc, derived_);
    }
    /** No output has been touched. */
    void expect_unchanged() const {
        for (const poly* p : {static_cast<const poly*>(&derived_.rate), static_cast<const poly*>(&derived_.theta),
                              static_cast<const poly*>(&derived_.phi), static_cast<const poly*>(&derived_.ground),
                              static_cast<const poly*>(&derived_.slant)}) {
            EXPECT_THAT(p->pol, Each(0.0));
            EXPECT_EQ(p->trg0, -999.0);
            EXPECT_EQ(p->taz0, -999.0);
        }
    }

    test::Report report_;
    Product scene_{test::kScenes[2]};
    Derived derived_;
};
INSTANTIATE_TEST_SUITE_P(All, DerivedFailures, testing::ValuesIn(kOperations),
                         [](const auto& row) { return row.param.name; });

TEST_P(DerivedFailures, LeaveTheOutputsAndSaySo) {
    constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
    struct Defect {
        const char* name;
        void (*spoil)(ROI_Obj&, polyDC&);
        int status;
    };
    const Defect defects[] = {
        {"no start", [](ROI_Obj& roi, polyDC&) { roi.FastStartTime = kNaN; }, 1},
        {"no azimuth", [](ROI_Obj& roi, polyDC&) { roi.SlowStartTime = kNaN; }, 1},
        {"no length", [](ROI_Obj& roi, polyDC&) { roi.FastTimeLength = kNaN; }, 1},
        {"beyond the horizon", [](ROI_Obj& roi, polyDC&) { roi.FastTimeLength = 0.1; }, 10},
        {"shorter than the height", [](ROI_Obj& roi, polyDC&) { roi.FastStartTime *= 0.5; }, 10},
        {"Doppler not a number", [](ROI_Obj&, polyDC& dc) { dc.pol[0] = kNaN; }, 1},
        {"Doppler too large", [](ROI_Obj&, polyDC& dc) { dc.pol[0] = 1e6; }, 10},
    };
    for (const Defect& defect : defects) {
        SCOPED_TRACE(defect.name);
        ROI_Obj roi;
        polyDC dc;
        scene_.roi.clone(&roi);
        defect.spoil(roi, dc);
        const std::size_t before = report_.entries("ERROR_CALL_TREE").size();
        EXPECT_EQ(run(roi, dc), defect.status);
        expect_unchanged();
        const auto entries = report_.entries("ERROR_CALL_TREE");
        ASSERT_GT(entries.size(), before);
        EXPECT_EQ(entries.back().function, std::string{"GeneralSAROrbit::"} + GetParam().name);
    }
    EXPECT_EQ(GetParam().run(scene_.orbit, nullptr, &scene_.dc, derived_), 1);
    EXPECT_EQ(GetParam().run(scene_.orbit, &scene_.roi, nullptr, derived_), 1);
    GeneralSAROrbit empty;
    EXPECT_EQ(GetParam().run(empty, &scene_.roi, &scene_.dc, derived_), 1);
    expect_unchanged();
}

// Ten or fifty times the same range time: a singular system, of which the mean remains.
TEST_P(DerivedFailures, ARegionWithoutExtentGivesNoNaN) {
    test::CapturedStderr captured;
    scene_.roi.FastTimeLength = 0.0;
    if (GetParam().in_both_times) {
        EXPECT_EQ(run(scene_.roi, scene_.dc), 10);
        expect_unchanged();
        scene_.roi.FastTimeLength = 1e-5;
        scene_.roi.SlowTimeLength = 0.0;
        EXPECT_EQ(run(scene_.roi, scene_.dc), 10);
        return expect_unchanged();
    }
    ASSERT_EQ(run(scene_.roi, scene_.dc), 0);
    EXPECT_THAT(captured.text(), testing::HasSubstr("Singular Matrix"));
    double direct[3]{};
    const double azimuth_s = scene_.azimuth(0.5), range_s = scene_.range(0.0);
    ASSERT_EQ(scene_.orbit.SVGetFR(azimuth_s, range_s, 0.0, &direct[0]), 0);
    ASSERT_EQ(scene_.orbit.SVGetAngles(azimuth_s, range_s, 0.0, &direct[1], &direct[2]), 0);
    const poly* constants[] = {&derived_.rate, &derived_.theta, &derived_.phi};
    for (int q = 0; q < 3; ++q) {
        if (constants[q]->taz0 == -999.0) continue;  // of another operation
        EXPECT_NEAR(constants[q]->pol[0], direct[q], 1e-12 * std::abs(direct[q]));
        EXPECT_EQ(constants[q]->pol[1], 0.0);
        EXPECT_EQ(constants[q]->pol[4], 0.0);
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
    Derived both, one;
    both.grid_forms(scene.orbit, scene.roi, scene.dc);
    ASSERT_EQ(scene.orbit.SVGetTimeToAnglesPolys(&scene.roi, &scene.dc, nullptr, &one.phi), 0);
    ASSERT_EQ(scene.orbit.SVGetGroundToTimePolys(&scene.roi, &scene.dc, &one.ground, nullptr), 0);
    EXPECT_THAT(one.phi.pol, ElementsAreArray(both.phi.pol));
    EXPECT_THAT(one.ground.pol, ElementsAreArray(both.ground.pol));
    both.range_forms(scene.orbit, scene.roi, scene.dc);
    ASSERT_EQ(scene.orbit.SVGetSlantToAnglesPolys(&scene.roi, &scene.dc, &one.theta, nullptr), 0);
    ASSERT_EQ(scene.orbit.SVGetGroundToSlantPolys(&scene.roi, &scene.dc, nullptr, &one.slant), 0);
    EXPECT_THAT(one.theta.pol, ElementsAreArray(both.theta.pol));
    EXPECT_THAT(one.slant.pol, ElementsAreArray(both.slant.pol));
    EXPECT_EQ(scene.orbit.SVGetFRpoly(&scene.roi, &scene.dc, nullptr), 0);
}

}  // namespace
