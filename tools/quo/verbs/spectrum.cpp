// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <complex>
#include <functional>
#include <memory>
#include <nlohmann/json.hpp>
#include <numbers>
#include <optional>
#include <utility>

#include "apart.h"
#include "commands.h"
#include "document.h"
#include "interrupt.h"
#include "output.h"
#include "progress.h"
#include "quo_base/acquisition.h"
#include "quo_base/derived_raster.h"
#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"
#include "raster.h"
#include "spectrum_picture.h"
#include "transform.h"

namespace tool {
namespace {

struct SpectrumOptions {
    std::string raster, picture, header;
    bool json = false, waitbar = false;
    int threads = 0;
};

constexpr int kLongest = 1024;  // samples and lines of a segment

/** The mean power of segments, bin by bin; frequencies from 0 up. */
using Power = std::vector<double>;

/** A taper, so that strong targets stay within their bins. */
std::vector<float> hann(int length) {
    std::vector<float> window(static_cast<std::size_t>(length));
    double place = 0.5;
    for (float& factor : window)
        factor = static_cast<float>(0.5 - 0.5 * std::cos(2.0 * std::numbers::pi * place++ / length));
    return window;
}

/** Where segments of a length start so that all of an axis is covered; the last two may overlap. */
std::vector<int> starts(int in_all, int length) {
    std::vector<int> firsts;
    for (std::int64_t first = 0; first < in_all; first += length)
        firsts.push_back(static_cast<int>(std::min<std::int64_t>(first, in_all - length)));
    return firsts;
}

/** The power spectra of one segment along both axes. */
struct SegmentPower {
    Power range, azimuth;
};

/** What a thread needs to look at segments of a raster. */
class Segments {
public:
    Segments(const std::string& name, const RasterDescription& description, int lines, int samples)
        : file_{name, description},
          along_{samples, lines, +1, 0},
          down_{samples, lines, 0, +1},
          range_window_{hann(samples)},
          azimuth_window_{hann(lines)} {}

    SegmentPower look_at(const Tile& tile) {
        SegmentPower power{Power(range_window_.size()), Power(azimuth_window_.size())};
        segment_.resize(tile.size());
        file_.read(tile, segment_.data());
        for (fcomplex& value : segment_)
            if (!std::isfinite(std::norm(value))) value = {};
        work_ = segment_;
        each([&](std::size_t /*line*/, std::size_t sample, fcomplex& value) { value *= range_window_[sample]; });
        along_.run(work_.data());
        each([&](std::size_t /*line*/, std::size_t sample, fcomplex& value) {
            power.range[sample] += std::norm(value);
        });
        work_ = segment_;
        each([&](std::size_t line, std::size_t /*sample*/, fcomplex& value) { value *= azimuth_window_[line]; });
        down_.run(work_.data());
        each([&](std::size_t line, std::size_t /*sample*/, fcomplex& value) {
            power.azimuth[line] += std::norm(value);
        });
        return power;
    }

private:
    template <typename Work>
    void each(Work work) {
        auto value = work_.begin();
        for (std::size_t line = 0; line < azimuth_window_.size(); ++line)
            for (std::size_t sample = 0; sample < range_window_.size(); ++sample) work(line, sample, *value++);
    }

    RasterReader file_;
    Transform along_, down_;
    std::vector<float> range_window_, azimuth_window_;
    std::vector<fcomplex> segment_, work_;
};

/** The power spectra of a raster of any size, segment by segment. */
class Spectra {
public:
    explicit Spectra(const RasterDescription& description)
        : lines_{std::min(kLongest, description.NrOfLinesPerImage)},
          samples_{std::min(kLongest, description.NrOfPixelsPerLine)} {
        for (const int line : starts(description.NrOfLinesPerImage, lines_))
            for (const int sample : starts(description.NrOfPixelsPerLine, samples_))
                tiles_.push_back({line, lines_, sample, samples_});
    }

    void run(const std::string& name, const RasterDescription& description, int threads, bool waitbar) {
        Progress progress{waitbar ? "Spectrum" : nullptr};
        const std::int64_t bytes = std::int64_t{lines_} * samples_ * description.element_sizeof();
        auto tile = tiles_.cbegin();
        std::int64_t done = 0;
        const auto next = [&]() -> std::optional<Tile> {
            throw_if_interrupted();
            if (tile == tiles_.cend()) return std::nullopt;
            return *tile++;
        };
        const auto make_worker = [&] {
            auto own = std::make_unique<Segments>(name, description, lines_, samples_);
            return [own = std::move(own)](const Tile& segment) { return own->look_at(segment); };
        };
        blocks::in_order(threads, next, make_worker, [&](const SegmentPower& power) {
            std::ranges::transform(range_, power.range, range_.begin(), std::plus{});
            std::ranges::transform(azimuth_, power.azimuth, azimuth_.begin(), std::plus{});
            progress.step(++done * bytes, segments() * bytes);
        });
    }

