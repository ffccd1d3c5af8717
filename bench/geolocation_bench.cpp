// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cstddef>
#include <memory>
#include <vector>

#include "diagnosticslib/call_frame.h"
#include "generalSAR/orbit/orbit_model.h"
#include "geolocation_floor.h"
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
            double p[3];
            orbit.sat2earth(times.back(), ranges.back(), p);
            ground.push_back(quo::load(p));
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

// --- arrays -----------------------------------------------------------------------------------------------------

/** The scene's points as arrays, a block of them, and room for the results. */
struct Arrays {
    std::vector<double> x, y, z;
    std::vector<double> rows[10];
    std::unique_ptr<quo::OrbitModel> model;
    quo::OrbitView view;
    quo::ForwardBlock samples{};
    quo::InverseBlock points{};

    explicit Arrays(const Bench& scene)
        : model{quo::OrbitModel::create(scene.orbit.nSV_n)}, view{made_view(scene.orbit, *model)} {
        for (auto& row : rows) row.resize(scene.times.size());
        for (const quo::Vec3& p : scene.ground) {
            x.push_back(p.x);
            y.push_back(p.y);
            z.push_back(p.z);
        }
        const auto middle = static_cast<std::ptrdiff_t>(x.size() / 2);
        const auto take = [&](const std::vector<double>& from, double* to) {
            std::copy_n(from.begin() + middle, quo::kBlockPoints, to);
        };
        take(scene.times, samples.t_s);
        take(scene.ranges, samples.range_s);
        take(x, points.x_m);
        take(y, points.y_m);
        take(z, points.z_m);
    }
    static quo::OrbitView made_view(const GeneralSAROrbit& orbit, quo::OrbitModel& model) {
        model.build({orbit.pSV_m, orbit.vSV_mOs, orbit.nSV_n, orbit.dtSV_s}, orbit.t0SV_s);
        return model.view(orbit.getLambda(), 1.0);
    }
};

/** Runs `body` on many points at once; the time is that of one point. */
template <typename Body>
void all_points(benchmark::State& state, std::size_t count, Body body) {
    Bench& scene = bench_scene();
    static Arrays arrays{scene};
    while (state.KeepRunningBatch(static_cast<benchmark::IterationCount>(count))) {
        body(scene, arrays);
        benchmark::ClobberMemory();
    }
}
OrbitGround positions(Arrays& to) {
    OrbitGround ground;
    ground.x_m = to.rows[0].data();
    ground.y_m = to.rows[1].data();
    ground.z_m = to.rows[2].data();
    return ground;
}
OrbitSamples samples_of(const Bench& s) { return {s.times.size(), s.times.data(), s.ranges.data()}; }
void forward_array(benchmark::State& state) {
    all_points(state, bench_scene().times.size(), [](Bench& s, Arrays& a) {
        benchmark::DoNotOptimize(s.orbit.sat2earth(samples_of(s), positions(a)));
    });
}
void height_array(benchmark::State& state) {
    static const std::vector<double> heights(bench_scene().times.size(), 517.3);
    all_points(state, heights.size(), [](Bench& s, Arrays& a) {
        OrbitSamples samples = samples_of(s);
        samples.height_m = heights.data();
        benchmark::DoNotOptimize(s.orbit.sat2earth(samples, positions(a)));
    });
}
void height_call(benchmark::State& state) {
    double p[3];
    each_point(state, [&](Bench& s, std::size_t i) {
        benchmark::DoNotOptimize(s.orbit.sat2earth(s.times[i], s.ranges[i], 0.0, 517.3, p));
        benchmark::DoNotOptimize(p);
    });
}
void geometry_array(benchmark::State& state) {
    all_points(state, bench_scene().times.size(), [](Bench& s, Arrays& a) {
        OrbitGround ground = positions(a);
        ground.latitude_deg = a.rows[3].data();
        ground.longitude_deg = a.rows[4].data();
        ground.incidence_deg = a.rows[5].data();
        ground.look_deg = a.rows[6].data();
        ground.fm_rate_hz_s = a.rows[7].data();
        ground.speed_m_s = a.rows[8].data();
        benchmark::DoNotOptimize(s.orbit.sat2earth(samples_of(s), ground));
    });
}
void inverse_array(benchmark::State& state) {
    all_points(state, bench_scene().times.size(), [](Bench& s, Arrays& a) {
        OrbitTargets targets{s.times.size()};
        targets.x_m = a.x.data();
        targets.y_m = a.y.data();
        targets.z_m = a.z.data();
        benchmark::DoNotOptimize(s.orbit.earth2sat(targets, {a.rows[0].data(), a.rows[1].data(), nullptr}));
    });
}

