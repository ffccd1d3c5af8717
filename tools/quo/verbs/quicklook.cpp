#include <algorithm>
#include <cmath>
#include <complex>
#include <filesystem>
#include <limits>
#include <memory>
#include <numbers>
#include <optional>
#include <span>
#include <utility>

#include "apart.h"
#include "commands.h"
#include "common/drawing/picture.h"
#include "framed_picture.h"
#include "interrupt.h"
#include "output.h"
#include "product.h"
#include "progress.h"
#include "quo_base/geometry.h"
#include "raster.h"
#include "view.h"

namespace tool {
namespace {

struct QuicklookOptions {
    std::string raster, picture, looks, db = "auto", title;
    int width = 1000;
    bool north_up = false, world = false, frame = false, waitbar = false;
    int threads = 0;
};

struct Stretch {
    double low_db, high_db;
};

/** What the header beside a raster tells of it. */
struct Described {
    explicit Described(const std::string& header) {
        try {
            if (product.GSread(header.c_str()) == QUO_OK && Pixels::known(header, product))
                pixels.emplace(header, product);
        } catch (const Failure&) {
            return;  // a grid that makes none takes nothing from the picture itself
        }
        spacing = pixels ? pixels->ground_spacing() : std::nullopt;
    }

    GeneralSAR product;
    std::optional<Pixels> pixels;  // where they are known
    std::optional<Pixels::Spacing> spacing;
};

Looks looks_of(const QuicklookOptions& options, const DataFile& raster, const Described& described) {
    if (options.looks.empty()) {
        // As few as keep to the width and to four times it in height.
        const auto times = [](int length, std::int64_t most) {
            return static_cast<int>(std::max<std::int64_t>(1, (std::int64_t{length} + most - 1) / most));
        };
        const Looks least{times(raster.NrOfLinesPerImage, 4 * std::int64_t{options.width}),
                          times(raster.NrOfPixelsPerLine, options.width)};
        const auto& spacing = described.spacing;
        return square_looks(least, spacing ? spacing->sample_m / spacing->line_m : 1.0);
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

    /** The picture, which is not turned yet. */
    [[nodiscard]] View view() const { return {looks_, width_, height_}; }
    [[nodiscard]] const Looks& looks() const { return looks_; }
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

/** The mean powers of blocks of pixels, without the empty ones: in single pixels speckle would reach further than
 * the ground's own contrast does. */
std::vector<float> block_powers(const std::vector<float>& power, std::size_t width) {
    constexpr std::size_t kSide = 4;
    const std::size_t height = power.size() / width;
    std::vector<float> means;
    for (std::size_t top = 0; top < height; top += kSide)
        for (std::size_t left = 0; left < width; left += kSide) {
            float sum = 0.0F, filled = 0.0F;
            for (std::size_t row = top; row < std::min(top + kSide, height); ++row)
                for (std::size_t column = left; column < std::min(left + kSide, width); ++column) {
                    sum += power[row * width + column];
                    filled += power[row * width + column] > 0.0F ? 1.0F : 0.0F;
                }
            if (filled > 0.0F) means.push_back(sum / filled);
        }
    return means;
}

/** From the 2nd to the 98th percentile of the blocks, and 3 dB more either way. A scene of one level stays dark
 * under what is bright in it, and a dark border does not take the contrast from all else. */
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

Stretch stretch_of(const QuicklookOptions& options, const std::vector<float>& power, std::size_t width) {
    if (options.db == "auto") return automatic_stretch(power, width);
    const auto bounds = number_pair(options.db, ':');
    if (!bounds || !(bounds->first < bounds->second))
        throw WrongUse("--db " + options.db + ": not of the form MIN:MAX or auto");
    return {bounds->first, bounds->second};
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

// --- North ------------------------------------------------------------------------------------------------------

const Pixels& placed(const Described& described, const QuicklookOptions& options, const char* option) {
    if (!described.pixels)
        throw Failure(options.raster + ".hdr: does not place the pixels, which " + option +
                      " needs: orbit, look side, and a pixel grid or a region");
    return *described.pixels;
}

/** North and east as steps to the right and down in a picture. */
std::pair<drawing::Point, drawing::Point> north_and_east(const Bearings& turned) {
    return {{turned.across.north, turned.down.north}, {turned.across.east, turned.down.east}};
}

std::string north_text(const View& view, const Bearings& turned) {
    const auto north = north_and_east(turned).first;
    const double degrees = std::atan2(north.x, -north.y) * 180.0 / std::numbers::pi;
    const std::string down = view.upwards() ? "upwards" : "downwards",
                      across = view.leftwards() ? "left" : "right";
    return "lines run " + (view.swapped() ? "to the " + across : down) + ", samples " +
           (view.swapped() ? down : "to the " + across) + "; north is " + fixed(std::abs(degrees), 1) +
           " degrees to the " + (degrees < 0.0 ? "left" : "right") + " of the top\n";
}

// --- World files ------------------------------------------------------------------------------------------------

std::string world_name(const std::string& picture) {
    return std::filesystem::path{picture}.replace_extension(".pgw").string();
}

/** The six numbers of a world file: columns first, then rows, then the left upper pixel's centre. */
std::string world_text(const AffineMap& map) {
    std::string text;
    for (const double value : {map.longitude_per_column, map.latitude_per_column, map.longitude_per_row,
                               map.latitude_per_row, map.longitude_deg, map.latitude_deg})
        text += exact(value) + "\n";
    return text;
}

/** Throws Failure where no affine map comes near to where the pixels lie. */
AffineMap map_of(const QuicklookOptions& options, const View& view, const Pixels& pixels) {
    constexpr double kTolerated = 0.02;  // of the picture's diagonal
    const auto map = fit_map(view, pixels);
    if (!map) throw Failure(options.raster + ": --world: a pixel sees no ground");
    const auto first = view.place(0.0, 0.0), last = view.place(static_cast<double>(view.width()) - 1.0,
                                                               static_cast<double>(view.height()) - 1.0);
    const auto a = pixels.geometry(first.line, first.sample), b = pixels.geometry(last.line, last.sample);
    const double diagonal_m = a && b ? norm(quo::load(a->point_m) - quo::load(b->point_m)) : 0.0;
    if (map->rms_m > kTolerated * diagonal_m)
        throw Failure(options.raster + ": --world: the pixels lie " + fixed(map->rms_m, 0) +
                      " m (rms) off any affine map; quo vrt writes control points instead");
    return *map;
}

// --- Frames -----------------------------------------------------------------------------------------------------

std::string about_text(const Described& described, const Looks& looks) {
    const DataSetInfo_Obj& info = described.product.dataSetInfo;
    std::string text;
    const auto add = [&](const std::string& part) { text += (text.empty() ? "" : "  \u00b7  ") + part; };
    if (described.product.GSexists(gsDataSetInfo)) {
        for (const char* part : {info.SensorName, info.Swath, info.Polarization})
            if (is_told(part)) add(shown(part));
    }
    const std::string pixel = "pixel " + std::to_string(looks.azimuth) + " x " + std::to_string(looks.range);
    if (!described.spacing) {
        add(pixel + " looks");
    } else {
        add(pixel + " looks, " + rough(looks.azimuth * described.spacing->line_m) + " m x " +
            rough(looks.range * described.spacing->sample_m) + " m");
    }
    return text;
}

drawing::Picture with_frame(const drawing::Picture& picture, const QuicklookOptions& options,
                            const Described& described, const View& view, const Looks& looks,
                            const Stretch& stretch) {
    const DataSetInfo_Obj& info = described.product.dataSetInfo;
    const bool has_scene = described.product.GSexists(gsDataSetInfo) && is_told(info.SceneID);
    FrameAround around;
    around.low_db = stretch.low_db;
    around.high_db = stretch.high_db;
    around.about = about_text(described, looks);
    around.title = shown(!options.title.empty() ? options.title : has_scene ? info.SceneID : options.raster);
    const double lines = looks.azimuth * static_cast<double>(view.swapped() ? picture.width : picture.height);
    const double samples = looks.range * static_cast<double>(view.swapped() ? picture.height : picture.width);
    around.down = {"lines", 0.0, lines};
    around.across = {"samples", 0.0, samples};
    if (const auto& spacing = described.spacing) {
        around.down = {"azimuth, km", 0.0, 1e-3 * lines * spacing->line_m};
        around.across = {"ground range, km", 0.0, 1e-3 * samples * spacing->sample_m};
        around.aspect = looks.azimuth * spacing->line_m / (looks.range * spacing->sample_m);
        if (view.swapped()) around.aspect = 1.0 / around.aspect;
    }
    if (view.swapped()) std::swap(around.down, around.across);
    if (view.upwards()) std::swap(around.down.first, around.down.last);
    if (view.leftwards()) std::swap(around.across.first, around.across.last);
    if (const auto bearings = described.pixels ? bearings_of(*described.pixels) : std::nullopt)
        around.north_and_east = north_and_east(view.turned(*bearings));
    if (!can_be_framed(static_cast<double>(picture.width), static_cast<double>(picture.height), around.aspect))
        throw Failure(options.raster + ": the picture is too large for a frame; take more looks");
    return framed(picture, around);
}

// --- The verb ---------------------------------------------------------------------------------------------------

void require_sense(const QuicklookOptions& options) {
    if (options.width < 1) throw WrongUse("--width " + std::to_string(options.width));
    if (!options.title.empty() && !options.frame) throw WrongUse("--title: needs --frame, which shows it");
    if (options.world && options.frame) throw WrongUse("--world excludes --frame, whose pixels are no map's");
    if (options.world && options.picture == "-") throw WrongUse("--world: stands beside a picture with a name");
    std::vector<std::string> written{options.picture};
    if (options.world) written.push_back(world_name(options.picture));
    require_apart(raster_files(options.raster), written);
}

int quicklook(const QuicklookOptions& options) {
    require_sense(options);
    DataFile raster;
    read_samples_description(options.raster, raster);
    const Described described{options.raster + ".hdr"};
    note_interrupts();
    Multilook multilook{raster, options.raster, looks_of(options, raster, described)};
    View view = multilook.view();
    std::string said;
    if (options.north_up) {
        const auto bearings = bearings_of(placed(described, options, "--north-up"));
        if (!bearings) throw Failure(options.raster + ": --north-up: a corner sees no ground");
        view.put_north_up(*bearings);
        said += north_text(view, view.turned(*bearings));
    }
    std::optional<AffineMap> map;
    if (options.world) map = map_of(options, view, placed(described, options, "--world"));

    multilook.run(raster, options.raster, options.threads, options.waitbar);
    const Stretch stretch = stretch_of(options, multilook.power(), multilook.view().width());
    drawing::Picture picture = picture_of(multilook.power(), stretch, view);
    if (options.frame) picture = with_frame(picture, options, described, view, multilook.looks(), stretch);
    write_output(options.picture, png_of(picture));
    if (map) {
        write_output(world_name(options.picture), world_text(*map));
        said += world_name(options.picture) + ": longitude and latitude in degrees, off by " + rough(map->rms_m) +
                " m rms, " + rough(map->most_m) + " m at most\n";
    }
    if (!said.empty()) print(said);
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
    command.takes("--db", options.db, "Black and white: MIN:MAX in dB, or auto (percentiles)");
    command.takes("--width", options.width, "Greatest width in pixels, in place of --looks (1000)",
                  {.excludes = "--looks"});
    command.flag("--north-up", options.north_up,
                 "Turn and mirror it so that north is nearest to the top; say how");
    command.flag("--world", options.world, "Write a world file beside it: longitude and latitude of its pixels");
    command.flag("--frame", options.frame,
                 "Frame with title, axes in km, a bar of decibels and an arrow to the north");
    command.takes("--title", options.title, "Title of the frame, in place of the scene's name");
    add_block_options(command, options);
}

}  // namespace tool
