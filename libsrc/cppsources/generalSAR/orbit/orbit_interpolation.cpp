// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/orbit/orbit_interpolation.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace quo {
namespace {

// Either makes order 8. Higher orders would only let the noise of real vectors grow near the ends.
constexpr std::int32_t kHermiteNodes = 4, kLagrangeNodes = 8;
constexpr std::int32_t kRunVectors = 5;

/** Value and derivative of the j-th Lagrange polynomial at s, and its derivative at its own node. */
struct Lagrange {
    double value = 1.0, rate = 0.0, rate_at_node = 0.0;
};

Lagrange lagrange(const StateVectors& states, std::span<const std::int32_t> nodes, std::size_t j,
                  double s) noexcept {
    Lagrange l;
    for (std::size_t m = 0; m < nodes.size(); ++m) {
        if (m == j) continue;
        const double place = states.place(nodes[m]);
        const double per_gap = 1.0 / (states.place(nodes[j]) - place);
        const double factor = (s - place) * per_gap;
        l.rate = l.rate * factor + l.value * per_gap;
        l.value *= factor;
        l.rate_at_node += per_gap;
    }
    return l;
}

double distance(const double a[3], const double b[3]) noexcept {
    return std::hypot(a[0] - b[0], a[1] - b[1], a[2] - b[2]);
}

using NodeRoom = std::array<std::int32_t, NodeWeights::kMostNodes>;

/** The `count` consecutive nodes that lie most evenly to both sides of the gap before vector `next`. */
std::span<const std::int32_t> nodes_around(std::int32_t next, std::int32_t count, std::int32_t vectors,
                                           NodeRoom& room) noexcept {
    const std::int32_t first = std::clamp(next - count / 2, 0, vectors - count);
    for (std::int32_t i = 0; i < count; ++i) room[std::size_t(i)] = first + i;
    return std::span{room}.first(std::size_t(count));
}

/** Number of the first vector at or after a place. */
std::int32_t first_from(const StateVectors& states, double s) noexcept {
    const double* const end = states.places + states.count;
    const double next = states.places
                            ? static_cast<double>(std::lower_bound(states.places, end, s) - states.places)
                            : std::ceil(s);
    return static_cast<std::int32_t>(std::clamp(next, 0.0, static_cast<double>(states.count)));
}

struct State {
    double position_m[3], velocity_m_s[3];
};

State by_both(const StateVectors& states, double s, std::int32_t next) noexcept {
    NodeRoom room;
    State state;
    hermite_weights(states, nodes_around(next, kHermiteNodes, states.count, room), s)
        .apply(states, state.position_m, state.velocity_m_s);
    return state;
}
State by_positions(const StateVectors& states, double s, std::int32_t next, std::int32_t nodes) noexcept {
    NodeRoom room;
    State state;
    lagrange_weights(states, nodes_around(next, std::min(nodes, states.count), states.count, room), s)
        .apply(states, state.position_m, state.velocity_m_s);
    return state;
}

/** How far the interpolations lie apart, at worst over the whole list, m. */
struct Spread {
    double apart = 0.0;            // by positions and velocities from by positions alone
    double by_another_node = 0.0;  // by eight positions from by nine, or by all from by one less
};

Spread spread_of(const StateVectors& states) noexcept {
    const std::int32_t another = states.count > kLagrangeNodes ? kLagrangeNodes + 1 : states.count - 1;
    Spread spread;
    for (std::int32_t next = 1; next < states.count; ++next)
        for (const double part : {0.25, 0.5, 0.75}) {
            const double s = states.place(next - 1) + part * (states.place(next) - states.place(next - 1));
            const State alone = by_positions(states, s, next, kLagrangeNodes);
            const State more = by_positions(states, s, next, another);
            const State both = by_both(states, s, next);
            spread.apart = std::max(spread.apart, distance(alone.position_m, both.position_m));
            spread.by_another_node = std::max(spread.by_another_node, distance(alone.position_m, more.position_m));
        }
    return spread;
}

/** What interpolation in positions and velocities leaves, m: every vector is compared with what the four around it
 * make of it, its velocity by what it bends in a spacing. Left out, a vector is missed by about four times as much
 * as a place between two vectors, on withheld vectors of a real orbit 20 s to 300 s apart. */
double error_by_both_m(const StateVectors& states) noexcept {
    constexpr double kMissedMore = 4.0;
    double worst_m = 0.0;
    for (std::int32_t i = 2; i + 2 < states.count; ++i) {
        const std::array<std::int32_t, 4> around{i - 2, i - 1, i + 1, i + 2};
        State state;
        hermite_weights(states, around, states.place(i)).apply(states, state.position_m, state.velocity_m_s);
        const double gap_s = 0.5 * (states.place(i + 1) - states.place(i - 1)) * states.spacing_s;
        worst_m = std::max({worst_m, distance(state.position_m, states.position(i)),
                            gap_s * distance(state.velocity_m_s, states.velocity(i))});
    }
    return worst_m / kMissedMore;
}

/** Length of the fifth difference of six positions from the i-th on, m. */
double fifth_difference(const StateVectors& states, std::int32_t i) noexcept {
    constexpr double kBinomial[] = {-1.0, 5.0, -10.0, 10.0, -5.0, 1.0};
    double difference[3] = {};
    for (std::int32_t j = 0; j < 6; ++j)
        for (std::size_t axis = 0; axis < 3; ++axis)
            difference[axis] += kBinomial[j] * states.position(i + j)[axis];
    return std::hypot(difference[0], difference[1], difference[2]);
}

/** Length of the fourth difference of the first five velocities, m/s. */
double fourth_difference_m_s(const StateVectors& states) noexcept {
    constexpr double kBinomial[] = {1.0, -4.0, 6.0, -4.0, 1.0};
    double difference[3] = {};
    for (std::int32_t j = 0; j < kRunVectors; ++j)
        for (std::size_t axis = 0; axis < 3; ++axis) difference[axis] += kBinomial[j] * states.velocity(j)[axis];
    return std::hypot(difference[0], difference[1], difference[2]);
}

}  // namespace

