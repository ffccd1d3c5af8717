#include "product.h"

#include <cmath>

#include "document.h"
#include "failure.h"
#include "quo_base/derived_raster.h"
#include "scene.h"

namespace tool {
namespace {

bool is_known(const geopoint& point) {
    return std::abs(point.Latitude) <= 90.0 && std::abs(point.Longitude) <= 360.0;
}

}  // namespace

void read_product(const std::string& header, GeneralSAR& product) {
    require_header_file(header);
    forget_system_error();
    if (const int status = product.GSread(header.c_str())) refuse_header(header, status, "cannot be read");
    for (int object = gsRoi; object < GeneralSAR::kObjects; ++object) {
        if (product.GSexists(static_cast<GSObject>(object))) return;
    }
    if (described_raster(product) != nullptr) return;
    refuse_header(header, QUO_OK, "holds no object of a product");
}

const GeneralSAR_Base& elements_of(GeneralSAR& product, GSObject object) { return *product.GSelements(object); }

const char* section_of(GeneralSAR& product, GSObject object) {
    const parElement* element = elements_of(product, object).element(0);
    return element != nullptr ? element->section : "";
}

const parElement* element_at(GeneralSAR& product, std::string_view field) {
    for (int i = gsRoi; i < GeneralSAR::kObjects; ++i) {
        if (const parElement* element = product.GSelement(static_cast<GSObject>(i), field)) return element;
    }
    return nullptr;
}

bool is_numeric_field(GeneralSAR& product, std::string_view field) {
    // Polynomials and corner points stand in sections of their own, as many as there are.
    for (const char* nested : {"/pol", "/trg0_s", "/taz0_s", "/Point"}) {
        if (field.ends_with(nested)) return true;
    }
    const parElement* element = element_at(product, field);
    return element != nullptr && element->type != parElement::typeString;
}

std::vector<Corner> grid_corners(const GeneralSAR& product) {
    if (!product.GSexists(gsGeoCoords)) return {};
    const geoCoords_Obj& grid = product.geoCoords;
    std::vector<Corner> corners;
    for (const geopoint* point : {&grid.NorthWest, &grid.NorthEast, &grid.SouthEast, &grid.SouthWest}) {
        if (!is_known(*point)) return {};
        corners.push_back({point->Latitude, point->Longitude});
    }
    return corners;
}

bool is_told(std::string_view text) {
    return !text.empty() && text != "NOT_AVAILABLE" && text != "NOT SET" && text != "SENSOR UNKNOWN" &&
           !text.ends_with(" UNDEFINED");
}

void read_region(const std::string& header, ROI_Obj& region) {
    const bool found = region.read_roi(header.c_str(), "ROI") == QUO_OK && region.isNULL() == 0;
    const double sum = region.FastStartTime + region.FastTimeLength + region.SlowStartTime + region.SlowTimeLength;
    if (!found || !std::isfinite(sum)) throw Failure(header + ": no region (section ROI)");
}

double last_line_time(const ROI_Obj& region) {
    return region.SlowStartTime + region.SlowTimeDelta * (region.Lines - 1);
}

std::vector<Corner> orbit_corners(GeneralSAR& product) {
    const ROI_Obj& region = product.roi.Roi;
    for (const GSObject needed : {gsOrbit, gsRoi, gsDataSetInfo}) {  // the last tells the look side
        if (!product.GSexists(needed)) return {};
    }
    if (region.isNULL() != 0 || !uneven_vectors(product.orbit).empty()) return {};
    // Of the last line and sample themselves: the region's lengths lead to the ones after them.
    const double first_s = region.SlowStartTime, near_s = region.FastStartTime;
    const double last_s = last_line_time(region);
    const double far_s = near_s + region.FastTimeDelta * (region.Samples - 1);
    const std::pair<double, double> places[] = {
        {first_s, near_s}, {last_s, near_s}, {last_s, far_s}, {first_s, far_s}};
    std::vector<Corner> corners;
    for (const auto& [azimuth_s, range_s] : places) {
        Corner corner{};
        if (product.orbit.SVGetLatLon(azimuth_s, range_s, &corner.latitude_deg, &corner.longitude_deg) != 0)
            return {};
        corners.push_back(corner);
    }
    return corners;
}

std::vector<Corner> corners_of(GeneralSAR& product) {
    std::vector<Corner> corners = grid_corners(product);
    return corners.empty() ? orbit_corners(product) : corners;
}

std::optional<std::string> raster_of(const std::string& header) {
    return header.ends_with(".hdr") ? std::optional{header.substr(0, header.size() - 4)} : std::nullopt;
}

}  // namespace tool
