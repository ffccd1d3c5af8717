// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/orbit/orbit_check.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdlib>
#include <numeric>
#include <utility>

#include "sarutillib/geometry/geometry_kernels.h"
#include "sarutillib/ground/bounded_text.h"

namespace quo {
namespace {

constexpr std::int32_t kLeastVectors = 5;
constexpr double kDeepest_m = 50e3;
// Two vectors closer together than this part of a step are the same one.
constexpr double kDuplicateStep = 1e-3;
// What rounding may leave in good positions and velocities.
constexpr double kPositionNoise_m = 2e-3, kVelocityNoise_m_s = 2e-4;
// A velocity that is off by so little moves a point by centimetres.
constexpr double kVelocityTolerance_m_s = 1e-3;
// A step so near to a whole number of spacings is one.
constexpr double kNearlyWhole = 0.2;
// A vector is compared with the curve through so many neighbours, which lie at most so far away.
constexpr std::size_t kNeighbours = 4;
constexpr std::int32_t kReach = 6;

Vec3 position_of(const StateVectors& states, std::int32_t i) noexcept { return load(states.position(i)); }
Vec3 velocity_of(const StateVectors& states, std::int32_t i) noexcept { return load(states.velocity(i)); }
bool finite(const Vec3& v) noexcept { return std::isfinite(v.x + v.y + v.z); }

struct Wording {
    SVFinding::Problem problem;
    const char *words, *unit;
};
constexpr Wording kWordings[] = {
    {SVFinding::kTooFew, "fewer than five", "vectors"},
    {SVFinding::kTimes, "the times are not finite or do not increase; spacing", "s"},
    {SVFinding::kNotFinite, "position or velocity is not finite", ""},
    {SVFinding::kInsideEarth, "the position lies inside the Earth, from its centre", "m"},
    {SVFinding::kDuplicate, "stands where its predecessor stands, within", "m"},
    {SVFinding::kPositionStep, "the position is off the curve through its neighbours by", "m"},
    {SVFinding::kVelocity, "the velocity differs from the derivative of the positions by", "m/s"},
    {SVFinding::kGap, "comes after a gap of", "missing vectors"},
    {SVFinding::kOrder, "lies behind its predecessor by", "spacings"},
};
static_assert(kWordings[SVFinding::kOrder].problem == SVFinding::kOrder);

SVFinding make_finding(SVFinding::Problem problem, std::int32_t index, double size) noexcept {
    const Wording& wording = kWordings[problem];
    SVFinding finding{problem, index, size, ""};
    char* text = finding.text;
    const std::size_t room = sizeof finding.text;
    if (index < 0)
        format_bounded(text, room, "state vectors: %s %.6g %s", wording.words, size, wording.unit);
    else if (problem == SVFinding::kNotFinite)
        format_bounded(text, room, "state vector %d: %s", static_cast<int>(index), wording.words);
    else
        format_bounded(text, room, "state vector %d: %s %.6g %s", static_cast<int>(index), wording.words, size,
                       wording.unit);
    return finding;
}

/** Time of flight from one vector to another, s, along the circle that the turn of the velocity belongs to; below
 * 0 against the velocities, and not a number where they stand still. */
double flight_s(const StateVectors& states, std::int32_t from, std::int32_t to) noexcept {
    const Vec3 chord = position_of(states, to) - position_of(states, from);
    const Vec3 v0 = velocity_of(states, from), v1 = velocity_of(states, to);
    const double half_turn = 0.5 * angle_deg(v0, v1) / kDegPerRad;
    const double arc = norm(chord) * (half_turn > 1e-9 ? half_turn / std::sin(half_turn) : 1.0);
    return std::copysign(arc, dot(chord, v0 + v1)) / (0.5 * (norm(v0) + norm(v1)));
}

/** How far a vector lies from the curve through its neighbours, and how much of that is to be expected. */
struct Deviation {
    double position_m = 0.0, velocity_m_s = 0.0;
    double times_expected = 0.0;
};

/** The examination of one list: vectors one by one, then each against its neighbours. */
class Examination {
public:
    explicit Examination(const StateVectors& states)
        : states_{states},
          usable_(static_cast<std::size_t>(std::max(states.count, 0)), true),
          places_(usable_.size()) {
        std::iota(places_.begin(), places_.end(), 0.0);
        states_.places = places_.data();
    }

