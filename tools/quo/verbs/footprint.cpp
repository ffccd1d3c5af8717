#include <algorithm>
#include <cmath>
#include <nlohmann/json.hpp>

#include "commands.h"
#include "date.h"
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

nlohmann::ordered_json geometry_of(Ring ring) {
    unwrap(ring);
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

/** What users search outlines by; of what the header does not tell nothing. */
nlohmann::ordered_json properties_of(const std::string& header, const GeneralSAR& product) {
    const DataSetInfo_Obj& info = product.dataSetInfo;
    nlohmann::ordered_json properties{{"header", header}, {"scene", info.SceneID}};
    const auto add = [&](const char* key, const std::string& text, std::string_view unknown) {
        if (product.GSexists(gsDataSetInfo) && text != unknown && text != "NOT_AVAILABLE") properties[key] = text;
    };
    add("mission", info.SensorName, "SENSOR UNKNOWN");
    add("mode", info.AcquisitionMode, "ACQUISITION MODE UNDEFINED");
    add("polarization", info.Polarization, "");
    add("orbit_number", info.OrbitNumber, "");
    if (product.GSexists(gsRoi) && product.roi.Roi.isNULL() == 0) {
        properties["start_time"] = iso_text(product.roi.Roi.SlowStartTime);
        properties["stop_time"] = iso_text(last_line_time(product.roi.Roi));
    }
    if (product.GSexists(gsOrbit))
        properties["orbit_direction"] = product.orbit.isAscending() ? "ascending" : "descending";
    return properties;
}

int footprint(const std::string& header) {
    GeneralSAR product;
    read_product(header, product);
    const Ring ring = corners_of(product);
    const std::string uneven = product.GSexists(gsOrbit) ? uneven_vectors(product.orbit) : "";
    if (ring.empty() && !uneven.empty()) throw Failure(header + ": " + uneven);
    if (ring.empty())
        throw Failure(header + ": neither a corner grid nor orbit, region and look side to find the corners from");
    const nlohmann::ordered_json feature{
        {"type", "Feature"}, {"properties", properties_of(header, product)}, {"geometry", geometry_of(ring)}};
    print_json(feature, -1);
    return kFine;
}

}  // namespace

void add_footprint(Command& program) {
    auto [command, header] = add_verb(program, "footprint", "Prints a product's outline as GeoJSON", footprint);
    command.needs("HEADER", header, "Product header");
}

}  // namespace tool
