#ifndef QUO_SENTINEL1_H
#define QUO_SENTINEL1_H

#include <optional>
#include <string>

#include "missions/mission_xml.h"
#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"
#include "quo_base/mission_import.h"

namespace quo {

/** The files of a product that are taken over. */
struct Sentinel1Files {
    std::string annotation, measurement;
    std::string manifest;  // empty where there is none
};

/** Finds them from the product's folder, its manifest or an annotation. Refused where there is no annotation of
 * the wanted swath and polarization, or more than one. */
Sentinel1Files find_sentinel1_files(const std::string& source, const std::string& swath,
                                    const std::string& polarization);

/** What an annotation makes of a product. */
struct Sentinel1Product {
    GeneralSAR header;
    ImageGrid_Obj grid;
    std::int32_t lines = 0, samples = 0;
    bool is_complex = false;
    quo_tie_points ties{};  // how far the grid and the orbit are off the annotation's tie points
};

/** Fills a product from the annotation, but for its raster's description. `orbit_file` takes the place of the
 * annotation's state vectors; empty: none. */
void describe_sentinel1(const Sentinel1Files& files, const std::string& orbit_file, Sentinel1Product& product);

/** Writes the header with all digits of its numbers: the times of lines need more than a header's 15. */
void write_mission_header(Sentinel1Product& product, const std::string& header);

}  // namespace quo

#endif
