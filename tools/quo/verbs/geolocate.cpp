// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <memory>
#include <optional>
#include <span>

#include "apart.h"
#include "commands.h"
#include "date.h"
#include "interrupt.h"
#include "output.h"
#include "progress.h"
#include "scene.h"
#include "table.h"

namespace tool {
namespace {

struct GeolocateOptions {
    std::string header, direction, input = "-", output = "-", look;
    std::optional<double> wavelength_m, resample_s, height_m;
    bool precise = false, waitbar = false, pixels = false, first = false, iso = false;
    int threads = 0;
};

constexpr std::size_t kInputs = 3;  // at most
constexpr std::size_t kOutputs = 11;

/** A column that a direction reads, and the values that make sense in it. */
struct Input {
    const char* name;
    double lowest = -std::numeric_limits<double>::max();
    double highest = std::numeric_limits<double>::max();
};

/** Points that are solved together: what was read of them, and what is found. */
struct Points {
    std::array<std::vector<double>, kInputs> in, position_m;  // the latter of ground points
    std::vector<double> doppler_hz, height_m;  // 0, or what the command line says, where the table has no column
    std::array<std::vector<double>, kOutputs> out;
    std::vector<double> second_line;  // of a point that two bursts see; else not-a-number
    std::vector<std::int32_t> status;

