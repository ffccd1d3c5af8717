// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <climits>
#include <cmath>
#include <filesystem>
#include <numbers>
#include <optional>
#include <utility>

#include "apart.h"
#include "commands.h"
#include "framed_picture.h"
#include "interrupt.h"
#include "multilook.h"
#include "output.h"
#include "product.h"
#include "quo_base/geometry.h"
#include "raster.h"
#include "stretch.h"
#include "view.h"

namespace tool {
namespace {

struct QuicklookOptions {
    std::string raster, picture, looks, db = "auto", title;
    int width = 1000;
    bool north_up = false, world = false, frame = false, waitbar = false;
    int threads = 0;
};

/** What the header beside a raster tells of it. */
struct Described {
    explicit Described(const std::string& header) {
        const bool any = read_objects(header, product);
        try {
            if (any && Pixels::known(header, product)) pixels.emplace(header, product);
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

Stretch stretch_of(const QuicklookOptions& options, const std::vector<float>& power, std::size_t width) {
    if (options.db == "auto") return automatic_stretch(power, width);
    const auto bounds = number_pair(options.db, ':');
    if (!bounds || !(bounds->first < bounds->second))
        throw WrongUse("--db " + options.db + ": not of the form MIN:MAX or auto");
    return {bounds->first, bounds->second};
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
        throw Failure(options.raster + ": the picture is too large, or too flat, for a frame");
    return framed(picture, around);
}

// --- The verb ---------------------------------------------------------------------------------------------------

void require_sense(const QuicklookOptions& options) {
    if (!options.title.empty() && !options.frame) throw WrongUse("--title: needs --frame, which shows it");
    if (options.world && options.frame) throw WrongUse("--world excludes --frame, whose pixels are no map's");
    if (options.world && options.picture == "-") throw WrongUse("--world: stands beside a picture with a name");
    std::vector<std::string> written{options.picture};
    if (options.world) written.push_back(world_name(options.picture));
    require_apart(raster_files(options.raster), written);
    require_png_name(options.picture);
}

/** Which power no sample has; null for a raster that shows something. */
const char* nothing_seen(const Multilook& multilook) {
    if (!multilook.has_power()) return "that is a finite number";
    return std::ranges::any_of(multilook.power(), [](float power) { return power > 0.0F; }) ? nullptr : "above 0";
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
    Output output{options.picture};
    output.write(png_of(picture));
    if (!map) {
        output.commit();
    } else {
        Output world{world_name(options.picture)};
        world.write(world_text(*map));
        commit_together(output, world);
        said += world_name(options.picture) + ": longitude and latitude in degrees, off by " + rough(map->rms_m) +
                " m rms, " + rough(map->most_m) + " m at most\n";
    }
    if (!said.empty()) print(said);
    if (const char* const none = nothing_seen(multilook))
        complain(options.raster + ": no sample has a power " + none + ", the picture is black");
    return kFine;
}

}  // namespace

void add_quicklook(Command& program) {
    auto [command, options] =
        add_verb(program, "quicklook", "Shows a raster as a picture: power in dB, multilooked", quicklook);
    command.needs("RASTER", options.raster, "Raster with a side file RASTER.hdr");
    command.needs("OUT", options.picture, "Picture to write (PNG)");
    command.takes("--looks", options.looks, "Lines x samples averaged into a pixel, such as 4x1");
    command.takes("--db", options.db, "Black and white: MIN:MAX in dB, or auto (percentiles)",
                  {.offers = {"auto", "MIN:MAX"}});
    command.takes("--width", options.width, "Greatest width in pixels, in place of --looks (1000)",
                  {.excludes = "--looks", .within = {{1, INT_MAX}}});
    command.flag("--north-up", options.north_up,
                 "Turn and mirror it so that north is nearest to the top; say how");
    command.flag("--world", options.world, "Write a world file beside it: longitude and latitude of its pixels");
    command.flag("--frame", options.frame,
                 "Frame with title, axes in km, a bar of decibels and an arrow to the north");
    command.takes("--title", options.title, "Title of the frame, in place of the scene's name");
    add_block_options(command, options);
}

}  // namespace tool
