// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_TARGETS_H
#define QUO_EXAMPLES_TARGETS_H

#include <string>
#include <vector>

#include "quo_base/geometry.h"

namespace example {

/** A point target: a reflector that gives back an echo of the same strength from every direction. */
struct Target {
    std::string name;
    GeodeticPoint place;  // on WGS84
    double strength;      // amplitude of its echo
};

/** Reads targets from a table of comma-separated values with the columns name, latitude_deg, longitude_deg,
 * height_m, strength, in this order, under a line of column names. Lines that begin with # are skipped. Throws
 * Failure with the number of the line for one that is no target, and for one with the name of another. */
std::vector<Target> read_targets(const std::string& file);

}  // namespace example

#endif
