// SPDX-License-Identifier: Apache-2.0
#include "canvas.h"

#include <algorithm>
#include <array>
#include <cmath>
#include <new>
#include <numbers>
#include <stdexcept>

#ifdef __SANITIZE_ADDRESS__
#include <sanitizer/lsan_interface.h>
#endif

namespace drawing {
namespace {

/** Stands where fonts are looked for: what fontconfig keeps of them until the process ends hangs on pointers that
 * the leak sanitizer cannot follow, which would take it for lost. */
#ifdef __SANITIZE_ADDRESS__
using KeepsFonts = __lsan::ScopedDisabler;
#else
struct KeepsFonts {};
#endif

/** Where a line of a pixel's width lies on one row or column of pixels. */
double sharp(double place) { return std::floor(place) + 0.5; }

/** The pixels of a surface, 0x00RRGGBB each, row after row. */
class Words {
public:
    explicit Words(cairo_surface_t* surface)
        : data_{reinterpret_cast<std::uint32_t*>(cairo_image_surface_get_data(surface))},
          stride_{static_cast<std::size_t>(cairo_image_surface_get_stride(surface)) / sizeof *data_} {}
    [[nodiscard]] std::uint32_t* row(std::size_t row) const { return data_ + row * stride_; }

private:
    std::uint32_t* data_;
    std::size_t stride_;
};

constexpr std::uint32_t kOneOfEach = 0x010101;

bool is_grey(std::uint32_t word) { return (word & 0xFFU) * kOneOfEach == (word & 0xFFFFFFU); }

}  // namespace

Canvas::Surface Canvas::make(std::size_t width, std::size_t height) {
    Surface surface{cairo_image_surface_create(CAIRO_FORMAT_RGB24, static_cast<int>(std::min(width, kLongest)),
                                               static_cast<int>(std::min(height, kLongest))),
                    cairo_surface_destroy};
    if (cairo_surface_status(surface.get()) != CAIRO_STATUS_SUCCESS) throw std::bad_alloc{};
    return surface;
}

Canvas::Canvas(std::size_t width, std::size_t height)
    : surface_{make(width, height)}, cairo_{cairo_create(surface_.get()), cairo_destroy} {
    use(kWhite);
    cairo_paint(cairo_.get());
    cairo_set_line_join(cairo_.get(), CAIRO_LINE_JOIN_ROUND);
    // Letters smoothed in grey: in colours of the screen's points they would colour a grey picture.
    cairo_font_options_t* const options = cairo_font_options_create();
    cairo_font_options_set_antialias(options, CAIRO_ANTIALIAS_GRAY);
    cairo_set_font_options(cairo_.get(), options);
    cairo_font_options_destroy(options);
}

void Canvas::follow(std::span<const Point> points) {
    cairo_new_path(cairo_.get());  // else it would go on from the last letter
    for (const Point& point : points) cairo_line_to(cairo_.get(), point.x, point.y);
}

void Canvas::path(std::span<const Point> points, const Pen& pen) {
    use(pen.colour);
    cairo_set_line_width(cairo_.get(), pen.width);
    follow(points);
    cairo_stroke(cairo_.get());
}

void Canvas::line(Point from, Point to, const Pen& pen) {
    if (from.x == to.x) from.x = to.x = sharp(from.x);
    if (from.y == to.y) from.y = to.y = sharp(from.y);
    path(std::array{from, to}, pen);
}

void Canvas::fill(std::span<const Point> corners, const Colour& colour) {
    use(colour);
    follow(corners);
    cairo_fill(cairo_.get());
}

void Canvas::fill(const Box& box, const Colour& colour) {
    fill(std::array{Point{box.left, box.top}, Point{box.right(), box.top}, Point{box.right(), box.bottom()},
                    Point{box.left, box.bottom()}},
         colour);
}

void Canvas::outline(const Box& box, const Pen& pen) {
    const double left = sharp(box.left), top = sharp(box.top), right = sharp(box.right()),
                 bottom = sharp(box.bottom());
    path(std::array{Point{left, top}, Point{right, top}, Point{right, bottom}, Point{left, bottom},
                    Point{left, top}, Point{right, top}},
         pen);
}

void Canvas::choose(const Letters& letters) const {
    cairo_select_font_face(cairo_.get(), "sans-serif", CAIRO_FONT_SLANT_NORMAL,
                           letters.bold ? CAIRO_FONT_WEIGHT_BOLD : CAIRO_FONT_WEIGHT_NORMAL);
    cairo_set_font_size(cairo_.get(), letters.size);
}

double Canvas::width_of(const std::string& text, const Letters& letters) const {
    [[maybe_unused]] const KeepsFonts fonts{};
    choose(letters);
    cairo_text_extents_t extents;
    cairo_text_extents(cairo_.get(), text.c_str(), &extents);
    return extents.x_advance;
}

void Canvas::text(Point place, const std::string& text, const Letters& letters) {
    cairo_t* const cairo = cairo_.get();
    [[maybe_unused]] const KeepsFonts fonts{};
    const double before = letters.across * width_of(text, letters);
    cairo_save(cairo);
    use(letters.colour);
    cairo_translate(cairo, place.x, place.y);
    if (letters.upwards) cairo_rotate(cairo, -0.5 * std::numbers::pi);
    // Figures are 0.73 of the size high; texts of the same size share their base line, whatever they say.
    cairo_move_to(cairo, -before, 0.73 * letters.size * (1.0 - letters.down));
    cairo_show_text(cairo, text.c_str());
    cairo_restore(cairo);
}

void Canvas::heading(const std::string& title, const std::string& about) {
    const double width = cairo_image_surface_get_width(surface_.get());
    const auto write = [&](double y, const std::string& line, Letters letters) {
        letters.across = 0.5;
        letters.down = 0.5;
        letters.size *= std::min(1.0, 0.96 * width / std::max(width_of(line, letters), 1.0));
        text({0.5 * width, y}, line, letters);
    };
    write(19.0, title, {.size = 17.0, .bold = true});
    write(44.0, about, {.size = 13.0, .colour = kGrey});
}

void Canvas::image(const Picture& picture, const Box& box, bool smooth) {
    const Surface surface = make(picture.width, picture.height);
    const Words words{surface.get()};
    const std::uint8_t* value = picture.values.data();
    for (std::size_t row = 0; row < picture.height; ++row)
        for (std::size_t column = 0; column < picture.width; ++column, value += picture.channels)
            words.row(row)[column] =
                picture.channels == 1 ? *value * kOneOfEach
                                      : std::uint32_t{value[0]} << 16U | std::uint32_t{value[1]} << 8U | value[2];
    cairo_surface_mark_dirty(surface.get());
    cairo_t* const cairo = cairo_.get();
    within(box, [&] {
        cairo_translate(cairo, box.left, box.top);
        cairo_scale(cairo, box.width / static_cast<double>(picture.width),
                    box.height / static_cast<double>(picture.height));
        cairo_set_source_surface(cairo, surface.get(), 0.0, 0.0);
        cairo_pattern_set_filter(cairo_get_source(cairo), smooth ? CAIRO_FILTER_GOOD : CAIRO_FILTER_NEAREST);
        cairo_pattern_set_extend(cairo_get_source(cairo), CAIRO_EXTEND_PAD);
        cairo_paint(cairo);
    });
}

Picture Canvas::picture() const {
    const cairo_status_t status = cairo_status(cairo_.get());
    if (status != CAIRO_STATUS_SUCCESS)
        throw std::runtime_error{std::string{"the picture cannot be drawn: "} + cairo_status_to_string(status)};
    cairo_surface_flush(surface_.get());
    Picture picture{static_cast<std::size_t>(cairo_image_surface_get_width(surface_.get())),
                    static_cast<std::size_t>(cairo_image_surface_get_height(surface_.get())),
                    1,
                    {}};
    const Words words{surface_.get()};
    for (std::size_t row = 0; row < picture.height; ++row)
        if (!std::all_of(words.row(row), words.row(row) + picture.width, is_grey)) picture.channels = 3;
    picture.values.reserve(picture.width * picture.height * picture.channels);
    for (std::size_t row = 0; row < picture.height; ++row)
        for (std::size_t column = 0; column < picture.width; ++column)
            for (std::size_t channel = 3; channel > 3 - picture.channels; --channel)
                picture.values.push_back(
                    static_cast<std::uint8_t>(words.row(row)[column] >> 8U * (channel - 1) & 0xFFU));
    return picture;
}

}  // namespace drawing