    std::vector<SVFinding> findings(double t0) {
        if (states_.count < kLeastVectors) add(SVFinding::kTooFew, -1, states_.count);
        const bool times_ok = std::isfinite(t0) && std::isfinite(states_.spacing_s) && states_.spacing_s > 0.0;
        if (!times_ok) add(SVFinding::kTimes, -1, states_.spacing_s);
        for (std::int32_t i = 0; i < states_.count; ++i) examine_alone(i);
        if (states_.count >= kLeastVectors) examine_order();
        if (times_ok && states_.count >= kLeastVectors) examine_together();
        std::ranges::stable_sort(findings_, {}, &SVFinding::index);
        return std::move(findings_);
    }

private:
    void note(SVFinding::Problem problem, std::int32_t index, double size) {
        findings_.push_back(make_finding(problem, index, size));
    }
    void add(SVFinding::Problem problem, std::int32_t index, double size) {
        note(problem, index, size);
        if (index >= 0) usable_[static_cast<std::size_t>(index)] = false;
    }
    [[nodiscard]] bool usable(std::int32_t i) const { return usable_[static_cast<std::size_t>(i)]; }

    void examine_alone(std::int32_t i) {
        const Vec3 position = position_of(states_, i), velocity = velocity_of(states_, i);
        if (!finite(position) || !finite(velocity)) return add(SVFinding::kNotFinite, i, 0.0);
        if (norm(position) < kWgs84.polar_m - kDeepest_m) return add(SVFinding::kInsideEarth, i, norm(position));
        if (i == 0) return;
        const double step = norm(position - position_of(states_, i - 1));
        if (step <= kDuplicateStep * std::abs(states_.spacing_s) * norm(velocity))
            add(SVFinding::kDuplicate, i, step);
    }

    /** The way from one vector to the next, and by how much it is longer than their numbers say. */
    struct Step {
        std::int32_t from, to;
        double spacings;

        [[nodiscard]] bool whole() const { return std::abs(spacings - std::round(spacings)) < kNearlyWhole; }
        [[nodiscard]] double missing() const { return (whole() ? std::round(spacings) : spacings) - (to - from); }
    };

    /** All steps, counted in the one that most of the list takes, whatever the unit of its velocities. */
    [[nodiscard]] std::vector<Step> steps() const {
        std::vector<Step> all;
        std::vector<double> singles_s;
        std::int32_t from = -1;
        for (std::int32_t i = 0; i < states_.count; ++i) {
            if (!usable(i)) continue;
            const double time_s = from < 0 ? 0.0 : flight_s(states_, from, i);
            if (from >= 0 && std::isfinite(time_s)) {
                all.push_back({from, i, time_s});
                singles_s.push_back(std::abs(time_s) / (i - from));
            }
            from = i;
        }
        if (all.empty()) return all;
        const auto middle = singles_s.begin() + static_cast<std::ptrdiff_t>((singles_s.size() - 1) / 2);
        std::ranges::nth_element(singles_s, middle);
        if (!(*middle > 0.0)) return {};
        for (Step& step : all) step.spacings /= *middle;
        return all;
    }

    /** Whether a step tells where its vector stands. A wrong position makes two steps that do not: neither is a
     * whole number of spacings, and the second makes up for the first. */
    static bool tells_place(const std::vector<Step>& all, std::size_t i) {
        if (all[i].whole()) return true;
        return all[i].spacings > 1.5 && i + 1 < all.size() && std::abs(all[i + 1].spacings - 1.0) < kNearlyWhole;
    }

    // Where every vector stands, in spacings. Steps ahead make up for steps back: a list that is out of order has
    // no gaps to be told.
    void examine_order() {
        const std::vector<Step> all = steps();
        const auto back = [](const Step& step) { return step.spacings < -0.5; };
        const bool ordered = std::ranges::none_of(all, back);
        double moved = 0.0;  // against the place in the list
        for (std::size_t i = 0; i < all.size(); ++i) {
            const Step& step = all[i];
            const double missing = tells_place(all, i) ? step.missing() : 0.0;
            moved += missing;
            places_[static_cast<std::size_t>(step.to)] += moved;
            if (back(step)) add(SVFinding::kOrder, step.to, -step.spacings);
            if (ordered && missing >= 0.5) note(SVFinding::kGap, step.to, missing);
        }
    }

