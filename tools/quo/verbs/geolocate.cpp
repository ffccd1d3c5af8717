#include <algorithm>
#include <array>
#include <cmath>
#include <limits>
#include <optional>
#include <span>

#include "apart.h"
#include "commands.h"
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
    bool precise = false, waitbar = false;
};

constexpr std::size_t kInputs = 3;  // at most
constexpr std::size_t kOutputs = 9;

/** A column that a direction reads, and the values that make sense in it. */
struct Input {
    const char* name;
    double lowest = -std::numeric_limits<double>::max();
    double highest = std::numeric_limits<double>::max();
};

/** What a row may say beside its place; 0, or what the command line says, where the table has no such column. */
struct Aside {
    double doppler_hz = 0.0;
    double height_m = 0.0;  // of the ground points that --to ground finds
};

/** One way through the geometry: what it must read, what it adds, and how. */
struct Direction {
    std::span<const Input> inputs;
    std::span<const char* const> outputs;
    int (*solve)(Scene& scene, const double* in, const Aside& aside, double* out);
};

constexpr Input kDoppler{"doppler_hz"}, kHeight{"height_m"};

int to_ground(Scene& scene, const double* in, const Aside& aside, double* out) {
    const double time_s = in[0];
    const double range_s = in[1];
    if (!scene.covers(time_s)) return QUO_NOT_SEEN;
    GrPtGeometry at{};
    const int status = scene.orbit().SVGetGeometry(time_s, range_s, aside.doppler_hz, aside.height_m, &at);
    const auto& [x, y, z] = at.point_m;
    const double values[] = {
        x, y, z, at.latitude_deg, at.longitude_deg, at.incidence_deg, at.look_deg, at.fm_rate_hz_s, at.speed_m_s};
    std::ranges::copy(values, out);
    return status;
}

using Inverse = int (GeneralSAROrbit::*)(const double*, double*, double*, double) noexcept;

// The equations of range and Doppler know nothing of the Earth in between: a point near the antipode solves them
// too.
template <Inverse solve>
int to_radar(Scene& scene, const double* in, const Aside& aside, double* out) {
    const GeodeticPoint ground{in[0], in[1], in[2]};
    double point[3], platform[3];
    quo::store(quo::from_geodetic(ground), point);
    int status = (scene.orbit().*solve)(point, out, out + 1, aside.doppler_hz);
    if (status == 0) status = scene.orbit().SVGetPos(out[0], platform);
    if (status != 0) return status;
    const quo::Vec3 line = quo::load(platform) - quo::load(point);
    return angle_deg(line, quo::ellipsoid_normal(ground)) > 90.0 ? QUO_NOT_SEEN : QUO_OK;
}

constexpr Input kSample[] = {{"azimuth_time_s"}, {"range_time_s"}};
constexpr Input kPoint[] = {{"latitude_deg", -90.0, 90.0}, {"longitude_deg", -360.0, 360.0}, kHeight};
constexpr const char* kGeometry[] = {"x_m",           "y_m",      "z_m",          "latitude_deg", "longitude_deg",
                                     "incidence_deg", "look_deg", "fm_rate_hz_s", "speed_m_s"};
constexpr const char* kTimes[] = {"azimuth_time_s", "range_time_s"};

constexpr Direction kToGround{kSample, kGeometry, to_ground};
constexpr Direction kToRadar{kPoint, kTimes, to_radar<&GeneralSAROrbit::earth2sat>};
constexpr Direction kToRadarPrecisely{kPoint, kTimes, to_radar<&GeneralSAROrbit::earth2satPrecise>};

const Direction& direction_of(const GeolocateOptions& options) {
    if (options.direction == "ground") {
        if (options.precise) throw WrongUse("--precise belongs to --to radar");
        if (options.height_m && !std::isfinite(*options.height_m))
            throw WrongUse("a height of " + exact(*options.height_m) + " m");
        return kToGround;
    }
    if (options.height_m) throw WrongUse("--height belongs to --to ground");
    return options.precise ? kToRadarPrecisely : kToRadar;
}

/** Where a direction finds its values in a row of the table. */
class Columns {
public:
    Columns(const Table& table, const GeolocateOptions& options, const Direction& direction)
        : doppler_{table.find(kDoppler.name)} {
        for (const Input& input : direction.inputs) indices_.push_back(table.need(input.name));
        if (&direction == &kToGround) height_ = table.find(kHeight.name);
        if (height_ && options.height_m)
            throw Failure(table.input().name() + ": there is a column " + kHeight.name + ", and --height");
        unless_told_.height_m = options.height_m.value_or(0.0);
    }
    bool has_doppler() const { return doppler_.has_value(); }

    /** The row's values, or what is wrong with them. */
    std::optional<std::string> read(const Table& table, const Direction& direction, double* in,
                                    Aside& aside) const {
        if (auto defect = table.defect()) return defect;
        for (std::size_t i = 0; i < indices_.size(); ++i)
            if (auto defect = read_one(table, direction.inputs[i], indices_[i], in[i])) return defect;
        aside = unless_told_;
        if (doppler_)
            if (auto defect = read_one(table, kDoppler, *doppler_, aside.doppler_hz)) return defect;
        return height_ ? read_one(table, kHeight, *height_, aside.height_m) : std::nullopt;
    }

private:
    static std::optional<std::string> read_one(const Table& table, const Input& input, std::size_t index,
                                               double& value) {
        const std::string_view text = table.fields()[index];
        const auto number = finite_number(text);
        const std::string what = std::string{input.name} + " is \"" + std::string{text} + "\"";
        if (!number) return what + ", not a number";
        if (*number < input.lowest || *number > input.highest)
            return what + ", outside " + fixed(input.lowest, 0) + " to " + fixed(input.highest, 0);
        value = *number;
        return std::nullopt;
    }

