#include "plot.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <cmath>
#include <string_view>

#include "number.h"

namespace tool {
namespace {

constexpr int kWidth = 1000, kPanelHeight = 340;  // of a panel with its labels, in pixels
constexpr int kLeft = 70, kRight = 30, kTop = 40, kBottom = 40;
constexpr int kScale = 2;        // pixels of a letter's dot
constexpr double kDepth = 40.0;  // dB
constexpr std::uint8_t kWhite = 255, kGrid = 215, kMark = 140, kBlack = 0;

/** A letter of five by seven dots; the highest of a row's five bits is the leftmost dot. */
struct Glyph {
    char letter;
    std::array<std::uint8_t, 7> rows;
};
constexpr Glyph kGlyphs[] = {
    {'0', {0x0E, 0x11, 0x13, 0x15, 0x19, 0x11, 0x0E}}, {'1', {0x04, 0x0C, 0x04, 0x04, 0x04, 0x04, 0x0E}},
    {'2', {0x0E, 0x11, 0x01, 0x02, 0x04, 0x08, 0x1F}}, {'3', {0x1F, 0x02, 0x04, 0x02, 0x01, 0x11, 0x0E}},
    {'4', {0x02, 0x06, 0x0A, 0x12, 0x1F, 0x02, 0x02}}, {'5', {0x1F, 0x10, 0x1E, 0x01, 0x01, 0x11, 0x0E}},
    {'6', {0x06, 0x08, 0x10, 0x1E, 0x11, 0x11, 0x0E}}, {'7', {0x1F, 0x01, 0x02, 0x04, 0x08, 0x08, 0x08}},
    {'8', {0x0E, 0x11, 0x11, 0x0E, 0x11, 0x11, 0x0E}}, {'9', {0x0E, 0x11, 0x11, 0x0F, 0x01, 0x02, 0x0C}},
    {'-', {0x00, 0x00, 0x00, 0x1F, 0x00, 0x00, 0x00}}, {'+', {0x00, 0x04, 0x04, 0x1F, 0x04, 0x04, 0x00}},
    {'.', {0x00, 0x00, 0x00, 0x00, 0x00, 0x0C, 0x0C}}, {'/', {0x00, 0x01, 0x02, 0x04, 0x08, 0x10, 0x00}},
    {'A', {0x0E, 0x11, 0x11, 0x11, 0x1F, 0x11, 0x11}}, {'B', {0x1E, 0x11, 0x11, 0x1E, 0x11, 0x11, 0x1E}},
    {'C', {0x0E, 0x11, 0x10, 0x10, 0x10, 0x11, 0x0E}}, {'D', {0x1C, 0x12, 0x11, 0x11, 0x11, 0x12, 0x1C}},
    {'E', {0x1F, 0x10, 0x10, 0x1E, 0x10, 0x10, 0x1F}}, {'G', {0x0E, 0x11, 0x10, 0x17, 0x11, 0x11, 0x0F}},
    {'H', {0x11, 0x11, 0x11, 0x1F, 0x11, 0x11, 0x11}}, {'I', {0x0E, 0x04, 0x04, 0x04, 0x04, 0x04, 0x0E}},
    {'K', {0x11, 0x12, 0x14, 0x18, 0x14, 0x12, 0x11}}, {'L', {0x10, 0x10, 0x10, 0x10, 0x10, 0x10, 0x1F}},
    {'M', {0x11, 0x1B, 0x15, 0x15, 0x11, 0x11, 0x11}}, {'N', {0x11, 0x11, 0x19, 0x15, 0x13, 0x11, 0x11}},
    {'P', {0x1E, 0x11, 0x11, 0x1E, 0x10, 0x10, 0x10}}, {'R', {0x1E, 0x11, 0x11, 0x1E, 0x14, 0x12, 0x11}},
    {'S', {0x0F, 0x10, 0x10, 0x0E, 0x01, 0x01, 0x1E}}, {'T', {0x1F, 0x04, 0x04, 0x04, 0x04, 0x04, 0x04}},
    {'U', {0x11, 0x11, 0x11, 0x11, 0x11, 0x11, 0x0E}}, {'Y', {0x11, 0x11, 0x11, 0x0A, 0x04, 0x04, 0x04}},
    {'Z', {0x1F, 0x01, 0x02, 0x04, 0x08, 0x10, 0x1F}},
};

/** Fills a rectangle; what lies outside the picture is left out. */
void fill(Picture& picture, int left, int top, int width, int height, std::uint8_t grey) {
    const int right = std::min(left + width, static_cast<int>(picture.width));
    const int bottom = std::min(top + height, static_cast<int>(picture.height));
    for (int y = std::max(top, 0); y < bottom; ++y)
        for (int x = std::max(left, 0); x < right; ++x)
            picture.grey[static_cast<std::size_t>(y) * picture.width + static_cast<std::size_t>(x)] = grey;
}

constexpr int text_width(std::string_view text) { return static_cast<int>(text.size()) * 6 * kScale; }

void write(Picture& picture, int left, int top, std::string_view text) {
    for (const char c : text) {
        const auto* glyph =
            std::ranges::find(kGlyphs, std::toupper(static_cast<unsigned char>(c)), &Glyph::letter);
        for (int row = 0; glyph != std::end(kGlyphs) && row < 7; ++row)
            for (int dot = 0; dot < 5; ++dot)
                if ((glyph->rows[static_cast<std::size_t>(row)] >> (4 - dot)) & 1)
                    fill(picture, left + dot * kScale, top + row * kScale, kScale, kScale, kBlack);
        left += 6 * kScale;
    }
}

/** One curve in its frame. */
class Panel {
public:
    Panel(Picture& picture, const Curve& curve, int top) : picture_{picture}, curve_{curve}, top_{top + kTop} {}

