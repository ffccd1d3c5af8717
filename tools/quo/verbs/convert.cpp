// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <complex>
#include <memory>
#include <optional>
#include <utility>
#include <variant>
#include <vector>

#include "apart.h"
#include "commands.h"
#include "interrupt.h"
#include "progress.h"
#include "quo_base/gen_utils.h"
#include "raster.h"

namespace tool {
namespace {

struct ConvertOptions {
    std::string in, out, type, order, lines = ":", samples = ":", prefix = "keep", scale = "1", offset = "0";
    bool waitbar = false;
    int threads = 0;
};

/** The description of the raster that the options ask for. */
class Wanted : public RasterDescription {
public:
    Wanted(const ConvertOptions& options, const RasterDescription& in, const Cut& lines, const Cut& samples) {
        copyDescription(in);
        HeaderOffset = 0;
        NrOfLinesPerImage = lines.count();
        NrOfPixelsPerLine = samples.count();
        if (!options.type.empty()) CellType = type_of(options.type);
        if (!options.order.empty()) ByteOrder = options.order == "m" ? 1 : 0;
        if (options.prefix == "drop") RowPrefix = 0;
        if (in.is_complex() != 0 && is_complex() == 0) {
            throw WrongUse("--type " + type_name(CellType) + ": complex samples do not become real ones");
        }
    }
};

/** What becomes of each value: scale x value + offset. Of complex values both parts are scaled, and the real one
 * is moved. */
class Scaling {
public:
    explicit Scaling(const ConvertOptions& options)
        : scale_{finite_number(options.scale, "--scale")}, offset_{finite_number(options.offset, "--offset")} {
        if (scale_ == 0.0) throw WrongUse("--scale 0: would leave nothing of the samples");
    }

    [[nodiscard]] bool changes() const { return scale_ != 1.0 || offset_ != 0.0; }
    template <typename T>
    void apply(std::vector<T>& values) const {
        for (T& value : values) value = value * scale_ + offset_;
    }

private:
    double scale_, offset_;
};

/** Samples of a tile in the type that they are written from, or as they are to stand in the file. */
using Samples = std::variant<std::vector<char>, std::vector<float>, std::vector<double>, std::vector<fcomplex>,
                             std::vector<dcomplex>>;

struct Converted {
    Tile tile;
    Samples samples;
};

/** Whether samples stay what they are, but for their byte order. */
bool keeps_samples(const RasterDescription& wanted, const RasterDescription& in, const Scaling& scaling) {
    return wanted.CellType == in.CellType && !scaling.changes();
}

/** What a thread needs to read tiles and bring their samples to what is written. */
class TileReader {
public:
    TileReader(const std::string& name, const RasterDescription& in, const RasterDescription& wanted,
               const Scaling& scaling, Cut lines, Cut samples)
        : in_{name, in}, wanted_{wanted}, scaling_{scaling}, lines_{lines}, samples_{samples} {}

    Converted read(const Tile& tile) {
        if (keeps_samples(wanted_, in_.description(), scaling_)) return {tile, stored(tile)};
        const bool complex = wanted_.is_complex() != 0;
        if (scaling_.changes()) {
            if (complex) return {tile, scaled<dcomplex>(tile)};
            return {tile, in_written_type(scaled<double>(tile))};
        }
        if (wanted_.CellType == FLOAT_COMPLEX) return {tile, samples<fcomplex>(tile)};
        if (complex) return {tile, samples<dcomplex>(tile)};
        if (wanted_.CellType == FLOAT32) return {tile, samples<float>(tile)};
        return {tile, samples<double>(tile)};
    }

private:
    [[nodiscard]] Tile in_source(Tile tile) const {
        tile.first_line += lines_.first;
        tile.first_sample += samples_.first;
        return tile;
    }
    // Bytes of one type, in the byte order that is wanted.
    std::vector<char> stored(const Tile& tile) {
        const int bytes = wanted_.element_sizeof(), parts = 1 + wanted_.is_complex();
        std::vector<char> values(tile.size() * static_cast<std::size_t>(bytes));
        in_.read(in_source(tile), values.data());
        get_endian(values.data(), static_cast<std::int64_t>(tile.size()) * parts, bytes / parts,
                   wanted_.ByteOrder == in_.description().ByteOrder ? 0 : 1);
        return values;
    }
    template <typename T>
    std::vector<T> samples(const Tile& tile) {
        std::vector<T> values(tile.size());
        in_.read(in_source(tile), values.data());
        return values;
    }
    // In double precision, whatever the two types.
    template <typename T>
    std::vector<T> scaled(const Tile& tile) {
        std::vector<T> values = samples<T>(tile);
        scaling_.apply(values);
        return values;
    }
    // FLOAT32 is written from its own type.
    [[nodiscard]] Samples in_written_type(std::vector<double> values) const {
        if (wanted_.CellType != FLOAT32) return values;
        std::vector<float> singles(values.size());
        std::ranges::transform(values, singles.begin(), [](double value) { return static_cast<float>(value); });
        return singles;
    }

