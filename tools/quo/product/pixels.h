// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_PIXELS_H
#define QUO_TOOL_PIXELS_H

#include <optional>
#include <string>

#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"

namespace tool {

/** Takes a product's pixel grid: the one in its header, else the one of its region. False where it has neither. */
bool take_grid(const std::string& header, const GeneralSAR& product, ImageGrid_Obj& grid);

/** The pixels of a product's raster, and where they lie. */
class Pixels {
public:
    /** The product keeps its orbit. Throws Failure without a grid, a raster's size or an orbit with its look side.
     */
    Pixels(const std::string& header, GeneralSAR& product);
    /** Makes them those of an image of the same samples whose lines follow each other one step apart, from
     * `first_s` after the grid's epoch on. */
    void drop_bursts(double first_s);
    /** Whether there is all that pixels need. */
    static bool known(const std::string& header, GeneralSAR& product);

    [[nodiscard]] int lines() const { return lines_; }
    [[nodiscard]] int samples() const { return samples_; }
    [[nodiscard]] const ImageGrid_Obj& grid() const { return grid_; }

    /** Azimuth and two-way range time of a pixel, s. */
    struct Times {
        double azimuth_s, range_s;
    };
    [[nodiscard]] std::optional<Times> times(double line, double sample) const;
    /** How a pixel is seen, at height 0. */
    [[nodiscard]] std::optional<GrPtGeometry> geometry(double line, double sample) const;

    /** Metres on the ground from pixel to pixel, in the middle of the raster. */
    struct Spacing {
        double line_m, sample_m;
    };
    [[nodiscard]] std::optional<Spacing> ground_spacing() const;

private:
    GeneralSAR& product_;
    ImageGrid_Obj grid_;
    int lines_ = 0, samples_ = 0;
};

}  // namespace tool

#endif
