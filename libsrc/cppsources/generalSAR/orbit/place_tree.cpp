// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/orbit/place_tree.h"

#include <algorithm>
#include <cstddef>
#include <limits>

namespace quo {
namespace {

constexpr double Vec3::*kAxes[] = {&Vec3::x, &Vec3::y, &Vec3::z};
constexpr std::size_t next_axis(std::size_t axis) noexcept { return (axis + 1) % 3; }

/** Parts of so few places are looked at one by one. */
constexpr std::size_t kLeaf = 16;

/** Keeps how near to the origin a part comes with the place in its middle: less than that by more than what
 * rounding does to the sums made of it. */
void note_radius(std::span<OrbitPlace> part, double least_m) noexcept {
    part[part.size() / 2].least_radius_m = static_cast<float>(least_m * (1.0 - 2e-7));
}

/** The least radius of the places. */
double plant_half(std::span<OrbitPlace> places, std::size_t axis) noexcept {
    double least_m = std::numeric_limits<double>::infinity();
    if (places.size() <= kLeaf) {
        for (const OrbitPlace& place : places) least_m = std::min(least_m, norm(place.at));
    } else {
        const std::size_t middle = places.size() / 2;
        const auto along = [axis](const OrbitPlace& place) { return place.at.*kAxes[axis]; };
        std::ranges::nth_element(places, places.begin() + static_cast<std::ptrdiff_t>(middle), {}, along);
        least_m = std::min({norm(places[middle].at), plant_half(places.first(middle), next_axis(axis)),
                            plant_half(places.subspan(middle + 1), next_axis(axis))});
    }
    if (!places.empty()) note_radius(places, least_m);
    return least_m;
}

/** A search for the nearest place. Orbits pass a point on the ground at nearly one distance over hundreds of
 * kilometres, so that boxes hardly tell which part is near. So they are looked at from the point S above P among
 * the places: with P = k S, |P - Q|^2 = k |S - Q|^2 + (1 - k) (|Q|^2 - k |S|^2) for any Q. For a P further out
 * than some place, S is P. */
struct NearestPlace {
    Vec3 point, above;
    double k, level_m2;  // k |S|^2
    double distance2_m2 = std::numeric_limits<double>::infinity();
    std::int32_t run = 0;

    NearestPlace(const Vec3& P, double least_radius_m) noexcept : point{P}, above{P}, k{1.0}, level_m2{0.0} {
        constexpr double kWithin = 1.0 - 1e-6;
        const double height = norm(P) / least_radius_m;
        if (!(height > 1e-3 && height < kWithin)) return;
        k = height;
        above = 1.0 / k * P;
        level_m2 = k * dot(above, above);
    }

    void take(const OrbitPlace& place) noexcept {
        const Vec3 d = point - place.at;
        if (!(dot(d, d) < distance2_m2)) return;
        distance2_m2 = dot(d, d);
        run = place.run;
    }
    /** `beyond` is how far, axis by axis, S lies outside the box that the part's places lie in. */
    void look(std::span<const OrbitPlace> part, std::size_t axis, const Vec3& beyond) noexcept {
        if (part.empty()) return;
        const std::size_t middle = part.size() / 2;
        const OrbitPlace& here = part[middle];
        const double radius_m = here.least_radius_m;
        const double least_m2 = k * dot(beyond, beyond) + (1.0 - k) * (radius_m * radius_m - level_m2);
        if (least_m2 >= distance2_m2) return;
        if (part.size() <= kLeaf) {
            for (const OrbitPlace& place : part) take(place);
            return;
        }
        take(here);
        const double past = above.*kAxes[axis] - here.at.*kAxes[axis];
        const auto before = part.first(middle), after = part.subspan(middle + 1);
        Vec3 further = beyond;
        further.*kAxes[axis] = past;
        look(past < 0.0 ? before : after, next_axis(axis), beyond);
        look(past < 0.0 ? after : before, next_axis(axis), further);
    }
};

}  // namespace

void plant_tree(std::span<OrbitPlace> places) noexcept { plant_half(places, 0); }

std::int32_t nearest_in_tree(std::span<const OrbitPlace> tree, const Vec3& point) noexcept {
    if (tree.empty()) return 0;
    NearestPlace nearest{point, tree[tree.size() / 2].least_radius_m};
    nearest.look(tree, 0, {});
    return nearest.run;
}

}  // namespace quo
