// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_SCENES_H
#define QUO_TESTS_SUPPORT_SCENES_H

#include "quo_base/generalSARorbit.h"
#include "quo_base/quorelxml_v2.h"
#include "support/diagnostics.h"

namespace test {

/** One of the bundled acquisitions: its header, its tie points, and what is reachable with them. */
struct Scene {
    const char* name;      ///< of the case
    const char* file;      ///< below the scenes' folder, without ending
    double time_reach_s;   ///< azimuth times of tie points and plain geometry agree within this
    double range_reach_m;  ///< and slant ranges within this
    double doppler_hz;     ///< a Doppler that the platform can have, for tests off broadside
    bool geocentric;       ///< the mission's incidence is against the geocentric radius, not the normal

    [[nodiscard]] std::string path(const char* ending) const {
        return std::string{QUO_TEST_DATA} + "/scenes/" + file + ending;
    }
};
inline std::ostream& operator<<(std::ostream& out, const Scene& scene) { return out << scene.name; }

inline constexpr Scene kScenes[] = {
    {"SatelliteAscendingRight", "s1a_iw1_slc_20220104_asc", 2.5e-6, 1e-5, 3000.0, true},
    {"SatelliteDescendingRight", "s1a_iw_grd_20201127_desc_sea", 2.5e-6, 1e-5, 3000.0, true},
    {"AirborneLeft", "uavsar_winnipeg_20120717_left", 2e-7, 1e-6, 300.0, false},
};

struct TiePoint {
    double azimuth_time_s, range_time_s, latitude_deg, longitude_deg, height_m;
    double incidence_deg, look_deg;  ///< as the mission defines them; the look angle may be not-a-number
};

/** The scene's orbit with its wavelength and look side, as its header tells them. */
inline void load_orbit(const Scene& scene, GeneralSAROrbit& orbit) {
    const std::string header = scene.path(".xml");
    double lambda_m = 0.0;
    std::int32_t side = 0;
    quorelxml document{header.c_str()};
    if (document.readDouble(1, "SamplingConstants/lambda_m", &lambda_m, 1) ||
        document.readInt(1, "DataSetInfo/LookDirection", &side, 1) || orbit.readhdr(header.c_str()) ||
        orbit.setLambda(lambda_m) || orbit.setLookSign(side))
        throw std::runtime_error{"cannot read " + header};
}

/** The scene's tie points, pure geometry. */
inline std::vector<TiePoint> load_tie_points(const Scene& scene) {
    std::vector<TiePoint> points;
    for (const auto& row : read_table("scenes/" + std::string{scene.file} + "_tie_points.csv")) {
        if (row[0].empty() || row[0][0] == 'a') continue;
        const auto value = [&](std::size_t i) {
            return i < row.size() && !row[i].empty() ? std::stod(row[i]) : std::nan("");
        };
        points.push_back({value(0), value(1), value(2), value(3), value(4), value(5), value(6)});
    }
    if (points.empty()) throw std::runtime_error{"no tie points of " + std::string{scene.file}};
    return points;
}

/** The rectangle of times that the tie points cover. */
struct Extent {
    double first_s = std::numeric_limits<double>::infinity(), last_s = -first_s;
    double near_s = first_s, far_s = -first_s;
};
inline Extent extent_of(const std::vector<TiePoint>& points) {
    Extent extent;
    for (const TiePoint& point : points) {
        extent.first_s = std::min(extent.first_s, point.azimuth_time_s);
        extent.last_s = std::max(extent.last_s, point.azimuth_time_s);
        extent.near_s = std::min(extent.near_s, point.range_time_s);
        extent.far_s = std::max(extent.far_s, point.range_time_s);
    }
    return extent;
}

}  // namespace test

#endif
