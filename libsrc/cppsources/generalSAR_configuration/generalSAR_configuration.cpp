// SPDX-License-Identifier: Apache-2.0
#include "quo_base/generalSAR_configuration.h"

#include <limits>
#include <typeinfo>

#include "diagnosticslib/call_frame.h"
#include "generalSAR/container/readable_file.h"
#include "quorelxmllib/field_table.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_session.h"

namespace {

constexpr const char* kSource = "generalSAR_configuration";
constexpr const char* kSharedSection = "generalProcessingConf";
constexpr double kMaxInt = std::numeric_limits<std::int32_t>::max();
constexpr double kAnyFloat = 1e30;

constexpr auto kFlag = quo::bounds(0, 1);
constexpr auto kCount = quo::bounds(0, kMaxInt);
constexpr auto kPercent = quo::bounds(0, 100);
constexpr auto kFraction = quo::bounds(0.0, 1.0);
constexpr auto kLength = quo::bounds(0.0, kAnyFloat);
using quo::note;

namespace shared {
using Obj = GeneralSAR_BaseConfiguration;
constexpr quo::FieldTable kTable{
    kSharedSection,
    QUO_FIELD(Memory, kCount, quo::kOptional, note("MB", "working memory that a processor may take")),
    QUO_FIELD(Incore, kFlag, quo::kOptional, note("", "keep intermediate results in memory")),
    QUO_FIELD(Verbose, kCount, quo::kOptional, note("", "above 0 prints progress in detail")),
    QUO_FIELD(ReportLevel, quo::bounds(0, 3), quo::kOptional, note("", "level of the report; 0 none")),
    QUO_FIELD(ReportFilename, quo::kOptional, note("", "name of the report file")),
};
static_assert(kTable.size() == Obj::kSharedParameters);

/** The shared parameters of one record as a section of a header file. */
class Section final : public GeneralSAR_Base {
public:
    explicit Section(Obj& owner) : owner_{owner} { createElementsVector(kTable.size()); }

protected:
    void refreshParameters() override { kTable.of(*this, owner_).register_all(); }

private:
    Obj& owner_;
};
}  // namespace shared

namespace azimuth {
using Obj = AzimuthConf;
constexpr quo::FieldTable kTable{
    "AzimuthConf",
    QUO_FIELD(WhiteningFlag, kFlag, note("", "flatten the azimuth spectrum before weighting")),
    QUO_FIELD(AntennaLength, kLength, note("m", "length of the antenna")),
    QUO_FIELD(AzimuthWindowHammingParameter, kFraction, note("", "Hamming weight in azimuth; 0 none")),
    QUO_FIELD(AzimuthLookBandwidth, kLength, note("Hz", "azimuth bandwidth kept; 0 all of it")),
    QUO_FIELD(AzimuthTransitionBandwidth, kLength, note("Hz", "width of the azimuth band's edges")),
    QUO_FIELD(RangeWindowHammingParameter, kFraction, note("", "Hamming weight in range; 0 none")),
    QUO_FIELD(RangeLookBandwidth, kLength, note("Hz", "range bandwidth kept; 0 all of it")),
    QUO_FIELD(RangeTransitionBandwidth, kLength, note("Hz", "width of the range band's edges")),
    QUO_FIELD(LinesInBlock, kCount, note("lines", "lines of a block")),
    QUO_FIELD(SamplesInBlock, kCount, note("samples", "samples of a block")),
    QUO_FIELD(AzimuthOverlap, kCount, note("lines", "lines that neighbouring blocks share")),
    QUO_FIELD(RangeOverlap, kCount, note("samples", "samples that neighbouring blocks share")),
    QUO_FIELD(PerformInterpolation, kCount, note("samples", "length of the migration interpolator; 0 none")),
    QUO_FIELD(StoltPadding, kFraction, note("", "padding of the range spectrum, as a part of its length")),
    QUO_FIELD(ApplyRgShift, note("", "shift the image to the nominal range")),
    QUO_FIELD(ApplyAzShift, note("", "shift the image to the nominal azimuth time")),
};
}  // namespace azimuth

namespace doppler {
using Obj = DCestConf;
constexpr auto kAny = quo::bounds(-kAnyFloat, kAnyFloat);
constexpr quo::FieldTable kTable{
    "DCestConf",
    QUO_FIELD(Nbestblocks, kCount, note("blocks", "blocks of best contrast that are kept")),
    QUO_FIELD(Nummlbf, kCount, note("", "range-look pairs of the beat-frequency ambiguity estimate")),
    QUO_FIELD(Nwdarbloks, kCount, note("blocks", "range blocks of the wavelength-diversity ambiguity estimate")),
    QUO_FIELD(Blocks, kCount, note("blocks", "azimuth blocks over the scene")),
    QUO_FIELD(Blockl, kCount, note("lines", "lines of a block")),
    QUO_FIELD(Dswst, kFlag, note("", "align lines where the sampling window moved")),
    QUO_FIELD(Patchs, kCount, note("samples", "samples of a patch")),
    QUO_FIELD(Patchl, kCount, note("lines", "lines of a patch")),
    QUO_FIELD(RgBand, kLength, note("Hz", "range bandwidth of the data")),
    QUO_FIELD(AnLen, kLength, note("m", "length of the antenna")),
    QUO_FIELD(Lookbf, kFraction, note("", "azimuth look bandwidth, as a part of the PRF")),
    QUO_FIELD(Lookbt, kFraction, note("", "transition of the azimuth look, as a part of the PRF")),
    QUO_FIELD(Lookrp, kFraction, note("", "range look bandwidth, as a part of the range bandwidth")),
    QUO_FIELD(Lookrs, kFraction, note("", "distance of the range looks, as a part of the range bandwidth")),
    QUO_FIELD(Decfac, kCount, note("", "decimation of the range looks")),
    QUO_FIELD(Flength, kCount, note("samples", "length of the look filters")),
    QUO_FIELD(Dftstep, kLength, note("Hz", "step of the spectral peak search")),
    QUO_FIELD(Fftrgprc, kLength, note("", "zero padding in range, times the length")),
    QUO_FIELD(Fftazprc, kLength, note("", "zero padding in azimuth, times the length")),
    QUO_FIELD(Peakwid, kLength, note("bins", "width of the spectral peak")),
    QUO_FIELD(Minamb, kAny, note("PRF", "lowest ambiguity number tried")),
    QUO_FIELD(Maxamb, kAny, note("PRF", "highest ambiguity number tried")),
    QUO_FIELD(Kthr, kLength, note("", "estimates further than this many deviations from the fit are dropped")),
    QUO_FIELD(Sthr, kFraction, note("", "least contrast of a block, as a part of the best")),
    QUO_FIELD(Varth, kLength, note("Hz^2", "largest variance of an estimate")),
    QUO_FIELD(Amb_flag, kCount, note("", "1 resolves the Doppler ambiguity")),
    QUO_FIELD(Pol_weights, kFlag, note("", "which of the seven polynomial coefficients are fitted")),
};
}  // namespace doppler

namespace extractor {
using Obj = ExtractorConf;
constexpr quo::FieldTable kTable{
    "ExtractorConf",
    QUO_FIELD(RawLinesSkip, kCount, note("lines", "raw lines to skip")),
    QUO_FIELD(RawLinesToExtract, kCount, note("lines", "raw lines to extract; 0 all")),
};
}  // namespace extractor

namespace processing {
using Obj = generalProcessingConf;
constexpr quo::FieldTable kTable{
    kSharedSection,
    QUO_FIELD(Flag_incore, kFlag, note("", "keep intermediate rasters in memory")),
    QUO_FIELD(Flag_ortog, kFlag, note("", "correct the channels' offset and orthogonality")),
    QUO_FIELD(Flag_swstal, kFlag, note("", "align lines where the sampling window moved")),
    QUO_FIELD(Flag_ext, kFlag, note("", "run the extraction of raw lines")),
    QUO_FIELD(Flag_rangefoc, kFlag, note("", "run the range compression")),
    QUO_FIELD(Flag_rgpatt, kFlag, note("", "compensate the elevation antenna pattern")),
    QUO_FIELD(Flag_azimuthfoc, kFlag, note("", "run the azimuth compression")),
    QUO_FIELD(Flag_dcest, kFlag, note("", "estimate the Doppler centroid")),
    QUO_FIELD(Remove_interferences, kFlag, note("", "remove narrow-band interferences")),
    QUO_FIELD(Azblk, kFlag, note("", "process in azimuth blocks")),
    QUO_FIELD(EraseTemp, kFlag, note("", "erase intermediate files at the end")),
};
}  // namespace processing

namespace fine {
using Obj = FinefitestConf;
constexpr quo::FieldTable kTable{
    "FinefitestConf",
    QUO_FIELD(RangeMaxShift, kCount, note("samples", "largest shift looked for in range")),
    QUO_FIELD(AzimuthMaxShift, kCount, note("lines", "largest shift looked for in azimuth")),
    QUO_FIELD(RangeBlockSize, kCount, note("samples", "samples of a correlation block")),
    QUO_FIELD(AzimuthBlockSize, kCount, note("lines", "lines of a correlation block")),
};
}  // namespace fine

namespace calibration {
using Obj = EnvisatCalibrationFactors;
constexpr quo::FieldTable kTable{
    "EnvisatCalibrationFactors",
    QUO_FIELD(IM_HH, note("", "image mode, H/H, swaths IS1 to IS7")),
    QUO_FIELD(IM_VV, note("", "image mode, V/V, swaths IS1 to IS7")),
    QUO_FIELD(AP_HH, note("", "alternating polarisation, H/H, swaths IS1 to IS7")),
    QUO_FIELD(AP_HV, note("", "alternating polarisation, H/V, swaths IS1 to IS7")),
    QUO_FIELD(AP_VH, note("", "alternating polarisation, V/H, swaths IS1 to IS7")),
    QUO_FIELD(AP_VV, note("", "alternating polarisation, V/V, swaths IS1 to IS7")),
    QUO_FIELD(WSML_HH, note("", "wide swath, multilook, H/H")),
    QUO_FIELD(WSML_VV, note("", "wide swath, multilook, V/V")),
    QUO_FIELD(WSS_HH, note("", "wide swath, single look, H/H")),
    QUO_FIELD(WSS_VV, note("", "wide swath, single look, V/V")),
};
}  // namespace calibration

namespace dem {
using Obj = DemExtractorConf;
constexpr quo::FieldTable kTable{
    "DemExtractorConf",
    QUO_FIELD(LatitudeOversampling, kCount, note("", "oversampling in latitude")),
    QUO_FIELD(LongitudeOversampling, kCount, note("", "oversampling in longitude")),
    QUO_FIELD(LatitudeMarginPerc, kPercent, note("%", "margin around the scene in latitude")),
    QUO_FIELD(LongitudeMarginPerc, kPercent, note("%", "margin around the scene in longitude")),
    QUO_FIELD(InterpolationFlag, kFlag, note("", "fill voids by interpolation")),
    QUO_FIELD(GeoidCorrectionFilename, note("", "file of geoid heights")),
    QUO_FIELD(SRTMDirectory, note("", "folder of the elevation tiles")),
};
}  // namespace dem

namespace geocoding {
using Obj = GeocodingConf;
constexpr quo::FieldTable kTable{
    "GeocodingConf",
    QUO_FIELD(InterpolationPrecision, quo::bounds(1, 5), note("", "precision class of the interpolator")),
    QUO_FIELD(InterpolationFilterLength, quo::bounds(3, kMaxInt), note("samples", "length of the interpolator")),
    QUO_FIELD(InterpolationFilterBandwidth, kFraction, note("", "its band, as a part of the sampling rate")),
};
}  // namespace geocoding

namespace precise {
using Obj = ATPrecise_FitestConf;
constexpr quo::FieldTable kTable{
    "ATPrecise_FitestConf",
    QUO_FIELD(RangeMinOverlap, kCount, note("samples", "least overlap of the images in range")),
    QUO_FIELD(AzimuthMinOverlap, kCount, note("lines", "least overlap of the images in azimuth")),
    QUO_FIELD(CoarseValidBlocks, kCount, note("blocks", "least valid blocks of the coarse fit")),
    QUO_FIELD(FineValidBlocks, kCount, note("blocks", "least valid blocks of the fine fit")),
};
}  // namespace precise

namespace resampling {
using Obj = CoregistrationConf;
constexpr quo::FieldTable kTable{
    "CoregistrationConf",
    QUO_FIELD(InterpolationPrecision, quo::bounds(1, 5), note("", "precision class of the interpolator")),
    QUO_FIELD(InterpolationFilterLength, quo::bounds(3, kMaxInt), note("samples", "length of the interpolator")),
    QUO_FIELD(InterpolationFilterBandwidth, kFraction, note("", "its band, as a part of the sampling rate")),
    QUO_FIELD(DCDemodulationType, kFlag,
              note("", "1 demodulates by the Doppler centroid around the interpolation")),
};
}  // namespace resampling

namespace coherence {
using Obj = CoherenceConf;
constexpr quo::FieldTable kTable{
    "CoherenceConf",
    QUO_FIELD(RangeEstimatesFrequencies, kCount, note("", "local range frequencies that are estimated")),
    QUO_FIELD(AzimuthEstimatesFrequencies, kCount, note("", "local azimuth frequencies that are estimated")),
    QUO_FIELD(MaxBias, kFraction, note("", "largest bias of the coherence that is accepted")),
    QUO_FIELD(MinimumNumberOfLooks, kLength, note("looks", "least equivalent looks of an estimate")),
    QUO_FIELD(CoherenceRangeSemiAperture, kCount, note("samples", "half the estimation window in range")),
    QUO_FIELD(CoherenceAzimuthSemiAperture, kCount, note("lines", "half the estimation window in azimuth")),
    QUO_FIELD(APrioriRangeSemiAperture, kCount, note("samples", "half the a-priori window in range")),
    QUO_FIELD(APrioriAzimuthSemiAperture, kCount, note("lines", "half the a-priori window in azimuth")),
    QUO_FIELD(RangeSemiAperture4Frequency, kCount, note("samples", "half the frequency window in range")),
    QUO_FIELD(AzimuthSemiAperture4Frequency, kCount, note("lines", "half the frequency window in azimuth")),
    QUO_FIELD(ConfidenceLevel, kFraction, note("", "confidence of the bias correction")),
    QUO_FIELD(SaturationLevel, kFraction, note("", "coherence above which no correction is made")),
    QUO_FIELD(AzimuthPresumSamples, kCount, note("lines", "lines averaged before the estimate")),
    QUO_FIELD(BiasMapFlag, kFlag, note("", "write a map of the bias")),
    QUO_FIELD(APrioriCoherenceFlag, kFlag, note("", "use an a-priori coherence")),
    QUO_FIELD(EFFlag, kFlag, note("", "remove the local fringe frequency")),
    QUO_FIELD(DespeckleFlag, kFlag, note("", "filter speckle before the estimate")),
    QUO_FIELD(ENLAzimuthAperture, kCount, note("lines", "window of the equivalent looks in azimuth")),
    QUO_FIELD(ENLRangeAperture, kCount, note("samples", "window of the equivalent looks in range")),
};
}  // namespace coherence

[[noreturn]] void fail(const char* function, const char* message, int line = __builtin_LINE()) {
    throw quorelException(line, function, kSource, message);
}

}  // namespace

