#include <algorithm>
#include <climits>
#include <complex>
#include <memory>
#include <optional>
#include <vector>

#include "commands.h"
#include "failure.h"
#include "interrupt.h"
#include "progress.h"
#include "quo_base/interp.h"
#include "raster.h"
#include "transform.h"

namespace tool {
namespace {

struct ResampleOptions {
    std::string in, out;
    int samples = 0, lines = 0;  // one of them is wanted
    bool waitbar = false;
};

/** Width and height of an image in memory. */
struct Size {
    int nx, ny;
    [[nodiscard]] std::size_t count() const { return static_cast<std::size_t>(nx) * static_cast<std::size_t>(ny); }
};

/** Brings images of one size to another, along one axis: a longer one by zero-padding of the spectrum, a shorter
 * one by cutting it, which keeps what the new sampling can hold. */
class Resampler {
public:
    Resampler(const Size& in, const Size& out) : in_{in}, out_{out} {
        if (out.count() >= in.count()) {
            require_transform(longer_.setplans(in.nx, in.ny, out.nx, out.ny));
            return;
        }
        const int along = out.nx != in.nx ? 1 : 0, down = 1 - along;
        forward_.emplace(in.nx, in.ny, along, down);
        inverse_.emplace(out.nx, out.ny, -2 * along, -2 * down);
    }

    /** The input is overwritten. */
    void run(fcomplex* from, fcomplex* to) {
        if (!forward_) return require_transform(longer_.interpft_p(from, to));
        forward_->run(from);
        cut(from, to);
        inverse_->run(to);
        const float factor = 1.0F / static_cast<float>(out_.nx != in_.nx ? in_.nx : in_.ny);
        std::transform(to, to + out_.count(), to, [factor](fcomplex value) { return value * factor; });
    }

private:
    /** The lowest frequencies of either sign; of an even number, one more of the negative. */
    void cut(const fcomplex* from, fcomplex* to) const {
        const bool along = out_.nx != in_.nx;
        const std::ptrdiff_t bin = along ? 1 : in_.nx, bins_in = along ? in_.nx : in_.ny;
        const std::ptrdiff_t bins = along ? out_.nx : out_.ny, rows = along ? in_.ny : 1;
        const std::ptrdiff_t upper = (bins + 1) / 2, lower = bins - upper;
        for (std::ptrdiff_t row = 0; row < rows; ++row, from += bins_in * bin, to += bins * bin) {
            std::copy_n(from, upper * bin, to);
            std::copy_n(from + (bins_in - lower) * bin, lower * bin, to + upper * bin);
        }
    }

    Size in_, out_;
    interp longer_;
    std::optional<Transform> forward_, inverse_;
};

/** The description of the raster that the options ask for. */
class Wanted : public RasterDescription {
public:
    Wanted(const ResampleOptions& options, const RasterDescription& in) {
        copyDescription(in);
        HeaderOffset = 0;
        RowPrefix = 0;
        (options.lines > 0 ? NrOfLinesPerImage : NrOfPixelsPerLine) = std::max(options.lines, options.samples);
    }
};

/** A raster of another number of samples or lines. */
class Resampling {
public:
    Resampling(const ResampleOptions& options, const RasterDescription& in)
        : lines_{options.lines > 0}, in_{options.in, in}, out_{options.out, Wanted{options, in}} {}

    void run(bool waitbar) {
        Progress progress{Progress::Unit::kBytes, waitbar ? "Resampling" : nullptr};
        lines_ ? by_strips(progress) : by_lines(progress);
        throw_if_interrupted();
        out_.commit();
    }

private:
    [[nodiscard]] const RasterDescription& from() const { return in_.description(); }
    [[nodiscard]] const RasterDescription& to() const { return out_.description(); }

    // Each line is an image of its own, so that nothing depends on how many are read at once.
    void by_lines(Progress& progress) {
        const Size in{from().NrOfPixelsPerLine, 1}, out{to().NrOfPixelsPerLine, 1};
        Resampler resampler{in, out};
        source_.resize(in.count());
        result_.resize(out.count());
        for (int line = 0; line < from().NrOfLinesPerImage; ++line) {
            throw_if_interrupted();
            in_.read({line, 1, 0, in.nx}, source_.data());
            resampler.run(source_.data(), result_.data());
            write({line, 1, 0, out.nx});
            progress.step(sample_offset(to(), line, out.nx), to().rasterSize());
        }
    }

