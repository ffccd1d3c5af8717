// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_FRAME_H
#define QUO_EXAMPLES_FRAME_H

#include <string>
#include <vector>

#include "canvas.h"

namespace drawing {

/** An axis with its title and unit; from left to right, or from the top down. */
struct Axis {
    std::string title;
    double first = 0.0, last = 1.0;  ///< different from each other
};

/** A number with so many decimals. */
std::string label(double value, int decimals);
/** Places of an axis at multiples of 1, 2 or 5 times a power of ten, at most so many, and their decimals; none
 * of an axis that is beyond all measure. */
struct Ticks {
    std::vector<double> places;
    int decimals = 0;
};
Ticks ticks_of(const Axis& axis, int most);

/** A rectangle between two axes, whose ticks and titles stand to its left and below. */
class Frame {
public:
    static constexpr double kLeft = 74.0, kBottom = 52.0;  ///< room that ticks and titles need, pixels

    Frame(Canvas& canvas, const Box& box, Axis across, Axis down);

    [[nodiscard]] const Box& box() const { return box_; }
    [[nodiscard]] double x(double value) const;
    [[nodiscard]] double y(double value) const;

    /** Pale lines at the ticks, to be drawn before what is shown. */
    void grid();
    /** The frame itself, to be drawn after it. */
    void edge();
    /** A curve through points of both axes; what lies beyond them is left out. */
    void curve(std::vector<Point> points, const Pen& pen);

private:
    Canvas& canvas_;
    Box box_;
    Axis across_, down_;
    Ticks columns_, rows_;
};

/** A bar of levels, the highest on top, with ticks to its right. */
void level_bar(Canvas& canvas, const Box& bar, const Axis& levels, const Picture& ramp);
/** What that looks like from white down to black. */
Picture grey_ramp();

}  // namespace drawing

#endif