int GeneralSAR_BaseConfiguration::readpar(const char*, int) { return QUO_OK; }
int GeneralSAR_BaseConfiguration::writepar(const char*, int) { return QUO_OK; }

GeneralSAR_BaseConfiguration::~GeneralSAR_BaseConfiguration() = default;

parElement GeneralSAR_BaseConfiguration::sharedParameter(int index) {
    parElement element;
    element.section = kSharedSection;
    if (const auto* row = shared::kTable.row(index)) row->describe(this, element);
    return element;
}
const char* GeneralSAR_BaseConfiguration::sharedUnit(int index) {
    const auto* row = shared::kTable.row(index);
    return row ? row->unit : "";
}
const char* GeneralSAR_BaseConfiguration::sharedMeaning(int index) {
    const auto* row = shared::kTable.row(index);
    return row ? row->meaning : "";
}

int GeneralSAR_BaseConfiguration::clone(GeneralSAR_BaseConfiguration* to) const {
    if (!to) return QUO_REFUSED;
    auto& from = const_cast<GeneralSAR_BaseConfiguration&>(*this);  // only read
    for (int i = 0; i < kSharedParameters; ++i) quo::copy_values(from.sharedParameter(i), to->sharedParameter(i));
    return QUO_OK;
}

int GeneralSAR_BaseConfiguration::readConf(const char* file, int channel, const char* section) {
    shared::Section{*this}.readAuxiliaryFile(file, channel, section);
    return QUO_OK;
}

