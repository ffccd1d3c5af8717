// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_MISSION_H
#define QUO_MISSION_H

#include <string>
#include <vector>

#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"
#include "quo_base/mission_import.h"

namespace quo {

/** The files of a product that are taken over. */
struct MissionFiles {
    std::string annotation, measurement;
    std::string manifest;  // empty where there is none
};

/** What the annotation makes of a product. */
struct MissionProduct {
    GeneralSAR header;  // but for the raster's description, which the measurement gives
    ImageGrid_Obj grid;
    std::int32_t lines = 0, samples = 0;
    bool is_complex = false;
    quo_tie_points ties{};  // how far the grid and the orbit are off the annotation's tie points
};

/** How the products of a mission are read. Both functions throw MissionRefusal. */
struct MissionReader {
    /** Finds the files from the product's folder, its manifest or an annotation. Refused where there is no
     * annotation of the wanted swath and polarization, or more than one. */
    MissionFiles (*find)(const std::string& source, const std::string& swath, const std::string& polarization);
    /** Fills a product. `orbit_file` takes the place of the annotation's state vectors; empty: none. */
    void (*describe)(const MissionFiles& files, const std::string& orbit_file, MissionProduct& product);
};

/** Places of an image that its producer states, and when the orbit sees them. */
struct TiePoints {
    std::vector<double> line, sample, latitude, longitude, height_m;
    std::vector<double> azimuth_s, range_s;

    [[nodiscard]] std::size_t count() const { return line.size(); }
    /** When the orbit sees them; not-a-number for those that it does not see. False where it sees none. */
    bool find_times(const GeneralSAROrbit& orbit);
    /** Drops those whose line or sample is more than kMost off grid and orbit, whose times they have. Refused, in
     * the name of `source`, where that is more than a tenth of them: then it is the image that is wrong. */
    void drop_wrong(const ImageGrid_Obj& grid, const GeneralSAROrbit& orbit, const std::string& source);
    static constexpr double kMost = 1.0;
    /** How far grid and orbit are off them; their times are the orbit's. */
    [[nodiscard]] quo_tie_points compare(const ImageGrid_Obj& grid, const GeneralSAROrbit& orbit) const;
};

/** Writes the header with all digits of its numbers: the times of lines need more than a header's 15. */
void write_mission_header(MissionProduct& product, const std::string& header);

}  // namespace quo

#endif
