// SPDX-License-Identifier: Apache-2.0
#include "portrait.h"

#include <algorithm>
#include <array>
#include <cmath>

#include "../common/drawing/frame.h"

namespace example {
namespace {

using drawing::Canvas, drawing::Frame, drawing::label, drawing::Picture, drawing::Point;

constexpr double kDepth = 40.0;                                 // dB from white to black
constexpr double kTop = Canvas::kHeading + 22.0, kMap = 420.0;  // pixels
constexpr double kCuts = Frame::kLeft + kMap + 190.0, kCutWidth = 400.0, kCutHeight = 150.0;

/** Levels in colours from black over violet, red and orange to a pale yellow, which differ in brightness too. */
std::array<std::uint8_t, 3> colour_of(double share) {
    constexpr double kColours[][3] = {{0, 0, 8}, {87, 16, 110}, {188, 55, 84}, {249, 142, 9}, {252, 255, 164}};
    const double place = 4.0 * std::clamp(share, 0.0, 1.0);
    const auto below = std::min<std::size_t>(3, static_cast<std::size_t>(place));
    std::array<std::uint8_t, 3> colour{};
    for (std::size_t i = 0; i < 3; ++i)
        colour[i] = static_cast<std::uint8_t>(std::lround(
            std::lerp(kColours[below][i], kColours[below + 1][i], place - static_cast<double>(below))));
    return colour;
}

void append_level(Picture& picture, double share) {
    const auto colour = colour_of(share);
    picture.values.insert(picture.values.end(), colour.begin(), colour.end());
}

void draw_map(Canvas& canvas, const Measurement& found, const Closeup& closeup) {
    Picture map{closeup.side(), closeup.side(), 3, {}}, ramp{1, 256, 3, {}};
    for (const double level : closeup.decibel) append_level(map, 1.0 + level / kDepth);
    for (int level = 255; level >= 0; --level) append_level(ramp, level / 255.0);
    const double reach = closeup.reach;
    Frame frame{canvas,
                {Frame::kLeft, kTop, kMap, kMap},
                {"range from the peak, samples", -reach, reach},
                {"azimuth from the peak, lines", -reach, reach}};
    canvas.image(map, frame.box(), true);
    frame.edge();
    // Where the target should be.
    const Point place{frame.x(-found.range.shift), frame.y(-found.azimuth.shift)};
    canvas.line({place.x - 7.0, place.y}, {place.x + 7.0, place.y});
    canvas.line({place.x, place.y - 7.0}, {place.x, place.y + 7.0});
    drawing::level_bar(canvas, {frame.box().right() + 28.0, kTop, 18.0, kMap - 28.0}, {"dB", -kDepth, 0.0}, ramp);
}

/** What is drawn of one of the two cuts. */
struct CutShown {
    const char *name, *unit;
    const Response& response;
    double top;
    bool across;
};

void draw_cut(Canvas& canvas, const CutShown& cut, const Closeup& closeup) {
    const double reach = closeup.reach;
    Frame frame{canvas,
                {kCuts, cut.top, kCutWidth, kCutHeight},
                {std::string{cut.unit} + " from the peak", -reach, reach},
                {"dB", 3.0, -kDepth}};
    const Response& response = cut.response;
    canvas.text({kCuts, cut.top - 9.0}, cut.name, {.down = 1.0, .size = 14.0, .bold = true});
    canvas.text({kCuts + kCutWidth, cut.top - 9.0},
                "theory " + label(response.theory, 3) + ",  PSLR " + label(response.side_lobe_db, 2) +
                    " dB,  ISLR " + label(response.integrated_db, 2) + " dB",
                {.across = 1.0, .down = 1.0, .size = 12.0});
    frame.grid();
    canvas.line({frame.box().left, frame.y(response.side_lobe_db)},
                {frame.box().right(), frame.y(response.side_lobe_db)}, {.colour = drawing::kGrey});
    const std::size_t side = closeup.side(), middle = side / 2;
    std::vector<Point> points;
    for (std::size_t i = 0; i < side; ++i)
        points.push_back({(static_cast<double>(i) - static_cast<double>(middle)) / closeup.finer,
                          cut.across ? closeup.at(middle, i) : closeup.at(i, middle)});
    frame.curve(points, {.colour = drawing::kBlue, .width = 2.0});

    const double half = 10.0 * std::log10(0.5), y = frame.y(half);
    const Point from{frame.x(-0.5 * response.resolution), y}, to{frame.x(0.5 * response.resolution), y};
    canvas.line(from, to, {.colour = drawing::kRed, .width = 2.0});
    for (const Point& end : {from, to})
        canvas.line({end.x, y - 5.0}, {end.x, y + 6.0}, {.colour = drawing::kRed, .width = 2.0});
    canvas.text({to.x + 9.0, y + 3.0}, "\u22123 dB: " + label(response.resolution, 3) + " " + cut.unit,
                {.down = 0.5, .size = 12.0, .colour = drawing::kRed});
    frame.edge();
}

}  // namespace

Picture portrait(const Measurement& found, const Closeup& closeup) {
    constexpr double kWidth = kCuts + kCutWidth + 30.0, kHeight = kTop + kMap + Frame::kBottom + 4.0;
    Canvas canvas{static_cast<std::size_t>(kWidth), static_cast<std::size_t>(kHeight)};
    std::string name = found.name;
    std::ranges::replace_if(
        name, [](char c) { return c < ' ' || c > '~'; }, '?');
    canvas.heading(name, "shift " + label(found.azimuth.shift, 3) + " lines, " + label(found.range.shift, 3) +
                             " samples  \u00b7  " + label(found.ground_m, 3) + " m on the ground  \u00b7  phase " +
                             label(found.phase_rad, 3) + " rad  \u00b7  amplitude " + label(found.strength_db, 2) +
                             " dB");
    draw_map(canvas, found, closeup);
    draw_cut(canvas, {"Azimuth", "lines", found.azimuth, kTop, false}, closeup);
    draw_cut(canvas, {"Range", "samples", found.range, kTop + kMap - kCutHeight, true}, closeup);
    return canvas.picture();
}

}  // namespace example
