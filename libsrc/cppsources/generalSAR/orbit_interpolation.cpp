#include "generalSAR/orbit_interpolation.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace quo {
namespace {

// Either makes order 8: what a smooth orbit leaves out at 60 s is below a micrometre, and higher orders would only
// let the noise of real vectors grow near the ends.
constexpr std::int32_t kHermiteNodes = 4, kLagrangeNodes = 8;
// Slopes that are off by e at every node bend the cubic between two nodes by up to e / (6 sqrt(3)) spacings.
constexpr double kBendPerMismatch = 0.0962;
constexpr std::int32_t kRunVectors = 5;
constexpr double kTolerableBend_m = 1e-4;

/** Value and derivative of the j-th Lagrange polynomial at s, and its derivative at its own node. */
struct Lagrange {
    double value = 1.0, rate = 0.0, rate_at_node = 0.0;
};

Lagrange lagrange(std::span<const std::int32_t> nodes, std::size_t j, double s) noexcept {
    Lagrange l;
    for (std::size_t m = 0; m < nodes.size(); ++m) {
        if (m == j) continue;
        const double per_gap = 1.0 / (nodes[j] - nodes[m]);
        const double factor = (s - nodes[m]) * per_gap;
        l.rate = l.rate * factor + l.value * per_gap;
        l.value *= factor;
        l.rate_at_node += per_gap;
    }
    return l;
}

double distance(const double a[3], const double b[3]) noexcept {
    return std::hypot(a[0] - b[0], a[1] - b[1], a[2] - b[2]);
}

/** The `count` consecutive nodes that lie most evenly around s. */
template <std::size_t Most>
std::span<const std::int32_t> nodes_around(double s, std::int32_t count, std::int32_t vectors,
                                           std::array<std::int32_t, Most>& room) noexcept {
    const std::int32_t half = count / 2;
    const double first = std::clamp(std::ceil(s) - half, 0.0, static_cast<double>(vectors - count));
    for (std::int32_t i = 0; i < count; ++i) room[std::size_t(i)] = static_cast<std::int32_t>(first) + i;
    return std::span{room}.first(std::size_t(count));
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

bool velocities_fit(const StateVectors& states) noexcept {
    double worst_m_s = 0.0;
    for (std::int32_t i = kLagrangeNodes / 2 - 1; i <= states.count - kLagrangeNodes / 2 - 1; ++i)
        worst_m_s = std::max(worst_m_s, velocity_mismatch_m_s(states, i));
    return worst_m_s * states.spacing_s * kBendPerMismatch <= kTolerableBend_m;
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
NodeWeights hermite_weights(std::span<const std::int32_t> nodes, double s) noexcept {
    NodeWeights weights;
    weights.count = nodes.size();
    for (std::size_t j = 0; j < nodes.size(); ++j) {
        const Lagrange l = lagrange(nodes, j, s);
        const double from_node = s - nodes[j];
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

NodeWeights lagrange_weights(std::span<const std::int32_t> nodes, double s) noexcept {
    NodeWeights weights;
    weights.count = nodes.size();
    for (std::size_t j = 0; j < nodes.size(); ++j) {
        const Lagrange l = lagrange(nodes, j, s);
        weights.node[j] = nodes[j];
        weights.value[j] = l.value;
        weights.value_rate[j] = l.rate;
    }
    return weights;
}

double velocity_mismatch_m_s(const StateVectors& states, std::int32_t i) noexcept {
    std::array<std::int32_t, kLagrangeNodes> room;
    const auto nodes = nodes_around(i + 0.5, std::min(kLagrangeNodes, states.count), states.count, room);
    double position_m[3], velocity_m_s[3];
    lagrange_weights(nodes, i).apply(states, position_m, velocity_m_s);
    return distance(velocity_m_s, states.velocity(i));
}

double run_error_m(const StateVectors& states) noexcept {
    // Largest value of |u (u - 1) (u - 2) (u - 3) (u - 4)| / 5! between 0.6 and 3.4, and from there to the end.
    constexpr double kInside = 2.7418 / 120.0, kAtEnds = 3.6315 / 120.0;
    if (states.count == kRunVectors) {
        // The slope of that product is 24 at both ends.
        const double mismatch = std::max(velocity_mismatch_m_s(states, 0), velocity_mismatch_m_s(states, 4));
        return mismatch * states.spacing_s / 24.0 * 120.0 * kAtEnds;
    }
    double worst = 0.0;
    const std::int32_t last = states.count - kRunVectors - 1;
    for (std::int32_t k = 0; k <= last; ++k)
        worst = std::max(worst, fifth_difference(states, k) * (k == 0 || k == last ? kAtEnds : kInside));
    return worst;
}

StateInterpolation::StateInterpolation(const StateVectors& states) noexcept
    : states_{states}, use_velocities_{states.count < kLagrangeNodes || velocities_fit(states)} {}

void StateInterpolation::at(double s, double position_m[3], double velocity_m_s[3]) const noexcept {
    std::array<std::int32_t, NodeWeights::kMostNodes> room;
    const std::int32_t count = use_velocities_ ? kHermiteNodes : kLagrangeNodes;
    const auto nodes = nodes_around(s, count, states_.count, room);
    const NodeWeights weights = use_velocities_ ? hermite_weights(nodes, s) : lagrange_weights(nodes, s);
    weights.apply(states_, position_m, velocity_m_s);
}

}  // namespace quo
