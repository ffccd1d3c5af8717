// SPDX-License-Identifier: Apache-2.0
#include "view.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <numbers>
#include <utility>
#include <vector>

#include "quo_base/geometry.h"

namespace tool {
namespace {

/** From one place to another, in degrees of latitude. */
Bearing way(const GrPtGeometry& from, const GrPtGeometry& to) {
    const double middle_deg = 0.5 * (from.latitude_deg + to.latitude_deg);
    return {std::remainder(to.longitude_deg - from.longitude_deg, 360.0) *
                std::cos(middle_deg * std::numbers::pi / 180.0),
            to.latitude_deg - from.latitude_deg};
}

Bearing direction(const Bearing& a, const Bearing& b) {
    const double east = a.east + b.east, north = a.north + b.north, length = std::hypot(east, north);
    return {east / length, north / length};
}

/** Column and row of a picture's pixel, and where it lies; longitudes continue the first one's. */
struct Control {
    double column, row, longitude_deg, latitude_deg;
    double point_m[3];
};

std::vector<Control> controls_of(const View& view, const Pixels& pixels) {
    constexpr int kSteps = 16;
    std::vector<Control> controls;
    for (int i = 0; i <= kSteps; ++i)
        for (int j = 0; j <= kSteps; ++j) {
            const double row = static_cast<double>(view.height() - 1) * i / kSteps;
            const double column = static_cast<double>(view.width() - 1) * j / kSteps;
            const auto [line, sample] = view.place(column, row);
            const auto seen = pixels.geometry(line, sample);
            if (!seen) return {};
            const double near_deg = controls.empty() ? seen->longitude_deg : controls[0].longitude_deg;
            controls.push_back({column,
                                row,
                                near_deg + std::remainder(seen->longitude_deg - near_deg, 360.0),
                                seen->latitude_deg,
                                {seen->point_m[0], seen->point_m[1], seen->point_m[2]}});
        }
    return controls;
}

double mean_of(const std::vector<Control>& controls, double Control::*value) {
    double sum = 0.0;
    for (const Control& control : controls) sum += control.*value;
    return sum / static_cast<double>(controls.size());
}

/** The slope of a value along an axis. On a grid of even steps the two axes do not share in each other's. */
double slope_of(const std::vector<Control>& controls, double Control::*value, double Control::*axis) {
    const double middle = mean_of(controls, axis), level = mean_of(controls, value);
    double sum = 0.0, squares = 0.0;
    for (const Control& control : controls) {
        sum += (control.*axis - middle) * (control.*value - level);
        squares += (control.*axis - middle) * (control.*axis - middle);
    }
    return squares > 0.0 ? sum / squares : 0.0;
}

}  // namespace

Looks square_looks(Looks least, double ratio) {
    constexpr int kTried = 16;
    if (!(ratio > 1e-3 && ratio < 1e3)) ratio = 1.0;
    const double finest = std::max<double>(least.range, least.azimuth / ratio);
    Looks best = least;
    double least_fault = std::numeric_limits<double>::infinity();
    const auto consider = [&](double azimuth, double range) {
        if (range < least.range || azimuth < least.azimuth || range > 1e9 || azimuth > 1e9) return;
        // An aspect that is off counts four times as much as pixels that are larger.
        const double fault = std::abs(std::log(azimuth / (range * ratio))) +
                             0.25 * std::log(std::max(range, azimuth / ratio) / finest);
        if (fault >= least_fault) return;
        least_fault = fault;
        best = {static_cast<int>(azimuth), static_cast<int>(range)};
    };
    for (int more = 0; more < kTried; ++more) {
        const double range = static_cast<double>(least.range) + more;
        const double azimuth = static_cast<double>(least.azimuth) + more;
        consider(std::max<double>(least.azimuth, std::round(range * ratio)), range);
        consider(azimuth, std::max<double>(least.range, std::round(azimuth / ratio)));
    }
    return best;
}

std::optional<Bearings> bearings_of(const Pixels& pixels) {
    const double line = pixels.lines() - 1, sample = pixels.samples() - 1;
    const auto near = pixels.geometry(0.0, 0.0), far = pixels.geometry(0.0, sample),
               last_near = pixels.geometry(line, 0.0), last_far = pixels.geometry(line, sample);
    if (!near || !far || !last_near || !last_far) return std::nullopt;
    const Bearings bearings{direction(way(*near, *last_near), way(*far, *last_far)),
                            direction(way(*near, *far), way(*last_near, *last_far))};
    const bool lead_somewhere = std::isfinite(bearings.down.north) && std::isfinite(bearings.across.north);
    return lead_somewhere ? std::optional{bearings} : std::nullopt;
}

void View::put_north_up(const Bearings& bearings) {
    swapped_ = std::abs(bearings.across.north) > std::abs(bearings.down.north);
    const auto [down, across] = turned(bearings);
    upwards_ = down.north > 0.0;
    leftwards_ = across.east < 0.0;
}

Bearings View::turned(const Bearings& bearings) const {
    const auto led = [](const Bearing& bearing, bool back) {
        return back ? Bearing{-bearing.east, -bearing.north} : bearing;
    };
    return {led(swapped_ ? bearings.across : bearings.down, upwards_),
            led(swapped_ ? bearings.down : bearings.across, leftwards_)};
}

std::size_t View::source(std::size_t column, std::size_t row) const {
    if (leftwards_) column = width() - 1 - column;
    if (upwards_) row = height() - 1 - row;
    return swapped_ ? column * width_ + row : row * width_ + column;
}

View::Place View::place(double column, double row) const {
    if (leftwards_) column = static_cast<double>(width() - 1) - column;
    if (upwards_) row = static_cast<double>(height() - 1) - row;
    if (swapped_) std::swap(column, row);
    return {(row + 0.5) * looks_.azimuth - 0.5, (column + 0.5) * looks_.range - 0.5};
}

std::optional<AffineMap> fit_map(const View& view, const Pixels& pixels) {
    const std::vector<Control> controls = controls_of(view, pixels);
    if (controls.empty()) return std::nullopt;
    AffineMap map{};
    const auto fit = [&](double Control::*value, double& first, double& per_column, double& per_row) {
        per_column = slope_of(controls, value, &Control::column);
        per_row = slope_of(controls, value, &Control::row);
        first = mean_of(controls, value) - per_column * mean_of(controls, &Control::column) -
                per_row * mean_of(controls, &Control::row);
    };
    fit(&Control::longitude_deg, map.longitude_deg, map.longitude_per_column, map.longitude_per_row);
    fit(&Control::latitude_deg, map.latitude_deg, map.latitude_per_column, map.latitude_per_row);
    for (const Control& control : controls) {
        const GeodeticPoint mapped{
            map.latitude_deg + control.column * map.latitude_per_column + control.row * map.latitude_per_row,
            map.longitude_deg + control.column * map.longitude_per_column + control.row * map.longitude_per_row,
            0.0};
        double point_m[3];
        geodetic_to_xyz(&mapped, QUO_WGS84_EQUATORIAL_M, QUO_WGS84_POLAR_M, point_m);
        const double off_m = norm(quo::load(point_m) - quo::load(control.point_m));
        map.rms_m += off_m * off_m / static_cast<double>(controls.size());
        map.most_m = std::max(map.most_m, off_m);
    }
    map.rms_m = std::sqrt(map.rms_m);
    return map;
}

}  // namespace tool
