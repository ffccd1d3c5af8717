// SPDX-License-Identifier: Apache-2.0

// Inversion beside LAPACK, polynomial and linear fits beside a straightforward solution with Eigen, in one run.
// The summary at the end prints the ratios.
#include <benchmark/benchmark.h>

#include <Eigen/Dense>
#include <cmath>
#include <random>
#include <vector>

#include "quo_base/MatrixAlgebraANSI.h"
#include "quo_base/alloc_free.h"
#include "quo_base/ckerr.h"
#include "ratio_reporter.h"

extern "C" {
void dgetrf_(const int* m, const int* n, double* a, const int* lda, int* pivots, int* info);
void dgetri_(const int* n, double* a, const int* lda, const int* pivots, double* work, const int* lwork,
             int* info);
}

namespace {

std::vector<double> random_matrix(int n) {
    std::mt19937_64 generator{17};
    std::uniform_real_distribution<double> uniform{-1.0, 1.0};
    std::vector<double> a(static_cast<std::size_t>(n) * static_cast<std::size_t>(n));
    for (double& value : a) value = uniform(generator);
    return a;
}

void invert_own(benchmark::State& state) {
    const int n = static_cast<int>(state.range(0));
    const std::vector<double> a = random_matrix(n);
    std::vector<double> y(a.size());
    for (auto _ : state) {
        if (MatInv(a.data(), y.data(), n) != 0) state.SkipWithError("MatInv failed");
        benchmark::DoNotOptimize(y.data());
    }
}

void invert_lapack(benchmark::State& state) {
    const int n = static_cast<int>(state.range(0)), lwork = 64 * n;
    const std::vector<double> a = random_matrix(n);
    std::vector<double> y(a.size()), work(static_cast<std::size_t>(lwork));
    std::vector<int> pivots(static_cast<std::size_t>(n));
    for (auto _ : state) {
        y = a;
        int info = 0;
        dgetrf_(&n, &n, y.data(), &n, pivots.data(), &info);
        dgetri_(&n, y.data(), &n, pivots.data(), work.data(), &lwork, &info);
        benchmark::DoNotOptimize(y.data());
    }
}

constexpr int kPoints = 5000;

/** Points of a smooth curve. */
struct Curve {
    Curve() {
        for (int k = 0; k < kPoints; ++k) {
            x.push_back(k / static_cast<double>(kPoints));
            y.push_back(std::sin(3.0 * x.back()));
        }
    }
    std::vector<double> x, y;
};

void polynomial_own(benchmark::State& state) {
    const Curve curve;
    double c[5];
    for (auto _ : state) {
        polfit(curve.x.data(), curve.y.data(), kPoints, c, 4);
        benchmark::DoNotOptimize(c);
    }
    state.SetItemsProcessed(state.iterations() * kPoints);
}

void polynomial_eigen(benchmark::State& state) {
    const Curve curve;
    for (auto _ : state) {
        Eigen::MatrixXd design(kPoints, 5);
        for (int k = 0; k < kPoints; ++k) {
            double power = 1.0;
            for (int j = 0; j < 5; ++j, power *= curve.x[static_cast<std::size_t>(k)]) design(k, j) = power;
        }
        const Eigen::Map<const Eigen::VectorXd> y{curve.y.data(), kPoints};
        const Eigen::VectorXd c = (design.transpose() * design).ldlt().solve(design.transpose() * y);
        benchmark::DoNotOptimize(c.data());
    }
    state.SetItemsProcessed(state.iterations() * kPoints);
}

// The basis of the fits over a grid of samples: point number to range and azimuth index.
void grid_basis(double point, double f[], int) {
    const double j = std::floor(point / 100.0), i = point - 100.0 * j;
    f[1] = 1.0;
    f[2] = i;
    f[3] = j;
    f[4] = i * j;
    f[5] = i * i;
    f[6] = f[5] * i;
    f[7] = f[6] * i;
}

void linear_own(benchmark::State& state) {
    const Curve curve;
    std::vector<double> number, sig(kPoints, 1.0);
    for (int k = 0; k < kPoints; ++k) number.push_back(k);
    const std::vector<int> all(8, 1);
    std::vector<double> a(8);
    double chisq = 0.0;
    double** covar = dmatrix(1, 7, 1, 7);
    for (auto _ : state) {
        lfitd(number.data() - 1, curve.y.data() - 1, sig.data() - 1, kPoints, a.data(), all.data(), 7, covar,
              &chisq, grid_basis);
        benchmark::DoNotOptimize(a.data());
    }
    free_dmatrix(covar, 1, 7, 1, 7);
    state.SetItemsProcessed(state.iterations() * kPoints);
}

struct GridSystem {
    GridSystem() {
        for (int k = 0; k < kPoints; ++k) {
            double f[8];
            grid_basis(k, f, 7);
            design.insert(design.end(), f + 1, f + 8);
        }
    }
    Curve curve;
    std::vector<double> design;
};

void orthogonal_own(benchmark::State& state) {
    const GridSystem system;
    double x[7];
    for (auto _ : state) {
        if (lsq_fit(system.design.data(), kPoints, 7, system.curve.y.data(), x, nullptr) != 0)
            state.SkipWithError("lsq_fit failed");
        benchmark::DoNotOptimize(x);
    }
    state.SetItemsProcessed(state.iterations() * kPoints);
}

void orthogonal_eigen(benchmark::State& state) {
    const GridSystem system;
    const Eigen::Map<const Eigen::VectorXd> y{system.curve.y.data(), kPoints};
    using RowMajor = Eigen::Matrix<double, Eigen::Dynamic, 7, Eigen::RowMajor>;
    for (auto _ : state) {
        const Eigen::MatrixXd design = Eigen::Map<const RowMajor>{system.design.data(), kPoints, 7};
        const Eigen::VectorXd x = design.colPivHouseholderQr().solve(y);
        benchmark::DoNotOptimize(x.data());
    }
    state.SetItemsProcessed(state.iterations() * kPoints);
}

void linear_eigen(benchmark::State& state) {
    const Curve curve;
    for (auto _ : state) {
        Eigen::MatrixXd design(kPoints, 7);
        for (int k = 0; k < kPoints; ++k) {
            double f[8];
            grid_basis(k, f, 7);
            for (int j = 0; j < 7; ++j) design(k, j) = f[j + 1];
        }
        const Eigen::Map<const Eigen::VectorXd> y{curve.y.data(), kPoints};
        const Eigen::VectorXd a = (design.transpose() * design).ldlt().solve(design.transpose() * y);
        benchmark::DoNotOptimize(a.data());
    }
    state.SetItemsProcessed(state.iterations() * kPoints);
}

BENCHMARK(invert_own)->Arg(3)->Arg(7)->Arg(50)->Arg(200)->Arg(500);
BENCHMARK(invert_lapack)->Arg(3)->Arg(7)->Arg(50)->Arg(200)->Arg(500);
BENCHMARK(polynomial_own);
BENCHMARK(polynomial_eigen);
BENCHMARK(linear_own);
BENCHMARK(linear_eigen);
BENCHMARK(orthogonal_own);
BENCHMARK(orthogonal_eigen);

}  // namespace

int main(int argc, char** argv) {
    init_ckerr_locking();
    const int status = bench::run(argc, argv,
                                  {{"MatInv n=3 / LAPACK", "invert_own/3", "invert_lapack/3", 1.3},
                                   {"MatInv n=7 / LAPACK", "invert_own/7", "invert_lapack/7", 1.3},
                                   {"MatInv n=50 / LAPACK", "invert_own/50", "invert_lapack/50", 1.0},
                                   {"MatInv n=200 / LAPACK", "invert_own/200", "invert_lapack/200", 0.5},
                                   {"MatInv n=500 / LAPACK", "invert_own/500", "invert_lapack/500", 0.5},
                                   {"polfit degree 4 / Eigen", "polynomial_own", "polynomial_eigen", 1.0},
                                   {"lfitd 7 functions / Eigen", "linear_own", "linear_eigen", 1.0},
                                   {"lsq_fit 7 columns / Eigen", "orthogonal_own", "orthogonal_eigen", 2.0}});
    exit_ckerr();
    return status;
}
