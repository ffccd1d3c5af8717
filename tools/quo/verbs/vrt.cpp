// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <array>
#include <cmath>
#include <filesystem>
#include <limits>
#include <numbers>
#include <numeric>
#include <optional>
#include <utility>
#include <vector>

#include "apart.h"
#include "commands.h"
#include "output.h"
#include "pixels.h"
#include "product.h"
#include "quo_base/MatrixAlgebraANSI.h"
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

// --- The lines that are shown -----------------------------------------------------------------------------------

/** `count` rows of the raster from `row` on, which are shown from line `line` on. */
struct Part {
    std::int32_t row, line, count;
};

/** An image whose lines are one step apart: the raster's, of which the rows that two bursts have of the same
 * ground are shown once. */
struct Shown {
    std::int32_t lines = 0;
    std::vector<Part> parts;  // of the rows of two parts at one line the later part's are shown
    double off_lines = 0.0;   // how far rows are off their lines, at most
};

/** The rows of every burst, their lines not known yet, and the time of the first. */
std::vector<std::pair<Part, double>> burst_rows(const Pixels& pixels) {
    const ImageGrid_Obj& grid = pixels.grid();
    std::vector<std::pair<Part, double>> bursts;
    for (std::size_t burst = 0; burst < grid.BurstStart_s.size(); ++burst) {
        const double before = static_cast<double>(burst) * grid.LinesPerBurst - grid.FirstLine;
        const double first = std::max(0.0, std::ceil(before - 0.5)),
                     next = std::min<double>(pixels.lines(), std::ceil(before + grid.LinesPerBurst - 0.5));
        if (!(first < next)) continue;
        bursts.push_back({{static_cast<std::int32_t>(first), 0, static_cast<std::int32_t>(next - first)},
                          grid.BurstStart_s[burst] + (first - before) * grid.LineStep_s});
    }
    return bursts;
}

/** Leaves a part the rows behind the middle of what it has in common with the part before it. */
void trim(const Part& before, Part& part) {
    const std::int32_t end = before.line + before.count;
    if (part.line <= before.line || part.line >= end) return;
    const std::int32_t dropped = std::min((end - part.line) / 2, part.count);
    part = {part.row + dropped, part.line + dropped, part.count - dropped};
}

/** What is shown of a raster, whose pixels are the shown image's from then on. */
Shown show(const std::string& header, Pixels& pixels) {
    Shown shown;
    shown.lines = pixels.lines();
    const auto bursts = burst_rows(pixels);
    if (bursts.empty()) {
        shown.parts = {{0, 0, shown.lines}};
        return shown;
    }
    const double step_s = pixels.grid().LineStep_s,
                 first_s = std::ranges::min_element(bursts, {}, &std::pair<Part, double>::second)->second;
    shown.lines = 0;
    for (const auto& [rows, start_s] : bursts) {
        const double line = (start_s - first_s) / step_s;
        if (!(line < 2.0 * pixels.lines())) throw Failure(header + ": its bursts do not follow each other");
        Part part = rows;
        part.line = static_cast<std::int32_t>(std::lround(line));
        shown.off_lines = std::max(shown.off_lines, std::abs(line - part.line));
        shown.lines = std::max(shown.lines, part.line + part.count);
        if (!shown.parts.empty()) trim(shown.parts.back(), part);
        if (part.count > 0) shown.parts.push_back(part);
    }
    pixels.drop_bursts(first_s);
    return shown;
}

// --- Ground control points --------------------------------------------------------------------------------------

/** A place in the image and on the ground; longitudes are continuous over the image. */
struct Control {
    double line, sample, latitude_deg, longitude_deg;
};

/** The thin plate spline from ground to image that GDAL lays through control points: in degrees, its kernel
 * r^2 log r^2. J. Duchon, "Splines minimizing rotation-invariant semi-norms in Sobolev spaces", 1977. */
