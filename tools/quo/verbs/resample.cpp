// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <climits>
#include <complex>
#include <filesystem>
#include <memory>
#include <numbers>
#include <optional>
#include <utility>

#include "apart.h"
#include "commands.h"
#include "interrupt.h"
#include "progress.h"
#include "quo_base/image_grid.h"
#include "quo_base/interp.h"
#include "raster.h"
#include "transform.h"

namespace tool {
namespace {

struct ResampleOptions {
    std::string in, out;
    int samples = 0, lines = 0;  // one of them is wanted
    double centre = 0.0;         // cycles per sample
    bool waitbar = false;
    int threads = 0;
};

/** Width and height of an image in memory. */
struct Size {
    int nx, ny;
    [[nodiscard]] std::size_t count() const { return static_cast<std::size_t>(nx) * static_cast<std::size_t>(ny); }
};

/** A phase that turns by so many cycles from sample to sample. */
std::vector<fcomplex> ramp(double cycles, int count) {
    std::vector<fcomplex> turns;
    turns.reserve(static_cast<std::size_t>(count));
    for (int k = 0; k < count; ++k) turns.emplace_back(std::polar(1.0, 2.0 * std::numbers::pi * cycles * k));
    return turns;
}

/** Brings images of one size to another, along one axis: a longer one by zero-padding of the spectrum, a shorter
 * one by cutting it, which keeps what the new sampling can hold. Rows are taken one by one: along them, images
 * have a single one. */
class Resampler {
public:
    /** @param centre  of the band, cycles per sample of the input, which is brought to frequency 0 meanwhile */
    Resampler(const Size& in, const Size& out, double centre) : in_{in}, out_{out} {
        make_plans();  // first: they are refused where the lengths are beyond memory
        if (centre == 0.0) return;
        const double length_in = length(in), length_out = length(out);
        down_ = ramp(-centre, length(in));
        up_ = ramp(centre * length_in / length_out, length(out));
    }

    /** The input is overwritten. */
    void run(fcomplex* from, fcomplex* to) {
        turn(from, down_);
        forward_ ? shorten(from, to) : require_transform(longer_.interpft_p(from, to));
        turn(to, up_);
    }

private:
    void make_plans() {
        if (out_.count() >= in_.count()) {
            require_transform(longer_.setplans(in_.nx, in_.ny, out_.nx, out_.ny));
            return;
        }
        const int rows = along() ? 1 : 0, columns = 1 - rows;
        forward_.emplace(in_.nx, in_.ny, rows, columns);
        inverse_.emplace(out_.nx, out_.ny, -2 * rows, -2 * columns);
    }
    [[nodiscard]] bool along() const { return in_.ny == 1 && out_.ny == 1; }
    [[nodiscard]] int length(const Size& size) const { return along() ? size.nx : size.ny; }
    /** Samples that belong together: of a row that is a place on the axis, or single ones. */
    [[nodiscard]] std::ptrdiff_t step() const { return along() ? 1 : in_.nx; }

    void turn(fcomplex* image, const std::vector<fcomplex>& turns) const {
        for (const fcomplex by : turns)
            for (std::ptrdiff_t k = 0; k < step(); ++k) *image++ *= by;
    }

    void shorten(fcomplex* from, fcomplex* to) const {
        forward_->run(from);
        // The lowest frequencies of either sign; of an even number, one more of the negative.
        const std::ptrdiff_t upper = (length(out_) + 1) / 2, lower = length(out_) - upper;
        std::copy_n(from, upper * step(), to);
        std::copy_n(from + (length(in_) - lower) * step(), lower * step(), to + upper * step());
        inverse_->run(to);
        const float factor = 1.0F / static_cast<float>(length(in_));
        std::transform(to, to + out_.count(), to, [factor](fcomplex value) { return value * factor; });
    }

