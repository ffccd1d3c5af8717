// SPDX-License-Identifier: Apache-2.0
#include "quo_base/acquisition.h"

#include <algorithm>
#include <cmath>
#include <limits>
#include <numbers>
#include <optional>
#include <string>

#include "diagnosticslib/call_frame.h"
#include "generalSAR/objects/annex_file.h"
#include "quo_base/datafile.h"
#include "quo_base/gen_utils.h"
#include "quorelxmllib/field_table.h"
#include "quorelxmllib/guarded.h"
#include "roilib/rounding.h"
#include "sarutillib/ground/bounded_text.h"

namespace {

constexpr const char* kSource = "generalSAR";
constexpr double kMaxInt = std::numeric_limits<std::int32_t>::max();

namespace sampling {
using Obj = SamplingConstants_Obj;
constexpr quo::FieldTable kTable{
    "SamplingConstants",
    QUO_FIELD(fc_hz, "CarrierFrequency", quo::above(0.0), quo::unit("Hz")),
    QUO_FIELD(frg_hz, "SamplingRate", quo::above(0.0), quo::unit("Hz")),
    QUO_FIELD(Brg_hz, "RangeBandWidth", quo::above(0.0), quo::unit("Hz")),
    QUO_FIELD(Trg_s, "RangeTSamplingStep", quo::above(0.0), quo::unit("s")),
    QUO_FIELD(prf_hz, "PRF", quo::above(0.0), quo::unit("Hz")),
    QUO_FIELD(pri_s, "PRI", quo::above(0.0), quo::unit("s")),
    QUO_FIELD(Baz_hz, "AzimuthBandwidth", quo::above(0.0), quo::unit("Hz")),
    QUO_FIELD(brf_hz, "BRF", quo::at_least(0.0), quo::unit("Hz")),
    QUO_FIELD(bri_s, "BRI", quo::at_least(0.0), quo::unit("s")),
    QUO_FIELD(lambda_m, "WaveLength", quo::above(0.0), quo::unit("m")),
};
}  // namespace sampling

namespace pulse {
using Obj = SARPulse_Obj;
constexpr quo::FieldTable kTable{
    "Pulse",
    QUO_FIELD(PulseLength, quo::above(0.0), quo::unit("s")),
    QUO_FIELD(Bandwidth, quo::above(0.0), quo::unit("Hz")),
    QUO_FIELD(PulseKRate, quo::unit("Hz/s")),
    QUO_FIELD(PulseEnergy, quo::at_least(0.0)),
    QUO_FIELD(PulseSamplingRate, quo::above(0.0), quo::unit("Hz")),
};
}  // namespace pulse

namespace attitude {
using Obj = SensorAttitude_Obj;
constexpr quo::FieldTable kTable{
    "SensorAttitude",
    QUO_FIELD(Eq_speed, quo::at_least(0.0), quo::unit("m/s")),
    QUO_FIELD(Eq_distance, quo::at_least(0.0), quo::unit("m")),
    QUO_FIELD(Mean_DC, quo::unit("Hz")),
    QUO_FIELD(SquintAngle, quo::between(-90.0, 90.0), quo::unit("degrees")),
    QUO_FIELD(AntennaLength, quo::above(0.0), quo::unit("m")),
    QUO_FIELD(DroopGain),
    QUO_FIELD(Temperature),
};

// The data set of an annex file ends with one record per swath: a temperature and the gains.
constexpr int kAnnexSwaths = 5;
constexpr std::size_t kAnnexData = 171648, kAnnexFirst = 171232, kAnnexRecord = 68;
}  // namespace attitude

namespace windows {
using Obj = SpectralWindows_Obj;
constexpr quo::FieldTable kTable{
    "SpectralWindows",
    QUO_FIELD(AzMatchedFilterType),
    QUO_FIELD(RgMatchedFilterType),
    QUO_FIELD(RgMatchedFilterCoef, quo::between(0.0, 1.0)),
    QUO_FIELD(AzMatchedFilterCoef, quo::between(0.0, 1.0)),
    QUO_FIELD(RgLookBandwidth, quo::at_least(0.0), quo::unit("Hz")),
    QUO_FIELD(AzLookBandwidth, quo::at_least(0.0), quo::unit("Hz")),
};
}  // namespace windows

namespace quicklook {
using Obj = QuickLook_Obj;
constexpr quo::FieldTable kTable{
    "QuickLook",
    QUO_FIELD(QL_FirstSample, quo::bounds(0, kMaxInt)),
    QUO_FIELD(QL_Samples, quo::bounds(0, kMaxInt)),
    QUO_FIELD(QL_FirstLine, quo::bounds(0, kMaxInt)),
    QUO_FIELD(QL_Lines, quo::bounds(0, kMaxInt)),
    QUO_FIELD(QL_AzimuthML, quo::bounds(0, kMaxInt)),
    QUO_FIELD(QL_RangeML, quo::bounds(0, kMaxInt)),
};
}  // namespace quicklook

/** The numbers that a reference chirp follows from. */
struct Chirp {
    int samples;
    double half_length;    // from the middle to the first sample, in samples
    double sampling_rate;  // Hz
    double phase_rate;     // rad/s^2
    double divisor;        // of the amplitude
    [[nodiscard]] double phase(int n) const {
        const double t = (n - half_length) / sampling_rate;
        return phase_rate * (t * t);
    }
};

/** Nothing where the pulse does not make a chirp that a caller can store. */
std::optional<Chirp> chirp_of(const SARPulse_Obj& pulse) {
    if (!(pulse.PulseLength > 0.0) || !(pulse.PulseSamplingRate > 0.0)) return std::nullopt;
    const int n = quo::round_clamped(pulse.PulseSamplingRate * pulse.PulseLength);
    if (n < 1 || n > SARPulse_Obj::kMaxChirpSamples) return std::nullopt;

    const Chirp chirp{n, (n - 1) * 0.5, pulse.PulseSamplingRate,
                      std::numbers::pi * pulse.Bandwidth / pulse.PulseLength,
                      std::sqrt(std::abs(n / pulse.Bandwidth * pulse.PulseSamplingRate))};
    // The phase is largest at the ends; both tests fail for what is no number, too.
    const bool finite = std::isfinite(chirp.phase(0)) && 1.0 / chirp.divisor <= std::numeric_limits<float>::max();
    return finite ? std::optional{chirp} : std::nullopt;
}

fcomplex sample_of(const Chirp& chirp, int n) {
    const double phase = chirp.phase(n);
    return {static_cast<float>(std::cos(phase) / chirp.divisor),
            static_cast<float>(std::sin(phase) / chirp.divisor)};
}

}  // namespace

