#include <algorithm>
#include <array>
#include <cmath>
#include <filesystem>
#include <optional>
#include <vector>

#include "apart.h"
#include "commands.h"
#include "output.h"
#include "pixels.h"
#include "product.h"
#include "raster.h"
#include "sarutillib/ground/letters.h"
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
Control between(const Control& a, const Control& b) {
    return {0.5 * (a.line + b.line), 0.5 * (a.sample + b.sample), 0.5 * (a.latitude_deg + b.latitude_deg),
            0.5 * (a.longitude_deg + b.longitude_deg)};
}
/** Degrees of latitude between two places on the ground. */
double distance(const Control& a, const Control& b) {
    const double shrink = std::cos(a.latitude_deg / quo::kDegPerRad);
    return std::hypot(a.latitude_deg - b.latitude_deg, (a.longitude_deg - b.longitude_deg) * shrink);
}

/** Numbers of lines and samples, evenly spread over a stretch. */
struct Places {
    double first, last;
    int count;

    /** Adds them to a list, no closer to each other than 1. */
    void append_to(std::vector<double>& list) const {
        const int steps = static_cast<int>(std::min(count - 1.0, last - first));
        for (int i = 0; i <= steps; ++i) list.push_back(first + (last - first) * i / std::max(1, steps));
    }
};

/** The lines at which the ground makes a jump, in their order: where bursts begin, and of ground range where the
 * polynomial changes. */
std::vector<double> jumps(const Pixels& pixels) {
    const ImageGrid_Obj& grid = pixels.grid();
    std::vector<double> lines;
    const auto add = [&](double line_of_grid) {
        const double line = std::ceil(line_of_grid - grid.FirstLine);
        if (line > 0.0 && line < pixels.lines()) lines.push_back(line);
    };
    for (int burst = 1; burst < grid.Bursts; ++burst) add(static_cast<double>(burst) * grid.LinesPerBurst - 0.5);
    for (std::size_t i = 1; i < grid.GroundTime_s.size(); ++i)
        add((0.5 * (grid.GroundTime_s[i - 1] + grid.GroundTime_s[i]) - grid.FirstLine_s) / grid.LineStep_s);
    return lines;
}

/** Control points on a grid of lines by columns. */
class Controls {
public:
    /** So many lines of each stretch between two jumps, and so many columns. Of a raster that the orbit does not
     * see everywhere there are none. */
    Controls(const Pixels& pixels, int lines, int columns) : pixels_{pixels}, jumps_{jumps(pixels)} {
        double first = 0.0;
        for (const double jump : jumps_) {
            Places{first, jump - 1.0, lines}.append_to(lines_);
            first = jump;
        }
        Places{first, pixels.lines() - 1.0, lines}.append_to(lines_);
        Places{0.0, pixels.samples() - 1.0, columns}.append_to(samples_);
        for (const double line : lines_)
            for (const double sample : samples_) {
                const auto control = at(line, sample, points_.empty() ? 0.0 : points_.back().longitude_deg);
                if (control) points_.push_back(*control);
            }
        if (points_.size() != lines_.size() * samples_.size()) points_.clear();
    }
    [[nodiscard]] const std::vector<Control>& points() const { return points_; }

    /** The largest distances, in pixels, of what lies halfway between neighbours from its true place. */
    struct Error {
        double along_lines = 0.0, along_samples = 0.0, diagonal = 0.0;
        [[nodiscard]] double worst() const { return std::max({along_lines, along_samples, diagonal}); }
    };
    [[nodiscard]] Error error() const {
        Error error;
        for (std::size_t i = 0; i + 1 < lines_.size(); ++i)
            for (std::size_t j = 0; j + 1 < samples_.size(); ++j) {
                if (std::ranges::binary_search(jumps_, lines_[i + 1])) continue;
                const Control* const a = &points_[i * samples_.size() + j];
                const Control &b = a[1], &c = a[samples_.size()], &d = a[samples_.size() + 1];
                const double pixel =
                    std::min(distance(*a, b) / (b.sample - a->sample), distance(*a, c) / (c.line - a->line));
                const Control top = between(*a, b);
                error.along_lines = std::max(error.along_lines, off(between(*a, c)) / pixel);
                error.along_samples = std::max(error.along_samples, off(top) / pixel);
                error.diagonal = std::max(error.diagonal, off(between(top, between(c, d))) / pixel);
            }
        return error;
    }

private:
    [[nodiscard]] std::optional<Control> at(double line, double sample, double near_longitude_deg) const {
        const auto seen = pixels_.geometry(line, sample);
        if (!seen) return std::nullopt;
        const double turns = std::round((near_longitude_deg - seen->longitude_deg) / 360.0);
        return Control{line, sample, seen->latitude_deg, seen->longitude_deg + 360.0 * turns};
    }
    /** How far a place on the ground is from where its pixel lies. */
    [[nodiscard]] double off(const Control& place) const {
        const auto truth = at(place.line, place.sample, place.longitude_deg);
        return truth ? distance(*truth, place) : 0.0;
    }