int GeneralSAR_BaseConfiguration::writeConf(const char*, int, const char*) { return QUO_OK; }

int GeneralSAR_ConfigurationRecord::readConf(const char* file, int channel, const char* base_section,
                                             const char* own_section) {
    if (GeneralSAR_BaseConfiguration::readConf(file, channel, base_section) != QUO_OK) {
        fail("readConf", "Cannot read base configuration file");
    }
    if (!readAuxiliaryFile(file, channel, own_section))
        fail("readConf", "Cannot read specific configuration file");
    return QUO_OK;
}

int GeneralSAR_ConfigurationRecord::writeConf(const char* file, int channel, const char* base_section,
                                              const char* own_section) {
    if (GeneralSAR_BaseConfiguration::writeConf(file, channel, base_section) != QUO_OK) {
        fail("writeConf", "Cannot write base configuration file");
    }
    if (writeAuxiliaryFile(file, channel, own_section) != QUO_OK) {
        fail("writeConf", "Cannot write specific configuration file");
    }
    return QUO_OK;
}

int GeneralSAR_ConfigurationRecord::readpar(const char* file, int channel) {
    if (readConf(file, channel, kSharedSection, section_) != QUO_OK) fail("readpar", "Cannot read input file");
    return QUO_OK;
}

int GeneralSAR_ConfigurationRecord::writepar(const char* file, int channel) {
    if (writeConf(file, channel, kSharedSection, section_) != QUO_OK) fail("writepar", "Cannot write input file");
    return QUO_OK;
}

