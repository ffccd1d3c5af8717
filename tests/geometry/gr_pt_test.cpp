// SPDX-License-Identifier: Apache-2.0
#include "quo_base/gr_pt.h"

#include "quo_base/geometry.h"
#include "support/diagnostics.h"
#include "support/geometry.h"

namespace {

using test::circular_orbit, test::CircularOrbit, test::Platform, test::Vec3;
using test::kEarthRate, test::kLightSpeed, test::kSemiMajor, test::kSemiMinor;

constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kInfinity = std::numeric_limits<double>::infinity();

/** The inputs of the solvers, to be varied one by one. */
struct Request {
    Vec3 S, V;
    double tau, fd = 0.0, lambda = 0.05546576, omega = 0.0, side = 1.0, a = kSemiMajor, b = kSemiMinor;

    Request(const Platform& sat, double range)
        : S{sat.position}, V{sat.velocity}, tau{2.0 * range / kLightSpeed} {}
    int gr_pt(Vec3& P) const { return ::gr_pt(P.v, S.v, V.v, tau, fd, lambda, omega, side, a, b); }
    int gr_pt_at_height(double height, Vec3& P) const {
        return ::gr_pt_at_height(P.v, S.v, V.v, tau, fd, lambda, omega, side, height, a, b);
    }
    int gr_pt0(Vec3& P) const { return ::gr_pt0(P.v, S.v, V.v, tau, fd, lambda, omega, side, a, b); }
};

/** Rounding of the ground's own coordinates, however far away the platform is, m. */
constexpr double kOnTheGround = 5e-9;

/** The defining equations, written independently of the solver: a one-way range time, a swapped look side, a wrong
 * Doppler sign, a sphere for the ellipsoid each break one of them. Rounding grows with the numbers' size. */
void expect_solution(const Request& look, const Vec3& P) {
    const double rounding = 1e-15 * norm(look.S) + 1e-9;
    const Vec3 line = P - look.S;
    const Vec3 relative = look.V - cross({0.0, 0.0, look.omega}, P);  // against the ground at P
    EXPECT_NEAR(norm(line), look.tau * kLightSpeed / 2.0, rounding);
    EXPECT_NEAR(dot(relative, line) / norm(line), 0.5 * look.lambda * look.fd, 1e-10 + 1e-15 * norm(look.V));
    EXPECT_NEAR(test::height_above_ellipsoid(P, look.a, look.b), 0.0, kOnTheGround);
    EXPECT_GT((look.side < 0.0 ? -1.0 : 1.0) * dot(cross(relative, look.S), line), 0.0);
    EXPECT_GT(dot(test::ellipsoid_gradient(P, look.a, look.b), -line), 0.0) << "beyond the horizon";
}

/** Where a ray from a satellite meets the WGS84 ellipsoid first, as the distance; NaN where it passes by. */
double ray_range(const Vec3& from, const Vec3& direction) {
    const Vec3 gradient = test::ellipsoid_gradient(direction);
    const double A = dot(gradient, direction), B = dot(gradient, from);
    const double C = dot(test::ellipsoid_gradient(from), from) - 1.0;
    return C / (-B + std::sqrt(B * B - A * C));
}

/** An orbiting platform, or an aircraft at heights that no orbit has, with its inertial velocity or without. */
Platform platform_at(double latitude, double longitude, double heading, double height, bool inertial) {
    const CircularOrbit orbit{latitude, longitude, heading, height};
    Platform sat = inertial ? orbit.inertial(0.0) : orbit.earth_fixed(0.0);
    if (height < 100e3) {
        sat.velocity = 231.7 / norm(sat.velocity) * sat.velocity;
        if (inertial) sat.velocity = sat.velocity + cross({0.0, 0.0, kEarthRate}, sat.position);
        sat.position = test::geodetic_point(latitude, longitude, height);
    }
    return sat;
}

// Truth by looking: a ray meets the ground, and range, Doppler and side of that place must lead back to it.
TEST(GrPtSwept, FindsWhateverARayMeets) {
    std::mt19937_64 random{20260117};
    const auto between = [&](double low, double high) {
        return std::uniform_real_distribution<>{low, high}(random);
    };
    constexpr double kLambdas[] = {0.0311, 0.0555, 0.2384}, kSides[] = {1.0, -1.0, 0.0};
    for (int solved = 0; solved < 20000;) {
        const bool aircraft = solved % 50 == 7, inertial = solved % 5 == 3;
        const double height = aircraft ? between(8e3, 20e3) : 200e3 * std::pow(180.0, between(0.0, 1.0));
        const double latitude = solved % 100 < 2 ? 180.0 * (solved % 2) - 90.0 : between(-90.0, 90.0);
        const Platform sat =
            platform_at(latitude, between(-180.0, 180.0), between(-180.0, 180.0), height, inertial);
        Request look{sat, 0.0};
        look.side = kSides[solved % 3];
        look.lambda = kLambdas[solved / 3 % 3];
        look.omega = inertial ? kEarthRate : 0.0;
        const Vec3 over_ground = sat.velocity - cross({0.0, 0.0, look.omega}, sat.position);
        const Vec3 ahead = test::unit(over_ground), right = test::unit(cross(ahead, sat.position));
        const double off_nadir = between(0.02, 0.995) * std::asin(kSemiMinor / norm(sat.position));
        const double around = between(-1.4, 1.4), aside = look.side < 0.0 ? -1.0 : 1.0;
        const Vec3 ray =
            test::unit(std::sin(off_nadir) * (std::cos(around) * aside * right + std::sin(around) * ahead) -
                       std::cos(off_nadir) * test::unit(sat.position));
        const double range = ray_range(sat.position, ray);
        look.tau = 2.0 * range / kLightSpeed;
        look.fd = 2.0 / look.lambda * dot(over_ground, ray);
        // A platform nearly at rest over the ground has no Doppler to tell places apart.
        const bool tells = norm(over_ground) > (aircraft ? 200.0 : 300.0);
        if (!std::isfinite(range) || std::abs(look.fd) > 20e3 || !tells) continue;
        ++solved;
        SCOPED_TRACE(testing::Message() << "height " << height << " side " << look.side << " fd " << look.fd);
        Vec3 P{}, start{};
        ASSERT_EQ(look.gr_pt(P), 0);
        ASSERT_EQ(look.gr_pt0(start), 0);
        ASSERT_LT(norm(P - (sat.position + range * ray)), 1e-4);
        ASSERT_LT(norm(start - P), 1e-3);
        if (solved % 50 == 0) expect_solution(look, P);
        ASSERT_NEAR(test::height_above_ellipsoid(P), 0.0, kOnTheGround);

        // The same from a place above or below it.
        Vec3 same{}, raised{};
        ASSERT_EQ(look.gr_pt_at_height(0.0, same), 0);
        ASSERT_TRUE(std::equal(same.v, same.v + 3, P.v));
        const double up_m = aircraft ? between(-400.0, 5e3) : between(-400.0, 36e3);
        const Vec3 place = P + up_m * test::unit(test::ellipsoid_gradient(P));
        const Vec3 line = place - sat.position;
        look.tau = 2.0 * norm(line) / kLightSpeed;
        look.fd = 2.0 / look.lambda * dot(over_ground, line) / norm(line);
        ASSERT_EQ(look.gr_pt_at_height(up_m, raised), 0);
        ASSERT_LT(norm(raised - place), 1e-4);
        ASSERT_NEAR(test::height_above_ellipsoid(raised), up_m, 1.1e-7);
    }
}

// The shortest and the longest range at which the zero-Doppler plane meets the ground, found by sweeping rays in
// it: solved up to either, and refused beyond.
TEST(GrPtSwept, EndsAtTheHeightAndAtTheHorizon) {
    for (const double side : {+1.0, -1.0})
        for (const double latitude : {-71.3, 0.0, 44.7}) {
            SCOPED_TRACE(testing::Message() << "latitude " << latitude << " side " << side);
            const Platform sat = circular_orbit(latitude, 12.8, -12.7);
            const Vec3 across = side * test::unit(cross(sat.velocity, sat.position));
            const Vec3 down = -test::unit(cross(cross(sat.velocity, sat.position), sat.velocity));
            const auto range_at = [&](double angle) {
                return ray_range(sat.position, std::cos(angle) * down + std::sin(angle) * across);
            };
            double shortest = kInfinity, inside = 0.5, outside = 1.5;
            for (int i = 0; i < 20000; ++i) shortest = std::min(shortest, range_at(1e-6 * i));
            while (outside - inside > 1e-15) {
                const double middle = 0.5 * (inside + outside);
                (std::isnan(range_at(middle)) ? outside : inside) = middle;
            }
            const double longest = range_at(inside);
            Vec3 P{};
            for (const double range :
                 {shortest + 0.001, longest - 0.7, 17.3, shortest - 0.001, longest + 0.7, 3e7}) {
                Request sided{sat, range};
                sided.side = side;
                const bool seen = range > shortest && range < longest;
                ASSERT_EQ(sided.gr_pt(P), seen ? 0 : 10) << range;
                if (seen) expect_solution(sided, P);
            }
        }
}

struct Fault {
    int status;
    void (*apply)(Request&);
};
constexpr Fault kFaults[] = {
    {10, [](Request& r) { r.tau *= 0.3; }},  // shorter than the height
    {10, [](Request& r) { r.tau *= 4.0; }},  // beyond the horizon
    {10, [](Request& r) { r.fd = 2.1 * norm(r.V) / r.lambda; }},
    {10, [](Request& r) { r.V = -1.1e-3 * r.S; }},  // straight down
    // The same with the cone that meets the ground at this range: every place of the circle lies straight ahead,
    // none is left or right.
    {10, [](Request& r) { r.V = -1.1e-3 * r.S, r.fd = 2.0 / r.lambda * norm(r.V) * 0.8463; }},
    {10, [](Request& r) { r.S = 0.3 * r.S; }},  // below the ground
    {10, [](Request& r) { r.S = {}; }},
    {1, [](Request& r) { r.V = {}; }},
    {1, [](Request& r) { r.tau = 0.0; }},
    {1, [](Request& r) { r.lambda = 0.0; }},
    {1, [](Request& r) { r.b = 0.0; }},
};

TEST(GrPtFaults, GiveAStatusAndNoPoint) {
    for (const Fault& fault : kFaults) {
        SCOPED_TRACE(testing::Message() << "row " << &fault - kFaults);
        const test::Report report;
        Request look{circular_orbit(41.3, 12.8, -12.7), 848730.1};
        fault.apply(look);
        Vec3 P{17.3, 18.3, 19.3};
        EXPECT_EQ(look.gr_pt0(P), fault.status);
        EXPECT_EQ(look.gr_pt(P), fault.status);
        EXPECT_EQ(look.gr_pt_at_height(17.3, P), fault.status);
        EXPECT_EQ(P[0] + P[1] + P[2], 17.3 + 18.3 + 19.3);

        const auto entries = report.entries("ERROR"), tree = report.entries("ERROR_CALL_TREE");
        ASSERT_TRUE(entries.size() == 3 && tree.size() == 2) << "one of every call";
        EXPECT_EQ(entries[1].function + tree[0].function + tree[1].function, "gr_pt0gr_ptgr_pt_at_height");
    }
}

TEST(GrPtFaults, NoInputThatIsNotFiniteGivesAPoint) {
    const Request good{circular_orbit(41.3, 12.8, -12.7), 848730.1};
    for (const double bad : {kNaN, -kInfinity, 1e200, 1e-320}) {
        const bool tiny = std::abs(bad) < 1.0;
        Vec3 P{17.3, 18.3, 19.3};
        EXPECT_TRUE(tiny || (good.gr_pt_at_height(bad, P) != 0 && P[0] == 17.3)) << bad;
        for (std::size_t i = 0; i < 13; ++i) {
            Request look = good;
            double* const scalars[] = {&look.tau, &look.fd, &look.lambda, &look.omega,
                                       &look.a,   &look.b,  &look.side};
            (i < 7 ? *scalars[i] : i < 10 ? look.S[i - 7] : look.V[i - 10]) = bad;
            if ((i == 6 && std::isfinite(bad)) || (i > 6 && tiny)) continue;
            P[0] = 17.3;
            const int status = look.gr_pt(P);
            if (std::isfinite(bad) && status == 0)
                expect_solution(look, P);
            else
                EXPECT_TRUE((status == 1 || status == 10) && P[0] == 17.3)
                    << i << ": " << bad << " gives " << status;
        }
    }
}

TEST(Vectors, AreTurnedIntoVersorsAndMultiplied) {
    const Vec3 a{17.3, -4.1, 2.9};
    Vec3 b{-0.7, 8.3, 5.9}, r{};
    v1pv2(a.v, b.v, r.v);
    EXPECT_NEAR(dot(a, r), 0.0, 1e-12);
    EXPECT_NEAR(dot(b, r), 0.0, 1e-12);
    v1pv2(a.v, b.v, b.v);
    EXPECT_TRUE(b[2] == r[2] && std::abs(b[2] - (17.3 * 8.3 - 4.1 * 0.7)) < 1e-12);
    make_versor(a.v, r.v);
    EXPECT_LT(norm(norm(a) * r - a), 1e-14);
    for (const double first : {0.0, kNaN}) {
        double none[3] = {first, 0.0, 0.0};
        make_versor(none, none);
        EXPECT_EQ(none[0] + none[2], 0.0);
    }
}

}  // namespace