    const Pixels& pixels_;
    const std::vector<double> jumps_;
    std::vector<double> lines_, samples_;
    std::vector<Control> points_;
};

/** As few control points as keep half a pixel. */
std::string control_points(const Pixels& pixels, int lines = 2, int columns = 5) {
    constexpr std::size_t kMost = 4096;
    constexpr double kTolerated = 0.5;  // pixels
    const Controls controls{pixels, lines, columns};
    if (controls.points().empty()) return {};
    const Controls::Error error = controls.error();
    if (error.worst() > kTolerated && 2 * controls.points().size() <= kMost && std::max(lines, columns) < 1024)
        return error.along_lines > error.along_samples ? control_points(pixels, 2 * lines - 1, columns)
                                                       : control_points(pixels, lines, 2 * columns - 1);
    std::string text =
        "  <!-- Points on the ellipsoid, height 0; between them up to " + fixed(error.worst(), 2) +
        " pixels off. -->\n  <GCPList Projection=\"EPSG:4979\" dataAxisToSRSAxisMapping=\"2,1,3\">\n";
    int id = 0;
    for (const Control& point : controls.points())
        text += "    <GCP Id=\"" + std::to_string(++id) + "\" Pixel=\"" + exact(point.sample + 0.5) +
                "\" Line=\"" + exact(point.line + 0.5) + "\" X=\"" + exact(point.longitude_deg) + "\" Y=\"" +
                exact(point.latitude_deg) + "\" Z=\"0\" />\n";
    return text + "  </GCPList>\n";
}

std::string metadata(const Told& told) {
    std::string text;
    for (const auto& [key, value] : {std::pair{"MISSION_ID", told.mission},
                                     {"MODE", told.mode},
                                     {"SWATH", told.swath},
                                     {"POLARISATION", told.polarization},
                                     {"ORBIT_NUMBER", told.orbit_number},
                                     {"PRODUCT_TYPE", told.image_type},
                                     {"PRODUCT_NAME", told.scene},
                                     {"ORBIT_DIRECTION", quo::upper(told.direction)},
                                     {"ACQUISITION_START_TIME", told.start_time},
                                     {"ACQUISITION_STOP_TIME", told.stop_time}})
        if (!value.empty())
            text += "    <MDI key=\"" + std::string{key} + "\">" + quo::quoted_xml(value) + "</MDI>\n";
    return text.empty() ? text : "  <Metadata>\n" + text + "  </Metadata>\n";
}

/** What the header beside a raster tells of it beyond its layout; empty where that is all. */
struct Described {
    std::string before_band, band_name;
    std::string damage;  // what keeps the raster from having control points, though the header should place it
};
Described describe(const std::string& header) {
    GeneralSAR product;
    if (product.GSread(header.c_str()) != QUO_OK) return {};
    const Told told{product};
    Described described{metadata(told), "", ""};
    try {
        if (Pixels::known(header, product))
            described.before_band = control_points({header, product}) + described.before_band;
    } catch (const Failure& damaged) {
        described.damage = damaged.what();
    }
    if (!told.polarization.empty())
        described.band_name = element("Description", quo::quoted_xml(told.polarization));
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
    const Described described = describe(name + ".hdr");
    write_output(name + ".vrt", vrt_text(raster, std::filesystem::path{name}.filename().string(), described));
    if (described.damage.empty()) return kFine;
    complain(described.damage + "; the image has no control points");
    return kFindings;
}

}  // namespace

void add_vrt(Command& program) {
    auto [command, name] =
        add_verb(program, "vrt", "Writes RASTER.vrt beside a raster, which GDAL opens", write_vrt);
    command.needs("RASTER", name, "Raster with a side file RASTER.hdr");
}

}  // namespace tool
