// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_ORBIT_MADE_ORBITS_H
#define QUO_TESTS_ORBIT_MADE_ORBITS_H

#include "quo_base/generalSARorbit.h"
#include "support/geometry.h"
#include "support/prelude.h"

namespace test {

/** State on an elliptic orbit in the field of a point mass, seen from the rotating Earth. At time 0 the platform
 * passes its perigee, above the place and with the heading of a circular orbit; eccentricity 0 is that circle. */
inline Platform elliptic_orbit(const CircularOrbit& circle, double eccentricity, double t) {
    const Vec3 outward = unit(circle.inertial(0.0).position), along = unit(circle.inertial(0.0).velocity);
    const double axis_m = norm(circle.inertial(0.0).position) / (1.0 - eccentricity);
    const double rate = std::sqrt(kGravity / axis_m) / axis_m, flat = std::sqrt(1.0 - eccentricity * eccentricity);
    double E = rate * t;  // Kepler's equation
    for (int step = 0; step < 50; ++step)
        E -= (E - eccentricity * std::sin(E) - rate * t) / (1.0 - eccentricity * std::cos(E));
    const double c = std::cos(E), s = std::sin(E), E1 = rate / (1.0 - eccentricity * c);
    return to_earth_fixed({axis_m * ((c - eccentricity) * outward + flat * s * along),
                           axis_m * E1 * (flat * c * along - s * outward),
                           {}},
                          t);
}

/** When the state vectors of a made orbit stand: uneven numbers, and half a spacing off the orbit's time 0. */
struct Times {
    double first_s, spacing_s;
    int count;
    [[nodiscard]] double at(int i) const { return first_s + i * spacing_s; }
    [[nodiscard]] double last() const { return at(count - 1); }
};

/** Gives `orbit` the state vectors of any motion, a function of time that returns a Platform. */
template <typename Motion>
void make_orbit(GeneralSAROrbit& orbit, const Times& times, const Motion& motion) {
    if (orbit.SVCreate(times.first_s, times.spacing_s, times.count)) throw std::runtime_error{"SVCreate"};
    for (int i = 0; i < times.count; ++i) {
        const Platform state = motion(times.at(i));
        for (std::size_t axis = 0; axis < 3; ++axis) {
            orbit.pSV_m[3 * static_cast<std::size_t>(i) + axis] = state.position[axis];
            orbit.vSV_mOs[3 * static_cast<std::size_t>(i) + axis] = state.velocity[axis];
        }
    }
    if (orbit.computeApproximateSV()) throw std::runtime_error{"computeApproximateSV"};
}

/** A circular orbit, above its place at the time of the first vector: the truth, and the model of it. */
struct Flight {
    explicit Flight(const Times& when) : times{when} {
        make_orbit(orbit, times, [this](double t) { return state(t); });
    }
    [[nodiscard]] Platform state(double t) const { return circle.earth_fixed(t - times.first_s); }

    Times times;
    CircularOrbit circle{41.3, 12.8, -12.7};
    GeneralSAROrbit orbit;
};

inline Vec3 position_at(GeneralSAROrbit& orbit, double t) {
    Vec3 p{};
    if (orbit.SVGetPos(t, p.v)) throw std::runtime_error{"SVGetPos"};
    return p;
}
inline Vec3 velocity_at(GeneralSAROrbit& orbit, double t) {
    Vec3 v{};
    if (orbit.SVGetVel(t, v.v)) throw std::runtime_error{"SVGetVel"};
    return v;
}

}  // namespace test

#endif
