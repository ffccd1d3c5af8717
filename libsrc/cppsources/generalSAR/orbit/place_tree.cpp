#include "generalSAR/orbit/place_tree.h"

#include <algorithm>
#include <cstddef>
#include <limits>

namespace quo {
namespace {

constexpr double Vec3::*kAxes[] = {&Vec3::x, &Vec3::y, &Vec3::z};
constexpr std::size_t next_axis(std::size_t axis) noexcept { return (axis + 1) % 3; }

void plant_half(std::span<OrbitPlace> places, std::size_t axis) noexcept {
    if (places.size() < 2) return;
    const auto middle = static_cast<std::ptrdiff_t>(places.size() / 2);
    const auto along = [axis](const OrbitPlace& place) { return place.at.*kAxes[axis]; };
    std::ranges::nth_element(places, places.begin() + middle, {}, along);
    plant_half(places.first(places.size() / 2), next_axis(axis));
    plant_half(places.subspan(places.size() / 2 + 1), next_axis(axis));
}

struct NearestPlace {
    Vec3 point;
    double distance2_m2 = std::numeric_limits<double>::infinity();
    std::int32_t run = 0;

    /** `beyond` is how far, axis by axis, the point lies outside the box that the part's places lie in. */
    void look(std::span<const OrbitPlace> part, std::size_t axis, const Vec3& beyond) noexcept {
        if (part.empty() || dot(beyond, beyond) >= distance2_m2) return;
        const std::size_t middle = part.size() / 2;
        const OrbitPlace& here = part[middle];
        const Vec3 d = point - here.at;
        if (dot(d, d) < distance2_m2) {
            distance2_m2 = dot(d, d);
            run = here.run;
        }
        const double past = d.*kAxes[axis];
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
    NearestPlace nearest{point};
    nearest.look(tree, 0, {});
    return nearest.run;
}

}  // namespace quo