    std::vector<std::size_t> indices_;
    std::optional<std::size_t> doppler_, height_;
    Aside unless_told_;
};

/** A name for a computed column that no column of the table bears yet. */
std::string free_name(const Table& table, std::string name) {
    const auto& taken = table.columns();
    while (std::find(taken.begin(), taken.end(), name) != taken.end()) name.insert(0, "computed_");
    return name;
}

std::string heading(const Table& table, const Direction& direction) {
    std::string line{table.line()};
    for (const char* output : direction.outputs) line += "," + free_name(table, output);
    return line + "," + free_name(table, "status") + "\n";
}

/** The row's own fields, as many as there are columns, so that the computed ones stand where they belong. */
void append_row(std::string& line, const Table& table) {
    if (!table.defect()) {
        line += table.line();
        return;
    }
    for (std::size_t i = 0; i < table.columns().size(); ++i) {
        if (i > 0) line += ',';
        if (table.well_quoted() && i < table.fields().size()) line += table.fields()[i];
    }
}

/** Solves one row and writes it. Returns nothing, or why there is no solution. */
std::optional<std::string> geolocate_row(Scene& scene, const Table& table, const Direction& direction,
                                         const Columns& columns, std::string& line) {
    std::array<double, kInputs> in{};
    std::array<double, kOutputs> out{};
    Aside aside;
    auto cause = columns.read(table, direction, in.data(), aside);
    const int status = cause ? QUO_REFUSED : direction.solve(scene, in.data(), aside, out.data());
    if (!cause && status != 0) cause = "status " + status_text(status);

    append_row(line, table);
    for (std::size_t i = 0; i < direction.outputs.size(); ++i) {
        line += ',';
        if (status == 0) append_exact(line, out[i]);
    }
    line += "," + std::to_string(status) + "\n";
    return cause;
}

int geolocate_table(Scene& scene, const GeolocateOptions& options, const Direction& direction) {
    Table table{options.input};
    const Columns columns{table, options, direction};
    if (&direction == &kToGround) scene.require_look_side();
    if (&direction == &kToGround || columns.has_doppler()) scene.require_wavelength();

    Output output{options.output};
    output.write(heading(table, direction));
    constexpr std::int64_t kShown = 10;  // messages about single rows; all of them are counted
    std::int64_t rows = 0, unsolved = 0;
    {
        Progress progress{options.waitbar ? "Geolocating" : nullptr};
        std::string line;
        while (table.next()) {
            line.clear();
            const auto cause = geolocate_row(scene, table, direction, columns, line);
            if (cause && ++unsolved <= kShown) {
                progress.wipe();
                complain(table.place() + ": " + *cause);
            }
            output.write(line);
            progress.show(table.input().bytes_read(), table.input().bytes_in_all(), ++rows);
        }
    }
    output.commit();
    if (unsolved == 0) return kFine;
    complain(table.input().name() + ": " + std::to_string(unsolved) + " of " + std::to_string(rows) +
             " rows without a solution");
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
    const Direction& direction = direction_of(options);
    require_apart(header_files(options.header), {options.output});  // the table may be replaced by itself
    note_interrupts();
    Scene scene{options.header};
    if (options.wavelength_m) scene.use_wavelength(*options.wavelength_m);
    if (!options.look.empty()) scene.use_look_sign(options.look == "left" ? -1 : 1);
    if (options.resample_s) scene.resample(*options.resample_s);
    warn_of_coarse_orbit(scene, scene.orbit());
    return geolocate_table(scene, options, direction);
}

constexpr const char* kAbout = "Brings image samples to the ground, or ground points to image samples";
constexpr const char* kDetails =
    "Reads and writes comma-separated values with a line of column names; columns that are not needed are passed\n"
    "through. A row without a solution gets a status other than 0 and empty values.\n"
    "  ground: reads azimuth_time_s, range_time_s and, if there, doppler_hz and height_m; adds x_m, y_m, z_m,\n"
    "          latitude_deg, longitude_deg, incidence_deg, look_deg, fm_rate_hz_s, speed_m_s, status\n"
    "  radar:  reads latitude_deg, longitude_deg, height_m and, if there, doppler_hz; adds azimuth_time_s,\n"
    "          range_time_s, status\n"
    "Points of --to ground lie on the WGS84 ellipsoid, unless a column height_m or --height gives their heights.\n"
    "A computed column whose name is taken gets the prefix computed_.\n";

}  // namespace

void add_geolocate(CLI::App& app, Job& job) {
    const auto [command, options] = add_verb(app, job, "geolocate", kAbout, geolocate);
    command->footer(kDetails);
    command->add_option("HEADER", options.header, "Product header with the orbit")->required();
    command->add_option("--to", options.direction, "Which way")
        ->required()
        ->check(CLI::IsMember({"ground", "radar"}));
    command->add_option("--input", options.input, "Table to read, - for standard input")->capture_default_str();
    command->add_option("--output", options.output, "Table to write, - for standard output")
        ->capture_default_str();
    command->add_flag("--precise", options.precise, "First guess on the polynomial through the whole orbit");
    command->add_option("--wavelength", options.wavelength_m, "Wavelength in m, instead of the header's");
    command->add_option("--look", options.look, "Look side, instead of the header's")
        ->check(CLI::IsMember({"right", "left"}));
    command->add_option("--height", options.height_m, "Height of all ground points in m, instead of a column's");
    command->add_option("--resample", options.resample_s, "State vectors at most so many seconds apart");
    add_waitbar_option(*command, options.waitbar);
}

}  // namespace tool
