// SPDX-License-Identifier: Apache-2.0
#include "quo_base/image_grid.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <new>
#include <optional>
#include <span>
#include <type_traits>
#include <utility>

#include "diagnosticslib/call_frame.h"
#include "quo_base/geometry.h"
#include "quo_base/roi.h"
#include "quorelxmllib/field_table.h"
#include "quorelxmllib/guarded.h"
#include "sarutillib/ground/array_extents.h"

namespace {

constexpr const char* kSource = "image_grid";
constexpr const char* kNoGrid = "The grid makes no image";
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
constexpr double kAbsent = -999.0;  // of the first element, which is read before any other

using Obj = ImageGrid_Obj;
constexpr quo::FieldTable kTable{
    "ImageGrid",
    QUO_FIELD(Epoch_s, quo::unit("s")),
    QUO_FIELD(FirstLine_s, quo::unit("s")),
    QUO_FIELD(LineStep_s, quo::above(0.0), quo::unit("s")),
    QUO_FIELD(FirstSample_s, quo::above(0.0), quo::unit("s")),
    QUO_FIELD(SampleStep_s, quo::at_least(0.0), quo::unit("s")),
    QUO_FIELD(GroundStep_m, quo::at_least(0.0), quo::unit("m")),
    QUO_FIELD(DelayShare),
    QUO_FIELD(DelayReference_s, quo::unit("s")),
    QUO_FIELD(FirstLine),
    QUO_FIELD(FirstSample),
    QUO_FIELD(LinesPerBurst, quo::at_least(0)),
    QUO_FIELD(BurstStart_s, QUO_LENGTH(Bursts), quo::unit("s")),
    QUO_FIELD(GroundTime_s, QUO_LENGTH(GroundLists), quo::unit("s")),
    QUO_FIELD(GroundToSlant, QUO_LENGTH(GroundLists, Obj::kTerms)),
    QUO_FIELD(Bursts, quo::at_least(0)),
    QUO_FIELD(GroundLists, quo::at_least(0)),
};

constexpr double to_slant_m(double tau_s) { return 0.5 * quo::kLightSpeed * tau_s; }
constexpr double to_tau_s(double slant_m) { return slant_m / (0.5 * quo::kLightSpeed); }

/** Value and slope of a polynomial from ground to slant range. */
struct Slant {
    double value_m = 0.0, slope = 0.0;

    Slant(const double* terms, double ground_m) {
        for (int i = Obj::kTerms; i-- > 0;) {
            slope = slope * ground_m + value_m;
            value_m = value_m * ground_m + terms[i];
        }
    }
};

/** Where the slant range is so long: Newton's method, from the start of the axis. Nothing where it does not settle
 * within a micrometre: the polynomial does not reach that far. */
std::optional<double> ground_of(const double* terms, double slant_m) {
    constexpr int kMostSteps = 30;
    double ground_m = 0.0;
    for (int step = 0; step < kMostSteps; ++step) {
        const Slant at{terms, ground_m};
        const double move = (slant_m - at.value_m) / at.slope;
        if (!(at.slope > 0.0) || !std::isfinite(move)) return std::nullopt;
        ground_m += move;
        if (std::abs(move) < 1e-6) return ground_m;
    }
    return std::nullopt;
}

/** The times of a grid, all in seconds after its epoch. */
class Axes {
public:
    explicit Axes(const Obj& grid) : grid_{grid} {}

    /** Nothing for a line that is in no burst. */
    [[nodiscard]] std::optional<double> line_time(double line) const {
        const double k = line + grid_.FirstLine;
        if (grid_.Bursts == 0) return grid_.FirstLine_s + k * grid_.LineStep_s;
        const double burst = std::floor((k + 0.5) / grid_.LinesPerBurst);
        if (!(burst >= 0.0 && burst < grid_.Bursts)) return std::nullopt;
        return grid_.BurstStart_s[static_cast<std::size_t>(burst)] +
               (k - burst * grid_.LinesPerBurst) * grid_.LineStep_s;
    }
    /** The earliest and the latest time of so many lines of the raster; nothing where one is in no burst. */
    [[nodiscard]] std::optional<std::pair<double, double>> ends_of(std::int32_t lines) const {
        const auto first = line_time(0.0), last = line_time(lines - 1.0);
        if (!first || !last) return std::nullopt;
        std::pair ends{*first, *last};
        if (grid_.Bursts == 0) return ends;
        // Each burst begins before the one before it ends.
        for (std::int32_t burst = 1; burst < grid_.Bursts; ++burst) {
            const double line = static_cast<double>(burst) * grid_.LinesPerBurst - grid_.FirstLine;
            if (!(line > 0.0 && line < lines)) continue;
            ends.first = std::min(ends.first, line_time(line).value_or(ends.first));
            ends.second = std::max(ends.second, line_time(line - 1.0).value_or(ends.second));
        }
        return ends;
    }
    [[nodiscard]] double range_time(double sample, double line_time_s) const {
        const double k = sample + grid_.FirstSample;
        if (grid_.GroundLists == 0) return grid_.FirstSample_s + k * grid_.SampleStep_s;
        return to_tau_s(Slant{nearest_list(line_time_s), k * grid_.GroundStep_m}.value_m);
    }
    [[nodiscard]] double delay(double range_s) const {
        return grid_.DelayShare * (range_s - grid_.DelayReference_s);
    }

