#include <memory>
#include <nlohmann/json.hpp>
#include <string_view>
#include <vector>

#include "commands.h"
#include "date.h"
#include "failure.h"
#include "number.h"
#include "output.h"
#include "product.h"
#include "raster.h"

namespace tool {
namespace {

/** What is known of a product, in the order in which it is shown. */
class Facts {
public:
    void add(const char* name, const std::string& text, nlohmann::ordered_json value) {
        rows_.push_back({name, text});
        json_[name] = std::move(value);
    }
    void add(const char* name, const std::string& text) { add(name, text, text); }
    void add_number(const char* name, double value, const char* unit) {
        if (value > -900.0) add(name, exact(value) + " " + unit, value);
    }
    void add_known(const char* name, std::string_view text, std::string_view unknown) {
        if (!text.empty() && text != unknown && text != "NOT_AVAILABLE") add(name, std::string{text});
    }
    void add_time(const char* name, double seconds) {
        const std::string date = date_text(seconds).value_or("-");
        add(name, date + "  (" + exact(seconds) + " s)", {{"seconds", seconds}, {"date", date}});
    }

    [[nodiscard]] std::string text() const {
        constexpr std::size_t kColumn = 20;
        std::string text;
        for (const auto& [name, value] : rows_) {
            text += name;
            text.append(name.size() < kColumn ? kColumn - name.size() : 1, ' ').append(value) += '\n';
        }
        return text;
    }
    [[nodiscard]] std::string json() const {
        return json_.dump(2, ' ', false, nlohmann::json::error_handler_t::replace) + "\n";
    }

private:
    struct Row {
        std::string name, value;
    };
    std::vector<Row> rows_;
    nlohmann::ordered_json json_;
};

void add_data_set(Facts& facts, const DataSetInfo_Obj& info) {
    facts.add_known("mission", info.SensorName, "SENSOR UNKNOWN");
    facts.add_known("mode", info.AcquisitionMode, "ACQUISITION MODE UNDEFINED");
    facts.add_known("polarization", info.Polarization, "");
    facts.add_known("swath", info.Swath, "");
    facts.add_known("scene", info.SceneID, "");
    facts.add_known("description", info.Description, "");
    facts.add_known("image type", info.ImageType, "NOT SET");
    facts.add_known("projection", info.Projection, "PROJECTION UNDEFINED");
    facts.add("look side", info.LookDirection < 0 ? "left" : "right");
}

void add_times(Facts& facts, const GeneralSAR& product) {
    const ROI_Obj& region = product.roi.Roi;
    if (product.GSexists(gsRoi) && region.isNULL() == 0) {
        facts.add_time("first line", region.SlowStartTime);
        facts.add_time("last line", region.SlowStartTime + region.SlowTimeLength);
        facts.add_number("span", region.SlowTimeLength, "s");
        facts.add("region",
                  std::to_string(region.Lines) + " lines x " + std::to_string(region.Samples) + " samples",
                  {{"lines", region.Lines}, {"samples", region.Samples}});
    }
    if (!product.GSexists(gsOrbit)) return;
    const GeneralSAROrbit& orbit = product.orbit;
    const double last = orbit.t0SV_s + orbit.dtSV_s * (orbit.nSV_n - 1);
    facts.add("orbit direction", orbit.isAscending() ? "ascending" : "descending");
    facts.add(
        "state vectors",
        std::to_string(orbit.nSV_n) + ", " + exact(orbit.dtSV_s) + " s apart, to " + date_text(last).value_or("-"),
        {{"count", orbit.nSV_n}, {"spacing_s", orbit.dtSV_s}, {"first_s", orbit.t0SV_s}, {"last_s", last}});
}

void add_raster(Facts& facts, const RasterDescription& raster) {
    facts.add("raster",
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

void add_sampling(Facts& facts, const SamplingConstants_Obj& sampling) {
    facts.add_number("PRF", sampling.prf_hz, "Hz");
    facts.add_number("sampling rate", sampling.frg_hz, "Hz");
    facts.add_number("carrier", sampling.fc_hz, "Hz");
    facts.add_number("wavelength", sampling.lambda_m, "m");
    facts.add_number("range bandwidth", sampling.Brg_hz, "Hz");
    facts.add_number("azimuth bandwidth", sampling.Baz_hz, "Hz");
}

void add_corners(Facts& facts, GeneralSAR& product) {
    nlohmann::ordered_json list = nlohmann::json::array();
    std::string text;
    for (const Corner& corner : corners_of(product)) {
        list.push_back({{"latitude_deg", corner.latitude_deg}, {"longitude_deg", corner.longitude_deg}});
        text += (text.empty() ? "" : "; ") + fixed(corner.latitude_deg, 5) + " " + fixed(corner.longitude_deg, 5);
    }
    if (!text.empty()) facts.add("corners", text, list);
}

void add_objects(Facts& facts, const GeneralSAR& product) {
    constexpr const char* kNames[] = {"GSDataFile",   "GSRoi",          "polySAR",         "SamplingConstants",
                                      "StateVectors", "Orbit",          "Pulse",           "AntennaPattern",
                                      "DataSetInfo",  "SensorAttitude", "SpectralWindows", "geoCoords",
                                      "SwathInfo",    "BufferFile"};
    nlohmann::ordered_json list = nlohmann::json::array();
    std::string text;
    for (int i = 0; i < GeneralSAR::kObjects; ++i) {
        if (!product.GSexists(static_cast<GSObject>(i))) continue;
        list.push_back(kNames[i]);
        text += (text.empty() ? "" : " ") + std::string{kNames[i]};
    }
    facts.add("objects", text, list);
}

int show_info(const std::string& header, bool json) {
    GeneralSAR product;
    read_product(header, product);
    Facts facts;
    facts.add("header", header);
    if (product.GSexists(gsDataSetInfo)) add_data_set(facts, product.dataSetInfo);
    add_times(facts, product);
    if (product.GSexists(gsBufferFile)) add_raster(facts, product.bufferFile);
    if (product.GSexists(gsSamplingConstants)) add_sampling(facts, product.samplingConstants);
    add_corners(facts, product);
    add_objects(facts, product);
    Output output{"-"};
    output.write(json ? facts.json() : facts.text());
    output.commit();
    return kFine;
}

}  // namespace

void add_info(CLI::App& app, Job& job) {
    struct Options {
        std::string header;
        bool json = false;
    };
    auto options = std::make_shared<Options>();
    CLI::App* command = app.add_subcommand("info", "What a product is: one screen");
    command->add_option("HEADER", options->header, "Product header")->required();
    command->add_flag("--json", options->json, "Print JSON");
    command->callback([options, &job] { job = [options] { return show_info(options->header, options->json); }; });
}

}  // namespace tool
