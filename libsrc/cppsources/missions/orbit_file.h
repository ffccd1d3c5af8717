// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ORBIT_FILE_H
#define QUO_ORBIT_FILE_H

#include <string>
#include <vector>

#include "missions/mission_xml.h"

class GeneralSAR;
class GeneralSAROrbit;

namespace quo {

/** A state vector of a mission's files. */
struct MissionVector {
    SplitTime time;
    double position_m[3], velocity_m_s[3];
};

/** Gives a product its orbit: at least five vectors in the order of their times, which may be off their raster by
 * a millisecond: files round to the microsecond. Refused, with `source` in the line, where they make no orbit. */
void set_orbit(GeneralSAR& product, const std::vector<MissionVector>& vectors, const std::string& source);

/** The vectors of an orbit file from `margin_s` before `first` to as long after `last`, "S1A" being the satellite.
 * Refuses a file that is of another satellite or does not cover that time. */
std::vector<MissionVector> read_orbit_file(const std::string& file, const std::string& satellite,
                                           const SplitTime& first, const SplitTime& last);

/** Refuses vectors of `source` that are more than 100 m off the orbit that the annotation states: the orbits of a
 * satellite differ by metres, those of another time or place by more. */
void require_same_orbit(const std::vector<MissionVector>& vectors, GeneralSAROrbit& stated,
                        const std::string& source);

}  // namespace quo

#endif
