// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_DATASET_INFO_H
#define QUO_BASE_DATASET_INFO_H

#include "quo_base/api.h"
#include "quo_base/quorelxml_v2.h"

/** What a product is: its orbit, track and scene, its sensor and mode, the kind of image, its projection, units
 * and reference system, and the radiometric corrections applied to it.
 *
 * Section "DataSetInfo" of an XML header (channel 1), or of a parameter file, with the members' names. -999 marks
 * an unknown number, "NOT_AVAILABLE" an unknown text. Six of the texts hold classifications; programs set and test
 * them through the enumerations, files hold the texts. One object serves one thread at a time. */
class QUO_BASE_API DataSetInfo_Obj : public GeneralSAR_Base {
public:
    /** Kind of image. The text that the header stores stands beside each value. */
    enum DSImageType : int {
        dsImageTypeNotSet = 0,          ///< "NOT SET"
        dsRangeFocused = 1,             ///< "RANGE FOCUSED"
        dsAzimuthFocused = 2,           ///< "AZIMUTH FOCUSED"
        dsRawData = 3,                  ///< "RAW DATA"
        dsMultilook = 4,                ///< "MULTILOOK"
        dsInterferometry = 5,           ///< "INTERFEROMETRY"
        dsFlatEarth = 6,                ///< "FLAT EARTH"
        dsCoherenceMap = 7,             ///< "COHERENCE MAP"
        dsDem = 8,                      ///< "DEM"
        dsSyntheticFringes = 9,         ///< "SYNTHETIC FRINGES"
        dsDemImageTimesMap = 10,        ///< "DEM IMAGE TIMES MAP"
        dsImageHeightMap = 11,          ///< "IMAGE HEIGHT MAP"
        dsCoregisteredSlantRange = 12,  ///< "COREGISTERED SLANT RANGE COMPLEX IMAGE"
        dsPhaseUnwrapped = 13,          ///< "PHASE UNWRAPPED"
        dsRawDataAligned = 14           ///< "RAW DATA ALIGNED"
    };
    /** Sensor, in SensorName. */
    enum DSSensorType : int {
        dsSensorUnknown = 0,  ///< "SENSOR UNKNOWN"
        dsAsar = 1,           ///< "ASAR"
        dsRadarsat = 2,       ///< "RADARSAT"
        dsErs1 = 3,           ///< "ERS1"
        dsErs2 = 4,           ///< "ERS2"
        dsPalsar = 5,         ///< "PALSAR"
        dsTerraSarX = 6,      ///< "TERRA SAR-X"
        dsCsks1 = 7,          ///< "CSKS1"
        dsCsks2 = 8,          ///< "CSKS2"
        dsCsks3 = 9,          ///< "CSKS3"
        dsCsks4 = 10          ///< "CSKS4"
    };
    /** Acquisition mode. */
    enum DSAcqMode : int {
        dsAcqModeUndefined = 0,    ///< "ACQUISITION MODE UNDEFINED"
        dsStripmap = 1,            ///< "STRIPMAP"
        dsDoublePolarization = 2,  ///< "DOUBLE POLARIZATION"
        dsQuadPolarization = 3,    ///< "QUAD POLARIZATION"
        dsScansar = 4              ///< "SCANSAR"
    };
    /** Projection. */
    enum DSProjection : int {
        dsProjectionUndefined = 0,  ///< "PROJECTION UNDEFINED"
        dsGroundRange = 1,          ///< "GROUND RANGE"
        dsSlantRange = 2,           ///< "SLANT RANGE"
        dsGeocoded = 3              ///< "GEOCODED"
    };
    /** Unit of the samples. */
    enum DSUnitType : int {
        dsUnitUndefined = 0,  ///< "UNIT TYPE UNDEFINED"
        dsVolt = 1,           ///< "VOLT"
        dsVoltSquared = 2,    ///< "VOLT^2"
        dsVoltComplex = 3,    ///< "VOLTcomplex"
        dsMeter = 4,          ///< "meter"
        dsRadian = 5,         ///< "Radian"
        dsDegree = 6,         ///< "Degree"
        dsSecond = 7          ///< "sec"
    };
    /** Reference system of a geocoded product. */
    enum DSRefSys : int {
        dsRefSysUndefined = 0,  ///< "REFERENCE SYSTEM UNDEFINED"
        dsWgs84 = 1,            ///< "WGS84"
        dsEgm84 = 2             ///< "EGM84"
    };

    /** What getPolarizationNbr and getISNbr answer for a text they do not know. */
    static constexpr int kUnknownNumber = 666;

    DataSetInfo_Obj();
    /** Reads the XML section, else the same file as a parameter file. There every key but LookDirection is read;
     * the read fails where one of those from OrbitNumber to Projection is missing.
     *
     * @return 0; 1 where the read failed: members read so far are changed, the rest as they were */
    int readhdr(const char* file) override;
    int writehdr(const char* file) override;  ///< replaces the section in the file; 0 or 1
    int clone(DataSetInfo_Obj* to) const;     ///< copies every member; 0