class Spline {
public:
    explicit Spline(const std::vector<Control>& points) : points_{points} {
        const std::size_t n = points.size(), all = n + kPlane;
        std::vector<double> system(all * all), inverse(all * all);
        for (std::size_t i = 0; i < n; ++i) {
            const std::vector<double> row = terms(points[i]);
            for (std::size_t j = 0; j < all; ++j) system[i * all + j] = row[j];
            for (std::size_t j = n; j < all; ++j) system[j * all + i] = row[j];
        }
        if (MatInv(system.data(), inverse.data(), static_cast<int>(all)) != QUO_OK) return;
        for (std::size_t i = 0; i < all; ++i) {
            weights_.emplace_back(0.0, 0.0);
            for (std::size_t j = 0; j < n; ++j) {
                weights_[i].first += inverse[i * all + j] * points[j].line;
                weights_[i].second += inverse[i * all + j] * points[j].sample;
            }
        }
    }
    /** How far it puts a place of the ground off its pixel, in pixels. Infinite of points that make no spline. */
    [[nodiscard]] double off(const Control& place) const {
        if (weights_.empty()) return std::numeric_limits<double>::infinity();
        double line = -place.line, sample = -place.sample;
        const std::vector<double> row = terms(place);
        for (std::size_t i = 0; i < row.size(); ++i) {
            line += row[i] * weights_[i].first;
            sample += row[i] * weights_[i].second;
        }
        return std::hypot(line, sample);
    }

private:
    static constexpr std::size_t kPlane = 3;

    [[nodiscard]] std::vector<double> terms(const Control& at) const {
        const Control& middle = points_[points_.size() / 2];
        std::vector<double> row;
        for (const Control& point : points_) {
            const double north = at.latitude_deg - point.latitude_deg,
                         east = at.longitude_deg - point.longitude_deg, square = north * north + east * east;
            row.push_back(square > 0.0 ? square * std::log(square) : 0.0);
        }
        row.insert(row.end(),
                   {1.0, at.latitude_deg - middle.latitude_deg, at.longitude_deg - middle.longitude_deg});
        return row;
    }

    const std::vector<Control>& points_;
    std::vector<std::pair<double, double>> weights_;  // of line and sample
};

/** The lines at which the ground makes a jump, in their order: where the polynomial to slant range changes. */
std::vector<double> jumps(const ImageGrid_Obj& grid, std::int32_t shown) {
    std::vector<double> lines;
    for (std::size_t i = 1; i < grid.GroundTime_s.size(); ++i) {
        const double time_s = 0.5 * (grid.GroundTime_s[i - 1] + grid.GroundTime_s[i]) - grid.FirstLine_s;
        const double line = std::ceil(time_s / grid.LineStep_s - grid.FirstLine) - 0.5;
        if (line > 0.0 && line < shown - 1.0) lines.push_back(line);
    }
    return lines;
}

/** `count` places between two ends, denser towards them: a spline is least bound there. */
void append_between(double first, double last, int count, std::vector<double>& list) {
    for (int i = 1; i <= count; ++i)
        list.push_back(std::midpoint(first, last) -
                       0.5 * (last - first) * std::cos(std::numbers::pi * i / (count + 1)));
}

/** Control points on a grid of lines by columns. */
class Controls {
public:
    /** On the image's edges, and in so many lines of each stretch between two jumps and so many columns. At the
     * jumps themselves there are none: a spline would leave its way for two that contradict each other. Of an
     * image that the orbit does not see everywhere there are none at all. */
    Controls(const Pixels& pixels, const Shown& shown, int lines, int columns)
        : pixels_{pixels}, jumps_{jumps(pixels.grid(), shown.lines)} {
        double first = -0.5;
        lines_.push_back(first);
        for (const double jump : jumps_) append_between(std::exchange(first, jump), jump, lines, lines_);
        append_between(first, shown.lines - 0.5, lines, lines_);
        lines_.push_back(shown.lines - 0.5);
        samples_.push_back(-0.5);
        append_between(-0.5, pixels.samples() - 0.5, columns, samples_);
        samples_.push_back(pixels.samples() - 0.5);
        for (const double line : lines_)
            for (const double sample : samples_) {
                const auto control = at(line, sample);
                if (control) points_.push_back(*control);
            }
        if (points_.size() != lines_.size() * samples_.size()) points_.clear();
    }
    [[nodiscard]] const std::vector<Control>& points() const { return points_; }