    [[nodiscard]] std::size_t count() const { return status.size(); }
    void resize(std::size_t count) {
        for (auto& values : in) values.resize(count);
        for (auto& values : position_m) values.resize(count);
        for (auto& values : out) values.resize(count);
        doppler_hz.resize(count);
        height_m.resize(count);
        second_line.assign(count, std::numeric_limits<double>::quiet_NaN());
        status.resize(count);
    }
};

/** One way through the geometry: what it must read, what it adds, and how. */
struct Direction {
    std::span<const Input> inputs;
    std::span<const char* const> outputs;
    /** `own` is as freshly loaded, whatever block was before. */
    void (*solve)(const Scene& scene, GeneralSAROrbit& own, Points& points);
    bool ground = false;      // leads to the ground
    std::size_t line_at = 0;  // where the line stands among the outputs; 0 where no pixels are told
};

constexpr Input kDoppler{"doppler_hz"}, kHeight{"height_m"};

void to_ground(const Scene& scene, GeneralSAROrbit& /*own*/, Points& points) {
    auto& [x, y, z, latitude, longitude, incidence, look, fm_rate, speed, unused_time, unused_range] = points.out;
    const auto& [time_s, range_s, unused] = points.in;
    const OrbitSamples samples{points.count(), time_s.data(), range_s.data(), points.doppler_hz.data(),
                               points.height_m.data()};
    OrbitGround ground{.latitude_deg = latitude.data(), .longitude_deg = longitude.data()};
    ground.x_m = x.data();
    ground.y_m = y.data();
    ground.z_m = z.data();
    ground.incidence_deg = incidence.data();
    ground.look_deg = look.data();
    ground.fm_rate_hz_s = fm_rate.data();
    ground.speed_m_s = speed.data();
    ground.status = points.status.data();
    require_solved(scene.orbit().sat2earth(samples, ground));
    for (std::size_t i = 0; i < points.count(); ++i)
        if (!std::isnan(time_s[i]) && !scene.covers(time_s[i])) points.status[i] = QUO_NOT_SEEN;
}

/** Of pixels, whose times take the places of lines and samples, and are told too. */
void pixels_to_ground(const Scene& scene, GeneralSAROrbit& own, Points& points) {
    double *const first = points.in[0].data(), *const second = points.in[1].data();
    require_solved(scene.grid().pixelTimes({points.count(), first, second}, {first, second}));
    points.out[9] = points.in[0];
    points.out[10] = points.in[1];
    to_ground(scene, own, points);
}

GeodeticPoint place_of(const Points& points, std::size_t i) {
    return {points.in[0][i], points.in[1][i], points.in[2][i]};
}

/** Finds the positions of ground points: once, since each takes a few sines and cosines. */
void find_positions(Points& points) {
    auto& [x, y, z] = points.position_m;
    for (std::size_t i = 0; i < points.count(); ++i) {
        const quo::Vec3 p = quo::from_geodetic(place_of(points, i));
        x[i] = p.x;
        y[i] = p.y;
        z[i] = p.z;
    }
}

/** Whether what a line leads to from a point lies below its horizon.
 *
 * The point is a multiple of its normal and, at right angles, at most a e^2 / 2 = 21.4 km of its meridian: that is
 * known without trigonometry, and only near the horizon not enough. */
bool is_below(const quo::Vec3& line, const quo::Vec3& point, const GeodeticPoint& place) {
    constexpr double kMostBeside_m = 21.5e3, kDeepest_m = -6e6;  // deeper, it may be a negative multiple
    if (place.height_m > kDeepest_m && dot(line, point) > kMostBeside_m * norm(line)) return false;
    return dot(line, quo::ellipsoid_normal(place)) < 0.0;
}

// The equations of range and Doppler know nothing of the Earth in between: a point near the antipode solves them
// too.
void refuse_hidden(GeneralSAROrbit& orbit, Points& points) {
    const auto& [x, y, z] = points.position_m;
    for (std::size_t i = 0; i < points.count(); ++i) {
        if (points.status[i] != QUO_OK) continue;
        const quo::Vec3 point{x[i], y[i], z[i]};
        double platform[3];
        const int status = orbit.SVGetPos(points.out[0][i], platform);
        const bool hidden = is_below(quo::load(platform) - point, point, place_of(points, i));
        points.status[i] = status != QUO_OK ? status : hidden ? QUO_NOT_SEEN : QUO_OK;
    }
}

void to_radar(const Scene& scene, GeneralSAROrbit& own, Points& points) {
    OrbitTargets targets{.count = points.count()};
    find_positions(points);
    targets.x_m = points.position_m[0].data();
    targets.y_m = points.position_m[1].data();
    targets.z_m = points.position_m[2].data();
    targets.doppler_hz = points.doppler_hz.data();
    require_solved(
        scene.orbit().earth2sat(targets, {points.out[0].data(), points.out[1].data(), points.status.data()}));
    refuse_hidden(own, points);
}

/** Finds the pixels of the times that were found; a point that no burst sees, or no ground range, is not seen by
 * the image. Others may lie beside it. */
void find_pixels(const Scene& scene, Points& points) {
    std::vector<std::int32_t> outside(points.count());
    const TimePixels pixels{points.out[2].data(), points.second_line.data(), points.out[3].data(), outside.data()};
    require_solved(scene.grid().timePixels({points.count(), points.out[0].data(), points.out[1].data()}, pixels));
    for (std::size_t i = 0; i < points.count(); ++i)
        if (points.status[i] == QUO_OK && outside[i] != QUO_OK) points.status[i] = QUO_NOT_SEEN;
}

void to_radar_precisely(const Scene& /*scene*/, GeneralSAROrbit& own, Points& points) {
    find_positions(points);
    const auto& [x, y, z] = points.position_m;
    for (std::size_t i = 0; i < points.count(); ++i) {
        double point[] = {x[i], y[i], z[i]};
        points.status[i] = own.earth2satPrecise(point, &points.out[0][i], &points.out[1][i], points.doppler_hz[i]);
    }
    refuse_hidden(own, points);
}

constexpr Input kSample[] = {{kAzimuthTime}, {"range_time_s"}};
constexpr Input kPixel[] = {{"line"}, {"sample"}};
constexpr Input kPoint[] = {{"latitude_deg", -90.0, 90.0}, {"longitude_deg", -360.0, 360.0}, kHeight};
constexpr const char* kGeometry[] = {"x_m",           "y_m",           "z_m",         "latitude_deg",
                                     "longitude_deg", "incidence_deg", "look_deg",    "fm_rate_hz_s",
                                     "speed_m_s",     kAzimuthTime,    "range_time_s"};
constexpr const char* kTimes[] = {kAzimuthTime, "range_time_s", "line", "sample"};

constexpr Direction kToGround{kSample, std::span{kGeometry}.first(9), to_ground, true};
constexpr Direction kPixelsToGround{kPixel, kGeometry, pixels_to_ground, true};
constexpr Direction kToRadar{kPoint, std::span{kTimes}.first(2), to_radar};
constexpr Direction kToRadarPrecisely{kPoint, std::span{kTimes}.first(2), to_radar_precisely};
constexpr Direction kToPixels{kPoint, kTimes, to_radar, false, 2};
constexpr Direction kToPixelsPrecisely{kPoint, kTimes, to_radar_precisely, false, 2};

void check_use(const GeolocateOptions& options) {
    const bool ground = options.direction == "ground";
    if (ground && options.precise) throw WrongUse("--precise belongs to --to radar");
    if (ground && options.pixels)
        throw WrongUse("--pixels belongs to --to radar; --to ground takes columns line and sample");
    if (options.first && !options.pixels) throw WrongUse("--first belongs to --pixels");
    if (ground && options.height_m && !std::isfinite(*options.height_m))
        throw WrongUse("--height " + exact(*options.height_m) + ": must be a finite number of metres");
    if (!ground && options.height_m) throw WrongUse("--height belongs to --to ground");
}

/** A table to the ground has times, or where it has none lines and samples. */
const Direction& direction_of(const GeolocateOptions& options, const Table& table) {
    if (options.direction == "ground") {
        const bool pixels = table.find("line") && table.find("sample");
        if (table.find(kAzimuthTime) && (table.find("range_time_s") || !pixels)) return kToGround;
        if (table.find("line")) return kPixelsToGround;
        throw Failure(table.place_of_names() +
                      ": neither columns azimuth_time_s and range_time_s nor line and sample");
    }
    if (options.pixels) return options.precise ? kToPixelsPrecisely : kToPixels;
    return options.precise ? kToRadarPrecisely : kToRadar;
}

/** Why a point may have no solution, and what to look at. */
std::string advice(const Direction& direction, const Scene& scene, int status) {
    switch (status) {
        case QUO_NOT_SEEN:
            return ": the state vectors reach from " + iso_or_number(scene.first_time()) + " to " +
                   iso_or_number(scene.last_time()) +
                   (direction.ground        ? ""
                    : direction.line_at > 0 ? ", and the Earth may hide the point, or no burst show it"
                                            : ", and the Earth may hide the point");
        case QUO_NUMERIC:
            return ": no ground is there at that Doppler; range_time_s is two-way, in seconds";
        case QUO_REFUSED:
            return direction.inputs.data() == kPixel ? ": the pixel is in no burst, or before the first range"
                                                     : ": no such range or height can be";
        default:
            return "";
    }
}

/** Where a direction finds its values in a row of the table. */
class Columns {
public:
    Columns(const Table& table, const GeolocateOptions& options, const Direction& direction)
        : in_all_{table.columns().size()}, inputs_{direction.inputs}, doppler_{table.find(kDoppler.name)} {
        for (const Input& input : direction.inputs) indices_.push_back(table.need(input.name));
        if (direction.ground) height_ = table.find(kHeight.name);
        if (height_ && options.height_m)
            throw Failure(table.place_of_names() + ": there is a column " + kHeight.name +
                          "; leave --height out, or rename the column");
        given_height_m_ = options.height_m.value_or(0.0);
    }
    bool has_doppler() const { return doppler_.has_value(); }
    std::size_t count() const { return in_all_; }

