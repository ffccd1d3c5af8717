// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ORBIT_INTERPOLATION_H
#define QUO_ORBIT_INTERPOLATION_H

#include <cstddef>
#include <cstdint>
#include <span>

namespace quo {

/** State vectors, wherever they lie: count x 3 positions (m) and velocities (m/s). Their places are times after
 * the first vector, counted in spacings: increasing, and null for vectors that are equally spaced. */
struct StateVectors {
    const double* positions;
    const double* velocities;
    std::int32_t count;
    double spacing_s;
    const double* places = nullptr;

    [[nodiscard]] const double* position(std::int32_t i) const noexcept { return positions + 3 * std::size_t(i); }
    [[nodiscard]] const double* velocity(std::int32_t i) const noexcept { return velocities + 3 * std::size_t(i); }
    [[nodiscard]] double place(std::int32_t i) const noexcept { return places ? places[std::size_t(i)] : i; }
};

/** What an interpolation polynomial takes from each of its nodes: value = sum of value[j] f_j + slope[j] f'_j, and
 * likewise its derivative. Times are in spacings. */
struct NodeWeights {
    static constexpr std::size_t kMostNodes = 9;

    std::size_t count = 0;
    std::int32_t node[kMostNodes] = {};
    double value[kMostNodes] = {}, slope[kMostNodes] = {};
    double value_rate[kMostNodes] = {}, slope_rate[kMostNodes] = {};

    /** Position and velocity that the nodes give. */
    void apply(const StateVectors& states, double position_m[3], double velocity_m_s[3]) const noexcept;
    /** How much an error of the nodes (positions, and velocities times the spacing) can grow to, as a position and
     * as a velocity times the spacing: the larger of the two. */
    [[nodiscard]] double gain() const noexcept;
};

/** Weights at place `s` of the polynomial that takes values and slopes of the nodes: of degree 2 n - 1. */
NodeWeights hermite_weights(const StateVectors& states, std::span<const std::int32_t> nodes, double s) noexcept;
/** The same from the values alone: of degree n - 1. */
NodeWeights lagrange_weights(const StateVectors& states, std::span<const std::int32_t> nodes, double s) noexcept;

/** The interpolation that state vectors are re-sampled by: of order 8, in positions and velocities of four
 * vectors, or in the positions alone of eight (or of all, where there are fewer). Velocities that are not the
 * positions' derivative bend the one, a spacing too wide for the orbit lets the other swing near the ends: the
 * vectors themselves tell which is worse. Needs at least five vectors. */
class StateInterpolation {
public:
    explicit StateInterpolation(const StateVectors& states) noexcept;
    /** State at place `s`. */
    void at(double s, double position_m[3], double velocity_m_s[3]) const noexcept;
    /** Estimate of the interpolated positions' largest error, m. */
    [[nodiscard]] double error_m() const noexcept { return error_m_; }

private:
    StateVectors states_;
    bool use_velocities_;
    double error_m_;
};

/** How far a curve of degree 4 through each five vectors misses a smooth orbit where it is used: from 0.6 to 3.4
 * spacings after its first vector, and to the orbit's own ends, m, for equally spaced vectors. The miss is the
 * next term of Newton's interpolation formula, in the fifth difference of the positions. With five vectors the
 * fourth difference of the velocities stands for it: an inconsistency that changes smoothly from vector to vector,
 * as velocities of another frame or epoch have it, drops out there. */
double run_error_m(const StateVectors& states) noexcept;

/** Length of the difference between a vector's velocity and the derivative of the polynomial through the positions
 * of up to eight vectors around it, m/s. */
double velocity_mismatch_m_s(const StateVectors& states, std::int32_t i) noexcept;

}  // namespace quo

#endif