    /** The largest distances, in pixels, of where GDAL puts what lies halfway between neighbours from its place.
     */
    struct Error {
        double along_lines = 0.0, along_samples = 0.0, diagonal = 0.0, at_jumps = 0.0;
        [[nodiscard]] double between() const { return std::max({along_lines, along_samples, diagonal}); }
    };
    [[nodiscard]] Error error() const {
        const Spline spline{points_};
        const auto raise = [&](double& most, double line, double sample) {
            if (const auto place = at(line, sample)) most = std::max(most, spline.off(*place));
        };
        Error error;
        for (std::size_t i = 0; i + 1 < lines_.size(); ++i)
            for (std::size_t j = 0; j + 1 < samples_.size(); ++j) {
                const double line = 0.5 * (lines_[i] + lines_[i + 1]),
                             sample = 0.5 * (samples_[j] + samples_[j + 1]);
                raise(error.along_samples, lines_[i], sample);
                const auto jump = std::ranges::lower_bound(jumps_, lines_[i]);
                if (jump != jumps_.end() && *jump < lines_[i + 1]) {
                    for (const double side : {*jump - 0.5, *jump + 0.5})
                        raise(error.at_jumps, side, samples_[j + 1]);
                    continue;
                }
                raise(error.along_lines, line, samples_[j]);
                raise(error.diagonal, line, sample);
            }
        return error;
    }

private:
    [[nodiscard]] std::optional<Control> at(double line, double sample) const {
        const auto seen = pixels_.geometry(line, sample);
        if (!seen) return std::nullopt;
        const double near_deg = points_.empty() ? 0.0 : points_.front().longitude_deg;
        const double turns = std::round((near_deg - seen->longitude_deg) / 360.0);
        return Control{line, sample, seen->latitude_deg, seen->longitude_deg + 360.0 * turns};
    }

    const Pixels& pixels_;
    const std::vector<double> jumps_;
    std::vector<double> lines_, samples_;
    std::vector<Control> points_;
};

/** As few control points as keep half a pixel; `lines` of each stretch and `columns`, and the edges. */
std::string control_points(const Pixels& pixels, const Shown& shown, int lines, int columns) {
    constexpr std::size_t kMost = 1024;
    constexpr double kTolerated = 0.4;  // pixels
    const Controls controls{pixels, shown, lines, columns};
    if (controls.points().empty()) return {};
    const Controls::Error error = controls.error();
    if (error.between() > kTolerated && 2 * controls.points().size() <= kMost)
        return error.along_lines > error.along_samples ? control_points(pixels, shown, 2 * lines, columns)
                                                       : control_points(pixels, shown, lines, 2 * columns);
    std::string text = "  <!-- Points on the ellipsoid, height 0; gdalwarp -tps puts the rest up to " +
                       fixed(error.between() + shown.off_lines, 2) + " pixels off" +
                       (error.at_jumps > 0.0 ? ", up to " + fixed(error.at_jumps, 2) +
                                                   " where the conversion to ground range changes"
                                             : std::string{}) +
                       ". -->\n  <GCPList Projection=\"EPSG:4979\" dataAxisToSRSAxisMapping=\"2,1,3\">\n";
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
    std::vector<Part> parts;  // more than one of a raster of bursts
    std::int32_t lines = 0;   // of the parts
    std::string damage;  // what keeps the raster from having control points, though the header should place it
};
Described describe(const std::string& header) {
    GeneralSAR product;
    if (!read_objects(header, product)) return {};
    const Told told{product};
    Described described;
    described.before_band = metadata(told);
    try {
        if (Pixels::known(header, product)) {
            Pixels pixels{header, product};
            Shown shown = show(header, pixels);
            described.before_band = control_points(pixels, shown, 1, 3) + described.before_band;
            described.parts = std::move(shown.parts);
            described.lines = shown.lines;
        }
    } catch (const Failure& damaged) {
        described.damage = damaged.what();
    }
    if (!told.polarization.empty())
        described.band_name = element("Description", quo::quoted_xml(told.polarization));
    return described;
}

