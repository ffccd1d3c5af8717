// SPDX-License-Identifier: Apache-2.0
#include "measure.h"

#include <algorithm>
#include <cmath>
#include <complex>
#include <limits>
#include <numbers>

#include "../common/session.h"
#include "quo_base/derived_raster.h"
#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"
#include "quo_base/interp.h"

namespace example {
namespace {

constexpr double kPi = std::numbers::pi;
constexpr int kChip = 64;  // lines and samples that are looked at
constexpr int kFiner = Closeup::finer;
constexpr int kFine = kChip * kFiner;

/** An image, and the grid on which its pixels stand. */
struct Image {
    GeneralSAR product;
    ImageGrid_Obj grid;

    [[nodiscard]] bool is_detected() const { return product.bufferFile.is_complex() == 0; }
};

/** An image around a target, finely interpolated: kFine rows of azimuth by kFine columns of range. */
class Chip {
public:
    Chip(BufferFile& image, int line, int sample, double doppler_cycles);

    [[nodiscard]] fcomplex at(int row, int column) const { return fine_[row * kFine + column]; }
    [[nodiscard]] double power(int row, int column) const {
        return static_cast<double>(std::norm(at(row, column)));
    }
    struct Place {
        int row, column;
    };
    [[nodiscard]] Place brightest() const;

private:
    std::vector<fcomplex> fine_;
};

Chip::Chip(BufferFile& image, int line, int sample, double doppler_cycles) {
    constexpr auto kSize = static_cast<std::size_t>(kChip) * kChip;
    const int first_line = line - kChip / 2, first_sample = sample - kChip / 2;
    if (first_line < 0 || first_sample < 0 || first_line + kChip > image.getLines() ||
        first_sample + kChip > image.getSamples())
        throw Failure{"a target lies outside the image, or at its border"};
    std::vector<fcomplex> chip(kSize), turned(kSize);
    if (image.is_complex() != 0) {
        image.readbuffer(chip.data(), first_line, kChip, first_sample, kChip);
    } else {
        std::vector<float> detected(kSize);
        image.readbuffer(detected.data(), first_line, kChip, first_sample, kChip);
        std::ranges::copy(detected, chip.begin());
    }
    require(image.status(), "the image cannot be read");

    // The phase ramp of the Doppler centroid runs along azimuth, demodulationPhase along rows.
    for (std::size_t i = 0; i < kSize; ++i) turned[i % kChip * kChip + i / kChip] = chip[i];
    const demodulationPhase centroid{2.0 * kPi * doppler_cycles};
    require(centroid.applyDemodPhase(turned.data(), kChip, kChip), "the Doppler centroid");

    interp finer;
    std::vector<fcomplex> tall(kSize * kFiner);
    fine_.resize(kSize * kFiner * kFiner);
    require(finer.interpft(turned.data(), kChip, kChip, kChip, kFine, tall.data()), "interpolation in range");
    std::vector<fcomplex> wide(fine_.size());
    require(finer.interpft(tall.data(), kChip, kFine, kFine, kFine, wide.data()), "interpolation in azimuth");
    for (std::size_t i = 0; i < wide.size(); ++i) fine_[i % kFine * kFine + i / kFine] = wide[i];
}

/** The brightest place; not at the border, where the image's other end shines in. */
Chip::Place Chip::brightest() const {
    constexpr int kBorder = kFine / 8;
    static_assert(kBorder >= Closeup::reach * Closeup::finer);
    Place place{kBorder, kBorder};
    for (int row = kBorder; row < kFine - kBorder; ++row)
        for (int column = kBorder; column < kFine - kBorder; ++column)
            if (power(row, column) > power(place.row, place.column)) place = {row, column};
    return place;
}

/** Where the parabola through three neighbouring values peaks, relative to the middle one. */
double parabola_peak(double before, double middle, double after) {
    return 0.5 * (before - after) / (before - 2.0 * middle + after);
}

/** A cut through the peak: power at fine steps. */
struct Cut {
    std::vector<double> powers;
    int peak;
    /** Whether there is a place beside this one, to one side. */
    [[nodiscard]] bool goes_on(int i, int direction) const {
        return i + direction >= 0 && i + direction < static_cast<int>(powers.size());
    }
};

/** Steps from the peak to the place where the power falls below a level, to one side. */
double steps_to(const Cut& cut, double level, int direction) {
    for (int i = cut.peak; cut.goes_on(i, direction); i += direction) {
        const double here = cut.powers[i], next = cut.powers[i + direction];
        if (next < level) return std::abs(i - cut.peak) + (here - level) / (here - next);
    }
    throw Failure{"a response without an end"};
}

/** The first minimum to one side of the peak. */
int null_of(const Cut& cut, int direction) {
    int i = cut.peak;
    while (cut.goes_on(i, direction) && cut.powers[i + direction] < cut.powers[i]) i += direction;
    return i;
}

Response respond(const Cut& cut, double shift, double theory) {
    const double top = cut.powers[cut.peak];
    const double width = steps_to(cut, 0.5 * top, -1) + steps_to(cut, 0.5 * top, +1);
    const int left = null_of(cut, -1), right = null_of(cut, +1);
    const int reach = static_cast<int>(10.0 * theory * kFiner);
    double main = 0.0, side = 0.0, highest = 0.0;
    for (int i = std::max(0, cut.peak - reach); i <= std::min(kFine - 1, cut.peak + reach); ++i) {
        const double power = cut.powers[i];
        const bool inside = i >= left && i <= right;
        (inside ? main : side) += power;
        if (!inside) highest = std::max(highest, power);
    }
    return {shift, width / kFiner, theory, 10.0 * std::log10(highest / top), 10.0 * std::log10(side / main)};
}

/** Opens an image by its header. */
void open_image(const std::string& image, Image& opened) {
    const std::string header = image + ".hdr";
    GeneralSAR& product = opened.product;
    require(product.GSread(header.c_str()), header + ": cannot be read");
    for (const GSObject object : {gsOrbit, gsSamplingConstants, gsBufferFile})
        if (!product.GSexists(object)) throw Failure{header + ": a section is missing"};
    if (!opened.is_detected() && !product.GSexists(gsPolySAR))
        throw Failure{header + ": no Doppler centroid (section PolySAR)"};
    require(read_image_grid(header.c_str(), product, opened.grid), header + ": does not place the pixels");
    product.bufferFile.setFilename(image.c_str());
    product.bufferFile.open(BufferFile::READ);
    if (!product.bufferFile.is_open()) throw Failure{image + ": cannot be read"};
}

Closeup close_up(const Chip& chip, int row, int column) {
    constexpr int kReach = Closeup::reach * Closeup::finer;
    constexpr double kLeast = 1e-12;  // against the peak
    const double top = chip.power(row, column);
    Closeup closeup;
    closeup.decibel.reserve(Closeup::side() * Closeup::side());
    for (int i = -kReach; i <= kReach; ++i)
        for (int j = -kReach; j <= kReach; ++j)
            closeup.decibel.push_back(10.0 * std::log10(std::max(kLeast, chip.power(row + i, column + j) / top)));
    return closeup;
}

/** Lines from a line to the nearer end of its burst; the lines beyond belong to another time. */
double room_in_burst(const ImageGrid_Obj& grid, double line) {
    if (grid.Bursts == 0) return std::numeric_limits<double>::infinity();
    const double after = std::fmod(line + grid.FirstLine + 0.5, grid.LinesPerBurst);
    return std::min(after, grid.LinesPerBurst - after);
}

struct Pixel {
    double line, sample;
};

/** The pixel of what is seen at some times; of two bursts that see it, in the one with more lines around it. */
Pixel pixel_of(const ImageGrid_Obj& grid, double azimuth_s, double range_s, const std::string& name) {
    Pixel pixel{};
    double later_line = 0.0;
    std::int32_t status = 0;
    const int refused =
        grid.timePixels({1, &azimuth_s, &range_s}, {&pixel.line, &later_line, &pixel.sample, &status});
    require(refused != QUO_OK ? refused : status, name + " lies on no pixel");
    if (room_in_burst(grid, later_line) > room_in_burst(grid, pixel.line)) pixel.line = later_line;
    if (room_in_burst(grid, pixel.line) < 0.5 * kChip) throw Failure{name + " lies at the border of a burst"};
    return pixel;
}

struct Times {
    double azimuth_s, range_s;
};
Times times_of(const ImageGrid_Obj& grid, const Pixel& pixel) {
    Times times{};
    std::int32_t status = 0;
    const int refused =
        grid.pixelTimes({1, &pixel.line, &pixel.sample}, {&times.azimuth_s, &times.range_s, &status});
    require(refused != QUO_OK ? refused : status, "the times of a pixel");
    return times;
}

/** From sample to sample, which in ground range hangs on where they are. */
double range_step_s(const ImageGrid_Obj& grid, const Pixel& at) {
    return times_of(grid, {at.line, at.sample + 0.5}).range_s - times_of(grid, {at.line, at.sample - 0.5}).range_s;
}

Measurement find(Image& image, const Target& target, Closeup* closeup) {
    auto& [product, grid] = image;
    const SamplingConstants_Obj& sampling = product.samplingConstants;
    double place[3], located[3];
    geodetic_to_xyz(&target.place, QUO_WGS84_EQUATORIAL_M, QUO_WGS84_POLAR_M, place);
    double azimuth_s = 0.0, range_s = 0.0, doppler_hz = 0.0;
    require(product.orbit.earth2sat(place, &azimuth_s, &range_s), target.name + " is not seen");
    if (!image.is_detected())
        require(product.polynomials.EvaluateDC(range_s, azimuth_s, &doppler_hz), "the Doppler centroid");
    const Pixel place_in_image = pixel_of(grid, azimuth_s, range_s, target.name);
    const auto& [line, sample] = place_in_image;
    const int middle_line = static_cast<int>(std::lround(line));
    const int middle_sample = static_cast<int>(std::lround(sample));
    const Chip chip{product.bufferFile, middle_line, middle_sample, doppler_hz * grid.LineStep_s};

    const auto [row, column] = chip.brightest();
    if (closeup != nullptr) *closeup = close_up(chip, row, column);
    const auto amplitude = [&](int r, int c) { return std::sqrt(chip.power(r, c)); };
    const double top = amplitude(row, column);
    const double rows = row + parabola_peak(amplitude(row - 1, column), top, amplitude(row + 1, column));
    const double columns = column + parabola_peak(amplitude(row, column - 1), top, amplitude(row, column + 1));
    const double chip_line = rows / kFiner;  // after the chip's first line
    const int first_line = middle_line - kChip / 2, first_sample = middle_sample - kChip / 2;
    const Pixel peak{first_line + chip_line, first_sample + columns / kFiner};

    Cut along{{}, row}, across{{}, column};
    for (int i = 0; i < kFine; ++i) {
        along.powers.push_back(chip.power(i, column));
        across.powers.push_back(chip.power(row, i));
    }
    Measurement found{};
    found.name = target.name;
    found.azimuth = respond(along, peak.line - line, 0.886 / (grid.LineStep_s * sampling.Baz_hz));
    found.range =
        respond(across, peak.sample - sample, 0.886 / (range_step_s(grid, place_in_image) * sampling.Brg_hz));
    const Times seen = times_of(grid, peak);
    require(product.orbit.sat2earth(seen.azimuth_s, seen.range_s, 0.0, target.place.height_m, located),
            "a ground point");
    found.ground_m = norm(quo::load(located) - quo::load(place));
    found.strength_db = 20.0 * std::log10(top / target.strength);
    found.phase_rad = std::numeric_limits<double>::quiet_NaN();
    if (image.is_detected()) return found;
    // The centroid's ramp is put on again at the peak; between the fine places the phase hardly changes without
    // it.
    const double phase =
        static_cast<double>(std::arg(chip.at(row, column))) + 2.0 * kPi * doppler_hz * grid.LineStep_s * chip_line;
    found.phase_rad =
        std::remainder(phase + 2.0 * kPi * range_s * quo::kLightSpeed / sampling.lambda_m, 2.0 * kPi);
    return found;
}

}  // namespace

std::vector<Measurement> measure(const std::string& image, const std::vector<Target>& targets,
                                 const std::string& portrayed, Closeup* closeup) {
    Image opened;
    open_image(image, opened);
    std::vector<Measurement> found;
    found.reserve(targets.size());
    for (const Target& target : targets)
        found.push_back(find(opened, target, target.name == portrayed ? closeup : nullptr));
    return found;
}

void print_table(std::FILE* out, const std::vector<Measurement>& measurements) {
    std::fprintf(out, "%-10s|%-37s|%-37s|\n", "", " azimuth, lines", " range, samples");
    std::fprintf(out, "%-10s|%8s%7s%7s%8s%7s |%8s%7s%7s%8s%7s | %8s %8s %8s\n", "target", "shift", "width", "%",
                 "PSLR", "ISLR", "shift", "width", "%", "PSLR", "ISLR", "ground m", "phase", "ampl. dB");
    for (const Measurement& measurement : measurements) {
        std::fprintf(out, "%-10s", measurement.name.c_str());
        for (const Response& r : {measurement.azimuth, measurement.range})
            std::fprintf(out, "| %+7.3f %6.3f %+6.2f %7.2f %7.2f", r.shift, r.resolution,
                         100.0 * (r.resolution / r.theory - 1.0), r.side_lobe_db, r.integrated_db);
        std::fprintf(out, "| %8.3f %+8.4f %+8.3f\n", measurement.ground_m, measurement.phase_rad,
                     measurement.strength_db);
    }
}

bool within_bounds(const Measurement& measurement) {
    const auto good = [](const Response& response) {
        return std::abs(response.shift) < 0.1 && std::abs(response.resolution / response.theory - 1.0) < 0.05;
    };
    const bool off_phase = std::abs(measurement.phase_rad) >= 0.1;  // not of an image without phases
    return good(measurement.azimuth) && good(measurement.range) && !off_phase;
}

}  // namespace example