int GeneralSAR_ConfigurationRecord::clone(GeneralSAR_BaseConfiguration* to) const {
    auto* record = dynamic_cast<GeneralSAR_ConfigurationRecord*>(to);
    if (!record || typeid(*record) != typeid(*this)) return QUO_REFUSED;
    GeneralSAR_BaseConfiguration::clone(to);
    for (int i = 0; i < elementCount(); ++i) quo::copy_values(*element(i), *record->element(i));
    return QUO_OK;
}

namespace {

using Record = GeneralSAR_ConfigurationRecord;

parElement element_of(const Record& record, int index) {
    const parElement* element = record.element(index);
    return element ? *element : parElement{};
}

}  // namespace

// The records, each with the namespace of its table.
#define QUO_EACH_RECORD(see)                                                                                     \
    see(AzimuthConf, azimuth) see(DCestConf, doppler) see(ExtractorConf, extractor)                              \
        see(generalProcessingConf, processing) see(FinefitestConf, fine)                                         \
            see(EnvisatCalibrationFactors, calibration) see(DemExtractorConf, dem) see(GeocodingConf, geocoding) \
                see(ATPrecise_FitestConf, precise) see(CoregistrationConf, resampling)                           \
                    see(CoherenceConf, coherence)

#define QUO_DEFINE(Class, part)                                                                    \
    Class::Class() : Record{part::kTable.section()} { createElementsVector(part::kTable.size()); } \
    void Class::refreshParameters() { part::kTable.register_all(*this); }                          \
    const char* Class::unit(int index) const { return element_of(*this, index).unit; }             \
    const char* Class::meaning(int index) const { return element_of(*this, index).meaning; }
