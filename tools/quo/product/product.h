// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_PRODUCT_H
#define QUO_TOOL_PRODUCT_H

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"

namespace tool {

class Document;

/** Reads the objects of a header; whether there are any. Throws Failure where it cannot be read, or an object that
 * is there does not fit into memory. */
bool read_objects(const std::string& header, GeneralSAR& product);
/** Reads a product header. Throws Failure where the file cannot be read or holds no object of a product. */
void read_product(const std::string& header, GeneralSAR& product);

/** What object `object` registers in its section; for the region, what the region itself does. */
const GeneralSAR_Base& elements_of(GeneralSAR& product, GSObject object);
/** The section that these stand in. */
const char* section_of(GeneralSAR& product, GSObject object);

/** The fields that headers have, with what new objects hold in them. */
class Fields {
public:
    /** The element at a path such as "SamplingConstants/prf_hz"; null where no object has it. */
    const parElement* at(std::string_view field) const;
    /** The registered fields of a path's section that a header has, else the sections that it has. */
    std::string list_for(std::string_view field, const Document& header);
    /** Whether a field is known to hold numbers. */
    bool is_numeric(std::string_view field) const;

private:
    GeneralSAR product_;
    ImageGrid_Obj grid_;
};

/** Whether a text of the description tells something: it is none of the marks of a missing one. */
bool is_told(std::string_view text);

/** What a header tells of a product to those who look for one; texts are empty where it tells nothing. */
struct Told {
    explicit Told(const GeneralSAR& product);

    std::string mission, swath, orbit_number, scene;
    std::string mode;  ///< "IW" of the swath "IW1", where swaths are named after their mode, else the header's
    std::string polarization;           ///< "VV"
    std::string image_type;             ///< "SLC" or "GRD", or what else the header calls it
    std::string direction;              ///< of the orbit: "ascending", "descending"
    std::string start_time, stop_time;  ///< of the region's first and last line, ISO 8601 in UTC
};

/** Reads a header's section ROI. Throws Failure where it is not there or holds no sample. */
void read_region(const std::string& header, ROI_Obj& region);

/** Azimuth time of a region's last line, s since 1985. */
double last_line_time(const ROI_Obj& region);

struct Corner {
    double latitude_deg, longitude_deg;
};
/** The corners of a product around its edge, from the corner grid, else as orbit_corners() finds them. Empty where
 * neither can be had. */
std::vector<Corner> corners_of(const std::string& header, GeneralSAR& product);
/** The same from orbit, pixel grid or region, and look side alone: of the first and the last line and sample. */
std::vector<Corner> orbit_corners(const std::string& header, GeneralSAR& product);
/** The same from the corner grid alone. */
std::vector<Corner> grid_corners(const GeneralSAR& product);

/** The name of the raster that a header belongs to: the header's name without ".hdr"; nothing for another name. */
std::optional<std::string> raster_of(const std::string& header);

}  // namespace tool

#endif