void NodeWeights::apply(const StateVectors& states, double position_m[3], double velocity_m_s[3]) const noexcept {
    for (std::size_t axis = 0; axis < 3; ++axis) {
        double position = 0.0, step = 0.0;
        for (std::size_t j = 0; j < count; ++j) {
            const double p = states.position(node[j])[axis];
            const double v = states.velocity(node[j])[axis] * states.spacing_s;
            position += value[j] * p + slope[j] * v;
            step += value_rate[j] * p + slope_rate[j] * v;
        }
        position_m[axis] = position;
        velocity_m_s[axis] = step / states.spacing_s;
    }
}

double NodeWeights::gain() const noexcept {
    double position = 0.0, velocity = 0.0;
    for (std::size_t j = 0; j < count; ++j) {
        position += std::abs(value[j]) + std::abs(slope[j]);
        velocity += std::abs(value_rate[j]) + std::abs(slope_rate[j]);
    }
    return std::max(position, velocity);
}

// Hermite's formula: F. B. Hildebrand, "Introduction to Numerical Analysis", 1974, section 8.2.
NodeWeights hermite_weights(const StateVectors& states, std::span<const std::int32_t> nodes, double s) noexcept {
    NodeWeights weights;
    weights.count = nodes.size();
    for (std::size_t j = 0; j < nodes.size(); ++j) {
        const Lagrange l = lagrange(states, nodes, j, s);
        const double from_node = s - states.place(nodes[j]);
        const double square = l.value * l.value, square_rate = 2.0 * l.value * l.rate;
        const double factor = 1.0 - 2.0 * from_node * l.rate_at_node;
        weights.node[j] = nodes[j];
        weights.value[j] = factor * square;
        weights.value_rate[j] = factor * square_rate - 2.0 * l.rate_at_node * square;
        weights.slope[j] = from_node * square;
        weights.slope_rate[j] = from_node * square_rate + square;
    }
    return weights;
}

NodeWeights lagrange_weights(const StateVectors& states, std::span<const std::int32_t> nodes, double s) noexcept {
    NodeWeights weights;
    weights.count = nodes.size();
    for (std::size_t j = 0; j < nodes.size(); ++j) {
        const Lagrange l = lagrange(states, nodes, j, s);
        weights.node[j] = nodes[j];
        weights.value[j] = l.value;
        weights.value_rate[j] = l.rate;
    }
    return weights;
}

double velocity_mismatch_m_s(const StateVectors& states, std::int32_t i) noexcept {
    const State state = by_positions(states, states.place(i), i + 1, kLagrangeNodes);
    return distance(state.velocity_m_s, states.velocity(i));
}

double run_error_m(const StateVectors& states) noexcept {
    // Largest value of |u (u - 1) (u - 2) (u - 3) (u - 4)| / 5! between 0.6 and 3.4, and from there to the end.
    constexpr double kInside = 2.7418 / 120.0, kAtEnds = 3.6315 / 120.0;
    if (states.count == kRunVectors) return fourth_difference_m_s(states) * states.spacing_s * kAtEnds;
    double worst = 0.0;
    const std::int32_t last = states.count - kRunVectors - 1;
    for (std::int32_t k = 0; k <= last; ++k)
        worst = std::max(worst, fifth_difference(states, k) * (k == 0 || k == last ? kAtEnds : kInside));
    return worst;
}

// How far the two interpolations lie apart is at most the sum of their errors. So where it is more than twice what
// the velocities leave, the positions alone are off by more.
StateInterpolation::StateInterpolation(const StateVectors& states) noexcept : states_{states} {
    const Spread spread = spread_of(states);
    const double by_both_m = error_by_both_m(states);
    use_velocities_ = spread.apart > 2.0 * by_both_m;
    error_m_ = use_velocities_ ? by_both_m : std::min(spread.by_another_node, spread.apart);
}

void StateInterpolation::at(double s, double position_m[3], double velocity_m_s[3]) const noexcept {
    const std::int32_t next = first_from(states_, s);
    const State state =
        use_velocities_ ? by_both(states_, s, next) : by_positions(states_, s, next, kLagrangeNodes);
    std::copy_n(state.position_m, 3, position_m);
    std::copy_n(state.velocity_m_s, 3, velocity_m_s);
}

}  // namespace quo