    RasterReader in_;
    const RasterDescription& wanted_;
    const Scaling& scaling_;
    Cut lines_, samples_;
};

/** The part of a raster that is copied, tile by tile. */
class Conversion {
public:
    Conversion(const ConvertOptions& options, const RasterDescription& description)
        : options_{options},
          lines_{cut_of(options.lines, description.NrOfLinesPerImage, "--lines")},
          samples_{cut_of(options.samples, description.NrOfPixelsPerLine, "--samples")},
          wanted_{options, description, lines_, samples_},
          scaling_{options},
          in_{options.in, description},
          out_{options.out, wanted_} {
        if (!scaling_.changes() && holds_every_value(wanted_, description)) out_.expect_no_losses();
    }

    void run() {
        copy_tiles();
        out_.commit(options_.in,
                    {static_cast<double>(lines_.first), static_cast<double>(samples_.first), 1.0, 1.0});
    }

private:
    void copy_tiles() {
        Progress progress{options_.waitbar ? "Converting" : nullptr};
        std::vector<Tile> tiles;
        for_each_tile(lines_.count(), samples_.count(), 1, [&](const Tile& tile) { tiles.push_back(tile); });
        const auto tell = [&](const Tile& tile) {
            progress.step(
                sample_offset(wanted_, tile.first_line + tile.lines - 1, tile.first_sample + tile.samples),
                wanted_.rasterSize());
        };
        if (keeps_bytes()) {
            for (const Tile& tile : tiles) {
                throw_if_interrupted();
                copy(tile);
                tell(tile);
            }
            return;
        }
        auto tile = tiles.cbegin();
        const auto next = [&]() -> std::optional<Tile> {
            throw_if_interrupted();
            if (tile == tiles.cend()) return std::nullopt;
            return *tile++;
        };
        const auto make_worker = [&] {
            auto own =
                std::make_unique<TileReader>(options_.in, in_.description(), wanted_, scaling_, lines_, samples_);
            return [own = std::move(own)](const Tile& part) { return own->read(part); };
        };
        blocks::in_order(options_.threads, next, make_worker, [&](const Converted& part) {
            write(part);
            tell(part.tile);
        });
    }

    void write(const Converted& part) {
        if (part.tile.first_sample == 0) {
            for (int line = 0; line < part.tile.lines; ++line) copy_prefix(part.tile.first_line + line);
        }
        std::visit([&](const auto& samples) { out_.write(part.tile, samples.data()); }, part.samples);
    }

    void copy_prefix(int line) {
        const std::int64_t bytes = wanted_.RowPrefix;
        out_.copy_bytes(sample_offset(wanted_, line, 0) - bytes, in_,
                        sample_offset(in_.description(), lines_.first + line, 0) - bytes, bytes);
    }

    // Whether whole lines are copied as they stand.
    [[nodiscard]] bool keeps_bytes() const {
        const RasterDescription& in = in_.description();
        const bool same_order = wanted_.ByteOrder == in.ByteOrder || wanted_.CellType >= INT8_COMPLEX;
        return keeps_samples(wanted_, in, scaling_) && same_order && samples_.count() == in.NrOfPixelsPerLine &&
               wanted_.RowPrefix == in.RowPrefix;
    }
    // From the first prefix to the last sample.
    void copy(const Tile& tile) {
        const std::int64_t prefix = tile.first_sample == 0 ? wanted_.RowPrefix : 0;
        const std::int64_t to = sample_offset(wanted_, tile.first_line, tile.first_sample) - prefix;
        const std::int64_t end =
            sample_offset(wanted_, tile.first_line + tile.lines - 1, tile.first_sample + tile.samples);
        const std::int64_t from =
            sample_offset(in_.description(), lines_.first + tile.first_line, tile.first_sample) - prefix;
        out_.copy_bytes(to, in_, from, end - to);
    }

    const ConvertOptions& options_;
    Cut lines_, samples_;
    Wanted wanted_;
    Scaling scaling_;
    RasterReader in_;  // for what is copied as it stands
    NewRaster out_;
};

int convert(const ConvertOptions& options) {
    require_raster_apart(options.in, options.out);
    DataFile description;
    read_description(options.in, description);
    note_interrupts();
    Conversion{options, description}.run();
    return kFine;
}

}  // namespace

void add_convert(Command& program) {
    auto [command, options] = add_verb(program, "convert", "Cuts and converts a raster of any size", convert);
    command.needs("IN", options.in, "Raster with a side file IN.hdr");
    command.needs("OUT", options.out, "Raster to write, with a side file OUT.hdr");
    command.takes("--type", options.type, "Cell type of OUT, such as FLOAT32 or SHORT_COMPLEX");
    command.takes("--order", options.order, "Byte order of OUT: l little-endian, m big-endian",
                  {.one_of = {"l", "m"}});
    command.takes("--lines", options.lines, "Lines A:B, counted from 0, B excluded");
    command.takes("--samples", options.samples, "Samples A:B of each line");
    command.takes("--prefix", options.prefix, "Line prefixes: keep (default) or drop",
                  {.one_of = {"keep", "drop"}});
    command.takes("--scale", options.scale, "Factor for every sample (1), before --offset");
    command.takes("--offset", options.offset, "What is added to every sample (0)");
    add_block_options(command, options);
}

}  // namespace tool
