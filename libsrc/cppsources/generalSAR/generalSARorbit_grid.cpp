#include <algorithm>

#include "diagnosticslib/call_frame.h"
#include "quo_base/generalSARorbit.h"
#include "quo_base/geo_grid.h"

namespace {

constexpr const char* kSource = "generalSARorbit";

/** Fills a ground point from the sample at an azimuth and a range time. */
int fill_point(GeneralSAROrbit& orbit, double azimuth, double range, geopoint& point) noexcept {
    double latitude = 0.0, longitude = 0.0, incidence = 0.0, look = 0.0;
    if (const int status = orbit.SVGetLatLon(azimuth, range, 0.0, &latitude, &longitude)) return status;
    if (const int status = orbit.SVGetAngles(azimuth, range, 0.0, &incidence, &look)) return status;
    const double values[] = {latitude, longitude, 0.0, incidence, look};
    std::ranges::copy(values, point.Point);
    point.Latitude = latitude;
    point.Longitude = longitude;
    point.Height = 0.0;
    point.IncidenceAngle = incidence;
    point.LookAngle = look;
    return QUO_OK;
}

}  // namespace

int GeneralSAROrbit::SVGetGeoCoords(geoCoords_Obj* grid, const GSRoi_Obj* roi) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVGetGeoCoords", kSource};
    if (!grid || !roi) return frame.fail(QUO_REFUSED, "An argument is null");
    const ROI_Obj& region = roi->Roi;
    const bool up = isAscending();
    const struct {
        double along, across;  // parts of the region's lengths
        geopoint& point;
    } points[] = {{0.0, 0.0, up ? grid->SouthWest : grid->NorthEast},
                  {0.0, 1.0, up ? grid->SouthEast : grid->NorthWest},
                  {1.0, 0.0, up ? grid->NorthWest : grid->SouthEast},
                  {1.0, 1.0, up ? grid->NorthEast : grid->SouthWest},
                  {0.5, 0.5, grid->Center}};
    for (const auto& [along, across, point] : points) {
        const double azimuth = region.SlowStartTime + along * region.SlowTimeLength;
        const double range = region.FastStartTime + across * region.FastTimeLength;
        if (const int status = fill_point(*this, azimuth, range, point)) return frame.callee(status);
    }
    return frame.success();
}
