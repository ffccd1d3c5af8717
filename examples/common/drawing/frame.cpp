// SPDX-License-Identifier: Apache-2.0
#include "frame.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <utility>

namespace drawing {
namespace {

constexpr double kTick = 5.0, kGap = 4.0;  // pixels
constexpr Letters kTitle{.size = 13.0}, kLabel{.size = 12.0};

double place_of(const Axis& axis, double value) { return (value - axis.first) / (axis.last - axis.first); }

/** How many ticks an axis may have that has room for so many. */
int most_ticks(double room) { return static_cast<int>(std::clamp(room, 4.0, 12.0)); }

Letters placed(Letters letters, double across, double down) {
    letters.across = across;
    letters.down = down;
    return letters;
}

}  // namespace

std::string label(double value, int decimals) {
    char room[400];  // 309 digits before the point at most
    const auto [end, error] =
        std::to_chars(std::begin(room), std::end(room), std::abs(value), std::chars_format::fixed, decimals);
    const std::string digits{room, error == std::errc{} ? end : room};
    const bool zero = digits.find_first_not_of("0.") == digits.npos;
    return (value < 0.0 && !zero ? "\u2212" : "") + digits;
}

Ticks ticks_of(const Axis& axis, int most) {
    const auto [low, high] = std::minmax(axis.first, axis.last);
    const double least = (high - low) / std::max(1, most - 1);
    if (!(least > 1e-30 && least < 1e30)) return {};
    const double power = std::floor(std::log10(least));
    double step = std::pow(10.0, power);
    for (const double factor : {2.0, 2.5, 2.0})
        if (step < least * (1.0 - 1e-9)) step *= factor;
    Ticks ticks{{}, static_cast<int>(std::max(0.0, -std::floor(std::log10(step) + 1e-9)))};
    const double slack = 1e-9 * (high - low);
    for (double k = std::ceil((low - slack) / step); k * step <= high + slack; ++k)
        ticks.places.push_back(k * step);
    return ticks;
}

Frame::Frame(Canvas& canvas, const Box& box, Axis across, Axis down)
    : canvas_{canvas},
      box_{box},
      across_{std::move(across)},
      down_{std::move(down)},
      columns_{ticks_of(across_, most_ticks(box.width / 80.0))},
      rows_{ticks_of(down_, most_ticks(box.height / 30.0))} {}

double Frame::x(double value) const { return box_.left + box_.width * place_of(across_, value); }
double Frame::y(double value) const { return box_.top + box_.height * place_of(down_, value); }

void Frame::grid() {
    for (const double value : columns_.places)
        canvas_.line({x(value), box_.top}, {x(value), box_.bottom()}, {.colour = kPale});
    for (const double value : rows_.places)
        canvas_.line({box_.left, y(value)}, {box_.right(), y(value)}, {.colour = kPale});
}

void Frame::edge() {
    canvas_.outline(box_);
    for (const double value : columns_.places) {
        canvas_.line({x(value), box_.bottom()}, {x(value), box_.bottom() + kTick});
        canvas_.text({x(value), box_.bottom() + kTick + kGap}, label(value, columns_.decimals),
                     placed(kLabel, 0.5, 0.0));
    }
    for (const double value : rows_.places) {
        canvas_.line({box_.left - kTick, y(value)}, {box_.left, y(value)});
        canvas_.text({box_.left - kTick - kGap, y(value)}, label(value, rows_.decimals), placed(kLabel, 1.0, 0.5));
    }
    canvas_.text({box_.left + 0.5 * box_.width, box_.bottom() + kBottom - 8.0}, across_.title,
                 placed(kTitle, 0.5, 1.0));
    Letters upwards = placed(kTitle, 0.5, 0.0);
    upwards.upwards = true;
    canvas_.text({box_.left - kLeft + 8.0, box_.top + 0.5 * box_.height}, down_.title, upwards);
}

void Frame::curve(std::vector<Point> points, const Pen& pen) {
    for (Point& point : points) point = {x(point.x), y(point.y)};
    canvas_.within(box_, [&] { canvas_.path(points, pen); });
}

Picture grey_ramp() {
    Picture ramp{1, 256, 1, {}};
    for (int level = 255; level >= 0; --level) ramp.values.push_back(static_cast<std::uint8_t>(level));
    return ramp;
}

void level_bar(Canvas& canvas, const Box& bar, const Axis& levels, const Picture& ramp) {
    canvas.image(ramp, bar, true);
    canvas.outline(bar);
    const Axis down{levels.title, levels.last, levels.first};
    const Ticks ticks = ticks_of(down, most_ticks(bar.height / 30.0));
    for (const double value : ticks.places) {
        const double y = bar.top + bar.height * place_of(down, value);
        canvas.line({bar.right(), y}, {bar.right() + kTick, y});
        canvas.text({bar.right() + kTick + kGap, y}, label(value, ticks.decimals), placed(kLabel, 0.0, 0.5));
    }
    canvas.text({bar.left + 0.5 * bar.width, bar.bottom() + 2.0 * kGap}, levels.title, placed(kTitle, 0.5, 0.0));
}

}  // namespace drawing
