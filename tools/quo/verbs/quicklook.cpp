#include <algorithm>
#include <cmath>
#include <complex>
#include <limits>
#include <memory>
#include <optional>
#include <span>
#include <utility>

#include "apart.h"
#include "commands.h"
#include "common/drawing/picture.h"
#include "interrupt.h"
#include "output.h"
#include "progress.h"
#include "raster.h"

namespace tool {
namespace {

struct QuicklookOptions {
    std::string raster, picture, looks, db = "auto";
    int width = 1000;
    bool waitbar = false;
    int threads = 0;
};

struct Looks {
    int azimuth, range;
};
struct Stretch {
    double low_db, high_db;
};

Looks looks_of(const QuicklookOptions& options, const DataFile& raster) {
    if (options.looks.empty()) {
        // The same number both ways, so that neither the width nor four times it in height is exceeded.
        const auto times = [](int length, std::int64_t most) {
            return static_cast<int>((std::int64_t{length} + most - 1) / most);
        };
        const int looks = std::max({1, times(raster.NrOfPixelsPerLine, options.width),
                                    times(raster.NrOfLinesPerImage, 4 * std::int64_t{options.width})});
        return {looks, looks};
    }
    const auto can_be = [](double looks) { return looks >= 1.0 && looks <= 1e6; };
    const auto looks = number_pair(options.looks, 'x');
    if (!looks || !can_be(looks->first) || !can_be(looks->second))
        throw WrongUse("--looks " + options.looks + ": not of the form AxR, such as 4x1");
    return {static_cast<int>(looks->first), static_cast<int>(looks->second)};
}

/** The mean power of looks x looks samples each, over the whole raster. Looks at the far ends that are not full
 * are left out. */
class Multilook {
public:
    Multilook(const RasterDescription& raster, const std::string& name, Looks looks)
        : looks_{std::min(looks.azimuth, raster.NrOfLinesPerImage),
                 std::min(looks.range, raster.NrOfPixelsPerLine)},
          width_{static_cast<std::size_t>(raster.NrOfPixelsPerLine / looks_.range)},
          height_{static_cast<std::size_t>(raster.NrOfLinesPerImage / looks_.azimuth)} {
        if (width_ * height_ > kMostPixels) {
            throw Failure(name + ": a picture of " + std::to_string(width_) + " x " + std::to_string(height_) +
                          " pixels is too large; take more looks");
        }
        power_.assign(width_ * height_, 0.0F);
    }

    /** Each thread reads by itself and works on rows of pixels that are its alone. */
    void run(const RasterDescription& raster, const std::string& name, int threads, bool waitbar) {
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

    [[nodiscard]] std::size_t width() const { return width_; }
    [[nodiscard]] std::size_t height() const { return height_; }
    /** Whether any sample has a power that is a finite number. */
    [[nodiscard]] bool has_power() const { return has_power_; }
    /** Row after row; values that are no number count as 0. */
    [[nodiscard]] const std::vector<float>& power() const { return power_; }

private:
    static constexpr std::size_t kMostPixels = std::size_t{1} << 26;

    [[nodiscard]] std::int64_t rows() const { return static_cast<std::int64_t>(height_); }

    /** What a thread adds up: rows of pixels, tile by tile. */
    class Band {
    public:
        Band(Multilook& whole, const std::string& name, const RasterDescription& raster)
            : whole_{whole}, file_{name, raster} {}

        /** Whether a row of pixels has power. */
        bool add(std::int64_t row) {
            has_power_ = false;
            const Looks looks = whole_.looks_;
            row_ = std::span{whole_.power_}.subspan(static_cast<std::size_t>(row) * whole_.width_, whole_.width_);
            const int first_line = static_cast<int>(row) * looks.azimuth;
            for_each_tile(looks.azimuth, static_cast<int>(whole_.width_) * looks.range, looks.range,
                          [&](Tile tile) {
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

    Looks looks_;
    std::size_t width_, height_;
    std::vector<float> power_;
    bool has_power_ = false;
};

double decibel(float power) {
    return power > 0.0F ? 10.0 * std::log10(static_cast<double>(power)) : -std::numeric_limits<double>::infinity();
}

// From the 2nd to the 98th percentile of what is not empty, and never less than 3 dB. A part of the pixels, evenly
// taken, tells the percentiles of a large picture.
Stretch automatic_stretch(const std::vector<float>& power) {
    constexpr std::size_t kEnough = 1 << 20;
    const std::size_t step = 1 + power.size() / kEnough;
    std::vector<float> filled;
    for (std::size_t i = 0; i < power.size(); i += step) {
        if (power[i] > 0.0F) filled.push_back(power[i]);
    }
    if (filled.empty()) return {0.0, 1.0};
    const auto percentile = [&](double share) {
        const auto index = static_cast<std::ptrdiff_t>(share * static_cast<double>(filled.size() - 1));
        std::ranges::nth_element(filled, filled.begin() + index);
        return decibel(filled[static_cast<std::size_t>(index)]);
    };
    const double low = percentile(0.02), high = percentile(0.98);
    const double widen = std::max(0.0, 0.5 * (3.0 - (high - low)));
    return {low - widen, high + widen};
}

Stretch stretch_of(const QuicklookOptions& options, const std::vector<float>& power) {
    if (options.db == "auto") return automatic_stretch(power);
    const auto bounds = number_pair(options.db, ':');
    if (!bounds || !(bounds->first < bounds->second))
        throw WrongUse("--db " + options.db + ": not of the form MIN:MAX or auto");
    return {bounds->first, bounds->second};
}

int quicklook(const QuicklookOptions& options) {
    require_apart(raster_files(options.raster), {options.picture});
    if (options.width < 1) throw WrongUse("--width " + std::to_string(options.width));
    DataFile raster;
    read_samples_description(options.raster, raster);
    note_interrupts();
    Multilook multilook{raster, options.raster, looks_of(options, raster)};
    multilook.run(raster, options.raster, options.threads, options.waitbar);
    const Stretch stretch = stretch_of(options, multilook.power());
    drawing::Picture picture{multilook.width(), multilook.height(), 1, {}};
    picture.values.reserve(multilook.power().size());
    for (const float power : multilook.power()) {
        const double share = (decibel(power) - stretch.low_db) / (stretch.high_db - stretch.low_db);
        picture.values.push_back(static_cast<std::uint8_t>(std::lround(255.0 * std::clamp(share, 0.0, 1.0))));
    }
    write_output(options.picture, png_of(picture));
    if (!multilook.has_power())
        complain(options.raster + ": no sample has a power that is a finite number, the picture is black");
    return kFine;
}

}  // namespace

void add_quicklook(Command& program) {
    auto [command, options] =
        add_verb(program, "quicklook", "Shows a raster as a picture: power in dB, multilooked", quicklook);
    command.needs("RASTER", options.raster, "Raster with a side file RASTER.hdr");
    command.needs("OUT", options.picture, "Picture to write (PNG)");
    command.takes("--looks", options.looks, "Lines x samples averaged into a pixel, such as 4x1");
    command.takes("--db", options.db, "Black and white: MIN:MAX in dB, or auto (2nd to 98th percentile)");
    command.takes("--width", options.width, "Greatest width in pixels, in place of --looks (1000)",
                  {.excludes = "--looks"});
    add_block_options(command, options);
}

}  // namespace tool
