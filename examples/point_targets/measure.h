// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_MEASURE_H
#define QUO_EXAMPLES_MEASURE_H

#include <cstdio>
#include <string>
#include <vector>

#include "../common/targets.h"

namespace example {

/** The response to a point along one axis. */
struct Response {
    double shift;          // of the peak from where the target should be, samples or lines
    double resolution;     // width at half the power, samples or lines
    double theory;         // 0.886 / bandwidth, in the same unit: what a flat band gives
    double side_lobe_db;   // highest sidelobe against the peak
    double integrated_db;  // energy of the sidelobes, ten resolution cells to each side, against the main lobe's
};

/** What was found of a target in a focused image. */
struct Measurement {
    std::string name;
    Response azimuth, range;
    double ground_m;     // distance of the located peak from the given position
    double phase_rad;    // at the peak, against -4 pi R / lambda; not-a-number in a detected image
    double strength_db;  // amplitude at the peak, against the given strength
};

/** What lies around the peak of a response, finely interpolated. */
struct Closeup {
    static constexpr int reach = 8;   // samples and lines to each side
    static constexpr int finer = 16;  // places from one to the next
    std::vector<double> decibel;      // rows of azimuth, against the peak in the middle

    [[nodiscard]] static constexpr std::size_t side() { return 2 * reach * finer + 1; }
    [[nodiscard]] double at(std::size_t row, std::size_t column) const {
        return decibel.at(row * side() + column);
    }
};

/** Finds the targets in an image whose product header is "<image>.hdr" and measures their responses.
 *
 * A target is expected where the orbit passes it at zero Doppler, within some lines and samples: of an image of
 * bursts in the one that has more lines around it. Images may be detected and in ground range. The image is
 * interpolated there by zero-padding its spectrum, after its Doppler centroid was taken off. Throws Failure.
 * The closeup is that of the target `portrayed`, empty without one of that name. */
std::vector<Measurement> measure(const std::string& image, const std::vector<Target>& targets,
                                 const std::string& portrayed = "", Closeup* closeup = nullptr);

/** Prints the measurements as a table. */
void print_table(std::FILE* out, const std::vector<Measurement>& measurements);

/** Whether position, resolution and phase, where there is one, are within 0.1 samples, 5 % and 0.1 rad of what
 * they should be. */
bool within_bounds(const Measurement& measurement);

}  // namespace example

#endif