QUO_EACH_RECORD(QUO_DEFINE)

std::span<const char* const> Record::names() {
#define QUO_NAME(Class, part) part::kTable.section(),
    static constexpr const char* kNames[] = {QUO_EACH_RECORD(QUO_NAME)};
    return kNames;
}

std::unique_ptr<Record> Record::make(std::string_view name) {
#define QUO_MAKE(Class, part) \
    if (name == part::kTable.section()) return std::make_unique<Class>();
    QUO_EACH_RECORD(QUO_MAKE)
    return nullptr;
}

generalProcessingConf::generalProcessingConf(const char* file, int channel) : generalProcessingConf{} {
    readpar(file, channel);
}

GeneralSAR_configuration::GeneralSAR_configuration()
    : table_{&azimuth, &doppler, &extractor, &processing, &fine_fit, &calibration} {}

GeneralSAR_BaseConfiguration* GeneralSAR_configuration::GSget(GScObject object) {
    return object >= 0 && object < kSelectors ? table_[object] : nullptr;
}
int GeneralSAR_configuration::GSenable(GScObject object) {
    if (!GSget(object)) return QUO_REFUSED;
    enabled_[object] = true;
    return QUO_OK;
}
int GeneralSAR_configuration::GSdisable(GScObject object) {
    if (!GSget(object)) return QUO_REFUSED;
    enabled_[object] = false;
    return QUO_OK;
}
bool GeneralSAR_configuration::GSexists(GScObject object) const {
    return object >= 0 && object < kSelectors && enabled_[object];
}

