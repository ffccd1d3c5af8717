// SPDX-License-Identifier: Apache-2.0
#include "multilook.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <memory>
#include <optional>
#include <span>

#include "common/blocks.h"
#include "failure.h"
#include "interrupt.h"
#include "progress.h"

namespace tool {
namespace {

constexpr std::size_t kMostPixels = std::size_t{1} << 26;

}  // namespace

/** What a thread adds up: rows of pixels, tile by tile. */
class Multilook::Band {
public:
    Band(Multilook& whole, const std::string& name, const RasterDescription& raster)
        : whole_{whole}, file_{name, raster} {}

    /** Whether a row of pixels has power. */
    bool add(std::int64_t row) {
        has_power_ = false;
        const Looks looks = whole_.looks_;
        row_ = std::span{whole_.power_}.subspan(static_cast<std::size_t>(row) * whole_.width_, whole_.width_);
        const int first_line = static_cast<int>(row) * looks.azimuth;
        for_each_tile(looks.azimuth, static_cast<int>(whole_.width_) * looks.range, looks.range, [&](Tile tile) {
            tile.first_line += first_line;
            file_.description().is_complex() != 0 ? add(tile, complex_) : add(tile, real_);
        });
        const float scale = 1.0F / (static_cast<float>(looks.azimuth) * static_cast<float>(looks.range));
        for (float& value : row_) value *= scale;
        return has_power_;
    }

private:
    template <typename T>
    void add(const Tile& tile, std::vector<T>& room) {
        const int looks = whole_.looks_.range;
        room.resize(tile.size());
        file_.read(tile, room.data());
        const T* from = room.data();
        for (int line = 0; line < tile.lines; ++line) {
            float* to = row_.data() + tile.first_sample / looks;
            for (int pixel = 0; pixel < tile.samples / looks; ++pixel) {
                for (int look = 0; look < looks; ++look) {
                    const float value = std::norm(*from++);
                    const bool finite = std::isfinite(value);
                    to[pixel] += finite ? value : 0.0F;
                    has_power_ |= finite;
                }
            }
        }
    }

    Multilook& whole_;
    RasterReader file_;
    std::span<float> row_;
    bool has_power_ = false;
    std::vector<float> real_;  // the samples of a tile, as the raster has them
    std::vector<fcomplex> complex_;
};

Multilook::Multilook(const RasterDescription& raster, const std::string& name, Looks looks)
    : looks_{std::min(looks.azimuth, raster.NrOfLinesPerImage), std::min(looks.range, raster.NrOfPixelsPerLine)},
      width_{static_cast<std::size_t>(raster.NrOfPixelsPerLine / looks_.range)},
      height_{static_cast<std::size_t>(raster.NrOfLinesPerImage / looks_.azimuth)} {
    if (width_ * height_ > kMostPixels) {
        throw Failure(name + ": a picture of " + std::to_string(width_) + " x " + std::to_string(height_) +
                      " pixels is too large; take more looks");
    }
    power_.assign(width_ * height_, 0.0F);
}

void Multilook::run(const RasterDescription& raster, const std::string& name, int threads, bool waitbar) {
    Progress progress{waitbar ? "Quick look" : nullptr};
    const std::int64_t bytes = raster.rasterSize() / std::max<std::int64_t>(1, rows());
    std::int64_t begun = 0, done = 0;
    const auto next = [&]() -> std::optional<std::int64_t> {
        throw_if_interrupted();
        if (begun == rows()) return std::nullopt;
        return begun++;
    };
    const auto make_worker = [&] {
        auto band = std::make_unique<Band>(*this, name, raster);
        return [band = std::move(band)](std::int64_t row) { return band->add(row); };
    };
    blocks::in_order(threads, next, make_worker, [&](bool has_power) {
        has_power_ |= has_power;
        progress.step(++done * bytes, rows() * bytes);
    });
}

}  // namespace tool