    /** Store the text of a value; a value outside its enumeration stores the text of value 0. Return 0. */
    int SetImageType(DSImageType value);
    int SetSensorType(DSSensorType value);
    int SetAcqMode(DSAcqMode value);
    int SetProjection(DSProjection value);
    int SetUnitType(DSUnitType value);
    int SetRefSys(DSRefSys value);
    /** Sets the first five as above, then the reference system, but only where the projection is now "GEOCODED":
     * any other projection leaves RefSystem as it was. Returns 0. */
    int SetType(DSImageType image, DSSensorType sensor, DSAcqMode mode, DSProjection projection, DSUnitType unit,
                DSRefSys system);

    /** Whether the stored text is that of the value, to the letter; false for a value outside its enumeration. */
    bool IsImageType(DSImageType value) const;
    bool IsSensorType(DSSensorType value) const;
    bool IsAcqMode(DSAcqMode value) const;
    bool IsProjection(DSProjection value) const;
    bool IsUnitType(DSUnitType value) const;
    bool IsRefSys(DSRefSys value) const;
    /** Whether all six hold. */
    bool IsType(DSImageType image, DSSensorType sensor, DSAcqMode mode, DSProjection projection, DSUnitType unit,
                DSRefSys system) const;

    /** Sets ProcessingCenter to "QUOREL Vestra". Returns 0. */
    int fillQUOREL();
    /** Number of the polarization: "H/H" 0, "V/V" 1, "H/V" 2, "V/H" 3, anything else kUnknownNumber. */
    int getPolarizationNbr() const;
    /** Number of the swath: "IS1" to "IS7" 0 to 6, "SS2" to "SS5" 2 to 5, anything else kUnknownNumber.
     * "SS1" is 7, not the 1 of "IS2", and the other wide swaths share their numbers with "IS3" to "IS6". */
    int getISNbr() const;

    char OrbitNumber[512] = "NOT_AVAILABLE";         ///< number of the orbit
    char Track[512] = "NOT_AVAILABLE";               ///< number of the track
    char SenseDate[512] = "NOT_AVAILABLE";           ///< date of the acquisition
    char SceneID[512] = "NOT_AVAILABLE";             ///< name of the scene
    char Description[512] = "NOT_AVAILABLE";         ///< of the product
    char AcquisitionStation[512] = "NOT_AVAILABLE";  ///< receiving station
    char ProcessingCenter[512] = "NOT_AVAILABLE";    ///< see fillQUOREL
    char ProcessingDate[512] = "NOT_AVAILABLE";      ///< date of the processing
    char ProcessingSoftware[512] = "NOT_AVAILABLE";  ///< name and version of the processor
    double SceneHeading = -999.0;                    ///< degrees
    char OrbitConfiguration[512] = "NOT_AVAILABLE";  ///< of the platform
    char Polarization[512] = "NOT_AVAILABLE";        ///< see getPolarizationNbr
    char Swath[512] = "NOT_AVAILABLE";               ///< see getISNbr
    double SWST_MIN = -999.0;                        ///< earliest sampling window start time, s
    double SWST_MAX = -999.0;                        ///< latest sampling window start time, s
    double RO_REF = 800000.0;                        ///< reference range of the spreading-loss correction, m
    int RangeLooks = 1;                              ///< 1 to 1000
    double RangeBandwidth[5] = {};                   ///< per swath, Hz
    double ExternalCalibrationFactor = 1.0;          ///< absolute calibration; see EnvisatCalibrationFactors
    char Projection[512] = "PROJECTION UNDEFINED";   ///< text of a DSProjection
    char ImageType[512] = "NOT SET";                 ///< text of a DSImageType; optional, as all that follow
    char AcquisitionMode[512] = "ACQUISITION MODE UNDEFINED";  ///< text of a DSAcqMode
    char SensorName[512] = "SENSOR UNKNOWN";                   ///< text of a DSSensorType
    char RefSystem[512] = "REFERENCE SYSTEM UNDEFINED";        ///< text of a DSRefSys
    char UnitType[512] = "UNIT TYPE UNDEFINED";                ///< text of a DSUnitType
    int RGAntenna_flag = 0;                                    ///< 1: corrected for the range antenna pattern
    int AZAntenna_flag = 0;                                    ///< 1: corrected for the azimuth antenna pattern
    int SpreadLoss_flag = 0;                                   ///< 1: corrected for the range spreading loss
    int DroopGain_flag = 0;                                    ///< 1: corrected for the antenna droop gain
    int RGAntenna_AltitudeCorr_flag = 0;  ///< 1: the range antenna correction takes the altitude into account
    int NoiseCorr_flag = 0;               ///< 1: corrected for noise
    int MissingLines = -1;                ///< number of missing lines, -1 where unknown
    int LookDirection = 0;                ///< look sign: not negative looks right

protected:
    void refreshParameters() override;
};

#endif
