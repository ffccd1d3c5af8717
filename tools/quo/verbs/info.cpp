// SPDX-License-Identifier: Apache-2.0
#include "commands.h"
#include "date.h"
#include "facts.h"
#include "pixels.h"
#include "product.h"
#include "quo_base/derived_raster.h"
#include "raster.h"
#include "sarutillib/ground/letters.h"

namespace tool {
namespace {

void add_known(Facts& facts, const char* name, const char* key, std::string_view text) {
    if (is_told(text)) facts.add_text(name, key, std::string{text});
}
/** A number that is not the mark of a missing one; people see `scale` times it in `unit`. */
void add_number(Facts& facts, const char* name, const char* key, double value, double scale, const char* unit) {
    constexpr double kUnknown = -900.0;
    if (value > kUnknown) facts.add(name, key, handy(value * scale) + " " + unit, value);
}
void add_time(Facts& facts, const char* name, const char* key, double seconds, DateForm form) {
    const std::string date = date_text(seconds, form).value_or("-");
    facts.add(name, key, date + "  (" + exact(seconds) + " s)", {{"seconds", seconds}, {"date", date}});
}

void add_data_set(Facts& facts, const DataSetInfo_Obj& info) {
    add_known(facts, "mission", "mission", info.SensorName);
    add_known(facts, "mode", "mode", info.AcquisitionMode);
    add_known(facts, "polarization", "polarization", info.Polarization);
    add_known(facts, "swath", "swath", info.Swath);
    add_known(facts, "orbit number", "orbit_number", info.OrbitNumber);
    add_known(facts, "scene", "scene", info.SceneID);
    add_known(facts, "description", "description", info.Description);
    add_known(facts, "image type", "image_type", info.ImageType);
    add_known(facts, "projection", "projection", info.Projection);
    facts.add_text("look side", "look_side", info.LookDirection < 0 ? "left" : "right");
}

void add_region(Facts& facts, const ROI_Obj& region, DateForm form) {
    if (region.isNULL() != 0) return;
    add_time(facts, "first line", "first_line", region.SlowStartTime, form);
    add_time(facts, "last line", "last_line", last_line_time(region), form);
    add_number(facts, "span", "span_s", region.SlowTimeLength, 1.0, "s");
    facts.add("region", "region",
              std::to_string(region.Lines) + " lines x " + std::to_string(region.Samples) + " samples",
              {{"lines", region.Lines}, {"samples", region.Samples}});
}

void add_orbit(Facts& facts, const GeneralSAROrbit& orbit, DateForm form) {
    const double last = orbit.t0SV_s + orbit.dtSV_s * (orbit.nSV_n - 1);
    facts.add_text("orbit direction", "orbit_direction", orbit.isAscending() ? "ascending" : "descending");
    facts.add("state vectors", "state_vectors",
              std::to_string(orbit.nSV_n) + ", " + exact(orbit.dtSV_s) + " s apart, from " +
                  date_text(orbit.t0SV_s, form).value_or("-") + " to " + date_text(last, form).value_or("-"),
              {{"count", orbit.nSV_n}, {"spacing_s", orbit.dtSV_s}, {"first_s", orbit.t0SV_s}, {"last_s", last}});
}

void add_raster(Facts& facts, const RasterDescription& raster) {
    facts.add("raster", "raster",
              std::to_string(raster.NrOfLinesPerImage) + " lines x " + std::to_string(raster.NrOfPixelsPerLine) +
                  " samples, " + type_name(raster.CellType) + ", " +
                  (raster.ByteOrder == 1 ? "big-endian" : "little-endian"),
              {{"lines", raster.NrOfLinesPerImage},
               {"samples", raster.NrOfPixelsPerLine},
               {"type", type_name(raster.CellType)},
               {"order", raster.ByteOrder == 1 ? "m" : "l"},
               {"header_offset", raster.HeaderOffset},
               {"row_prefix", raster.RowPrefix}});
}

/** Sampling constants in their own units, people see them in `prefix` times those. */
void add_sampling(Facts& facts, GeneralSAR& product) {
    constexpr struct {
        const char *name, *key, *field;
        double scale;
        const char* prefix;
    } kShown[] = {{"PRF", "prf_hz", "prf_hz", 1.0, ""},
                  {"sampling rate", "sampling_rate_hz", "frg_hz", 1e-6, "M"},
                  {"carrier", "carrier_hz", "fc_hz", 1e-9, "G"},
                  {"wavelength", "wavelength_m", "lambda_m", 1.0, ""},
                  {"range bandwidth", "range_bandwidth_hz", "Brg_hz", 1e-6, "M"},
                  {"azimuth bandwidth", "azimuth_bandwidth_hz", "Baz_hz", 1.0, ""}};
    for (const auto& [name, key, field, scale, prefix] : kShown) {
        const parElement& element =
            *product.GSelement(gsSamplingConstants, std::string{"SamplingConstants/"} + field);
        add_number(facts, name, key, *static_cast<const double*>(element.pointer), scale,
                   (prefix + std::string{element.unit}).c_str());
    }
}

void add_corners(Facts& facts, const std::string& header, GeneralSAR& product) {
    nlohmann::ordered_json list = nlohmann::json::array();
    std::string text;
    for (const Corner& corner : corners_of(header, product)) {
        list.push_back({{"latitude_deg", corner.latitude_deg}, {"longitude_deg", corner.longitude_deg}});
        text += (text.empty() ? "" : "; ") + fixed(corner.latitude_deg, 5) + " " + fixed(corner.longitude_deg, 5);
    }
    if (!text.empty()) facts.add("corners", "corners", text + "  (latitude longitude, degrees)", list);
}

/** What the pixels are on the ground, of a raster that the header places. */
void add_geometry(Facts& facts, const std::string& header, GeneralSAR& product) {
    if (!Pixels::known(header, product)) return;
    const Pixels pixels{header, product};
    const double middle = 0.5 * (pixels.lines() - 1);
    constexpr struct {
        const char *name, *key;
        double share;
    } kPlaces[] = {{"near range", "near", 0.0}, {"mid range", "mid", 0.5}, {"far range", "far", 1.0}};
    for (const auto& [name, key, share] : kPlaces) {
        const double sample = share * (pixels.samples() - 1);
        const auto times = pixels.times(middle, sample);
        const auto seen = pixels.geometry(middle, sample);
        if (!times || !seen) continue;
        const double slant_m = 0.5 * quo::kLightSpeed * times->range_s;
        facts.add(name, key, fixed(slant_m, 1) + " m, incidence " + fixed(seen->incidence_deg, 3) + " degrees",
                  {{"slant_range_m", slant_m},
                   {"range_time_s", times->range_s},
                   {"incidence_deg", seen->incidence_deg}});
    }
    if (const auto spacing = pixels.ground_spacing())
        facts.add("spacing", "spacing_m",
                  fixed(spacing->line_m, 3) + " m x " + fixed(spacing->sample_m, 3) +
                      " m on the ground (lines x samples)",
                  {{"line", spacing->line_m}, {"sample", spacing->sample_m}});
}

void add_objects(Facts& facts, const GeneralSAR& product) {
    for (const bool present : {true, false}) {
        std::vector<std::string> names;
        for (int i = 0; i < GeneralSAR::kObjects; ++i) {
            const auto object = static_cast<GSObject>(i);
            if (product.GSexists(object) == present) names.emplace_back(GeneralSAR::GSname(object));
        }
        const char* which = present ? "objects" : "absent";
        facts.add(which, which, names.empty() ? "none" : quo::joined(names, " "), names);
    }
}

struct InfoOptions {
    std::string header;
    bool json = false, iso = false;
};

int show_info(const InfoOptions& options) {
    GeneralSAR product;
    read_product(options.header, product);
    const DateForm form = options.iso ? DateForm::kIso : DateForm::kHeader;
    Facts facts;
    facts.add_text("header", "header", options.header);
    if (product.GSexists(gsDataSetInfo)) add_data_set(facts, product.dataSetInfo);
    if (product.GSexists(gsRoi)) add_region(facts, product.roi.Roi, form);
    if (product.GSexists(gsOrbit)) add_orbit(facts, product.orbit, form);
    if (const RasterDescription* raster = described_raster(product)) add_raster(facts, *raster);
    if (product.GSexists(gsSamplingConstants)) add_sampling(facts, product);
    int status = kFine;
    try {
        add_geometry(facts, options.header, product);
    } catch (const Failure& damaged) {  // a grid that makes none takes nothing from what else is known
        complain(damaged.what());
        status = kFindings;
    }
    add_corners(facts, options.header, product);
    add_objects(facts, product);
    options.json ? print_json(facts.json()) : print(facts.text(20));
    return status;
}

}  // namespace

void add_info(Command& program) {
    auto [command, options] = add_verb(program, "info", "What a product is: one screen", show_info);
    command.needs("HEADER", options.header, "Product header");
    command.flag("--json", options.json, "Print JSON");
    command.flag("--iso", options.iso, "Write dates as ISO 8601");
}

}  // namespace tool
