#ifndef QUO_TOOL_PLOT_H
#define QUO_TOOL_PLOT_H

#include <string>
#include <vector>

#include "picture.h"

namespace tool {

/** A curve in dB below its peak, over an axis that runs evenly from `first` to `last`. */
struct Curve {
    std::string title;            ///< capital letters, digits and -+./ can be drawn
    std::vector<double> decibel;  ///< at most 0; not empty
    double first = 0.0, last = 1.0;
    double mark = 0.0;  ///< a place on the axis to be marked
};

/** Draws curves one below the other, each in a frame with ticks: decibels down to -40, the half-power line. */
Picture plot(const std::vector<Curve>& curves);

}  // namespace tool

#endif
