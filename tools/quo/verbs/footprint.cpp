// SPDX-License-Identifier: Apache-2.0
#include <nlohmann/json.hpp>
#include <string>
#include <utility>

#include "commands.h"
#include "outline.h"
#include "product.h"

namespace tool {
namespace {

/** What users search outlines by; of what the header does not tell nothing. */
nlohmann::ordered_json properties_of(const std::string& header, const GeneralSAR& product) {
    const Told told{product};
    const auto utc = [](const std::string& time) { return time.empty() ? time : time + "Z"; };
    nlohmann::ordered_json properties{{"header", header}, {"scene", product.dataSetInfo.SceneID}};
    for (const auto& [key, text] : {std::pair{"mission", told.mission},
                                    {"mode", told.mode},
                                    {"polarization", told.polarization},
                                    {"orbit_number", told.orbit_number},
                                    {"start_time", utc(told.start_time)},
                                    {"stop_time", utc(told.stop_time)},
                                    {"orbit_direction", told.direction}})
        if (!text.empty()) properties[key] = text;
    return properties;
}

int footprint(const std::string& header) {
    GeneralSAR product;
    read_product(header, product);
    const nlohmann::ordered_json feature{{"type", "Feature"},
                                         {"properties", properties_of(header, product)},
                                         {"geometry", outline_of(header, product).geometry}};
    print_json(feature, -1);
    return kFine;
}

}  // namespace

void add_footprint(Command& program) {
    auto [command, header] = add_verb(program, "footprint", "Prints a product's outline as GeoJSON", footprint);
    command.needs("HEADER", header, "Product header");
}

}  // namespace tool
