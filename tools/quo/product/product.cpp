// SPDX-License-Identifier: Apache-2.0
#include "product.h"

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <new>

#include "date.h"
#include "document.h"
#include "failure.h"
#include "quo_base/derived_raster.h"
#include "quorelxmllib/element_path.h"
#include "scene.h"

namespace tool {
namespace {

bool is_known(const geopoint& point) {
    return std::abs(point.Latitude) <= 90.0 && std::abs(point.Longitude) <= 360.0;
}

/** The letters of the swath "IW1" where they are two, as those that name a mode. */
std::string mode_of(const std::string& swath, const std::string& mode) {
    const auto letters = std::min(swath.find_first_of("0123456789"), swath.size());
    return letters == 2 ? swath.substr(0, letters) : mode;
}

/** The usual name of what the image is, where it has one. */
std::string type_of(const DataSetInfo_Obj& info, const std::string& otherwise) {
    if (info.IsImageType(DataSetInfo_Obj::dsAzimuthFocused) && info.IsProjection(DataSetInfo_Obj::dsSlantRange))
        return "SLC";
    if (info.IsImageType(DataSetInfo_Obj::dsMultilook) && info.IsProjection(DataSetInfo_Obj::dsGroundRange))
        return "GRD";
    return otherwise;
}

bool holds_objects(GeneralSAR& product) {
    for (int object = gsRoi; object < GeneralSAR::kObjects; ++object) {
        if (product.GSexists(static_cast<GSObject>(object))) return true;
    }
    return described_raster(product) != nullptr;
}

}  // namespace

bool read_objects(const std::string& header, GeneralSAR& product) {
    forget_system_error();
    if (const int status = product.GSread(header.c_str())) refuse_header(header, status, "cannot be read");
    if (!holds_objects(product)) return false;  // the caller may still ask for the system's reason
    if (quo_take_system_error() == ENOMEM) refuse_unread(header, QUO_NO_MEMORY);
    return true;
}

void read_product(const std::string& header, GeneralSAR& product) {
    require_header_file(header);
    if (!read_objects(header, product))
        refuse_header(header, QUO_OK, "holds no object of a product: no section such as ROI or StateVectorData");
}

const GeneralSAR_Base& elements_of(GeneralSAR& product, GSObject object) {
    const GeneralSAR_Base& elements = *product.GSelements(object);
    if (elements.elementCount() == 0)
        throw std::bad_alloc{};  // all register some, where there is room for the list
    return elements;
}

const char* section_of(GeneralSAR& product, GSObject object) {
    return elements_of(product, object).element(0)->section;
}

const parElement* Fields::at(std::string_view field) const {
    for (int i = gsRoi; i < GeneralSAR::kObjects; ++i) {
        if (const parElement* element = product_.GSelement(static_cast<GSObject>(i), field)) return element;
    }
    return quo::element_at(grid_, field);
}

std::string Fields::list_for(std::string_view field, const Document& header) {
    const std::string wanted{field.substr(0, field.find('/'))};
    std::string fields, sections;
    const auto append = [&](std::string& list, std::string_view name, const std::string& path) {
        if (header.has(path)) list.append(list.empty() ? "" : ", ").append(name);
    };
    const auto look_at = [&](const GeneralSAR_Base& elements, const std::string& section) {
        append(sections, section, section);
        for (int i = 0; section == wanted && i < elements.elementCount(); ++i)
            append(fields, elements.element(i)->name, section + '/' + elements.element(i)->name);
    };
    for (int i = gsRoi; i < GeneralSAR::kObjects; ++i) {
        const auto object = static_cast<GSObject>(i);
        if (object != gsOrbit) look_at(elements_of(product_, object), section_of(product_, object));
    }
    look_at(grid_, grid_.element(0)->section);
    const bool known = header.has(wanted);
    const std::string& list = known ? fields : sections;
    return (known ? "has no field " + std::string{field} + "; that section"
                  : "has no section " + wanted + "; it") +
           (list.empty() ? " has none that is known" : " has " + list);
}

bool Fields::is_numeric(std::string_view field) const {
    // Polynomials and corner points stand in sections of their own, as many as there are.
    for (const char* nested : {"/pol", "/trg0_s", "/taz0_s", "/Point"}) {
        if (field.ends_with(nested)) return true;
    }
    const parElement* element = at(field);
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

Told::Told(const GeneralSAR& product) {
    const DataSetInfo_Obj& info = product.dataSetInfo;
    const auto text = [&](const char* field) {
        return product.GSexists(gsDataSetInfo) && is_told(field) ? std::string{field} : std::string{};
    };
    mission = text(info.SensorName);
    swath = text(info.Swath);
    mode = mode_of(swath, text(info.AcquisitionMode));
    polarization = text(info.Polarization);
    std::erase(polarization, '/');
    orbit_number = text(info.OrbitNumber);
    image_type = type_of(info, text(info.ImageType));
    scene = text(info.SceneID);
    if (product.GSexists(gsOrbit)) direction = product.orbit.isAscending() ? "ascending" : "descending";
    if (!product.GSexists(gsRoi) || product.roi.Roi.isNULL() != 0) return;
    start_time = iso_text(product.roi.Roi.SlowStartTime);
    stop_time = iso_text(last_line_time(product.roi.Roi));
}

void read_region(const std::string& header, ROI_Obj& region) {
    const bool found = region.read_roi(header.c_str(), "ROI") == QUO_OK && region.isNULL() == 0;
    const double sum = region.FastStartTime + region.FastTimeLength + region.SlowStartTime + region.SlowTimeLength;
    if (!found || !std::isfinite(sum)) throw Failure(header + ": no region (section ROI)");
}

double last_line_time(const ROI_Obj& region) {
    return region.SlowStartTime + region.SlowTimeDelta * (region.Lines - 1);
}

std::vector<Corner> orbit_corners(const std::string& header, GeneralSAR& product) {
    if (!product.GSexists(gsOrbit) || !product.GSexists(gsDataSetInfo)) return {};  // which tells the look side
    if (!uneven_vectors(product.orbit).empty()) return {};
    ImageGrid_Obj grid;
    int lines = 0, samples = 0;
    const RasterDescription* const raster = described_raster(product);
    if (raster != nullptr && read_image_grid(header.c_str(), product, grid) == QUO_OK) {
        lines = raster->NrOfLinesPerImage;
        samples = raster->NrOfPixelsPerLine;
    } else if (const ROI_Obj& region = product.roi.Roi;
               product.GSexists(gsRoi) && region.isNULL() == 0 && grid.setRegion(region) == QUO_OK) {
        lines = region.Lines;
        samples = region.Samples;
    }
    if (lines == 0) return {};
    const double last_line = lines - 1.0, last_sample = samples - 1.0;
    const double at_line[] = {0.0, last_line, last_line, 0.0}, at_sample[] = {0.0, 0.0, last_sample, last_sample};
    double azimuth_s[4], range_s[4];
    if (grid.pixelTimes({4, at_line, at_sample}, {azimuth_s, range_s}) != QUO_OK) return {};
    std::vector<Corner> corners(4);
    for (std::size_t i = 0; i < corners.size(); ++i)
        if (product.orbit.SVGetLatLon(azimuth_s[i], range_s[i], &corners[i].latitude_deg,
                                      &corners[i].longitude_deg) != QUO_OK)
            return {};
    return corners;
}

std::vector<Corner> corners_of(const std::string& header, GeneralSAR& product) {
    std::vector<Corner> corners = grid_corners(product);
    return corners.empty() ? orbit_corners(header, product) : corners;
}

std::optional<std::string> raster_of(const std::string& header) {
    return header.ends_with(".hdr") ? std::optional{header.substr(0, header.size() - 4)} : std::nullopt;
}

}  // namespace tool
