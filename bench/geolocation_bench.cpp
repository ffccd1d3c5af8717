#include <cstddef>
#include <vector>

#include "diagnosticslib/call_frame.h"
#include "quo_base/interp_orb.h"
#include "ratio_reporter.h"
#include "sarutillib/geometry/geometry_kernels.h"
#include "support/scenes.h"

// What geolocation on an orbit costs per point, beside the same kernels without frame, checks and choice of the
// run.

namespace {

/** A real scene's orbit and samples in the order of an image, range fastest, with their ground points. The kernels
 * work on one run of vectors, fitted here. */
struct Bench {
    static constexpr std::size_t kLines = 48, kColumns = 64;
    GeneralSAROrbit orbit;
    double c[3][5] = {};
    double run_start_s = 0.0, length_s = 0.0;
    std::vector<double> times, ranges;
    std::vector<quo::RadarLook> looks;
    std::vector<quo::Vec3> ground;

    Bench() {
        test::load_orbit(test::kScenes[0], orbit);
        const test::Extent extent = test::extent_of(test::load_tie_points(test::kScenes[0]));
        const auto first = static_cast<std::ptrdiff_t>((extent.first_s - orbit.t0SV_s) / orbit.dtSV_s);
        run_start_s = orbit.t0SV_s + static_cast<double>(first) * orbit.dtSV_s;
        length_s = 4.0 * orbit.dtSV_s;
        orb_interp(0.0, orbit.dtSV_s, orbit.pSV_m + 3 * first, nullptr, 5, c[0], c[1], c[2]);
        for (std::size_t i = 0; i < kLines * kColumns; ++i) {
            const std::size_t row = i / kColumns;
            const double line = static_cast<double>(row) / kLines;
            const double column = static_cast<double>(i % kColumns) / kColumns;
            times.push_back(extent.first_s + line * (extent.last_s - extent.first_s));
            ranges.push_back(extent.near_s + column * (extent.far_s - extent.near_s));
            looks.push_back({ranges.back(), 0.0, orbit.getLambda(), 1.0});
            double xyz[3];
            orbit.sat2earth(times.back(), ranges.back(), xyz);
            ground.push_back(quo::load(xyz));
        }
    }
    [[nodiscard]] quo::OrbitSegment segment() const { return {c[0], c[1], c[2]}; }
};
Bench& bench_scene() {
    static Bench made;
    return made;
}

template <typename Body>
void each_point(benchmark::State& state, Body body) {
    Bench& scene = bench_scene();
    std::size_t i = 0;
    for (auto _ : state) {
        body(scene, i);
        if (++i == scene.times.size()) i = 0;
    }
}

void two_frames(benchmark::State& state) {
    for (auto _ : state) {  // NOLINT(clang-analyzer-deadcode.DeadStores): the library's own loop
        for (int i = 0; i < 2; ++i) {
            quo::CallFrame frame{"two_frames", "geolocation_bench"};
            benchmark::DoNotOptimize(frame.success());
        }
    }
}
void orbit_kernel(benchmark::State& state) {
    each_point(state, [](Bench& s, std::size_t i) {
        benchmark::DoNotOptimize(quo::orbit_position(s.segment(), s.times[i] - s.run_start_s));
        benchmark::DoNotOptimize(quo::orbit_velocity(s.segment(), s.times[i] - s.run_start_s));
    });
}
void orbit_calls(benchmark::State& state) {
    double p[3], v[3];
    each_point(state, [&](Bench& s, std::size_t i) {
        benchmark::DoNotOptimize(s.orbit.SVGetPos(s.times[i], p));
        benchmark::DoNotOptimize(s.orbit.SVGetVel(s.times[i], v));
        benchmark::DoNotOptimize(p);
        benchmark::DoNotOptimize(v);
    });
}
void forward_kernel(benchmark::State& state) {
    quo::Vec3 p;
    each_point(state, [&](Bench& s, std::size_t i) {
        const double u = s.times[i] - s.run_start_s;
        benchmark::DoNotOptimize(quo::ground_point(quo::orbit_position(s.segment(), u),
                                                   quo::orbit_velocity(s.segment(), u), s.looks[i], quo::kWgs84,
                                                   &p));
        benchmark::DoNotOptimize(p);
    });
}
void forward_call(benchmark::State& state) {
    double p[3];
    each_point(state, [&](Bench& s, std::size_t i) {
        benchmark::DoNotOptimize(s.orbit.sat2earth(s.times[i], s.ranges[i], p));
        benchmark::DoNotOptimize(p);
    });
}
void inverse_kernel(benchmark::State& state) {
    quo::ImageTime seen{};
    each_point(state, [&](Bench& s, std::size_t i) {
        benchmark::DoNotOptimize(quo::image_time(s.segment(), s.ground[i], 0.5 * s.length_s, {0.0, s.length_s},
                                                 s.looks[i].lambda_m, s.looks[i].fd_hz, &seen));
        benchmark::DoNotOptimize(seen);
    });
}
void linear_call(benchmark::State& state) {
    double t = 0.0, tau = 0.0;
    each_point(state, [&](Bench& s, std::size_t i) {
        benchmark::DoNotOptimize(s.orbit.earth2satLinear(&s.ground[i].x, &t, &tau));
        benchmark::DoNotOptimize(t);
    });
}
void inverse_call(benchmark::State& state) {
    double t = 0.0, tau = 0.0;
    each_point(state, [&](Bench& s, std::size_t i) {
        benchmark::DoNotOptimize(s.orbit.earth2sat(&s.ground[i].x, &t, &tau));
        benchmark::DoNotOptimize(t);
    });
}
void precise_call(benchmark::State& state) {
    double t = 0.0, tau = 0.0;
    each_point(state, [&](Bench& s, std::size_t i) {
        benchmark::DoNotOptimize(s.orbit.earth2satPrecise(&s.ground[i].x, &t, &tau));
        benchmark::DoNotOptimize(t);
    });
}
void geodetic_kernel(benchmark::State& state) {
    each_point(state, [](Bench& s, std::size_t i) {
        benchmark::DoNotOptimize(quo::to_geodetic(s.ground[i], quo::kWgs84));
    });
}
void lat_lon_call(benchmark::State& state) {
    double latitude = 0.0, longitude = 0.0;
    each_point(state, [&](Bench& s, std::size_t i) {
        benchmark::DoNotOptimize(s.orbit.SVGetLatLon(s.times[i], s.ranges[i], &latitude, &longitude));
        benchmark::DoNotOptimize(latitude);
    });
}

void geometry_call(benchmark::State& state) {
    GrPtGeometry geometry;
    each_point(state, [&](Bench& s, std::size_t i) {
        benchmark::DoNotOptimize(s.orbit.SVGetGeometry(s.times[i], s.ranges[i], 0.0, &geometry));
        benchmark::DoNotOptimize(geometry);
    });
}

BENCHMARK(two_frames);
BENCHMARK(orbit_kernel);
BENCHMARK(orbit_calls);
BENCHMARK(forward_kernel);
BENCHMARK(forward_call);
BENCHMARK(inverse_kernel);
BENCHMARK(linear_call);
BENCHMARK(inverse_call);
BENCHMARK(precise_call);
BENCHMARK(geodetic_kernel);
BENCHMARK(lat_lon_call);
BENCHMARK(geometry_call);

}  // namespace

int main(int argc, char** argv) {
    return bench::run(argc, argv,
                      {
                          {"SVGetPos + SVGetVel / polynomials", "orbit_calls", "orbit_kernel", 5.0},
                          {"SVGetPos + SVGetVel / two frames", "orbit_calls", "two_frames", 10.0},
                          {"sat2earth / kernel", "forward_call", "forward_kernel", 1.3},
                          {"earth2sat / kernel", "inverse_call", "inverse_kernel", 1.3},
                          {"earth2satPrecise / kernel", "precise_call", "inverse_kernel", 2.5},
                          {"earth2satLinear / earth2sat", "linear_call", "inverse_call", 0.5},
                          {"SVGetLatLon / sat2earth", "lat_lon_call", "forward_call", 1.7},
                          {"SVGetGeometry / sat2earth", "geometry_call", "forward_call", 2.6},
                      });
}
