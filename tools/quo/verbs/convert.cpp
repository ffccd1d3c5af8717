#include <algorithm>
#include <complex>
#include <type_traits>

#include "apart.h"
#include "commands.h"
#include "interrupt.h"
#include "progress.h"
#include "raster.h"

namespace tool {
namespace {

struct ConvertOptions {
    std::string in, out, type, order, lines = ":", samples = ":", prefix = "keep", scale = "1", offset = "0";
    bool waitbar = false;
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
        : scale_{number_of("--scale", options.scale)}, offset_{number_of("--offset", options.offset)} {
        if (scale_ == 0.0) throw WrongUse("--scale 0: would leave nothing of the samples");
    }

    [[nodiscard]] bool changes() const { return scale_ != 1.0 || offset_ != 0.0; }
    template <typename T>
    void apply(std::vector<T>& values) const {
        for (T& value : values) value = value * scale_ + offset_;
    }

private:
    static double number_of(const char* option, const std::string& text) {
        const auto number = finite_number(text);
        if (!number) throw WrongUse(std::string{option} + " " + text + ": no finite number");
        return *number;
    }

    double scale_, offset_;
};

/** The part of a raster that is copied, tile by tile. */
class Conversion {
public:
    Conversion(const ConvertOptions& options, const RasterDescription& description)
        : lines_{cut_of(options.lines, description.NrOfLinesPerImage, "--lines")},
          samples_{cut_of(options.samples, description.NrOfPixelsPerLine, "--samples")},
          wanted_{options, description, lines_, samples_},
          scaling_{options},
          in_{options.in, description},
          out_{options.out, wanted_} {
        if (!scaling_.changes() && holds_every_value(wanted_, description)) out_.expect_no_losses();
    }

    void run(bool waitbar) {
        {
            Progress progress{waitbar ? "Converting" : nullptr};
            for_each_tile(lines_.count(), samples_.count(), 1, [&](const Tile& tile) {
                throw_if_interrupted();
                copy(tile);
                progress.step(
                    sample_offset(wanted_, tile.first_line + tile.lines - 1, tile.first_sample + tile.samples),
                    wanted_.rasterSize());
            });
        }
        out_.commit();
    }

private:
    void copy(const Tile& tile) {
        if (tile.first_sample == 0) {
            for (int line = 0; line < tile.lines; ++line) copy_prefix(tile.first_line + line);
        }
        if (scaling_.changes()) {
            wanted_.is_complex() != 0 ? scale_samples(tile, doubles_) : scale_samples(tile, real_doubles_);
        } else if (wanted_.CellType == FLOAT_COMPLEX) {
            copy_samples(tile, singles_);
        } else if (wanted_.is_complex() != 0) {
            copy_samples(tile, doubles_);
        } else if (wanted_.CellType == FLOAT32) {
            copy_samples(tile, real_singles_);
        } else {
            copy_samples(tile, real_doubles_);
        }
    }

    template <typename T>
    void read_samples(const Tile& tile, std::vector<T>& room) {
        room.resize(tile.size());
        Tile from = tile;
        from.first_line += lines_.first;
        from.first_sample += samples_.first;
        in_.read(from, room.data());
    }
    template <typename T>
    void copy_samples(const Tile& tile, std::vector<T>& room) {
        read_samples(tile, room);
        out_.write(tile, room.data());
    }
    // In double precision, whatever the two types.
    template <typename T>
    void scale_samples(const Tile& tile, std::vector<T>& room) {
        read_samples(tile, room);
        scaling_.apply(room);
        if (wanted_.CellType != FLOAT32) return out_.write(tile, room.data());
        if constexpr (std::is_same_v<T, double>) {  // FLOAT32 is written from its own type
            real_singles_.resize(room.size());
            std::ranges::transform(room, real_singles_.begin(), [](T value) { return static_cast<float>(value); });
            out_.write(tile, real_singles_.data());
        }
    }

    void copy_prefix(int line) {
        const std::int64_t bytes = wanted_.RowPrefix;
        const std::int64_t from = sample_offset(in_.description(), lines_.first + line, 0) - bytes;
        const std::int64_t to = sample_offset(wanted_, line, 0) - bytes;
        for (std::int64_t done = 0; done < bytes; done += kPiece) {
            const std::int64_t piece = std::min(kPiece, bytes - done);
            prefix_.resize(static_cast<std::size_t>(piece));
            in_.read_bytes(from + done, prefix_.data(), piece);
            out_.write_bytes(to + done, prefix_.data(), piece);
        }
    }

    static constexpr std::int64_t kPiece = 1 << 20;

    Cut lines_, samples_;
    Wanted wanted_;
    Scaling scaling_;
    RasterReader in_;
    NewRaster out_;
    // One of them holds the samples of a tile.
    std::vector<float> real_singles_;
    std::vector<double> real_doubles_;
    std::vector<fcomplex> singles_;
    std::vector<dcomplex> doubles_;
    std::vector<char> prefix_;
};

int convert(const ConvertOptions& options) {
    require_raster_apart(options.in, options.out);
    DataFile description;
    read_description(options.in, description);
    note_interrupts();
    Conversion{options, description}.run(options.waitbar);
    return kFine;
}

}  // namespace

void add_convert(CLI::App& app, Job& job) {
    const auto [command, options] =
        add_verb(app, job, "convert", "Cuts and converts a raster of any size", convert);
    command->add_option("IN", options.in, "Raster with a side file IN.hdr")->required();
    command->add_option("OUT", options.out, "Raster to write, with a side file OUT.hdr")->required();
    command->add_option("--type", options.type, "Cell type of OUT, such as FLOAT32 or SHORT_COMPLEX");
    command->add_option("--order", options.order, "Byte order of OUT: l little-endian, m big-endian")
        ->check(CLI::IsMember({"l", "m"}));
    command->add_option("--lines", options.lines, "Lines A:B, counted from 0, B excluded");
    command->add_option("--samples", options.samples, "Samples A:B of each line");
    command->add_option("--prefix", options.prefix, "Line prefixes: keep (default) or drop")
        ->check(CLI::IsMember({"keep", "drop"}));
    command->add_option("--scale", options.scale, "Factor for every sample (1), before --offset");
    command->add_option("--offset", options.offset, "What is added to every sample (0)");
    add_waitbar_option(*command, options.waitbar);
}

}  // namespace tool