    /** Reads a row's values to place `i`, or tells what is wrong with them. */
    std::optional<std::string> read(const Row& row, Points& points, std::size_t i) const {
        if (auto defect = row.defect(in_all_)) return defect;
        for (std::size_t k = 0; k < indices_.size(); ++k)
            if (auto defect = read_one(row, inputs_[k], indices_[k], points.in[k][i])) return defect;
        points.doppler_hz[i] = 0.0;
        points.height_m[i] = given_height_m_;
        if (doppler_)
            if (auto defect = read_one(row, kDoppler, *doppler_, points.doppler_hz[i])) return defect;
        return height_ ? read_one(row, kHeight, *height_, points.height_m[i]) : std::nullopt;
    }

private:
    static std::optional<std::string> read_one(const Row& row, const Input& input, std::size_t index,
                                               double& value) {
        const std::string_view text = row.fields()[index];
        if (auto defect = read_value(text, input.name, value)) return defect;
        if (value >= input.lowest && value <= input.highest) return std::nullopt;
        return std::string{input.name} + " is \"" + std::string{text} + "\", outside " + fixed(input.lowest, 0) +
               " to " + fixed(input.highest, 0);
    }

    std::size_t in_all_;
    std::span<const Input> inputs_;
    std::vector<std::size_t> indices_;
    std::optional<std::size_t> doppler_, height_;
    double given_height_m_ = 0.0;
};

/** A name for a computed column that no column of the table bears yet. */
std::string free_name(const Table& table, std::string name) {
    const auto& taken = table.columns();
    while (std::find(taken.begin(), taken.end(), name) != taken.end()) name.insert(0, "computed_");
    return name;
}

std::string heading(const Table& table, const Direction& direction) {
    std::string line{table.row().line()};
    for (const char* output : direction.outputs) line += "," + free_name(table, output);
    return line + "," + free_name(table, "status") + "\n";
}

/** The row's own fields, as many as there are columns, so that the computed ones stand where they belong. */
void append_row(std::string& text, const Row& row, std::size_t columns) {
    if (!row.defect(columns)) {
        text += row.line();
        return;
    }
    for (std::size_t i = 0; i < columns; ++i) {
        if (i > 0) text += ',';
        if (row.well_quoted() && i < row.fields().size()) text += row.fields()[i];
    }
}

/** What became of some rows: their text, and why there is no solution for some of them. */
struct Solved {
    struct Complaint {
        std::int64_t line_number;
        std::string cause;
    };
    std::string text;
    std::vector<Complaint> complaints;
    std::int64_t rows = 0, bytes_read = 0;
};

/** Solves rows and writes them, with room of its own for their values. */
class RowSolver {
public:
    RowSolver(Scene& scene, const Columns& columns, const Direction& direction, const GeolocateOptions& options)
        : scene_{&scene}, columns_{&columns}, direction_{&direction}, first_only_{options.first} {
        for (std::size_t k = 0; k < direction.outputs.size(); ++k)
            if (options.iso && direction.outputs[k] == kAzimuthTime) iso_at_ = k;
        require_solved(scene.orbit().clone(loaded_.get()));
    }