    /** The earlier and the later line of a time; not-a-number where there is none. */
    struct Lines {
        double first = kNaN, second = kNaN;
    };
    [[nodiscard]] Lines lines_at(double line_time_s) const {
        if (grid_.Bursts == 0)
            return {(line_time_s - grid_.FirstLine_s) / grid_.LineStep_s - grid_.FirstLine, kNaN};
        Lines lines;
        for (std::size_t burst = 0; burst < grid_.BurstStart_s.size(); ++burst) {
            const double line = (line_time_s - grid_.BurstStart_s[burst]) / grid_.LineStep_s;
            if (line < -0.5 || line >= grid_.LinesPerBurst - 0.5) continue;
            const double k = line + static_cast<double>(burst) * grid_.LinesPerBurst - grid_.FirstLine;
            // A cut begins behind the lines of bursts before it.
            if (std::isnan(lines.first) || lines.first < -0.5)
                lines.first = k;
            else if (std::isnan(lines.second))
                lines.second = k;
        }
        return lines;
    }
    [[nodiscard]] std::optional<double> sample_at(double range_s, double line_time_s) const {
        if (grid_.GroundLists == 0)
            return (range_s - grid_.FirstSample_s) / grid_.SampleStep_s - grid_.FirstSample;
        const auto ground_m = ground_of(nearest_list(line_time_s), to_slant_m(range_s));
        if (!ground_m) return std::nullopt;
        return *ground_m / grid_.GroundStep_m - grid_.FirstSample;
    }

private:
    [[nodiscard]] const double* nearest_list(double line_time_s) const {
        const auto& times = grid_.GroundTime_s;
        const auto after = std::ranges::upper_bound(times, line_time_s);
        auto nearest = after == times.end() ? after - 1 : after;
        if (nearest != times.begin() && line_time_s - *(nearest - 1) < *nearest - line_time_s) --nearest;
        return grid_.GroundToSlant.data() + (nearest - times.begin()) * Obj::kTerms;
    }

    const Obj& grid_;
};

template <typename T>
void put(T* array, std::size_t i, std::type_identity_t<T> value) {
    if (array) array[i] = value;
}

/** What keeps a grid from turning arrays into others; null where nothing does. */
const char* defect_of(const Obj& grid, std::span<const double* const> inputs, std::span<double* const> outputs,
                      const std::int32_t* status, std::size_t count) noexcept {
    if (!grid.isComplete()) return kNoGrid;
    if (count > 0 && std::ranges::find(inputs, nullptr) != inputs.end()) return "An array is missing";
    return quo::lie_well(inputs, outputs, status, count) ? nullptr : "Arrays overlap, or no memory can hold them";
}

}  // namespace

QUO_RECORD(ImageGrid_Obj, kTable)

int Obj::createBuffers() {
    quo::CallFrame frame{"ImageGrid_Obj::createBuffers", kSource};
    return kTable.of(*this).create_buffers(frame, "More bursts or polynomials than are plausible");
}

int Obj::destroyBuffers() { return kTable.destroy_buffers(*this); }
int Obj::clone(ImageGrid_Obj* to) const { return kTable.copy(*this, *to); }
int Obj::writehdr(const char* file) { return writeAuxiliaryFile(file, 1, kTable.section()); }

int Obj::readhdr(const char* file) {
    quo::CallFrame frame{"ImageGrid_Obj::readhdr", kSource};
    Epoch_s = kAbsent;
    if (!readAuxiliaryFile(file, 1, kTable.section())) {
        if (const int status = quo::Record::unread(*this)) return frame.silent(status);
        return frame.silent(Epoch_s == kAbsent ? QUO_REFUSED : QUO_READ_FAILED);
    }
    return isComplete() ? frame.success() : frame.fail(QUO_READ_FAILED, kNoGrid);
}

int Obj::setRegion(const ROI_Obj& region) {
    quo::CallFrame frame{"ImageGrid_Obj::setRegion", kSource};
    Obj grid;
    grid.Epoch_s = std::floor(region.SlowStartTime);
    grid.FirstLine_s = region.SlowStartTime - grid.Epoch_s;
    grid.LineStep_s = region.SlowTimeDelta;
    grid.FirstSample_s = region.FastStartTime;
    grid.SampleStep_s = region.FastTimeDelta;
    if (!grid.isComplete()) return frame.fail(QUO_REFUSED, kNoGrid);
    return quo::pass_on(frame, grid.clone(this));
}

