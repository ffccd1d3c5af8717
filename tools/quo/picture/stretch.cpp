// SPDX-License-Identifier: Apache-2.0
#include "stretch.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <limits>

namespace tool {
namespace {

double decibel(float power) {
    return power > 0.0F ? 10.0 * std::log10(static_cast<double>(power)) : -std::numeric_limits<double>::infinity();
}

/** The mean powers of blocks of pixels, without the empty ones: in single pixels speckle would reach further than
 * the ground's own contrast does. */
std::vector<float> block_powers(const std::vector<float>& power, std::size_t width) {
    constexpr std::size_t kSide = 4;
    const std::size_t height = power.size() / width;
    std::vector<float> means;
    for (std::size_t top = 0; top < height; top += kSide)
        for (std::size_t left = 0; left < width; left += kSide) {
            double sum = 0.0, filled = 0.0;
            for (std::size_t row = top; row < std::min(top + kSide, height); ++row)
                for (std::size_t column = left; column < std::min(left + kSide, width); ++column) {
                    sum += static_cast<double>(power[row * width + column]);
                    filled += power[row * width + column] > 0.0F ? 1.0 : 0.0;
                }
            if (filled > 0.0 && std::isfinite(sum)) means.push_back(static_cast<float>(sum / filled));
        }
    return means;
}

}  // namespace

Stretch automatic_stretch(const std::vector<float>& power, std::size_t width) {
    constexpr double kMargin = 3.0, kLeast = 15.0, kMost = 35.0;  // dB
    std::vector<float> means = block_powers(power, width);
    if (means.empty()) return {0.0, kLeast};
    const auto percentile = [&](double share) {
        const auto index = static_cast<std::ptrdiff_t>(share * static_cast<double>(means.size() - 1));
        std::ranges::nth_element(means, means.begin() + index);
        return decibel(means[static_cast<std::size_t>(index)]);
    };
    const double low = percentile(0.02) - kMargin, high = percentile(0.98) + kMargin;
    const double lacking = std::max(0.0, kLeast - (high - low));
    return {std::max(low - lacking / 3.0, high - kMost), high + lacking * 2.0 / 3.0};
}

drawing::Picture picture_of(const std::vector<float>& power, const Stretch& stretch, const View& view) {
    drawing::Picture picture{view.width(), view.height(), 1, {}};
    picture.values.reserve(power.size());
    for (std::size_t row = 0; row < picture.height; ++row)
        for (std::size_t column = 0; column < picture.width; ++column) {
            const double level = decibel(power[view.source(column, row)]);
            const double share = (level - stretch.low_db) / (stretch.high_db - stretch.low_db);
            picture.values.push_back(static_cast<std::uint8_t>(std::lround(255.0 * std::clamp(share, 0.0, 1.0))));
        }
    return picture;
}

}  // namespace tool