    void draw() {
        write(picture_, kLeft, top_ - 26, curve_.title);
        for (int db = 0; db <= static_cast<int>(kDepth); db += 10) {
            fill(picture_, kLeft, row_of(-db), kAcross, 1, kGrid);
            const std::string label = std::to_string(-db);
            write(picture_, kLeft - 8 - text_width(label), row_of(-db) - 7, label);
        }
        for (int tick = 0; tick <= 4; ++tick) {
            const double value = curve_.first + (curve_.last - curve_.first) * tick / 4.0;
            fill(picture_, column_of(value), top_, 1, kDown, kGrid);
            const std::string label = rough(value);
            write(picture_, column_of(value) - text_width(label) / 2, top_ + kDown + 12, label);
        }
        fill(picture_, kLeft, row_of(-10.0 * std::log10(2.0)), kAcross, 1, kMark);
        fill(picture_, column_of(curve_.mark), top_, 1, kDown, kMark);
        for (const int edge : {0, kAcross}) fill(picture_, kLeft + edge, top_, 1, kDown + 1, kBlack);
        for (const int edge : {0, kDown}) fill(picture_, kLeft, top_ + edge, kAcross, 1, kBlack);
        draw_curve();
    }

private:
    static constexpr int kAcross = kWidth - kLeft - kRight, kDown = kPanelHeight - kTop - kBottom;

    [[nodiscard]] int row_of(double decibel) const {
        return top_ + static_cast<int>(std::lround(std::clamp(-decibel / kDepth, 0.0, 1.0) * kDown));
    }
    [[nodiscard]] int column_of(double value) const {
        const double share = (value - curve_.first) / (curve_.last - curve_.first);
        return kLeft + static_cast<int>(std::lround(std::clamp(share, 0.0, 1.0) * kAcross));
    }
    void draw_curve() {
        const std::size_t count = curve_.decibel.size();
        int before = row_of(curve_.decibel.front());
        for (int x = 0; x < kAcross; ++x) {
            const int row = row_of(curve_.decibel[static_cast<std::size_t>(x) * count / kAcross]);
            fill(picture_, kLeft + x, std::min(before, row), 2, std::abs(row - before) + 2, kBlack);
            before = row;
        }
    }

    Picture& picture_;
    const Curve& curve_;
    int top_;
};

}  // namespace

Picture plot(const std::vector<Curve>& curves) {
    const std::size_t height = curves.size() * kPanelHeight;
    Picture picture{kWidth, height, std::vector<std::uint8_t>(kWidth * height, kWhite)};
    int top = 0;
    for (const Curve& curve : curves) {
        Panel{picture, curve, top}.draw();
        top += kPanelHeight;
    }
    return picture;
}

}  // namespace tool
