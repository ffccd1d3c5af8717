// SPDX-License-Identifier: Apache-2.0
#include "quo_base/dataset_info.h"

#include <algorithm>
#include <limits>
#include <span>
#include <string_view>

#include "quorelxmllib/field_table.h"
#include "sarutillib/ground/bounded_text.h"

namespace {

constexpr double kMaxInt = std::numeric_limits<std::int32_t>::max();

// The texts of the enumerations, by value; 0 is the text of what is not set.
constexpr std::string_view kImageTypes[] = {
    "NOT SET",
    "RANGE FOCUSED",
    "AZIMUTH FOCUSED",
    "RAW DATA",
    "MULTILOOK",
    "INTERFEROMETRY",
    "FLAT EARTH",
    "COHERENCE MAP",
    "DEM",
    "SYNTHETIC FRINGES",
    "DEM IMAGE TIMES MAP",
    "IMAGE HEIGHT MAP",
    "COREGISTERED SLANT RANGE COMPLEX IMAGE",
    "PHASE UNWRAPPED",
    "RAW DATA ALIGNED",
};
constexpr std::string_view kSensors[] = {"SENSOR UNKNOWN", "ASAR",  "RADARSAT", "ERS1",  "ERS2", "PALSAR",
                                         "TERRA SAR-X",    "CSKS1", "CSKS2",    "CSKS3", "CSKS4"};
constexpr std::string_view kAcqModes[] = {"ACQUISITION MODE UNDEFINED", "STRIPMAP", "DOUBLE POLARIZATION",
                                          "QUAD POLARIZATION", "SCANSAR"};
constexpr std::string_view kProjections[] = {"PROJECTION UNDEFINED", "GROUND RANGE", "SLANT RANGE", "GEOCODED"};
constexpr std::string_view kUnitTypes[] = {
    "UNIT TYPE UNDEFINED", "VOLT", "VOLT^2", "VOLTcomplex", "meter", "Radian", "Degree", "sec"};
constexpr std::string_view kRefSystems[] = {"REFERENCE SYSTEM UNDEFINED", "WGS84", "EGM84"};

constexpr std::string_view kPolarizations[] = {"H/H", "V/V", "H/V", "V/H"};  // by number

using Obj = DataSetInfo_Obj;
// The optional fields are those whose keys may also be missing in a parameter file.
constexpr quo::FieldTable kTable{
    "DataSetInfo",
    QUO_FIELD(OrbitNumber),
    QUO_FIELD(Track),
    QUO_FIELD(SenseDate, quo::kDate),
    QUO_FIELD(SceneID),
    QUO_FIELD(Description),
    QUO_FIELD(AcquisitionStation),
    QUO_FIELD(ProcessingCenter),
    QUO_FIELD(ProcessingDate, quo::kDate),
    QUO_FIELD(ProcessingSoftware),
    QUO_FIELD(SceneHeading, quo::between(-360.0, 360.0), quo::unit("degrees")),
    QUO_FIELD(OrbitConfiguration),
    QUO_FIELD(Polarization, quo::one_of(kPolarizations)),
    QUO_FIELD(Swath),
    QUO_FIELD(SWST_MIN, quo::at_least(0.0), quo::unit("s")),
    QUO_FIELD(SWST_MAX, quo::at_least(0.0), quo::unit("s")),
    QUO_FIELD(RO_REF, quo::above(0.0), quo::unit("m")),
    QUO_FIELD(RangeLooks, quo::bounds(1, 1000)),
    QUO_FIELD(RangeBandwidth, quo::at_least(0.0), quo::unit("Hz")),
    QUO_FIELD(ExternalCalibrationFactor),
    QUO_FIELD(Projection, quo::one_of(kProjections)),
    QUO_FIELD(ImageType, quo::one_of(kImageTypes), quo::kOptional),
    QUO_FIELD(RGAntenna_flag, quo::bounds(0, 1), quo::kOptional),
    QUO_FIELD(AZAntenna_flag, quo::bounds(0, 1), quo::kOptional),
    QUO_FIELD(SpreadLoss_flag, quo::bounds(0, 1), quo::kOptional),
    QUO_FIELD(DroopGain_flag, quo::bounds(0, 1), quo::kOptional),
    QUO_FIELD(RGAntenna_AltitudeCorr_flag, quo::bounds(0, 1), quo::kOptional),
    QUO_FIELD(NoiseCorr_flag, quo::bounds(0, 1), quo::kOptional),
    QUO_FIELD(SensorName, quo::kFilled, quo::kOptional),
    QUO_FIELD(AcquisitionMode, quo::one_of(kAcqModes), quo::kOptional),
    QUO_FIELD(RefSystem, quo::one_of(kRefSystems), quo::kOptional),
    QUO_FIELD(UnitType, quo::one_of(kUnitTypes), quo::kOptional),
    QUO_FIELD(MissingLines, quo::bounds(0, kMaxInt), quo::kOptional),
    // A look sign, which the registered bounds do not tell: left is -1.
    QUO_FIELD(LookDirection, quo::bounds(0, kMaxInt), quo::between(-1, 1), quo::kOptional, quo::kXmlOnly),
};

using Texts = std::span<const std::string_view>;

bool is_listed(Texts texts, int value) { return value >= 0 && static_cast<std::size_t>(value) < texts.size(); }

template <std::size_t Room>
int store_text(char (&member)[Room], Texts texts, int value) {
    quo::copy_bounded(member, texts[is_listed(texts, value) ? static_cast<std::size_t>(value) : 0]);
    return QUO_OK;
}

bool holds_text(std::string_view member, Texts texts, int value) {
    return is_listed(texts, value) && member == texts[static_cast<std::size_t>(value)];
}

struct NumberedText {
    std::string_view text;
    int number;
};
// SS1 is 7, where the order of the others would make it 1, the number of IS2.
constexpr NumberedText kSwaths[] = {{"SS1", 7}, {"SS2", 2}, {"SS3", 3}, {"SS4", 4}, {"SS5", 5}, {"IS1", 0},
                                    {"IS2", 1}, {"IS3", 2}, {"IS4", 3}, {"IS5", 4}, {"IS6", 5}, {"IS7", 6}};

int number_of(std::string_view text, std::span<const NumberedText> rows) {
    const auto row = std::ranges::find(rows, text, &NumberedText::text);
    return row == rows.end() ? DataSetInfo_Obj::kUnknownNumber : row->number;
}

}  // namespace

