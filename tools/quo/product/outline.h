// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_OUTLINE_H
#define QUO_TOOL_OUTLINE_H

#include <nlohmann/json.hpp>
#include <string>

#include "quo_base/generalSAR.h"

namespace tool {

/** Where a product lies, as GeoJSON has it. */
struct Outline {
    nlohmann::ordered_json geometry;  ///< counter-clockwise; of two parts where it crosses the antimeridian
    nlohmann::ordered_json box;       ///< west, south, east, north; across the antimeridian west is the larger
};

/** The outline of a product, from its corners. Throws Failure where it has none. */
Outline outline_of(const std::string& header, GeneralSAR& product);

}  // namespace tool

#endif