/** The kernels alone on one block, which stays in the first cache. */
template <int width>
void forward_lanes(benchmark::State& state) {
    all_points(state, quo::kBlockPoints, [](Bench&, Arrays& a) {
        benchmark::DoNotOptimize(quo::array_kernels(width).forward(a.view, quo::kBlockPoints, a.samples));
    });
}
template <int width>
void inverse_lanes(benchmark::State& state) {
    all_points(state, quo::kBlockPoints, [](Bench&, Arrays& a) {
        benchmark::DoNotOptimize(quo::array_kernels(width).inverse(a.view, quo::kBlockPoints, a.points));
    });
}

/** The operations of a point to the ground in three steps of Newton's method, and of one back in as many, a root
 * counted as a division. */
constexpr bench::Operations kForwardOperations{160, 110, 16}, kInverseOperations{195, 150, 7};

/** What they take where none waits for another. */
template <int width>
void arithmetic(benchmark::State& state, const bench::Operations& operations) {
    while (state.KeepRunningBatch(width)) {
        (width == 4 ? bench::operate_4 : bench::operate_8)(operations);
        benchmark::ClobberMemory();
    }
}
template <int width>
void add_width(const char* forward, const char* inverse) {
    if (quo::array_kernels(width).width != width) return;
    benchmark::RegisterBenchmark(forward, arithmetic<width>, kForwardOperations);
    benchmark::RegisterBenchmark(inverse, arithmetic<width>, kInverseOperations);
}
BENCHMARK(forward_array);
BENCHMARK(height_array);
BENCHMARK(height_call);
BENCHMARK(geometry_array);
BENCHMARK(inverse_array);
BENCHMARK(forward_lanes<2>)->Name("forward_lanes_2");
BENCHMARK(forward_lanes<4>)->Name("forward_lanes_4");
BENCHMARK(forward_lanes<8>)->Name("forward_lanes_8");
BENCHMARK(inverse_lanes<2>)->Name("inverse_lanes_2");
BENCHMARK(inverse_lanes<4>)->Name("inverse_lanes_4");
BENCHMARK(inverse_lanes<8>)->Name("inverse_lanes_8");
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
    add_width<4>("forward_arithmetic_4", "inverse_arithmetic_4");
    add_width<8>("forward_arithmetic_8", "inverse_arithmetic_8");
    const bool widest = quo::array_kernels().width == 8;  // unless QUO_CPU lowers it
    return bench::run(
        argc, argv,
        {
            {"SVGetPos + SVGetVel / polynomials", "orbit_calls", "orbit_kernel", 5.0},
            {"SVGetPos + SVGetVel / two frames", "orbit_calls", "two_frames", 10.0},
            {"sat2earth / kernel", "forward_call", "forward_kernel", 1.3},
            {"earth2sat / kernel", "inverse_call", "inverse_kernel", 1.3},
            {"earth2satPrecise / kernel", "precise_call", "inverse_kernel", 2.5},
            {"earth2satLinear / earth2sat", "linear_call", "inverse_call", 0.5},
            {"SVGetLatLon / sat2earth", "lat_lon_call", "forward_call", 1.7},
            {"SVGetGeometry / sat2earth", "geometry_call", "forward_call", 2.6},
            {"array: sat2earth / single", "forward_array", "forward_call", 0.14},
            {"array: the same at a height", "height_array", "height_call", 0.14},
            {"array: all of the geometry / single", "geometry_array", "geometry_call", 0.2},
            {"array: earth2sat / single", "inverse_array", "inverse_call", 0.25},
            {"array: sat2earth / arithmetic", "forward_array",
             widest ? "forward_arithmetic_8" : "forward_arithmetic_4", 1.6},
            {"array: earth2sat / arithmetic", "inverse_array",
             widest ? "inverse_arithmetic_8" : "inverse_arithmetic_4", 1.6},
            {"kernel, AVX2: sat2earth / single", "forward_lanes_4", "forward_call", 0.18},
            {"kernel, AVX2: earth2sat / single", "inverse_lanes_4", "inverse_call", 0.36},
            {"kernel, AVX2: sat2earth / arithmetic", "forward_lanes_4", "forward_arithmetic_4", 1.6},
            {"kernel, AVX2: earth2sat / arithmetic", "inverse_lanes_4", "inverse_arithmetic_4", 1.6},
            {"kernel, AVX-512: sat2earth / arithmetic", "forward_lanes_8", "forward_arithmetic_8", 1.6},
            {"kernel, AVX-512: earth2sat / arithmetic", "inverse_lanes_8", "inverse_arithmetic_8", 1.6},
        });
}