QUO_HEADER_RECORD(DataSetInfo_Obj, kTable)

int DataSetInfo_Obj::SetImageType(DSImageType value) { return store_text(ImageType, kImageTypes, value); }
int DataSetInfo_Obj::SetSensorType(DSSensorType value) { return store_text(SensorName, kSensors, value); }
int DataSetInfo_Obj::SetAcqMode(DSAcqMode value) { return store_text(AcquisitionMode, kAcqModes, value); }
int DataSetInfo_Obj::SetProjection(DSProjection value) { return store_text(Projection, kProjections, value); }
int DataSetInfo_Obj::SetUnitType(DSUnitType value) { return store_text(UnitType, kUnitTypes, value); }
int DataSetInfo_Obj::SetRefSys(DSRefSys value) { return store_text(RefSystem, kRefSystems, value); }
int DataSetInfo_Obj::SetType(DSImageType image, DSSensorType sensor, DSAcqMode mode, DSProjection projection,
                             DSUnitType unit, DSRefSys system) {
    SetImageType(image);
    SetSensorType(sensor);
    SetAcqMode(mode);
    SetProjection(projection);
    SetUnitType(unit);
    return IsProjection(dsGeocoded) ? SetRefSys(system) : QUO_OK;
}

bool DataSetInfo_Obj::IsImageType(DSImageType value) const { return holds_text(ImageType, kImageTypes, value); }
bool DataSetInfo_Obj::IsSensorType(DSSensorType value) const { return holds_text(SensorName, kSensors, value); }
bool DataSetInfo_Obj::IsAcqMode(DSAcqMode value) const { return holds_text(AcquisitionMode, kAcqModes, value); }
bool DataSetInfo_Obj::IsProjection(DSProjection value) const {
    return holds_text(Projection, kProjections, value);
}
bool DataSetInfo_Obj::IsUnitType(DSUnitType value) const { return holds_text(UnitType, kUnitTypes, value); }
bool DataSetInfo_Obj::IsRefSys(DSRefSys value) const { return holds_text(RefSystem, kRefSystems, value); }
bool DataSetInfo_Obj::IsType(DSImageType image, DSSensorType sensor, DSAcqMode mode, DSProjection projection,
                             DSUnitType unit, DSRefSys system) const {
    return IsImageType(image) && IsSensorType(sensor) && IsAcqMode(mode) && IsProjection(projection) &&
           IsUnitType(unit) && IsRefSys(system);
}

int DataSetInfo_Obj::fillQUOREL() {
    quo::copy_bounded(ProcessingCenter, "QUOREL Vestra");
    return QUO_OK;
}
int DataSetInfo_Obj::getPolarizationNbr() const {
    const auto* text = std::ranges::find(kPolarizations, std::string_view{Polarization});
    return text == std::end(kPolarizations) ? kUnknownNumber : static_cast<int>(text - std::begin(kPolarizations));
}
int DataSetInfo_Obj::getISNbr() const { return number_of(Swath, kSwaths); }