int Obj::getRegion(ROI_Obj* region, std::int32_t lines, std::int32_t samples) const {
    if (!region || lines < 1 || samples < 1 || !isComplete()) return QUO_REFUSED;
    const Axes axes{*this};
    const auto times = axes.ends_of(lines);
    if (!times) return QUO_REFUSED;
    const auto [first_s, last_s] = *times;
    const double steps = std::max(1, samples - 1);  // one sample has the step to the next
    const double near_s = axes.range_time(0.0, first_s), far_s = axes.range_time(steps, first_s);
    const double covered = Bursts == 0 ? lines : std::round((last_s - first_s) / LineStep_s) + 1.0;
    const bool possible = covered >= 1.0 && covered <= std::numeric_limits<std::int32_t>::max();
    if (!possible || !std::isfinite(near_s + far_s)) return QUO_REFUSED;
    region->SetSlowAxe(Epoch_s + first_s, LineStep_s, static_cast<int>(covered));
    region->SetFastAxe(near_s, GroundLists == 0 ? SampleStep_s : (far_s - near_s) / steps, samples);
    return QUO_OK;
}

int Obj::cut(double line, double sample, double line_step, double sample_step) {
    quo::CallFrame frame{"ImageGrid_Obj::cut", kSource};
    const bool steps =
        line_step > 0.0 && sample_step > 0.0 && std::isfinite(line_step + sample_step + line + sample);
    if (!steps) return frame.fail(QUO_REFUSED, "The steps of a cut are above 0");
    if (Bursts > 0 && line_step != 1.0) return frame.fail(QUO_REFUSED, "Lines of bursts keep their sampling");
    FirstLine = (FirstLine + line) / line_step;
    FirstSample = (FirstSample + sample) / sample_step;
    LineStep_s *= line_step;
    SampleStep_s *= sample_step;
    GroundStep_m *= sample_step;
    return frame.success();
}

bool Obj::isComplete() const {
    const double numbers[] = {Epoch_s,    FirstLine_s,      LineStep_s, FirstSample_s,
                              DelayShare, DelayReference_s, FirstLine,  FirstSample};
    const auto sizes = [](const std::vector<double>& array, std::int64_t count) {
        return count >= 0 && array.size() == static_cast<std::size_t>(count) &&
               std::ranges::all_of(array, [](double value) { return std::isfinite(value); });
    };
    return std::ranges::all_of(numbers, [](double value) { return std::isfinite(value); }) && LineStep_s > 0.0 &&
           FirstSample_s > 0.0 && sizes(BurstStart_s, Bursts) && sizes(GroundTime_s, GroundLists) &&
           sizes(GroundToSlant, std::int64_t{GroundLists} * kTerms) && std::ranges::is_sorted(GroundTime_s) &&
           (Bursts == 0 || LinesPerBurst > 0) &&
           (GroundLists == 0 ? SampleStep_s > 0.0 && std::isfinite(SampleStep_s)
                             : GroundStep_m > 0.0 && std::isfinite(GroundStep_m));
}

int Obj::pixelTimes(const ImagePixels& pixels, const PixelTimes& times) const noexcept {
    const double* const inputs[] = {pixels.line, pixels.sample};
    double* const outputs[] = {times.azimuth_s, times.range_s};
    if (const char* const defect = defect_of(*this, inputs, outputs, times.status, pixels.count)) {
        quo::CallFrame frame{"ImageGrid_Obj::pixelTimes", kSource};
        return frame.fail(QUO_REFUSED, defect);
    }
    const Axes axes{*this};
    for (std::size_t i = 0; i < pixels.count; ++i) {
        const auto line_s = axes.line_time(pixels.line[i]);
        const double range_s = line_s ? axes.range_time(pixels.sample[i], *line_s) : kNaN;
        const double azimuth_s = line_s ? Epoch_s + (*line_s + axes.delay(range_s)) : kNaN;
        const bool found = std::isfinite(azimuth_s) && std::isfinite(range_s);
        put(times.azimuth_s, i, found ? azimuth_s : kNaN);
        put(times.range_s, i, found ? range_s : kNaN);
        put(times.status, i, found ? QUO_OK : QUO_REFUSED);
    }
    return QUO_OK;
}

int Obj::timePixels(const ImageTimes& times, const TimePixels& pixels) const noexcept {
    const double* const inputs[] = {times.azimuth_s, times.range_s};
    double* const outputs[] = {pixels.line, pixels.second_line, pixels.sample};
    if (const char* const defect = defect_of(*this, inputs, outputs, pixels.status, times.count)) {
        quo::CallFrame frame{"ImageGrid_Obj::timePixels", kSource};
        return frame.fail(QUO_REFUSED, defect);
    }
    const Axes axes{*this};
    for (std::size_t i = 0; i < times.count; ++i) {
        const double range_s = times.range_s[i];
        const double line_s = times.azimuth_s[i] - Epoch_s - axes.delay(range_s);
        const bool finite = std::isfinite(line_s) && std::isfinite(range_s);
        const auto sample = finite ? axes.sample_at(range_s, line_s) : std::nullopt;
        const Axes::Lines lines = sample ? axes.lines_at(line_s) : Axes::Lines{};
        const bool found = !std::isnan(lines.first);
        put(pixels.line, i, lines.first);
        put(pixels.second_line, i, lines.second);
        put(pixels.sample, i, found ? *sample : kNaN);
        put(pixels.status, i, found ? QUO_OK : QUO_REFUSED);
    }
    return QUO_OK;
}
