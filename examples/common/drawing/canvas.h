// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_EXAMPLES_CANVAS_H
#define QUO_EXAMPLES_CANVAS_H

#include <cairo.h>

#include <memory>
#include <span>
#include <string>

#include "picture.h"

/** Pictures with lines and letters. Places are pixels from the left upper corner, to the right and down. */
namespace drawing {

struct Colour {
    double red, green, blue;
};
inline constexpr Colour kBlack{0.0, 0.0, 0.0}, kWhite{1.0, 1.0, 1.0}, kGrey{0.45, 0.45, 0.45},
    kPale{0.87, 0.87, 0.87}, kBlue{0.10, 0.35, 0.68}, kPaleBlue{0.64, 0.77, 0.92}, kRed{0.78, 0.16, 0.10};

struct Point {
    double x, y;
};
struct Box {
    double left, top, width, height;
    [[nodiscard]] double right() const { return left + width; }
    [[nodiscard]] double bottom() const { return top + height; }
};
struct Pen {
    Colour colour = kBlack;
    double width = 1.0;
};
/** How a text looks and where it stands from its place: shares of its width and height that lie before it. */
struct Letters {
    double across = 0.0, down = 0.0;
    double size = 13.0;
    bool bold = false, upwards = false;  ///< upwards: turned by a quarter, to be read from the right
    Colour colour = kBlack;
};

class Canvas {
public:
    /** White, of at most kLongest pixels either way. Throws std::bad_alloc where memory is short. */
    Canvas(std::size_t width, std::size_t height);
    static constexpr std::size_t kLongest = 32767;

    /** Lines along an axis are drawn sharply, on whole pixels. */
    void line(Point from, Point to, const Pen& pen = {});
    void path(std::span<const Point> points, const Pen& pen);
    void fill(std::span<const Point> corners, const Colour& colour);
    void fill(const Box& box, const Colour& colour);
    void outline(const Box& box, const Pen& pen = {});
    void text(Point place, const std::string& text, const Letters& letters = {});
    /** How wide that is, in pixels. */
    [[nodiscard]] double width_of(const std::string& text, const Letters& letters) const;
    /** Writes a title and a line about it across the top; where they do not fit, in smaller letters. */
    void heading(const std::string& title, const std::string& about);
    static constexpr double kHeading = 62.0;  ///< what that takes of the height
    /** Puts a picture into a box: pixel for pixel where it has that size, else stretched, `smooth` or in steps. */
    void image(const Picture& picture, const Box& box, bool smooth);
    /** What work() draws stays within a box. */
    template <typename Work>
    void within(const Box& box, Work work) {
        cairo_save(cairo_.get());
        cairo_rectangle(cairo_.get(), box.left, box.top, box.width, box.height);
        cairo_clip(cairo_.get());
        work();
        cairo_restore(cairo_.get());
    }

    /** What has been drawn; in grey where nothing has a colour. Throws std::runtime_error where drawing failed,
     * after which nothing more appears. */
    [[nodiscard]] Picture picture() const;

private:
    using Surface = std::unique_ptr<cairo_surface_t, decltype(&cairo_surface_destroy)>;

    static Surface make(std::size_t width, std::size_t height);
    void use(const Colour& colour) { cairo_set_source_rgb(cairo_.get(), colour.red, colour.green, colour.blue); }
    void follow(std::span<const Point> points);
    void choose(const Letters& letters) const;

    Surface surface_;
    std::unique_ptr<cairo_t, decltype(&cairo_destroy)> cairo_;
};

}  // namespace drawing

#endif
