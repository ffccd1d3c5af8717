// SPDX-License-Identifier: Apache-2.0
#include "framed_picture.h"

#include <algorithm>
#include <array>
#include <cmath>

namespace tool {
namespace {

using drawing::Box, drawing::Canvas, drawing::Frame, drawing::Point;

constexpr double kRoomAbove = Canvas::kHeading + 4.0, kRoomBeside = 104.0;  // room above and to the right, pixels
constexpr double kLeast = 320.0;                                            // of the longer side

/** How large a picture is shown. */
struct Shown {
    double width, height;
};
Shown shown_size(double width, double height, double aspect) {
    height *= aspect;
    const double times = std::max(1.0, std::ceil(kLeast / std::max(width, height)));
    return {width * times, height * times};
}

/** An arrow to the north and a shorter line to the east, which tells mirrored pictures from others. */
void compass(Canvas& canvas, Point middle, const Point& north, const Point& east) {
    constexpr double kLength = 24.0, kTip = 9.0, kHalfTip = 5.0;
    const auto at = [&](double to_north, double to_east) {
        return Point{middle.x + to_north * north.x + to_east * east.x,
                     middle.y + to_north * north.y + to_east * east.y};
    };
    canvas.path(std::array{at(-kLength, 0.0), at(kLength - kTip, 0.0)}, {.width = 2.0});
    canvas.fill(std::array{at(kLength, 0.0), at(kLength - kTip, kHalfTip), at(kLength - kTip, -kHalfTip)},
                drawing::kBlack);
    canvas.path(std::array{at(0.0, 0.0), at(0.0, 0.5 * kLength)}, {.width = 1.0});
    canvas.text(at(kLength + 10.0, 0.0), "N", {.across = 0.5, .down = 0.5, .size = 14.0, .bold = true});
    canvas.text(at(0.0, 0.5 * kLength + 9.0), "E", {.across = 0.5, .down = 0.5, .size = 11.0});
}

}  // namespace

bool can_be_framed(double width, double height, double aspect) {
    constexpr double kMostPixels = 1 << 25;
    const auto [across, down] = shown_size(width, height, aspect);
    const double most = static_cast<double>(Canvas::kLongest) - 400.0;
    return across <= most && down <= most && down >= 1.0 && across * down <= kMostPixels;
}

drawing::Picture framed(const drawing::Picture& picture, const FrameAround& around) {
    const auto [width, height] =
        shown_size(static_cast<double>(picture.width), static_cast<double>(picture.height), around.aspect);
    const Box box{Frame::kLeft, kRoomAbove, width, std::round(height)};
    const double whole_width = std::max(box.right() + kRoomBeside, 420.0);
    Canvas canvas{static_cast<std::size_t>(whole_width),
                  static_cast<std::size_t>(std::max(box.bottom(), kRoomAbove + 200.0) + Frame::kBottom)};
    canvas.heading(around.title, around.about);
    canvas.image(picture, box, around.aspect != 1.0);
    Frame{canvas, box, around.across, around.down}.edge();

    double top = kRoomAbove;
    const double middle = box.right() + 0.5 * kRoomBeside;
    if (around.north_and_east) {
        compass(canvas, {middle, top + 36.0}, around.north_and_east->first, around.north_and_east->second);
        top += 84.0;
    }
    const double bottom = std::max(box.bottom(), kRoomAbove + 200.0);
    level_bar(canvas, {box.right() + 24.0, top, 18.0, std::min(bottom - top - 26.0, 300.0)},
              {"dB", around.low_db, around.high_db}, drawing::grey_ramp());
    return canvas.picture();
}

}  // namespace tool