    Size in_, out_;
    std::vector<fcomplex> down_, up_;  // empty where the band is centred
    interp longer_;
    std::optional<Transform> forward_, inverse_;
};

/** Throws Failure where a raster is larger than what its disk has left, as far as the system knows that. */
void require_room(const std::string& name, const RasterDescription& raster) {
    std::error_code unknown;
    const auto place = std::filesystem::weakly_canonical(std::filesystem::absolute(name, unknown), unknown);
    const auto disk = std::filesystem::space(place.parent_path(), unknown);
    const auto size = static_cast<std::uintmax_t>(std::max<std::int64_t>(raster.rasterSize(), 0));
    if (!unknown && disk.capacity > 0 && size > disk.available)
        throw Failure(name + ": needs " + std::to_string(size) + " bytes, its disk has " +
                      std::to_string(disk.available) + " left");
}

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

/** A part of a raster that is resampled at once: where it is read, how many of the columns that come of it are
 * known already, and where the rest is written. */
struct Part {
    Tile from;
    int known;
    Tile to;
};

/** What became of a part. */
struct Resampled {
    Tile to;
    std::vector<fcomplex> samples;
};

/** What a thread needs to resample parts of one size. */
class PartResampler {
public:
    PartResampler(const std::string& name, const RasterDescription& in, const Size& from, const Size& to,
                  double centre)
        : in_{name, in}, to_{to}, resampler_{from, to, centre}, source_(from.count()) {}

    Resampled run(const Part& part) {
        Resampled result{part.to, std::vector<fcomplex>(to_.count())};
        in_.read(part.from, source_.data());
        resampler_.run(source_.data(), result.samples.data());
        drop_columns(result.samples, part.known);
        return result;
    }

private:
    // The first columns: the strip before has them.
    void drop_columns(std::vector<fcomplex>& samples, int known) const {
        for (int line = 0; known > 0 && line < to_.ny; ++line) {
            const auto row = samples.begin() + std::ptrdiff_t{line} * to_.nx;
            std::copy(row + known, row + to_.nx, samples.begin() + std::ptrdiff_t{line} * (to_.nx - known));
        }
    }

    RasterReader in_;
    Size to_;
    Resampler resampler_;
    std::vector<fcomplex> source_;
};

/** A raster of another number of samples or lines. */
class Resampling {
public:
    Resampling(const ResampleOptions& options, const RasterDescription& in)
        : options_{options}, in_{in}, out_{options.out, Wanted{options, in}} {}

    void run() {
        options_.lines > 0 ? by_strips() : by_lines();
        const double lines = in_.NrOfLinesPerImage, samples = in_.NrOfPixelsPerLine;
        out_.commit(options_.in, {0.0, 0.0, lines / to().NrOfLinesPerImage, samples / to().NrOfPixelsPerLine});
    }

private:
    [[nodiscard]] const RasterDescription& to() const { return out_.description(); }

    // Each line is an image of its own, so that nothing depends on how many are read at once.
    void by_lines() {
        const Size from{in_.NrOfPixelsPerLine, 1}, into{to().NrOfPixelsPerLine, 1};
        const Resampler can_be_had{from, into, options_.centre};
        require_room(options_.out, to());
        int line = 0;
        const auto next = [&]() -> std::optional<Part> {
            throw_if_interrupted();
            if (line == in_.NrOfLinesPerImage) return std::nullopt;
            const Part part{{line, 1, 0, from.nx}, 0, {line, 1, 0, into.nx}};
            ++line;
            return part;
        };
        run_parts(from, into, next);
    }

    // Whole columns, as many of them as memory should hold; the last strip may overlap the one before.
    void by_strips() {
        const int lines_in = in_.NrOfLinesPerImage, lines_out = to().NrOfLinesPerImage;
        const int samples = in_.NrOfPixelsPerLine;
        const auto fitting = kStripSamples / (std::int64_t{lines_in} + lines_out);
        const int width = static_cast<int>(std::clamp<std::int64_t>(fitting, 1, samples));
        const Size from{width, lines_in}, into{width, lines_out};
        const Resampler can_be_had{from, into, options_.centre};
        require_room(options_.out, to());
        take_room();
        std::int64_t begun = 0;
        const auto next = [&]() -> std::optional<Part> {
            throw_if_interrupted();
            if (begun >= samples) return std::nullopt;
            const int first = static_cast<int>(std::min<std::int64_t>(begun, samples - width));
            const int known = static_cast<int>(begun) - first;
            begun += width;
            return Part{{0, lines_in, first, width}, known, {0, lines_out, first + known, width - known}};
        };
        run_parts(from, into, next);
    }

