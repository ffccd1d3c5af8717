// SPDX-License-Identifier: Apache-2.0
#include "spectrum_picture.h"

#include <algorithm>
#include <cmath>

#include "common/drawing/frame.h"
#include "number.h"

namespace tool {
namespace {

using drawing::Axis, drawing::Box, drawing::Canvas, drawing::Frame, drawing::Letters, drawing::Point;

constexpr double kWidth = 1000.0, kTop = Canvas::kHeading, kPanel = 360.0, kRight = 30.0;  // pixels
constexpr double kHead = 36.0;                                                             // above a panel's frame
constexpr drawing::Colour kBand{0.93, 0.95, 0.99};
const double kHalf = 10.0 * std::log10(0.5);

/** A unit of frequencies, and how many of it a cycle per sample has. */
struct Unit {
    std::string name;
    double scale;
};

Unit unit_of(const SpectrumShown& spectrum, double frequency) {
    if (!spectrum.in_hertz) return {"cycles/sample", 1.0};
    const double size = std::abs(frequency) * spectrum.rate;
    if (size >= 1e6) return {"MHz", 1e-6 * spectrum.rate};
    if (size >= 1e3) return {"kHz", 1e-3 * spectrum.rate};
    return {"Hz", spectrum.rate};
}

std::string frequency_text(const SpectrumShown& spectrum, double frequency) {
    const Unit unit = unit_of(spectrum, frequency);
    const double value = frequency * unit.scale;
    const bool has_digits = std::isfinite(value) && value != 0.0;
    const auto digits = !has_digits ? 1 : static_cast<int>(std::floor(std::log10(std::abs(value)))) + 1;
    return drawing::label(value, std::max(0, 3 - std::max(digits, 0))) + " " + unit.name;
}

/** Decibels from the top of the frame down: room for labels above, and all that the smoothed curve does. */
Axis level_axis(const SpectrumShown& spectrum) {
    const double least = std::max(-60.0, *std::ranges::min_element(spectrum.smoothed));
    const double depth = std::clamp(5.0 * std::ceil(-1.1 * least / 5.0), 10.0, 60.0);
    const double highest = std::clamp(*std::ranges::max_element(spectrum.decibel), 0.0, 10.0);
    return {"power, dB", highest + 0.17 * depth, -depth};
}

/** One spectrum in its frame. */
class Panel {
public:
    Panel(Canvas& canvas, const SpectrumShown& spectrum, double top)
        : canvas_{canvas},
          spectrum_{spectrum},
          unit_{unit_of(spectrum, 0.5)},
          frame_{
              canvas,
              {Frame::kLeft, top + kHead, kWidth - Frame::kLeft - kRight, kPanel - kHead - Frame::kBottom - 10.0},
              {"frequency, " + unit_.name, -0.5 * unit_.scale, 0.5 * unit_.scale},
              level_axis(spectrum)} {}

    void draw() {
        canvas_.text({frame_.box().left, frame_.box().top - 10.0}, spectrum_.title,
                     {.down = 1.0, .size = 15.0, .bold = true});
        const std::vector<Span> above = spans_above_half();
        for (const Span& span : above)
            canvas_.fill(
                Box{span.left, frame_.y(kHalf), span.right - span.left, frame_.box().bottom() - frame_.y(kHalf)},
                kBand);
        frame_.grid();
        frame_.curve(points_of(spectrum_.decibel), {.colour = drawing::kPaleBlue});
        frame_.curve(points_of(spectrum_.smoothed), {.colour = drawing::kBlue, .width = 2.0});
        draw_width(above);
        draw_centre();
        frame_.edge();
    }

private:
    struct Span {
        double left, right;
    };

    [[nodiscard]] double count() const { return static_cast<double>(spectrum_.smoothed.size()); }
    /** Where a bin stands that counts from the lowest frequency. */
    [[nodiscard]] double frequency(double bin) const {
        return (bin - std::floor(0.5 * count())) / count() * unit_.scale;
    }
    /** From the lowest frequency up, and the lowest again at the end, which is where the band meets itself. */
    [[nodiscard]] std::vector<Point> points_of(const std::vector<double>& decibel) const {
        const std::size_t n = decibel.size();
        std::vector<Point> points;
        for (std::size_t i = 0; i <= n; ++i)
            points.push_back({frequency(static_cast<double>(i)), std::max(decibel[(i + n - n / 2) % n], -999.0)});
        return points;
    }

    [[nodiscard]] std::vector<Span> spans_above_half() const {
        std::vector<Span> spans;
        bool goes_on = false;
        for (const Point& point : points_of(spectrum_.smoothed)) {
            const bool above = point.y > kHalf;
            const double half_a_bin = 0.5 / count() * unit_.scale;
            const auto x = [&](double place) {
                return std::clamp(frame_.x(place), frame_.box().left, frame_.box().right());
            };
            if (above && !goes_on) spans.push_back({x(point.x - half_a_bin), 0.0});
            if (above) spans.back().right = x(point.x + half_a_bin);
            goes_on = above;
        }
        return spans;
    }

    void draw_width(const std::vector<Span>& above) {
        constexpr double kLongText = 190.0, kGap = 9.0;
        const double y = frame_.y(kHalf);
        for (const auto& [left, right] : above) {
            canvas_.line({left, y}, {right, y}, {.colour = drawing::kRed, .width = 2.0});
            for (const double end : {left, right})
                canvas_.line({end, y - 5.0}, {end, y + 6.0}, {.colour = drawing::kRed, .width = 2.0});
        }
        const auto& [left, right] =
            *std::ranges::max_element(above, {}, [](const Span& s) { return s.right - s.left; });
        Letters letters{.size = 13.0, .colour = drawing::kRed};
        Point place{left + kGap, y + kGap};
        if (right - left < 2.0 * kLongText) {  // beside it, where the centre's line does not run through it
            const bool has_room = right + kLongText < frame_.box().right();
            place = {has_room ? right + kGap : left - kGap, y};
            letters.across = has_room ? 0.0 : 1.0;
            letters.down = 0.5;
        }
        const bool whole = spectrum_.width >= 1.0;
        canvas_.text(
            place,
            "\u22123 dB width: " + frequency_text(spectrum_, spectrum_.width) + (whole ? ", the whole band" : ""),
            letters);
    }

    void draw_centre() {
        const double x = frame_.x(spectrum_.centre * unit_.scale), top = frame_.box().top;
        canvas_.line({x, top}, {x, frame_.box().bottom()}, {.colour = drawing::kGrey});
        const bool to_the_left = x > frame_.box().left + 0.7 * frame_.box().width;
        canvas_.text({x + (to_the_left ? -7.0 : 7.0), top + 7.0},
                     spectrum_.centre_name + ": " + frequency_text(spectrum_, spectrum_.centre),
                     {.across = to_the_left ? 1.0 : 0.0, .size = 13.0, .colour = drawing::kGrey});
    }

    Canvas& canvas_;
    const SpectrumShown& spectrum_;
    Unit unit_;
    Frame frame_;
};

}  // namespace

drawing::Picture draw_spectra(const std::string& title, const std::string& about,
                              const std::vector<SpectrumShown>& spectra) {
    const double height = kTop + kPanel * static_cast<double>(spectra.size());
    Canvas canvas{static_cast<std::size_t>(kWidth), static_cast<std::size_t>(height)};
    canvas.heading(title, about);
    double top = kTop;
    for (const SpectrumShown& spectrum : spectra) {
        Panel{canvas, spectrum, top}.draw();
        top += kPanel;
    }
    return canvas.picture();
}

}  // namespace tool
