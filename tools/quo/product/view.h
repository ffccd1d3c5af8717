// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_VIEW_H
#define QUO_TOOL_VIEW_H

#include <cstddef>
#include <optional>

#include "pixels.h"

namespace tool {

/** How many lines and samples make a pixel of a picture. */
struct Looks {
    int azimuth = 1, range = 1;
};

/** The looks that make pixels as square as whole numbers do without making them much larger than `least` asks for.
 * `ratio` is the distance of samples over that of lines. */
Looks square_looks(Looks least, double ratio);

/** A direction on the ground. */
struct Bearing {
    double east, north;
};
/** Where the lines and the samples of a raster lead, from its corners; unit vectors. */
struct Bearings {
    Bearing down, across;
};
/** Nothing where a corner has no place, and where they all lie at one. */
std::optional<Bearings> bearings_of(const Pixels& pixels);

/** A picture of a raster: which pixel shows what. */
class View {
public:
    /** Width and height are those of the picture before it is turned: samples run across, lines down. */
    View(Looks looks, std::size_t width, std::size_t height) : looks_{looks}, width_{width}, height_{height} {}
    /** Turns the picture by quarters and mirrors it so that north comes as near to the top as can be, with east to
     * the right of it. */
    void put_north_up(const Bearings& bearings);

    [[nodiscard]] std::size_t width() const { return swapped_ ? height_ : width_; }
    [[nodiscard]] std::size_t height() const { return swapped_ ? width_ : height_; }
    /** Whether lines run across and samples down. */
    [[nodiscard]] bool swapped() const { return swapped_; }
    /** Whether what runs down, or across, begins at the bottom, or on the right. */
    [[nodiscard]] bool upwards() const { return upwards_; }
    [[nodiscard]] bool leftwards() const { return leftwards_; }
    /** Where the picture's columns and rows lead. */
    [[nodiscard]] Bearings turned(const Bearings& bearings) const;

    /** The place of a pixel among those that are not turned, row after row. */
    [[nodiscard]] std::size_t source(std::size_t column, std::size_t row) const;
    /** Line and sample of the raster at a place of the picture, whose whole numbers are the centres of pixels. */
    struct Place {
        double line, sample;
    };
    [[nodiscard]] Place place(double column, double row) const;

private:
    Looks looks_;
    std::size_t width_, height_;
    bool swapped_ = false, upwards_ = false, leftwards_ = false;
};

/** The affine map from the pixels of a picture to the ellipsoid that fits best, and how far it is off. */
struct AffineMap {
    double longitude_deg, longitude_per_column, longitude_per_row;  ///< of the left upper pixel's centre on
    double latitude_deg, latitude_per_column, latitude_per_row;
    double rms_m, most_m;  ///< distances on the ground, over a grid of pixels with those at the border
};
/** Nothing where a pixel sees no ground. Longitudes are continuous: they may go beyond 180 degrees. */
std::optional<AffineMap> fit_map(const View& view, const Pixels& pixels);

}  // namespace tool

#endif
