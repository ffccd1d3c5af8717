// SPDX-License-Identifier: Apache-2.0
#include <unistd.h>

#include <algorithm>
#include <array>
#include <memory>
#include <nlohmann/json.hpp>
#include <optional>
#include <span>

#include "commands.h"
#include "sarutillib/ground/residuals.h"
#include "scene.h"
#include "table.h"

namespace tool {
namespace {

struct TiepointsOptions {
    std::vector<std::string> headers;
    std::string points, incidence;
    bool json = false;
    int threads = 0;
};

/** A ground point whose place in the image is known from elsewhere. */
struct TiePoint {
    std::int64_t line_number;  // of the table
    double time_s, range_s;
    GeodeticPoint ground;
    double incidence_deg;
};

/** What an incidence angle is measured against. The missions differ, by up to 0.04 degrees seen from orbit. */
enum class Vertical { kEllipsoidNormal, kGeocentricRadius };

constexpr std::size_t kQuantities = 4;
struct Quantity {
    const char *heading, *key;
};
constexpr std::array<Quantity, kQuantities> kQuantity{{{"azimuth time, us", "azimuth_time_us"},
                                                       {"slant range, m", "slant_range_m"},
                                                       {"ground position, m", "ground_position_m"},
                                                       {"incidence, deg", "incidence_deg"}}};

/** How well a scene's geometry meets its tie points. */
struct Agreement {
    std::string scene;
    Vertical vertical = Vertical::kEllipsoidNormal;
    std::int64_t points = 0, unsolved = 0;
    std::array<quo::Residuals, kQuantities> residuals;  // in the order of kQuantity