    /** What it gives stands until the next call. */
    const Solved* operator()(const Rows& rows) {
        read(rows);
        require_solved(loaded_->clone(own_.get()));
        direction_->solve(*scene_, *own_, points_);
        if (direction_->line_at > 0) find_pixels(*scene_, points_);
        write(rows);
        solved_.rows = static_cast<std::int64_t>(points_.count());
        solved_.bytes_read = rows.bytes_read;
        return &solved_;
    }

private:
    void read(const Rows& rows) {
        points_.resize(rows.most());
        defects_.clear();
        std::size_t i = 0;
        rows.each([&](std::string_view line, std::int64_t number) {
            row_.take(line, number);
            defects_.push_back(columns_->read(row_, points_, i));
            if (defects_.back()) clear(i);
            ++i;
        });
        points_.resize(i);
    }
    /** A point that is none: it is solved along, and nobody asks. */
    void clear(std::size_t i) {
        for (auto& values : points_.in) values[i] = 0.0;
        points_.doppler_hz[i] = points_.height_m[i] = 0.0;
    }
    void write(const Rows& rows) {
        std::string& text = solved_.text;
        text.clear();
        solved_.complaints.clear();
        std::size_t i = 0;
        rows.each([&](std::string_view line, std::int64_t number) {
            auto& cause = defects_[i];
            const int status = cause ? QUO_REFUSED : points_.status[i];
            append_row(text, line, number, cause.has_value());
            if (!cause && status != 0)
                cause = "status " + status_text(status) + advice(*direction_, *scene_, status);
            append_values(i, status);
            if (status == 0 && !first_only_ && !std::isnan(points_.second_line[i])) {
                append_row(text, line, number, false);
                points_.out[direction_->line_at][i] = points_.second_line[i];
                append_values(i, status);
            }
            if (cause) solved_.complaints.push_back({number, std::move(*cause)});
            ++i;
        });
    }
    void append_values(std::size_t i, int status) {
        std::string& text = solved_.text;
        for (std::size_t k = 0; k < direction_->outputs.size(); ++k) {
            text += ',';
            if (status != 0) continue;
            if (k == iso_at_)
                text += iso_or_number(points_.out[k][i]);
            else
                append_exact(text, points_.out[k][i]);
        }
        text.append(",").append(std::to_string(status)).append("\n");
    }
    /** A row without a defect has as many fields as there are columns. */
    void append_row(std::string& text, std::string_view line, std::int64_t number, bool defect) {
        if (!defect) {
            text += line;
            return;
        }
        row_.take(line, number);
        tool::append_row(text, row_, columns_->count());
    }

