// SPDX-License-Identifier: Apache-2.0
#include <cmath>
#include <filesystem>
#include <nlohmann/json.hpp>
#include <set>

#include "commands.h"
#include "date.h"
#include "outline.h"
#include "pixels.h"
#include "product.h"
#include "sarutillib/ground/letters.h"

namespace tool {
namespace {

using Json = nlohmann::ordered_json;

struct StacOptions {
    std::string header, id;
};

// What the extensions of the catalogue's format add to its properties.
constexpr const char* kExtensions[] = {"https://stac-extensions.github.io/sar/v1.0.0/schema.json",
                                       "https://stac-extensions.github.io/sat/v1.0.0/schema.json",
                                       "https://stac-extensions.github.io/projection/v1.1.0/schema.json",
                                       "https://stac-extensions.github.io/view/v1.0.0/schema.json"};

/** The letter of a radar band; empty for a frequency in none. */
std::string band_of(double frequency_ghz) {
    constexpr struct {
        const char* name;
        double from_ghz, to_ghz;
    } kBands[] = {{"P", 0.25, 0.5}, {"L", 1.0, 2.0},    {"S", 2.0, 4.0},   {"C", 4.0, 8.0},
                  {"X", 8.0, 12.0}, {"Ku", 12.0, 18.0}, {"K", 18.0, 26.5}, {"Ka", 26.5, 40.0}};
    for (const auto& [name, from_ghz, to_ghz] : kBands)
        if (frequency_ghz >= from_ghz && frequency_ghz < to_ghz) return name;
    return "";
}

/** A product as an item of a catalogue. */
class Item {
public:
    Item(const StacOptions& options, GeneralSAR& product)
        : header_{options.header}, id_{options.id}, product_{product}, told_{product}, pixels_{header_, product} {}

    Json make() {
        const Outline outline = outline_of(header_, product_);
        const DataSetInfo_Obj& info = product_.dataSetInfo;
        add_times();
        if (!told_.mission.empty()) properties_["platform"] = quo::lower(told_.mission);
        add_radar(info);
        add_orbit(info);
        add_pixels();
        const std::string file = std::filesystem::path{header_}.filename().string();
        return {{"type", "Feature"},
                {"stac_version", "1.0.0"},
                {"stac_extensions", kExtensions},
                {"id", id(file)},
                {"geometry", outline.geometry},
                {"bbox", outline.box},
                {"properties", properties_},
                {"links", Json::array()},
                {"assets", assets(file)}};
    }

private:
    std::string required(std::string text, const char* what) const {
        if (text.empty()) throw Failure(header_ + ": no " + what + ", without which there is no item");
        return text;
    }

    [[nodiscard]] std::string id(const std::string& file) const {
        if (!id_.empty()) return id_;
        return told_.scene.empty() ? raster_of(file).value_or(file) : told_.scene;
    }

    void add_times() {
        ROI_Obj region;
        if (pixels_.grid().getRegion(&region, pixels_.lines(), pixels_.samples()) != QUO_OK)
            throw Failure(header_ + ": the pixel grid does not hold the raster");
        const std::string first = required(iso_text(region.SlowStartTime), "date") + "Z",
                          last = required(iso_text(last_line_time(region)), "date") + "Z";
        properties_["datetime"] = first;
        properties_["start_datetime"] = first;
        properties_["end_datetime"] = last;
    }

    void add_radar(const DataSetInfo_Obj& info) {
        const double frequency_ghz = product_.samplingConstants.fc_hz * 1e-9;
        const std::string& polarization = told_.polarization;
        const bool known = std::set<std::string>{"HH", "VV", "HV", "VH"}.contains(polarization);
        properties_["sar:instrument_mode"] =
            required(told_.mode, "acquisition mode (DataSetInfo/AcquisitionMode)");
        properties_["sar:frequency_band"] =
            required(band_of(frequency_ghz), "frequency of a radar band (SamplingConstants/fc_hz)");
        properties_["sar:center_frequency"] = frequency_ghz;
        properties_["sar:polarizations"] =
            Json::array({required(known ? polarization : "", "polarization (DataSetInfo/Polarization)")});
        properties_["sar:product_type"] = required(told_.image_type, "image type (DataSetInfo/ImageType)");
        properties_["sar:observation_direction"] = info.LookDirection < 0 ? "left" : "right";
        if (info.RangeLooks > 0) properties_["sar:looks_range"] = info.RangeLooks;
    }

    void add_orbit(const DataSetInfo_Obj& info) {
        properties_["sat:orbit_state"] = told_.direction;
        add_number("sat:absolute_orbit", info.OrbitNumber);
        add_number("sat:relative_orbit", info.Track);
    }
    void add_number(const char* key, const std::string& text) {
        if (const auto number = whole_number(text); number && *number > 0) properties_[key] = *number;
    }

    void add_pixels() {
        const auto middle = pixels_.geometry(0.5 * (pixels_.lines() - 1), 0.5 * (pixels_.samples() - 1));
        if (!middle) throw Failure(header_ + ": the orbit sees no ground in the middle of the raster");
        if (const auto spacing = pixels_.ground_spacing()) {
            const ImageGrid_Obj& grid = pixels_.grid();
            properties_["sar:pixel_spacing_range"] =
                grid.GroundLists > 0 ? grid.GroundStep_m : 0.5 * quo::kLightSpeed * grid.SampleStep_s;
            properties_["sar:pixel_spacing_azimuth"] = spacing->line_m;
        }
        properties_["view:incidence_angle"] = middle->incidence_deg;
        properties_["view:off_nadir"] = middle->look_deg;
        properties_["proj:epsg"] = nullptr;  // as it was recorded, on no map
        properties_["proj:shape"] = {pixels_.lines(), pixels_.samples()};
        properties_["proj:centroid"] = {{"lat", middle->latitude_deg}, {"lon", middle->longitude_deg}};
    }

    /** A file beside the item. */
    static Json asset(const std::string& file, const char* type, const char* role) {
        std::string reference = "./";
        for (const char c : file) {
            constexpr std::string_view kPlain = "-._~", kDigits = "0123456789ABCDEF";
            const auto byte = static_cast<unsigned char>(c);
            const bool plain = (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') ||
                               kPlain.find(c) != kPlain.npos;
            reference += plain ? std::string{c} : std::string{'%', kDigits[byte / 16], kDigits[byte % 16]};
        }
        return {{"href", reference}, {"type", type}, {"roles", Json::array({role})}};
    }
    static Json assets(const std::string& file) {
        Json assets{{"header", asset(file, "application/xml", "metadata")}};
        if (const auto raster = raster_of(file))
            assets["raster"] = asset(*raster, "application/octet-stream", "data");
        return assets;
    }

    const std::string &header_, &id_;
    GeneralSAR& product_;
    const Told told_;
    Pixels pixels_;
    Json properties_ = Json::object();
};

int stac(const StacOptions& options) {
    GeneralSAR product;
    read_product(options.header, product);
    print_json(Item{options, product}.make());
    return kFine;
}

}  // namespace

void add_stac(Command& program) {
    auto [command, options] = add_verb(program, "stac", "Prints a product as an item of a STAC catalogue", stac);
    command.needs("HEADER", options.header, "Product header");
    command.takes("--id", options.id, "Identifier of the item, in place of the scene's name");
}

}  // namespace tool
