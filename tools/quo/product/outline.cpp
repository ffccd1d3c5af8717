// SPDX-License-Identifier: Apache-2.0
#include "outline.h"

#include <algorithm>
#include <cmath>

#include "failure.h"
#include "product.h"
#include "scene.h"

namespace tool {
namespace {

using Ring = std::vector<Corner>;

// Longitudes made continuous: each within 180 degrees of the one before.
void unwrap(Ring& ring) {
    for (std::size_t i = 1; i < ring.size(); ++i) {
        const double turns = std::round((ring[i - 1].longitude_deg - ring[i].longitude_deg) / 360.0);
        ring[i].longitude_deg += 360.0 * turns;
    }
}

// The part of a ring on one side of a meridian: east of it for side +1, west for -1.
Ring cut(const Ring& ring, double meridian, double side) {
    Ring part;
    for (std::size_t i = 0; i < ring.size(); ++i) {
        const Corner &a = ring[i], &b = ring[(i + 1) % ring.size()];
        const double da = side * (a.longitude_deg - meridian), db = side * (b.longitude_deg - meridian);
        if (da >= 0.0) part.push_back(a);
        if ((da > 0.0 && db < 0.0) || (da < 0.0 && db > 0.0)) {
            const double share = da / (da - db);
            part.push_back({a.latitude_deg + share * (b.latitude_deg - a.latitude_deg), meridian});
        }
    }
    return part;
}

// Counter-clockwise, as outer rings are.
bool clockwise(const Ring& ring) {
    double twice_area = 0.0;
    for (std::size_t i = 0; i < ring.size(); ++i) {
        const Corner &a = ring[i], &b = ring[(i + 1) % ring.size()];
        twice_area += a.longitude_deg * b.latitude_deg - b.longitude_deg * a.latitude_deg;
    }
    return twice_area < 0.0;
}

nlohmann::json coordinates(Ring ring, double shift_deg) {
    if (clockwise(ring)) std::ranges::reverse(ring);
    ring.push_back(ring.front());
    nlohmann::json list = nlohmann::json::array();
    for (const Corner& corner : ring) list.push_back({corner.longitude_deg + shift_deg, corner.latitude_deg});
    return nlohmann::json::array({list});
}

/** The geometry of an unwrapped ring. */
nlohmann::ordered_json geometry_of(const Ring& ring) {
    const auto [west, east] = std::ranges::minmax_element(ring, {}, &Corner::longitude_deg);
    double meridian = 0.0;
    if (east->longitude_deg > 180.0) {
        meridian = 180.0;
    } else if (west->longitude_deg < -180.0) {
        meridian = -180.0;
    } else {
        return {{"type", "Polygon"}, {"coordinates", coordinates(ring, 0.0)}};
    }
    const Ring eastern = cut(ring, meridian, +1.0), western = cut(ring, meridian, -1.0);
    nlohmann::json parts = nlohmann::json::array();
    if (western.size() > 2) parts.push_back(coordinates(western, meridian > 0.0 ? 0.0 : 360.0));
    if (eastern.size() > 2) parts.push_back(coordinates(eastern, meridian > 0.0 ? -360.0 : 0.0));
    return {{"type", "MultiPolygon"}, {"coordinates", parts}};
}

nlohmann::ordered_json box_of(const Ring& ring) {
    const auto [west, east] = std::ranges::minmax_element(ring, {}, &Corner::longitude_deg);
    const auto [south, north] = std::ranges::minmax_element(ring, {}, &Corner::latitude_deg);
    const auto known = [](double longitude_deg) {
        return longitude_deg - 360.0 * (longitude_deg > 180.0 ? 1.0 : longitude_deg < -180.0 ? -1.0 : 0.0);
    };
    return {known(west->longitude_deg), south->latitude_deg, known(east->longitude_deg), north->latitude_deg};
}

}  // namespace

Outline outline_of(const std::string& header, GeneralSAR& product) {
    Ring ring = corners_of(header, product);
    const std::string uneven = product.GSexists(gsOrbit) ? uneven_vectors(product.orbit) : "";
    if (ring.empty() && !uneven.empty()) throw Failure(header + ": " + uneven);
    if (ring.empty())
        throw Failure(header + ": neither a corner grid nor orbit, region and look side to find the corners from");
    unwrap(ring);
    return {geometry_of(ring), box_of(ring)};
}

}  // namespace tool