    const Scene* scene_;
    const Columns* columns_;
    const Direction* direction_;
    bool first_only_;
    std::size_t iso_at_ = kOutputs;  // the output that is written as a date
    std::unique_ptr<GeneralSAROrbit> loaded_ = std::make_unique<GeneralSAROrbit>(),
                                     own_ = std::make_unique<GeneralSAROrbit>();
    Points points_;
    Row row_;
    std::vector<std::optional<std::string>> defects_;  // of each row
    Solved solved_;
};

int geolocate_table(Scene& scene, const GeolocateOptions& options) {
    constexpr std::size_t kLinesAtOnce = 4096;
    Table table{options.input};
    const Direction& direction = direction_of(options, table);
    const Columns columns{table, options, direction};
    if (direction.ground) scene.require_look_side();
    if (direction.ground || columns.has_doppler()) scene.require_wavelength();
    if (&direction == &kPixelsToGround || options.pixels) scene.take_grid();

    Output output{options.output};
    output.write(heading(table, direction));
    constexpr std::int64_t kShown = 10;  // messages about single rows; all of them are counted
    std::int64_t rows = 0, unsolved = 0;
    {
        Progress progress{options.waitbar ? "Geolocating" : nullptr};
        const auto hand_on = [&](const Solved* solved) {
            for (const auto& [line_number, cause] : solved->complaints) {
                if (++unsolved > kShown) continue;
                progress.wipe();
                complain(table.place(line_number) + ": " + cause);
            }
            output.write(solved->text);
            progress.show(solved->bytes_read, table.input().bytes_in_all(), rows += solved->rows);
        };
        blocks::in_order(
            options.threads, [&] { return table.next_rows(kLinesAtOnce); },
            [&] {
                return RowSolver{scene, columns, direction, options};
            },
            hand_on);
    }
    output.commit();
    if (unsolved == 0) return kFine;
    complain(table.input().name() + ": " + std::to_string(unsolved) + " of " + std::to_string(rows) +
             " rows without a solution; column status tells which");
    return kFindings;
}

// Five state vectors a minute apart leave a model that is decimetres off; nobody would see it in the numbers.
void warn_of_coarse_orbit(const Scene& scene, const GeneralSAROrbit& orbit) {
    constexpr double kTolerated = 1e-3;  // m
    const double error_m = orbit.orbitFitError();
    if (error_m > kTolerated)
        complain(scene.name() + ": the orbit model may be " + fixed(error_m, 3) +
                 " m off, its state vectors are " + exact(orbit.dtSV_s) + " s apart; --resample 10 helps");
}

int geolocate(const GeolocateOptions& options) {
    check_use(options);
    require_apart(header_files(options.header), {options.output});  // the table may be replaced by itself
    note_interrupts();
    Scene scene{options.header};
    if (options.wavelength_m) scene.use_wavelength(*options.wavelength_m);
    if (!options.look.empty()) scene.use_look_sign(options.look == "left" ? -1 : 1);
    if (options.resample_s) scene.resample(*options.resample_s);
    warn_of_coarse_orbit(scene, scene.orbit());
    return geolocate_table(scene, options);
}

}  // namespace

void add_geolocate(Command& program) {
    auto [command, options] = add_verb(
        program, "geolocate", "Brings image samples to the ground, or ground points to image samples", geolocate);
    command.details(
        "Reads and writes comma-separated values with a line of column names; "
        "columns that are not needed are passed\n"
        "through. A row without a solution gets a status other than 0 and empty values.\n"
        "  ground: reads azimuth_time_s, range_time_s and, if there, "
        "doppler_hz and height_m; adds x_m, y_m, z_m,\n"
        "          latitude_deg, longitude_deg, incidence_deg, look_deg, fm_rate_hz_s, speed_m_s, status\n"
        "          or without times line and sample; then it adds azimuth_time_s and range_time_s too\n"
        "  radar:  reads latitude_deg, longitude_deg, height_m and, if there, doppler_hz; adds azimuth_time_s,\n"
        "          range_time_s, with --pixels line and sample, status\n"
        "Lines and samples count from 0 at the centre of the first; a point that "
        "two bursts see gets a row for each.\n"
        "Azimuth times may be dates: \"04-JAN-2022 17:05:58.5\" or \"2022-01-04T17:05:58.5Z\".\n"
        "Points of --to ground lie on the WGS84 ellipsoid, unless a column "
        "height_m or --height gives their heights.\n"
        "A computed column whose name is taken gets the prefix computed_.\n");
    command.needs("HEADER", options.header, "Product header with the orbit");
    command.needs("--to", options.direction, "Which way", {.one_of = {"ground", "radar"}});
    command.takes("--input", options.input, "Table to read, - for standard input", {.shows_default = true});
    command.takes("--output", options.output, "Table to write, - for standard output", {.shows_default = true});
    command.flag("--precise", options.precise, "First guess on the polynomial through the whole orbit");
    command.flag("--pixels", options.pixels, "With --to radar: add line and sample");
    command.flag("--first", options.first, "Of a point that two bursts see, the earlier burst's line only");
    command.flag("--iso", options.iso, "Write azimuth times as ISO 8601 dates");
    command.takes("--wavelength", options.wavelength_m, "Wavelength in m, instead of the header's");
    command.takes("--look", options.look, "Look side, instead of the header's", {.one_of = {"right", "left"}});
    command.takes("--height", options.height_m, "Height of all ground points in m, instead of a column's");
    command.takes("--resample", options.resample_s, "State vectors at most so many seconds apart");
    add_block_options(command, options);
}

}  // namespace tool
