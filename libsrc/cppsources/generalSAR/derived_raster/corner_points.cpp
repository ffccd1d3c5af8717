// SPDX-License-Identifier: Apache-2.0
#include "generalSAR/derived_raster/corner_points.h"

namespace quo {
namespace {

/** The middle of a description of the region that is a pixel alone. */
int place_pixel(const ImageGrid_Obj& grid, double line, double sample, GeneralSAROrbit& orbit, geopoint& point) {
    GSRoi_Obj pixel;
    geoCoords_Obj there;
    std::int32_t unplaced = QUO_OK;
    const PixelTimes times{&pixel.Roi.SlowStartTime, &pixel.Roi.FastStartTime, &unplaced};
    if (const int status = grid.pixelTimes({1, &line, &sample}, times)) return status;
    if (unplaced != QUO_OK) return unplaced;
    pixel.Roi.SlowTimeLength = pixel.Roi.FastTimeLength = 0.0;
    if (const int status = orbit.SVGetGeoCoords(&there, &pixel)) return status;
    return there.Center.clone(&point);
}

}  // namespace

int place_corners(const ImageGrid_Obj& grid, std::int32_t lines, std::int32_t samples, GeneralSAR& product) {
    geoCoords_Obj corners;
    (void)product.geoCoords.clone(&corners);
    const double last_line = lines - 1.0, last_sample = samples - 1.0;
    const bool up = product.orbit.isAscending();
    const struct {
        double line, sample;
        geopoint& point;
    } places[] = {{0.0, 0.0, up ? corners.SouthWest : corners.NorthEast},
                  {0.0, last_sample, up ? corners.SouthEast : corners.NorthWest},
                  {last_line, 0.0, up ? corners.NorthWest : corners.SouthEast},
                  {last_line, last_sample, up ? corners.NorthEast : corners.SouthWest},
                  {0.5 * last_line, 0.5 * last_sample, corners.Center}};
    for (const auto& [line, sample, point] : places)
        if (const int status = place_pixel(grid, line, sample, product.orbit, point)) return status;
    return corners.clone(&product.geoCoords);
}

}  // namespace quo