QUO_HEADER_RECORD(SamplingConstants_Obj, sampling::kTable)

QUO_HEADER_RECORD(SARPulse_Obj, pulse::kTable)

int SARPulse_Obj::chirpSamples() const {
    const auto chirp = chirp_of(*this);
    return chirp ? chirp->samples : 0;
}

int SARPulse_Obj::generateChirp(fcomplex* samples) const {
    quo::CallFrame frame{"SARPulse_Obj::generateChirp", kSource};
    const auto chirp = chirp_of(*this);
    if (!chirp || !samples) return frame.fail(QUO_REFUSED, "The pulse gives no reference chirp");

    // The chirp is symmetric to the last bit: each phase serves the two samples at its distance from the middle.
    for (int first = 0, last = chirp->samples - 1; first <= last; ++first, --last)
        samples[first] = samples[last] = sample_of(*chirp, first);
    return frame.success();
}

int SARPulse_Obj::writeChirp(const char* file) const {
    quo::CallFrame frame{"SARPulse_Obj::writeChirp", kSource};
    const int n = chirpSamples();
    quo::TrackedBuffer<fcomplex> chirp{static_cast<std::size_t>(std::max(n, 1))};
    if (!chirp) return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");
    if (const int status = generateChirp(chirp.data())) return frame.callee(status);

    DataFile raster;
    if (const int status = raster.setFilename(file)) return frame.callee(status);
    raster.NrOfPixelsPerLine = n;
    raster.NrOfLinesPerImage = 1;
    raster.CellType = FLOAT_COMPLEX;
    if (const int status = raster.open(1)) return frame.callee(status);
    BufferIO line{&raster, 0, n, 0, 1, FLOAT_COMPLEX};
    if (const int status = line.writebuffer(reinterpret_cast<const char*>(chirp.data()), n))
        return frame.callee(status);
    if (const int status = raster.close()) return frame.callee(status);
    return quo::pass_on(frame, raster.write_hdr());
}

QUO_HEADER_RECORD(SensorAttitude_Obj, attitude::kTable)

int SensorAttitude_Obj::getDroopGain(const char* annex_file, int swath) {
    quo::CallFrame frame{"SensorAttitude_Obj::getDroopGain", kSource};
    quo::TrackedBuffer<char> data{attitude::kAnnexData};
    if (!data) return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");
    if (const int status = quo::read_annex_data(annex_file, data.data(), data.size())) return frame.callee(status);
    // A swath that the file does not have is no failure: its gains stay unknown.
    if (swath < 0 || swath >= attitude::kAnnexSwaths) return frame.success();

    const char* record =
        data.data() + attitude::kAnnexFirst + attitude::kAnnexRecord * static_cast<std::size_t>(swath);
    Temperature = static_cast<double>(ch2float4(record, 'm'));
    record += sizeof(float);
    for (double& gain : DroopGain) {
        gain = ch2double8(record, 'm');
        record += sizeof(double);
    }
    return frame.success();
}

QUO_HEADER_RECORD(SpectralWindows_Obj, windows::kTable)

QUO_RECORD(QuickLook_Obj, quicklook::kTable)
int QuickLook_Obj::clone(QuickLook_Obj* to) const {
    to->QL_FirstSample = QL_FirstSample;
    to->QL_FirstLine = QL_FirstLine;
    to->QL_Samples = QL_Samples;
    to->QL_Lines = QL_Lines;
    return QUO_OK;  // the same part of the image; the multilook factors of the target stay its own
}
int QuickLook_Obj::writehdr(const char* file) { return writeAuxiliaryFile(file, 1, quicklook::kTable.section()); }
int QuickLook_Obj::readhdr(const char* file) {
    readAuxiliaryFile(file, 1, quicklook::kTable.section());
    return QUO_OK;  // a product without a quick-look is as good as one with
}