    // Whole columns, as many of them as memory should hold; the last strip may overlap the one before.
    void by_strips(Progress& progress) {
        const int lines_in = from().NrOfLinesPerImage, lines_out = to().NrOfLinesPerImage;
        const int samples = from().NrOfPixelsPerLine;
        const auto fitting = kStripSamples / (std::int64_t{lines_in} + lines_out);
        const int width = static_cast<int>(std::clamp<std::int64_t>(fitting, 1, samples));
        const Size in{width, lines_in}, out{width, lines_out};
        Resampler resampler{in, out};
        take_room();
        source_.resize(in.count());
        result_.resize(out.count());
        for (std::int64_t next = 0; next < samples; next += width) {
            throw_if_interrupted();
            const int first = static_cast<int>(std::min<std::int64_t>(next, samples - width));
            in_.read({0, lines_in, first, width}, source_.data());
            resampler.run(source_.data(), result_.data());
            write({0, lines_out, first, width});
            progress.step((first + width) * std::int64_t{lines_out}, std::int64_t{samples} * lines_out);
        }
    }

    // Strips leave gaps for those that follow: a disk that is too small must be found before.
    void take_room() {
        for_each_tile(to().NrOfLinesPerImage, to().NrOfPixelsPerLine, 1, [this](const Tile& tile) {
            throw_if_interrupted();
            result_.assign(tile.size(), {});
            write(tile);
        });
    }

    void write(const Tile& tile) {
        if (to().CellType == FLOAT_COMPLEX) return out_.write(tile, result_.data());
        if (to().is_complex() != 0) {
            doubles_.assign(result_.begin(), result_.begin() + static_cast<std::ptrdiff_t>(tile.size()));
            return out_.write(tile, doubles_.data());
        }
        to().CellType == FLOAT32 ? write_real(tile, real_singles_) : write_real(tile, real_doubles_);
    }
    template <typename T>
    void write_real(const Tile& tile, std::vector<T>& room) {
        room.resize(tile.size());
        std::transform(result_.begin(), result_.begin() + static_cast<std::ptrdiff_t>(tile.size()), room.begin(),
                       [](fcomplex value) { return static_cast<T>(value.real()); });
        out_.write(tile, room.data());
    }

    static constexpr std::int64_t kStripSamples = 8 << 20;  // read and written: 64 MiB

    bool lines_;
    RasterReader in_;
    NewRaster out_;
    std::vector<fcomplex> source_, result_;
    std::vector<dcomplex> doubles_;
    std::vector<float> real_singles_;
    std::vector<double> real_doubles_;
};

int resample(const ResampleOptions& options) {
    DataFile description;
    read_description(options.in, description);
    if (description.NrOfLinesPerImage < 1 || description.NrOfPixelsPerLine < 1)
        throw Failure(options.in + ": is empty");
    note_interrupts();
    Resampling{options, description}.run(options.waitbar);
    return kFine;
}

}  // namespace

void add_resample(CLI::App& app, Job& job) {
    auto options = std::make_shared<ResampleOptions>();
    CLI::App* command =
        app.add_subcommand("resample", "Changes the number of samples or lines of a raster of any size");
    command->add_option("IN", options->in, "Raster with a side file IN.hdr")->required();
    command->add_option("OUT", options->out, "Raster to write; its side file is written last")->required();
    CLI::App* size = command->add_option_group("New size")->require_option(1);
    size->add_option("--samples", options->samples, "Samples per line")->check(CLI::Range(1, INT_MAX));
    size->add_option("--lines", options->lines, "Lines")->check(CLI::Range(1, INT_MAX));
    add_waitbar_option(*command, options->waitbar);
    command->callback([options, &job] { job = [options] { return resample(*options); }; });
}

}  // namespace tool
