#include <nlohmann/json.hpp>

#include "commands.h"
#include "date.h"
#include "outline.h"
#include "product.h"

namespace tool {
namespace {

/** What users search outlines by; of what the header does not tell nothing. */
nlohmann::ordered_json properties_of(const std::string& header, const GeneralSAR& product) {
    const DataSetInfo_Obj& info = product.dataSetInfo;
    nlohmann::ordered_json properties{{"header", header}, {"scene", info.SceneID}};
    const auto add = [&](const char* key, const char* text) {
        if (product.GSexists(gsDataSetInfo) && is_told(text)) properties[key] = text;
    };
    add("mission", info.SensorName);
    add("mode", info.AcquisitionMode);
    add("polarization", info.Polarization);
    add("orbit_number", info.OrbitNumber);
    if (product.GSexists(gsRoi) && product.roi.Roi.isNULL() == 0) {
        properties["start_time"] = iso_text(product.roi.Roi.SlowStartTime);
        properties["stop_time"] = iso_text(last_line_time(product.roi.Roi));
    }
    if (product.GSexists(gsOrbit))
        properties["orbit_direction"] = product.orbit.isAscending() ? "ascending" : "descending";
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