    [[nodiscard]] int lines() const { return lines_; }
    [[nodiscard]] int samples() const { return samples_; }
    [[nodiscard]] std::int64_t segments() const { return static_cast<std::int64_t>(tiles_.size()); }
    [[nodiscard]] const Power& range() const { return range_; }
    [[nodiscard]] const Power& azimuth() const { return azimuth_; }

private:
    int lines_, samples_;
    std::vector<Tile> tiles_;
    Power range_ = Power(static_cast<std::size_t>(samples_)), azimuth_ = Power(static_cast<std::size_t>(lines_));
};

/** What a spectrum tells, in cycles per sample. */
struct Band {
    double centre, width;
};

/** Mean over neighbouring bins, around the end. */
Power smoothed(const Power& power) {
    const std::size_t n = power.size(), reach = n / 128;
    Power mean(n);
    for (std::size_t k = 0; k < n; ++k) {
        for (std::size_t i = n - reach; i <= n + reach; ++i) mean[k] += power[(k + i) % n];
        mean[k] /= static_cast<double>(2 * reach + 1);
    }
    return mean;
}

/** The centre is the phase of the correlation of neighbouring samples (S. N. Madsen, "Estimating the Doppler
 * Centroid of SAR Data", IEEE Trans. Aerosp. Electron. Syst. 25(2), 1989), the width that above half the peak. */
Band band_of(const Power& power) {
    const auto n = static_cast<double>(power.size());
    dcomplex correlation{};
    for (std::size_t k = 0; k < power.size(); ++k)
        correlation += std::polar(power[k], 2.0 * std::numbers::pi * static_cast<double>(k) / n);
    const Power mean = smoothed(power);
    const double half = 0.5 * *std::ranges::max_element(mean);
    const auto above = std::ranges::count_if(mean, [half](double value) { return value > half; });
    return {std::arg(correlation) / (2.0 * std::numbers::pi), static_cast<double>(above) / n};
}

/** Sampling rates of both directions; 1 and cycles per sample where no header tells them. */
struct Rates {
    bool in_hertz = false;
    double range = 1.0, azimuth = 1.0;
    [[nodiscard]] const char* unit() const { return in_hertz ? "Hz" : "cycles/sample"; }
};

Rates rates_of(const std::string& header) {
    if (header.empty()) return {};
    require_header_file(header);
    // The image's own rates; those of the constants are the recording's, which bursts and multilooked images
    // leave.
    GeneralSAR product;
    ImageGrid_Obj grid;
    if (product.GSread(header.c_str()) == QUO_OK && read_image_grid(header.c_str(), product, grid) == QUO_OK)
        return grid.GroundLists > 0 ? Rates{} : Rates{true, 1.0 / grid.SampleStep_s, 1.0 / grid.LineStep_s};
    SamplingConstants_Obj constants;
    if (constants.readhdr(header.c_str()) != QUO_OK) throw Failure(header + ": no sampling constants");
    if (!(constants.frg_hz > 0.0) || !(constants.prf_hz > 0.0))
        throw Failure(header + ": range sampling rate or pulse repetition frequency is unknown");
    return {true, constants.frg_hz, constants.prf_hz};
}

SpectrumShown shown_of(const char* direction, const char* centre_name, const Power& power, const Band& band,
                       double rate, const Rates& rates) {
    SpectrumShown spectrum{std::string{direction} + " spectrum",
                           power,
                           smoothed(power),
                           rate,
                           rates.in_hertz,
                           centre_name,
                           band.centre,
                           band.width};
    const double peak = *std::ranges::max_element(spectrum.smoothed);
    for (std::vector<double>* const values : {&spectrum.decibel, &spectrum.smoothed})
        for (double& value : *values) value = 10.0 * std::log10(value / peak);  // nothing is far below
    return spectrum;
}

int spectrum(const SpectrumOptions& options) {
    std::vector<std::string> read = raster_files(options.raster);
    if (!options.header.empty()) read.push_back(options.header);
    require_apart(read, {options.picture});
    require_png_name(options.picture);
    const Rates rates = rates_of(options.header);
    DataFile raster;
    read_samples_description(options.raster, raster);
    note_interrupts();
    Spectra spectra{raster};
    spectra.run(options.raster, raster, options.threads, options.waitbar);
    if (!(*std::ranges::max_element(spectra.range()) > 0.0)) throw Failure(options.raster + ": holds no signal");
    const Band range = band_of(spectra.range()), azimuth = band_of(spectra.azimuth());
    const std::pair<const char*, double> values[] = {{"range_centre", range.centre * rates.range},
                                                     {"range_bandwidth", range.width * rates.range},
                                                     {"doppler_centroid", azimuth.centre * rates.azimuth},
                                                     {"azimuth_bandwidth", azimuth.width * rates.azimuth}};
    const std::string segments = "mean of " + std::to_string(spectra.segments()) + " segments of " +
                                 std::to_string(spectra.lines()) + " lines x " +
                                 std::to_string(spectra.samples()) + " samples";
    write_output(
        options.picture,
        png_of(draw_spectra(
            shown(options.raster), segments + "; pale: bin by bin, dark: smoothed over 1/64 of the band",
            {shown_of("Range", "centre", spectra.range(), range, rates.range, rates),
             shown_of("Azimuth", "Doppler centroid", spectra.azimuth(), azimuth, rates.azimuth, rates)})));

    nlohmann::ordered_json json{{"raster", options.raster},
                                {"segments", spectra.segments()},
                                {"segment_lines", spectra.lines()},
                                {"segment_samples", spectra.samples()},
                                {"unit", rates.unit()}};
    std::string text = "# " + segments + "\nquantity,value,unit\n";
    for (const auto& [name, value] : values) {
        json[name] = value;
        text += std::string{name} + "," + exact(value) + "," + rates.unit() + "\n";
    }
    options.json ? print_json(json) : print(text);
    return kFine;
}

}  // namespace

void add_spectrum(Command& program) {
    auto [command, options] =
        add_verb(program, "spectrum", "Range and azimuth power spectra of a raster, and what they tell", spectrum);
    command.needs("RASTER", options.raster, "Raster with a side file RASTER.hdr");
    command.needs("OUT", options.picture, "Plot to write (PNG)");
    command.takes("--header", options.header, "Header with the sampling rates, for frequencies in Hz");
    command.flag("--json", options.json, "Print JSON");
    add_block_options(command, options);
}

}  // namespace tool