    template <typename Next>
    void run_parts(const Size& from, const Size& into, Next next) {
        Progress progress{options_.waitbar ? "Resampling" : nullptr};
        std::int64_t done = 0;
        const auto make_worker = [&] {
            auto own = std::make_unique<PartResampler>(options_.in, in_, from, into, options_.centre);
            return [own = std::move(own)](const Part& part) { return own->run(part); };
        };
        const std::int64_t bytes = to().element_sizeof();
        blocks::in_order(options_.threads, next, make_worker, [&](const Resampled& part) {
            write(part.to, part.samples);
            done += static_cast<std::int64_t>(part.to.size());
            progress.step(done * bytes, bytes * to().NrOfLinesPerImage * to().NrOfPixelsPerLine);
        });
    }

    // Strips leave gaps for those that follow: a disk that is too small must be found before.
    void take_room() {
        std::vector<fcomplex> nothing;
        for_each_tile(to().NrOfLinesPerImage, to().NrOfPixelsPerLine, 1, [&](const Tile& tile) {
            throw_if_interrupted();
            nothing.resize(tile.size());
            write(tile, nothing);
        });
    }

    void write(const Tile& tile, const std::vector<fcomplex>& samples) {
        if (to().CellType == FLOAT_COMPLEX) return out_.write(tile, samples.data());
        if (to().is_complex() != 0) {
            doubles_.assign(samples.begin(), samples.begin() + static_cast<std::ptrdiff_t>(tile.size()));
            return out_.write(tile, doubles_.data());
        }
        to().CellType == FLOAT32 ? write_real(tile, samples, real_singles_)
                                 : write_real(tile, samples, real_doubles_);
    }
    template <typename T>
    void write_real(const Tile& tile, const std::vector<fcomplex>& samples, std::vector<T>& room) {
        room.resize(tile.size());
        std::transform(samples.begin(), samples.begin() + static_cast<std::ptrdiff_t>(tile.size()), room.begin(),
                       [](fcomplex value) { return static_cast<T>(value.real()); });
        out_.write(tile, room.data());
    }

    static constexpr std::int64_t kStripSamples = 8 << 20;  // read and written: 64 MiB for each thread

    const ResampleOptions& options_;
    const RasterDescription& in_;
    NewRaster out_;
    std::vector<dcomplex> doubles_;
    std::vector<float> real_singles_;
    std::vector<double> real_doubles_;
};

/** What is wrong with a centre; empty for none. A range alone lets through what is no number. */
std::string defect_of_centre(const std::string& text) {
    const auto centre = finite_number(text);
    if (!centre) return text + " is no number of cycles per sample";
    return *centre >= -0.5 && *centre <= 0.5 ? "" : text + " is not within -0.5 to 0.5 cycles per sample";
}

int resample(const ResampleOptions& options) {
    require_raster_apart(options.in, options.out);
    DataFile description;
    read_samples_description(options.in, description);
    if (options.centre != 0.0 && description.is_complex() == 0)
        throw WrongUse("--centre: samples that are real have a band around 0");
    ImageGrid_Obj grid;
    if (options.lines > 0 && grid.readhdr((options.in + ".hdr").c_str()) == QUO_OK && grid.Bursts > 0)
        throw Failure(options.in + ": lines of bursts keep their sampling");
    note_interrupts();
    try {
        Resampling{options, description}.run();
    } catch (const TransformFailure& failure) {
        throw Failure(options.in + ": " + failure.what());
    }
    return kFine;
}

}  // namespace

void add_resample(Command& program) {
    auto [command, options] =
        add_verb(program, "resample", "Changes the number of samples or lines of a raster of any size", resample);
    command.needs("IN", options.in, "Raster with a side file IN.hdr");
    command.needs("OUT", options.out, "Raster to write, with a side file OUT.hdr");
    Command size = command.either("One of these", "What OUT has more or fewer of: one of --samples, --lines");
    size.takes("--samples", options.samples, "Samples per line", {.within = {{1, INT_MAX}}});
    size.takes("--lines", options.lines, "Lines", {.within = {{1, INT_MAX}}});
    command.takes("--centre", options.centre, "Centre of the band in cycles per sample, where it is not 0",
                  {.defect = defect_of_centre});
    add_block_options(command, options);
}

}  // namespace tool
