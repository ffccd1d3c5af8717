#include <algorithm>
#include <array>
#include <cmath>
#include <filesystem>
#include <numbers>
#include <optional>
#include <vector>

#include "apart.h"
#include "commands.h"
#include "date.h"
#include "output.h"
#include "pixels.h"
#include "product.h"
#include "raster.h"
#include "sarutillib/ground/quoted_xml.h"

namespace tool {
namespace {

// GDAL's names of the cell types; it does not know complex samples of 8 bits.
constexpr std::array<std::string_view, 10> kGdalTypes{"CFloat32", "Float32", "CFloat64", "Float64", "CInt32",
                                                      "Int32",    "CInt16",  "Int16",    "",        "Byte"};

std::string element(const char* name, const std::string& content) {
    return std::string{"    <"} + name + ">" + content + "</" + name + ">\n";
}

// --- Ground control points --------------------------------------------------------------------------------------

/** A place in the raster and on the ground; longitudes are continuous over the raster. */
struct Control {
    double line, sample, latitude_deg, longitude_deg;
};

/** Control points on a grid of lines by columns. */
struct Controls {
    std::vector<double> lines, samples;
    std::vector<Control> points;

    [[nodiscard]] const Control& at(std::size_t line, std::size_t sample) const {
        return points[line * samples.size() + sample];
    }
};

std::vector<double> even_places(int length, int count) {
    const int last = std::min(length, count) - 1;
    std::vector<double> places(static_cast<std::size_t>(last) + 1);
    for (int i = 0; i <= last; ++i)
        places[static_cast<std::size_t>(i)] = (length - 1) * static_cast<double>(i) / std::max(1, last);
    return places;
}

/** Of bursts every burst's first and last line in the raster: between two bursts the ground goes back. */
std::vector<double> line_places(const Pixels& pixels, int count) {
    const ImageGrid_Obj& grid = pixels.grid();
    if (grid.Bursts == 0) return even_places(pixels.lines(), count);
    std::vector<double> places;
    for (int burst = 0; burst < grid.Bursts; ++burst) {
        const double start = static_cast<double>(burst) * grid.LinesPerBurst - grid.FirstLine;
        const double first = std::max(start, 0.0),
                     last = std::min(start + grid.LinesPerBurst - 1.0, pixels.lines() - 1.0);
        if (first > last) continue;
        places.push_back(first);
        if (last > first) places.push_back(last);
    }
    return places;
}

std::optional<Control> control_at(const Pixels& pixels, double line, double sample, double near_longitude_deg) {
    const auto seen = pixels.geometry(line, sample);
    if (!seen) return std::nullopt;
    const double turns = std::round((near_longitude_deg - seen->longitude_deg) / 360.0);
    return Control{line, sample, seen->latitude_deg, seen->longitude_deg + 360.0 * turns};
}

std::optional<Controls> make_controls(const Pixels& pixels, int count) {
    Controls controls{line_places(pixels, count), even_places(pixels.samples(), count), {}};
    for (const double line : controls.lines)
        for (const double sample : controls.samples) {
            const double near = controls.points.empty() ? 0.0 : controls.points.back().longitude_deg;
            const auto control = control_at(pixels, line, sample, near);
            if (!control) return std::nullopt;
            controls.points.push_back(*control);
        }
    return controls;
}

/** The largest distance, in pixels, between the middle of four neighbouring points and where they lie in truth. */
double interpolation_error(const Pixels& pixels, const Controls& controls) {
    double worst = 0.0;
    for (std::size_t i = 0; i + 1 < controls.lines.size(); ++i)
        for (std::size_t j = 0; j + 1 < controls.samples.size(); ++j) {
            const Control &a = controls.at(i, j), &b = controls.at(i, j + 1), &c = controls.at(i + 1, j),
                          &d = controls.at(i + 1, j + 1);
            const double lines_per_burst = pixels.grid().Bursts > 0 ? pixels.grid().LinesPerBurst : HUGE_VAL;
            const auto burst_of = [&](double line) {
                return std::floor((line + pixels.grid().FirstLine + 0.5) / lines_per_burst);
            };
            if (burst_of(a.line) != burst_of(c.line)) continue;
            const auto truth =
                control_at(pixels, 0.5 * (a.line + c.line), 0.5 * (a.sample + b.sample), a.longitude_deg);
            if (!truth) continue;
            // How far a line and a sample reach, in degrees, with longitudes as long as latitudes.
            const double shrink = std::cos(truth->latitude_deg * std::numbers::pi / 180.0);
            const auto length = [&](const Control& from, const Control& to, double pixels_between) {
                return std::hypot(to.latitude_deg - from.latitude_deg,
                                  (to.longitude_deg - from.longitude_deg) * shrink) /
                       pixels_between;
            };
            const Control middle{0.0, 0.0,
                                 0.25 * (a.latitude_deg + b.latitude_deg + c.latitude_deg + d.latitude_deg),
                                 0.25 * (a.longitude_deg + b.longitude_deg + c.longitude_deg + d.longitude_deg)};
            const double pixel = std::min(length(a, b, b.sample - a.sample), length(a, c, c.line - a.line));
            worst = std::max(worst, length(middle, *truth, 1.0) / pixel);
        }
    return worst;
}

/** As few control points as keep half a pixel. */
std::string control_points(const Pixels& pixels) {
    constexpr int kMost = 65;
    constexpr double kTolerated = 0.5;  // pixels
    for (int count = 5;; count = 2 * count - 1) {
        const auto controls = make_controls(pixels, count);
        if (!controls) return {};
        const double error = interpolation_error(pixels, *controls);
        if (error > kTolerated && 2 * count - 1 <= kMost) continue;
        std::string text =
            "  <!-- Points on the ellipsoid, height 0; between them up to " + fixed(error, 2) +
            " pixels off. -->\n  <GCPList Projection=\"EPSG:4979\" dataAxisToSRSAxisMapping=\"2,1,3\">\n";
        int id = 0;
        for (const Control& point : controls->points)
            text += "    <GCP Id=\"" + std::to_string(++id) + "\" Pixel=\"" + exact(point.sample + 0.5) +
                    "\" Line=\"" + exact(point.line + 0.5) + "\" X=\"" + exact(point.longitude_deg) + "\" Y=\"" +
                    exact(point.latitude_deg) + "\" Z=\"0\" />\n";
        return text + "  </GCPList>\n";
    }
}

std::string metadata(GeneralSAR& product) {
    const DataSetInfo_Obj& info = product.dataSetInfo;
    std::string text;
    const auto add = [&](const char* key, const std::string& value) {
        if (is_told(value))
            text += "    <MDI key=\"" + std::string{key} + "\">" + quo::quoted_xml(value) + "</MDI>\n";
    };
    if (product.GSexists(gsDataSetInfo)) {
        add("MISSION_ID", info.SensorName);
        add("MODE", info.AcquisitionMode);
        add("SWATH", info.Swath);
        add("POLARISATION", info.Polarization);
        add("ORBIT_NUMBER", info.OrbitNumber);
        add("PRODUCT_TYPE", info.ImageType);
        add("PRODUCT_NAME", info.SceneID);
    }
    if (product.GSexists(gsOrbit))
        add("ORBIT_DIRECTION", product.orbit.isAscending() ? "ASCENDING" : "DESCENDING");
    if (product.GSexists(gsRoi) && product.roi.Roi.isNULL() == 0) {
        add("ACQUISITION_START_TIME", iso_text(product.roi.Roi.SlowStartTime));
        add("ACQUISITION_STOP_TIME", iso_text(last_line_time(product.roi.Roi)));
    }
    return text.empty() ? text : "  <Metadata>\n" + text + "  </Metadata>\n";
}

/** What the header beside a raster tells of it beyond its layout; empty where that is all. */
struct Described {
    std::string before_band, band_name;
};
Described describe(const std::string& header) {
    GeneralSAR product;
    if (product.GSread(header.c_str()) != QUO_OK) return {};
    Described described{metadata(product), ""};
    if (Pixels::known(header, product))
        described.before_band = control_points({header, product}) + described.before_band;
    const std::string polarization = product.dataSetInfo.Polarization;
    if (product.GSexists(gsDataSetInfo) && polarization != "NOT_AVAILABLE")
        described.band_name = element("Description", quo::quoted_xml(polarization));
    return described;
}

std::string vrt_text(const DataFile& raster, const std::string& name, const Described& described) {
    const std::int64_t size = raster.element_sizeof();
    const std::int64_t line = size * raster.NrOfPixelsPerLine + raster.RowPrefix;
    std::string text = "<VRTDataset rasterXSize=\"" + std::to_string(raster.NrOfPixelsPerLine) +
                       "\" rasterYSize=\"" + std::to_string(raster.NrOfLinesPerImage) + "\">\n" +
                       described.before_band + "  <VRTRasterBand dataType=\"" +
                       std::string{kGdalTypes[static_cast<std::size_t>(raster.CellType)]} +
                       "\" band=\"1\" subClass=\"VRTRawRasterBand\">\n" + described.band_name;
    if (raster.CellType == INT8) {
        text += "    <Metadata domain=\"IMAGE_STRUCTURE\"><MDI key=\"PIXELTYPE\">SIGNEDBYTE</MDI></Metadata>\n";
    }
    text += "    <SourceFilename relativeToVRT=\"1\">" + quo::quoted_xml(name) + "</SourceFilename>\n";
    text += element("ImageOffset", std::to_string(raster.HeaderOffset + raster.RowPrefix));
    text += element("PixelOffset", std::to_string(size));
    text += element("LineOffset", std::to_string(line));
    text += element("ByteOrder", raster.ByteOrder == 1 ? "MSB" : "LSB");
    return text + "  </VRTRasterBand>\n</VRTDataset>\n";
}

int write_vrt(const std::string& name) {
    DataFile raster;
    read_description(name, raster);
    if (raster.CellType == INT8_COMPLEX) throw Failure(name + ": GDAL has no type for INT8_COMPLEX");
    require_apart(raster_files(name), {name + ".vrt"});
    write_output(name + ".vrt",
                 vrt_text(raster, std::filesystem::path{name}.filename().string(), describe(name + ".hdr")));
    return kFine;
}

}  // namespace

void add_vrt(Command& program) {
    auto [command, name] =
        add_verb(program, "vrt", "Writes RASTER.vrt beside a raster, which GDAL opens", write_vrt);
    command.needs("RASTER", name, "Raster with a side file RASTER.hdr");
}

}  // namespace tool
