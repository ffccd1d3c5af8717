#include "product.h"

#include <array>
#include <filesystem>

#include "failure.h"

namespace tool {
namespace {

constexpr std::array<const char*, GeneralSAR::kObjects> kSections{"raster side file",
                                                                  "ROI",
                                                                  "PolySAR",
                                                                  "SamplingConstants",
                                                                  "StateVectorData",
                                                                  "StateVectorData",
                                                                  "Pulse",
                                                                  "AntennaPattern",
                                                                  "DataSetInfo",
                                                                  "SensorAttitude",
                                                                  "SpectralWindows",
                                                                  "GroundCornersPoints",
                                                                  "SwathInfo",
                                                                  "RasterInfo"};

bool is_known(const geopoint& point) { return point.Latitude > -900.0 && point.Longitude > -900.0; }

std::vector<Corner> grid_corners(const geoCoords_Obj& grid) {
    std::vector<Corner> corners;
    for (const geopoint* point : {&grid.NorthWest, &grid.NorthEast, &grid.SouthEast, &grid.SouthWest}) {
        if (!is_known(*point)) return {};
        corners.push_back({point->Latitude, point->Longitude});
    }
    return corners;
}

std::vector<Corner> orbit_corners(GeneralSAROrbit& orbit, const ROI_Obj& region) {
    std::vector<Corner> corners;
    for (const ROI_Time& at :
         {region.GetUpLeft(), region.GetUpRight(), region.GetDownRight(), region.GetDownLeft()}) {
        Corner corner{};
        if (orbit.SVGetLatLon(at.SlowTime, at.FastTime, &corner.latitude_deg, &corner.longitude_deg) != 0)
            return {};
        corners.push_back(corner);
    }
    return corners;
}

}  // namespace

void read_product(const std::string& header, GeneralSAR& product) {
    std::error_code error;
    const auto kind = std::filesystem::status(header, error).type();
    if (kind == std::filesystem::file_type::not_found) throw Failure(header + ": no such file");
    if (kind != std::filesystem::file_type::regular) throw Failure(header + ": not a regular file");
    if (product.GSread(header.c_str()) != QUO_OK) throw Failure(header + ": cannot be read");
    for (int object = gsRoi; object < GeneralSAR::kObjects; ++object) {
        if (product.GSexists(static_cast<GSObject>(object))) return;
    }
    throw Failure(header + ": holds no object of a product");
}

const char* section_of(GSObject object) { return kSections[static_cast<std::size_t>(object)]; }

std::vector<Corner> corners_of(GeneralSAR& product) {
    std::vector<Corner> corners;
    if (product.GSexists(gsGeoCoords)) corners = grid_corners(product.geoCoords);
    if (corners.empty() && product.GSexists(gsOrbit) && product.GSexists(gsRoi) && product.roi.Roi.isNULL() == 0) {
        corners = orbit_corners(product.orbit, product.roi.Roi);
    }
    return corners;
}

std::optional<std::string> raster_of(const std::string& header) {
    return header.ends_with(".hdr") ? std::optional{header.substr(0, header.size() - 4)} : std::nullopt;
}

}  // namespace tool