int GeneralSAR_configuration::GSwrite(const char* file, int channel) {
    quo::CallFrame frame{"GeneralSAR_configuration::GSwrite", kSource};
    const int status = quo::guarded(frame, [&] {
        quo::JoinedSession session{file};
        for (int i = 0; i < kSelectors; ++i)
            if (enabled_[i]) table_[i]->writepar(file, channel);
        const int saved = session.commit();
        return saved ? frame.silent(saved) : frame.success();
    });
    if (status != QUO_OK) fail("GSwrite", "Cannot write specific configuration file");
    return QUO_OK;
}

int GeneralSAR_configuration::GSread(const char* file, int channel) {
    quo::CallFrame frame{"GeneralSAR_configuration::GSread", kSource};
    if (const int status = quo::refuse_missing_file(frame, file)) return status;
    return quo::guarded(frame, [&] {
        const quo::JoinedSession session{file};
        for (int i = 0; i < kSelectors; ++i) {
            enabled_[i] = true;
            enabled_[i] = table_[i]->readpar(file, channel) == QUO_OK;
        }
        return frame.success();
    });
}

int GeneralSAR_configuration::GSclone(GeneralSAR_configuration* to) const {
    if (!to) return QUO_REFUSED;
    for (int i = 0; i < kSelectors; ++i) {
        if (!enabled_[i]) continue;
        table_[i]->clone(to->table_[i]);
        to->enabled_[i] = true;
    }
    return QUO_OK;
}
