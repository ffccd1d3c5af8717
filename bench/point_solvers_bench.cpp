// SPDX-License-Identifier: Apache-2.0
#include <array>
#include <cstddef>
#include <vector>

#include "quo_base/gr_pt.h"
#include "quo_base/interp_orb.h"
#include "ratio_reporter.h"
#include "sarutillib/geometry/geometry_kernels.h"
#include "support/geometry.h"

namespace {

constexpr double kLambda = 0.05546576, kSpacing = 10.0;

/** An orbit segment of real spacing, and samples in the order of an image: range fastest. */
struct Scene {
    static constexpr int kLines = 32, kColumns = 64;
    std::array<std::array<double, 5>, 3> c{};
    std::vector<quo::OrbitState> states;
    std::vector<quo::RadarLook> looks;
    std::vector<double> times;
    std::vector<quo::Vec3> ground;

    Scene() {
        const test::CircularOrbit orbit{41.3, 12.8, -12.7};
        std::array<double, 15> positions{};
        for (std::size_t i = 0; i < 5; ++i)
            for (std::size_t axis = 0; axis < 3; ++axis)
                positions[3 * i + axis] = orbit.earth_fixed(kSpacing * static_cast<double>(i)).position[axis];
        orb_interp(0.0, kSpacing, positions.data(), nullptr, 5, c[0].data(), c[1].data(), c[2].data());
        for (int line = 0; line < kLines; ++line)
            for (int column = 0; column < kColumns; ++column) add(12.3 + 0.5 * line, 803457.3 + 2311.7 * column);
    }
    void add(double t, double range) {
        times.push_back(t);
        states.push_back(quo::orbit_state(segment(), t));
        looks.push_back({2.0 * range / quo::kLightSpeed, 0.0, kLambda, 1.0});
        ground.emplace_back();
        quo::ground_point(states.back().position, states.back().velocity, looks.back(), quo::kWgs84,
                          &ground.back());
    }
    [[nodiscard]] quo::OrbitSegment segment() const { return {c[0].data(), c[1].data(), c[2].data()}; }
};
const Scene& scene() {
    static const Scene made;
    return made;
}

/** Runs `body(i)` over the samples; the time is that of one. */
template <typename Body>
void each_sample(benchmark::State& state, Body body) {
    const std::size_t n = scene().times.size();
    std::size_t i = 0;
    for (auto _ : state) {
        body(i);
        if (++i == n) i = 0;
    }
}

void orbit_kernel(benchmark::State& state) {
    const Scene& s = scene();
    each_sample(state,
                [&](std::size_t i) { benchmark::DoNotOptimize(quo::orbit_state(s.segment(), s.times[i])); });
}
void posvelacc_5(benchmark::State& state) {
    const Scene& s = scene();
    double p[3], v[3], a[3];
    each_sample(state, [&](std::size_t i) {
        POSVELACC_5(s.times[i], s.c[0].data(), s.c[1].data(), s.c[2].data(), p, v, a);
        benchmark::DoNotOptimize(p);
    });
}
void forward_kernel(benchmark::State& state) {
    const Scene& s = scene();
    quo::Vec3 p;
    each_sample(state, [&](std::size_t i) {
        benchmark::DoNotOptimize(
            quo::ground_point(s.states[i].position, s.states[i].velocity, s.looks[i], quo::kWgs84, &p));
        benchmark::DoNotOptimize(p);
    });
}
void forward_with_orbit(benchmark::State& state) {
    const Scene& s = scene();
    quo::Vec3 p;
    each_sample(state, [&](std::size_t i) {
        benchmark::DoNotOptimize(quo::ground_point(quo::orbit_position(s.segment(), s.times[i]),
                                                   quo::orbit_velocity(s.segment(), s.times[i]), s.looks[i],
                                                   quo::kWgs84, &p));
        benchmark::DoNotOptimize(p);
    });
}
void forward_call(benchmark::State& state, double omega) {
    const Scene& s = scene();
    double p[3];
    each_sample(state, [&](std::size_t i) {
        benchmark::DoNotOptimize(gr_pt(p, &s.states[i].position.x, &s.states[i].velocity.x, s.looks[i].tau_s, 0.0,
                                       kLambda, omega, 1.0, quo::kWgs84.equatorial_m, quo::kWgs84.polar_m));
        benchmark::DoNotOptimize(p);
    });
}
void inverse_kernel(benchmark::State& state) {
    const Scene& s = scene();
    quo::ImageTime seen{};
    each_sample(state, [&](std::size_t i) {
        benchmark::DoNotOptimize(
            quo::image_time(s.segment(), s.ground[i], 2.0 * kSpacing, {0.0, 4.0 * kSpacing}, kLambda, 0.0, &seen));
        benchmark::DoNotOptimize(seen);
    });
}
void inverse_call(benchmark::State& state) {
    const Scene& s = scene();
    double t = 0.0, tau = 0.0;
    each_sample(state, [&](std::size_t i) {
        benchmark::DoNotOptimize(inv_grpt_opt(&t, &tau, nullptr, s.c[0].data(), s.c[1].data(), s.c[2].data(),
                                              &s.ground[i].x, 4.0 * kSpacing, kLambda, 0.0));
        benchmark::DoNotOptimize(t);
    });
}
void geodetic_kernel(benchmark::State& state) {
    const Scene& s = scene();
    each_sample(state,
                [&](std::size_t i) { benchmark::DoNotOptimize(quo::to_geodetic(s.ground[i], quo::kWgs84)); });
}
void sample_call(benchmark::State& state) {
    const Scene& s = scene();
    GrPtGeometry out;
    each_sample(state, [&](std::size_t i) {
        benchmark::DoNotOptimize(gr_pt_lat_lon(0.0, kSpacing, s.times[i], s.looks[i].tau_s, 0.0, kLambda, 1.0, 0.0,
                                               s.c[0].data(), s.c[1].data(), s.c[2].data(),
                                               quo::kWgs84.equatorial_m, quo::kWgs84.polar_m, &out));
        benchmark::DoNotOptimize(out);
    });
}
void fit_call(benchmark::State& state) {
    std::array<double, 15> positions{};
    for (std::size_t i = 0; i < 15; ++i)
        positions[i] = (&scene().states[Scene::kColumns * (i / 3)].position.x)[i % 3];
    double x[5], y[5], z[5];
    for (auto _ : state)  // NOLINT(clang-analyzer-deadcode.DeadStores): the library's own loop
        benchmark::DoNotOptimize(orb_interp(0.0, kSpacing, positions.data(), nullptr, 5, x, y, z));
}

BENCHMARK(orbit_kernel);
BENCHMARK(posvelacc_5);
BENCHMARK(forward_kernel);
BENCHMARK(forward_with_orbit);
BENCHMARK_CAPTURE(forward_call, earth_fixed, 0.0);
BENCHMARK_CAPTURE(forward_call, inertial, test::kEarthRate);
BENCHMARK(inverse_kernel);
BENCHMARK(inverse_call);
BENCHMARK(geodetic_kernel);
BENCHMARK(sample_call);
BENCHMARK(fit_call);

}  // namespace

int main(int argc, char** argv) {
    return bench::run(argc, argv,
                      {{"POSVELACC_5 / kernel", "posvelacc_5", "orbit_kernel", 1.5},
                       {"forward with orbit / kernel", "forward_with_orbit", "forward_kernel", 1.2},
                       {"gr_pt / kernel", "forward_call/earth_fixed", "forward_kernel", 1.3},
                       {"gr_pt, inertial / kernel", "forward_call/inertial", "forward_kernel", 1.8},
                       {"inv_grpt_opt / kernel", "inverse_call", "inverse_kernel", 1.3},
                       {"gr_pt_lat_lon / forward kernel", "sample_call", "forward_kernel", 3.5},
                       {"orb_interp, 5 vectors / forward kernel", "fit_call", "forward_kernel", 25.0}});
}