    // A wrong vector bends the curves that its neighbours are compared with, too. So first come those without
    // which all their neighbours agree; what then still disagrees is wrong together.
    void examine_together() {
        std::vector<double> excess(usable_.size());
        const auto update = [&](std::int32_t from, std::int32_t to) {
            for (std::int32_t i = std::max(from, 0); i <= std::min(to, states_.count - 1); ++i)
                excess[static_cast<std::size_t>(i)] = usable(i) ? deviation(i).times_expected : 0.0;
        };
        update(0, states_.count - 1);
        for (std::int32_t i = 0; i < states_.count; ++i) {
            if (!usable(i) || !explains(excess, i)) continue;
            report(i, deviation(i));
            update(i - kReach, i + kReach);
        }
        for (std::int32_t i = 0; i < states_.count; ++i)
            if (excess[static_cast<std::size_t>(i)] > 1.0) report_with_others(i);
    }

    /** Whether vectors near the i-th disagree with theirs, and none does once the i-th is left out. */
    [[nodiscard]] bool explains(const std::vector<double>& excess, std::int32_t i) const {
        const std::int32_t from = std::max(i - kReach, 0), to = std::min(i + kReach, states_.count - 1);
        if (std::none_of(excess.begin() + from, excess.begin() + to + 1, [](double e) { return e > 1.0; }))
            return false;
        for (std::int32_t j = from; j <= to; ++j)
            if (j != i && usable(j) && deviation(j, i).times_expected > 1.0) return false;
        return true;
    }

    void report(std::int32_t i, const Deviation& off) {
        if (off.position_m > off.velocity_m_s * states_.spacing_s)
            add(SVFinding::kPositionStep, i, off.position_m);
        else
            add(SVFinding::kVelocity, i, off.velocity_m_s);
    }
    void report_with_others(std::int32_t i) {
        const double mismatch = velocity_mismatch_m_s(states_, i);
        if (mismatch > kVelocityTolerance_m_s)
            add(SVFinding::kVelocity, i, mismatch);
        else
            report(i, deviation(i));
    }

    /** The nearest usable vectors around the i-th, without it and without `left_out`. */
    [[nodiscard]] std::span<const std::int32_t> neighbours(std::int32_t i, std::int32_t left_out,
                                                           std::array<std::int32_t, kNeighbours>& room) const {
        std::size_t count = 0;
        for (std::int32_t away = 1; away <= kReach && count < kNeighbours; ++away) {
            for (const std::int32_t j : {i - away, i + away}) {
                const bool takes = j >= 0 && j < states_.count && j != left_out && count < kNeighbours;
                if (takes && usable(j)) room[count++] = j;
            }
        }
        return std::span{room}.first(count);
    }

    [[nodiscard]] Deviation deviation(std::int32_t i, std::int32_t left_out = -1) const {
        std::array<std::int32_t, kNeighbours> room;
        const auto nodes = neighbours(i, left_out, room);
        if (nodes.size() < kNeighbours) return {};
        const NodeWeights weights = hermite_weights(states_, nodes, states_.place(i));
        double position[3], velocity[3];
        weights.apply(states_, position, velocity);
        Deviation off{norm(load(position) - position_of(states_, i)),
                      norm(load(velocity) - velocity_of(states_, i)), 0.0};
        const double noise = std::max(kPositionNoise_m, kVelocityNoise_m_s * states_.spacing_s);
        off.times_expected = std::max(off.position_m, off.velocity_m_s * states_.spacing_s) /
                             (weights.gain() * noise + truncation_m(i, nodes));
        return off;
    }

    /** What a curve of order 8 can miss on a smooth orbit: the eighth derivative of a circle at the platform's own
     * angular rate, with room for the Earth's rotation and for ellipses. */
    [[nodiscard]] double truncation_m(std::int32_t i, std::span<const std::int32_t> nodes) const {
        constexpr double kRoom = 1.5, kFactorial8 = 40320.0;
        const double radius = norm(position_of(states_, i));
        double miss = radius / kFactorial8;
        for (const std::int32_t node : nodes)
            miss *= std::pow(kRoom * norm(velocity_of(states_, i)) / radius * states_.spacing_s *
                                 (states_.place(i) - states_.place(node)),
                             2.0);
        return miss;
    }

    StateVectors states_;
    std::vector<bool> usable_;    // as a neighbour of others
    std::vector<double> places_;  // of the usable ones, as their steps tell
    std::vector<SVFinding> findings_;
};

}  // namespace

std::vector<SVFinding> check_state_vectors(const StateVectors& states, double t0) {
    return Examination{states}.findings(t0);
}

}  // namespace quo
