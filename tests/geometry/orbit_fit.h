// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_ORBIT_FIT_H
#define QUO_TESTS_ORBIT_FIT_H

#include "quo_base/interp_orb.h"
#include "support/geometry.h"
#include "support/prelude.h"

namespace test {

/** Three polynomials as orb_interp() fits them. */
struct Trajectory {
    std::vector<double> x, y, z;
    int status;

    Trajectory(double t0, double dt, const std::vector<double>& positions)
        : x(positions.size() / 3), y(x.size()), z(x.size()) {
        status = orb_interp(t0, dt, positions.data(), nullptr, static_cast<int>(x.size()), x.data(), y.data(),
                            z.data());
    }
    [[nodiscard]] Vec3 position(double u) const { return at(POSMACRO, u); }
    [[nodiscard]] Vec3 velocity(double u) const { return at(VELMACRO, u); }

private:
    [[nodiscard]] Vec3 at(double (*macro)(double, const double*, unsigned), double u) const {
        const auto terms = static_cast<unsigned>(x.size());
        return {macro(u, x.data(), terms), macro(u, y.data(), terms), macro(u, z.data(), terms)};
    }
};

/** Positions of n equally spaced times, `position(t)` giving a Vec3. */
template <typename Position>
std::vector<double> sampled(int n, double t0, double dt, Position position) {
    std::vector<double> values;
    for (int i = 0; i < n; ++i)
        for (const double v : position(t0 + i * dt).v) values.push_back(v);
    return values;
}

}  // namespace test

#endif