/** A data set of one band. */
std::string vrt_text(const DataFile& raster, std::int64_t lines, const Described& described, const char* kind,
                     const std::string& sources) {
    std::string text = "<VRTDataset rasterXSize=\"" + std::to_string(raster.NrOfPixelsPerLine) +
                       "\" rasterYSize=\"" + std::to_string(lines) + "\">\n" + described.before_band +
                       "  <VRTRasterBand dataType=\"" +
                       std::string{kGdalTypes[static_cast<std::size_t>(raster.CellType)]} + "\" band=\"1\"" +
                       kind + ">\n" + described.band_name;
    if (raster.CellType == INT8) {
        text += "    <Metadata domain=\"IMAGE_STRUCTURE\"><MDI key=\"PIXELTYPE\">SIGNEDBYTE</MDI></Metadata>\n";
    }
    return text + sources + "  </VRTRasterBand>\n</VRTDataset>\n";
}

std::string source_file(const std::string& name) {
    return "    <SourceFilename relativeToVRT=\"1\">" + quo::quoted_xml(name) + "</SourceFilename>\n";
}

/** The raster as it stands in its file. */
std::string raw_vrt(const DataFile& raster, const std::string& name, const Described& described) {
    const std::int64_t size = raster.element_sizeof();
    const std::int64_t line = size * raster.NrOfPixelsPerLine + raster.RowPrefix;
    return vrt_text(
        raster, raster.NrOfLinesPerImage, described, " subClass=\"VRTRawRasterBand\"",
        source_file(name) + element("ImageOffset", std::to_string(raster.HeaderOffset + raster.RowPrefix)) +
            element("PixelOffset", std::to_string(size)) + element("LineOffset", std::to_string(line)) +
            element("ByteOrder", raster.ByteOrder == 1 ? "MSB" : "LSB"));
}

/** Parts of the raster one below the other, out of the data set that shows it as it stands. */
std::string mosaic_vrt(const DataFile& raster, const std::string& rows, const Described& described) {
    const auto rectangle = [&](const char* name, std::int32_t line, std::int32_t count) {
        return "      <" + std::string{name} + " xOff=\"0\" yOff=\"" + std::to_string(line) + "\" xSize=\"" +
               std::to_string(raster.NrOfPixelsPerLine) + "\" ySize=\"" + std::to_string(count) + "\" />\n";
    };
    std::string sources;
    for (const auto& [row, line, count] : described.parts)
        sources += "    <SimpleSource>\n  " + source_file(rows) + "      <SourceBand>1</SourceBand>\n" +
                   rectangle("SrcRect", row, count) + rectangle("DstRect", line, count) + "    </SimpleSource>\n";
    return vrt_text(raster, described.lines, described, "", sources);
}

int write_vrt(const std::string& name) {
    DataFile raster;
    read_description(name, raster);
    if (raster.CellType == INT8_COMPLEX) throw Failure(name + ": GDAL has no type for INT8_COMPLEX");
    const Described described = describe(name + ".hdr");
    const std::string file = std::filesystem::path{name}.filename().string();
    if (described.parts.size() > 1) {
        require_apart(raster_files(name), {name + ".vrt", name + ".rows.vrt"});
        write_output(name + ".rows.vrt", raw_vrt(raster, file, {}));
        write_output(name + ".vrt", mosaic_vrt(raster, file + ".rows.vrt", described));
    } else {
        require_apart(raster_files(name), {name + ".vrt"});
        write_output(name + ".vrt", raw_vrt(raster, file, described));
        std::error_code ignored;
        std::filesystem::remove(name + ".rows.vrt",
                                ignored);  // of an older raster of bursts: nothing leads there now
    }
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