    std::int64_t solved() const { return points - unsolved; }
};

double incidence_deg(const quo::Vec3& platform, const TiePoint& tie, const quo::Vec3& point, Vertical vertical) {
    return angle_deg(platform - point,
                     vertical == Vertical::kGeocentricRadius ? point : quo::ellipsoid_normal(tie.ground));
}

/** How far the geometry is off one tie point, in the order of kQuantity. */
struct Compared {
    const TiePoint* tie;
    int status;
    std::array<double, kQuantities> off;
};

Compared compare(GeneralSAROrbit& orbit, const TiePoint& tie, Vertical vertical) {
    double truth[3], point[3], platform[3];
    quo::store(quo::from_geodetic(tie.ground), truth);
    double time_s = 0.0;
    double range_s = 0.0;
    int status = orbit.earth2sat(truth, &time_s, &range_s);
    if (status == 0) status = orbit.sat2earth(tie.time_s, tie.range_s, 0.0, tie.ground.height_m, point);
    if (status == 0) status = orbit.SVGetPos(tie.time_s, platform);
    if (status != 0) return {&tie, status, {}};

    const quo::Vec3 found = quo::load(point);
    const double incidence = incidence_deg(quo::load(platform), tie, found, vertical);
    return {&tie,
            0,
            {(time_s - tie.time_s) * 1e6, (range_s - tie.range_s) * 0.5 * quo::kLightSpeed,
             norm(found - quo::load(truth)), incidence - tie.incidence_deg}};
}

/** The tie point of a row; throws Failure where a number is missing, since a truth with holes proves nothing. */
TiePoint tie_point(const Table& table, std::span<const std::size_t> columns) {
    const std::vector<double> v = table.numbers(columns);
    return {table.input().line_number(), v[0], v[1], {v[2], v[3], v[4]}, v[5]};
}

Vertical vertical_of(const Table& table, const std::string& option) {
    const auto says = [&](const char* text) {
        const auto& comments = table.comments();
        return std::find(comments.begin(), comments.end(), text) != comments.end();
    };
    const bool geocentric = option.empty() ? says("incidence: geocentric radius") : option == "geocentric";
    return geocentric ? Vertical::kGeocentricRadius : Vertical::kEllipsoidNormal;
}

/** The tie points that stand beside a header: scene_tie_points.csv beside scene.xml. */
std::string name_beside(const std::string& header) {
    const std::size_t dot = header.rfind('.');
    const std::size_t slash = header.rfind('/');
    const bool extension = dot != std::string::npos && (slash == std::string::npos || dot > slash);
    return header.substr(0, extension ? dot : header.size()) + "_tie_points.csv";
}

std::string scene_name(const std::string& header) {
    const std::string file = header.substr(header.rfind('/') + 1);
    return file.substr(0, file.rfind('.'));
}

/** Compares block by block, each with an orbit as freshly read, so that nothing hangs on the threads. */
template <typename Complain>
void compare_all(Scene& scene, std::span<const TiePoint> ties, int threads, Agreement& agreement,
                 Complain complain_of) {
    constexpr std::size_t kAtOnce = 1024;
    const auto next = [&]() -> std::optional<std::span<const TiePoint>> {
        if (ties.empty()) return std::nullopt;
        const auto block = ties.first(std::min(kAtOnce, ties.size()));
        ties = ties.subspan(block.size());
        return block;
    };
    const auto make_worker = [&] {
        auto loaded = std::make_unique<GeneralSAROrbit>();
        require_solved(scene.orbit().clone(loaded.get()));
        return [&, own = std::move(loaded)](std::span<const TiePoint> block) {
            GeneralSAROrbit orbit;
            require_solved(own->clone(&orbit));
            std::vector<Compared> all;
            for (const TiePoint& tie : block) all.push_back(compare(orbit, tie, agreement.vertical));
            return all;
        };
    };
    blocks::in_order(threads, next, make_worker, [&](const std::vector<Compared>& all) {
        for (const Compared& compared : all) {
            if (compared.status != 0) {
                ++agreement.unsolved;
                complain_of(compared);
                continue;
            }
            for (std::size_t i = 0; i < kQuantities; ++i) agreement.residuals[i].add(compared.off[i]);
        }
    });
}

std::string points_of(const std::string& header, const TiepointsOptions& options) {
    if (!options.points.empty()) return options.points;
    std::string name = name_beside(header);
    if (access(name.c_str(), F_OK) != 0)
        throw Failure(name + ": " + system_cause() + " (--points names another table)");
    return name;
}

Agreement check_scene(const std::string& header, const TiepointsOptions& options) {
    Scene scene{header};
    scene.require_look_side();
    scene.require_wavelength();
    Table table{points_of(header, options)};
    const std::size_t columns[] = {table.need(kAzimuthTime),   table.need("range_time_s"),
                                   table.need("latitude_deg"), table.need("longitude_deg"),
                                   table.need("height_m"),     table.need("incidence_deg")};
    Agreement agreement{
        .scene = scene_name(header), .vertical = vertical_of(table, options.incidence), .residuals = {}};
    std::vector<TiePoint> ties;
    while (table.next()) ties.push_back(tie_point(table, columns));
    agreement.points = static_cast<std::int64_t>(ties.size());
    compare_all(scene, ties, options.threads, agreement, [&](const Compared& compared) {
        complain(table.place(compared.tie->line_number) + ": status " + status_text(compared.status));
    });
    return agreement;
}

std::string padded(const std::string& text, std::size_t width) {
    return text.size() < width ? std::string(width - text.size(), ' ') + text : text;
}

constexpr std::size_t kNumberWidth = 11;

std::string as_row(const Agreement& agreement, std::size_t name_width) {
    const std::string name = shown(agreement.scene);
    std::string row = name + std::string(name_width - name.size(), ' ') +
                      padded(std::to_string(agreement.points), 8) + padded(std::to_string(agreement.solved()), 8);
    for (const quo::Residuals& residual : agreement.residuals)
        for (const double value : {residual.largest(), residual.rms()})
            row += padded(agreement.solved() > 0 ? rough(value) : "-", kNumberWidth);
    return row + "\n";
}

std::string as_text(const std::vector<Agreement>& list) {
    std::size_t name_width = 5;
    for (const Agreement& agreement : list) name_width = std::max(name_width, shown(agreement.scene).size());
    std::string first(name_width + 16, ' ');
    std::string second = "scene" + std::string(name_width - 5, ' ') + "  points  solved";
    for (const Quantity& quantity : kQuantity) {
        first += padded(quantity.heading, 2 * kNumberWidth);
        second += padded("largest", kNumberWidth) + padded("rms", kNumberWidth);
    }
    std::string text = first + "\n" + second + "\n";
    for (const Agreement& agreement : list) text += as_row(agreement, name_width);
    return text;
}

nlohmann::ordered_json as_json(const std::vector<Agreement>& list) {
    nlohmann::ordered_json json = nlohmann::ordered_json::array();
    for (const Agreement& agreement : list) {
        const bool geocentric = agreement.vertical == Vertical::kGeocentricRadius;
        nlohmann::ordered_json entry{{"scene", agreement.scene},
                                     {"points", agreement.points},
                                     {"solved", agreement.solved()},
                                     {"without_solution", agreement.unsolved},
                                     {"incidence_against", geocentric ? "geocentric radius" : "ellipsoid normal"}};
        for (std::size_t i = 0; i < kQuantities; ++i) {
            auto& quantity = entry[kQuantity[i].key] = {{"largest", nullptr}, {"rms", nullptr}};
            if (agreement.solved() == 0) continue;  // a residual of no point is none, not 0
            quantity["largest"] = agreement.residuals[i].largest();
            quantity["rms"] = agreement.residuals[i].rms();
        }
        json.push_back(entry);
    }
    return json;
}

int check_tiepoints(const TiepointsOptions& options) {
    if (!options.points.empty() && options.headers.size() > 1)
        throw WrongUse("--points belongs to a single header");
    std::vector<Agreement> list;
    for (const std::string& header : options.headers) list.push_back(check_scene(header, options));
    options.json ? print_json(as_json(list)) : print(as_text(list));
    const bool all_solved =
        std::all_of(list.begin(), list.end(), [](const Agreement& a) { return a.unsolved == 0; });
    return all_solved ? kFine : kFindings;
}

}  // namespace

void add_tiepoints(Command& program) {
    auto [command, options] = add_verb(
        program, "tiepoints", "Compares a header's geometry with points known from elsewhere", check_tiepoints);
    command.details(
        "Tie points are ground points whose azimuth time and range time are "
        "known. Azimuth time and slant range are\n"
        "found from the ground point, ground position and incidence angle from "
        "the times and the point's height.\n"
        "Reads azimuth_time_s, range_time_s, latitude_deg, longitude_deg, height_m and incidence_deg from\n"
        "SCENE_tie_points.csv beside SCENE.xml. Azimuth times may be dates.\n");
    command.needs("HEADER", options.headers, "Product headers");
    command.takes("--points", options.points, "Tie points of the one header given");
    command.takes(
        "--incidence", options.incidence,
        "What the incidence is measured against; else as the comment \"incidence: geocentric radius\" or "
        "\"incidence: ellipsoid normal\" says",
        {.one_of = {"normal", "geocentric"}});
    command.flag("--json", options.json, "Print JSON");
    command.threads(options.threads);
}

}  // namespace tool
