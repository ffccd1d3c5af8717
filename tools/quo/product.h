#ifndef QUO_TOOL_PRODUCT_H
#define QUO_TOOL_PRODUCT_H

#include <optional>
#include <string>
#include <vector>

#include "quo_base/generalSAR.h"

namespace tool {

/** Reads a product header. Throws Failure where the file cannot be read or holds no object of a product. */
void read_product(const std::string& header, GeneralSAR& product);

/** The sections that a product's objects stand in, in the order of GSObject. */
const char* section_of(GSObject object);

struct Corner {
    double latitude_deg, longitude_deg;
};
/** The corners of a product around its edge, from the corner grid, else from orbit and region. Empty where neither
 * is there. */
std::vector<Corner> corners_of(GeneralSAR& product);

/** The name of the raster that a header belongs to: the header's name without ".hdr"; nothing for another name. */
std::optional<std::string> raster_of(const std::string& header);

}  // namespace tool

#endif
