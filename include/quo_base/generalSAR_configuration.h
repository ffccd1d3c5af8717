// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_GENERALSAR_CONFIGURATION_H
#define QUO_BASE_GENERALSAR_CONFIGURATION_H

#include <memory>
#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "quo_base/api.h"
#include "quo_base/quorelReport.h"
#include "quo_base/quorelxml_v2.h"

class GeneralSAR;

/** @file
 * The parameters of the processors: one record per processor, kept in XML configuration files of the header
 * format.
 *
 * A record's section is its class name. Besides its own parameters every record has five that all processors
 * share, in the section "generalProcessingConf"; these are input only. Failures of reading and writing a record
 * are thrown as quorelException. Defaults are chosen for C-band stripmap data; docs/configuration.md lists every
 * parameter with type, unit, bounds, default and meaning. One object serves one thread at a time. */

/** The parameters that all processors share. Values missing in a file stay as they are. */
class QUO_BASE_API GeneralSAR_BaseConfiguration {
public:
    /** Number of shared parameters. */
    static constexpr int kSharedParameters = 5;

    GeneralSAR_BaseConfiguration() = default;

    virtual int readpar(const char* file, int channel);         ///< does nothing here, 0
    virtual int writepar(const char* file, int channel);        ///< does nothing here, 0
    virtual int clone(GeneralSAR_BaseConfiguration* to) const;  ///< copies the shared parameters; 0, 1 for null
    virtual ~GeneralSAR_BaseConfiguration();

    /** Reads the shared parameters from a section of a file; missing ones stay as they are. Returns 0. */
    int readConf(const char* file, int channel, const char* section);
    /** Writes nothing: the shared parameters are input only, set by hand for all processors. Returns 0. */
    int writeConf(const char* file, int channel, const char* section);

    /** A shared parameter by its index, described like an element of a header object; it points into this object.
     * Without name and values beyond the last. */
    [[nodiscard]] parElement sharedParameter(int index);
    /** Its unit, empty where it has none, and what it means. */
    [[nodiscard]] static const char* sharedUnit(int index);
    [[nodiscard]] static const char* sharedMeaning(int index);

    int32_t Memory = 512;                           ///< working memory that a processor may take, MB
    int32_t Incore = 0;                             ///< 1 keeps intermediate results in memory
    int32_t Verbose = 0;                            ///< above 0 prints progress in detail
    int32_t ReportLevel = 1;                        ///< level of the report, 1 to 3; 0 none
    char ReportFilename[512] = "quorelReport.txt";  ///< name of the report file
};

/** What every record can do. Records are neither copied nor moved; clone() copies their values. */
class QUO_BASE_API GeneralSAR_ConfigurationRecord : public GeneralSAR_Base, public GeneralSAR_BaseConfiguration {
public:
    /** Reads the shared parameters from `base_section` and the record's own from `own_section`.
     * @return 0. Throws quorelException "Cannot read base configuration file" or "Cannot read specific
     * configuration file", the latter when a mandatory element is missing; what was read stays. */
    int readConf(const char* file, int channel, const char* base_section, const char* own_section);
    /** Writes the record's own parameters, replacing `own_section` of the file; the shared ones are not written.
     * @return 0. Throws "Cannot write base configuration file" or "Cannot write specific configuration file"; the
     * old file is then whole. */
    int writeConf(const char* file, int channel, const char* base_section, const char* own_section);
    /** readConf() with the sections "generalProcessingConf" and the class name; a status other than 0 would throw
     * "Cannot read input file". */
    int readpar(const char* file, int channel) override;
    /** writeConf() likewise; "Cannot write input file". */
    int writepar(const char* file, int channel) override;
    /** Copies every parameter, the shared ones too, into a record of the same class. 0; 1 for one of another. */
    int clone(GeneralSAR_BaseConfiguration* to) const override;

    /** Names of all record classes, which are their sections. */
    [[nodiscard]] static std::span<const char* const> names();
    /** A new record with its defaults, by its name; null for any other name. */
    [[nodiscard]] static std::unique_ptr<GeneralSAR_ConfigurationRecord> make(std::string_view name);

    /** The record's section: its class name. */
    [[nodiscard]] const char* section() const { return section_; }
    /** Unit of an element, empty where it has none, and what it means, by its index. */
    [[nodiscard]] virtual const char* unit(int index) const = 0;
    [[nodiscard]] virtual const char* meaning(int index) const = 0;

protected:
    /** For the record classes: takes the class name, a literal. */
    explicit GeneralSAR_ConfigurationRecord(const char* section) : section_{section} {}

private:
    const char* section_;
};

/** What a record class declares besides its members. */
#define QUO_CONFIGURATION_RECORD(Class)                          \
public:                                                          \
    Class();                                                     \
    [[nodiscard]] const char* unit(int index) const override;    \
    [[nodiscard]] const char* meaning(int index) const override; \
                                                                 \
protected:                                                       \
    void refreshParameters() override;                           \
                                                                 \
public:

/** Focusing in azimuth. */
class QUO_BASE_API AzimuthConf : public GeneralSAR_ConfigurationRecord {
    QUO_CONFIGURATION_RECORD(AzimuthConf)
    int32_t WhiteningFlag = 0;
    float AntennaLength = 10.0F;
    float AzimuthWindowHammingParameter = 0.0F, AzimuthLookBandwidth = 0.0F, AzimuthTransitionBandwidth = 0.0F;
    float RangeWindowHammingParameter = 0.0F, RangeLookBandwidth = 0.0F, RangeTransitionBandwidth = 0.0F;
    int32_t LinesInBlock = 5000, SamplesInBlock = 256, AzimuthOverlap = 2500, RangeOverlap = 20;
    int32_t PerformInterpolation = 7;
    float StoltPadding = 0.4F;
    int32_t ApplyRgShift = 0, ApplyAzShift = 0;
};

/** Estimation of the Doppler centroid. */
class QUO_BASE_API DCestConf : public GeneralSAR_ConfigurationRecord {
    QUO_CONFIGURATION_RECORD(DCestConf)
    int32_t Nbestblocks = 12, Nummlbf = 8, Nwdarbloks = 4, Blocks = 20, Blockl = 1024;
    int32_t Dswst = 1;
    int32_t Patchs = 512, Patchl = 1024;
    float RgBand = 16.0e6F, AnLen = 10.0F, Lookbf = 0.8F, Lookbt = 0.1F, Lookrp = 0.4F, Lookrs = 0.4F;
    int32_t Decfac = 2, Flength = 33;
    float Dftstep = 1.0F, Fftrgprc = 1.0F, Fftazprc = 1.0F, Peakwid = 3.0F, Minamb = -3.0F, Maxamb = 3.0F;
    float Kthr = 3.0F, Sthr = 0.5F, Varth = 100.0F;
    int32_t Amb_flag = 1;
    int32_t Pol_weights[7] = {1, 1, 0, 0, 1, 0, 0};
};

/** Extraction of raw lines. */
class QUO_BASE_API ExtractorConf : public GeneralSAR_ConfigurationRecord {
    QUO_CONFIGURATION_RECORD(ExtractorConf)
    int32_t RawLinesSkip = 0, RawLinesToExtract = 0;
};

/** Which steps of the chain are run. */
class QUO_BASE_API generalProcessingConf : public GeneralSAR_ConfigurationRecord {
    QUO_CONFIGURATION_RECORD(generalProcessingConf)
    /** A record read from a file; throws as readpar(). */
    generalProcessingConf(const char* file, int channel);

    int32_t Flag_incore = 0, Flag_ortog = 1, Flag_swstal = 1, Flag_ext = 1, Flag_rangefoc = 1, Flag_rgpatt = 1;
    int32_t Flag_azimuthfoc = 1, Flag_dcest = 1, Remove_interferences = 0, Azblk = 1, EraseTemp = 1;
};

/** Fine coregistration. */
class QUO_BASE_API FinefitestConf : public GeneralSAR_ConfigurationRecord {
    QUO_CONFIGURATION_RECORD(FinefitestConf)
    int32_t RangeMaxShift = 8, AzimuthMaxShift = 128, RangeBlockSize = 128, AzimuthBlockSize = 128;
};

/** Absolute calibration of the sensor "ASAR": factors by mode, polarisation and swath IS1 to IS7. */
class QUO_BASE_API EnvisatCalibrationFactors : public GeneralSAR_ConfigurationRecord {
    QUO_CONFIGURATION_RECORD(EnvisatCalibrationFactors)
    /** Sets the product's ExternalCalibrationFactor from the tables. Stripmap and double-polarisation products
     * must be focused in azimuth and take the factor of their swath; ScanSAR products must be multilooked and take
     * WSML_HH or WSML_VV, or, with one range look, WSS_HH or WSS_VV, by polarisation.
     * @return 0; 1 for a null product, another sensor, or any other combination, with the factor unchanged. */
    int writeFactor(GeneralSAR* product) const;
    /** The same on a header file: read, set, written back. 0, or 1 also when the file cannot be read or saved, 7;
     * the old file is then whole. */
    int writeFactor(const char* header_file) const;

    double IM_HH[7] = {1, 1, 1, 1, 1, 1, 1}, IM_VV[7] = {1, 1, 1, 1, 1, 1, 1};
    double AP_HH[7] = {1, 1, 1, 1, 1, 1, 1}, AP_HV[7] = {1, 1, 1, 1, 1, 1, 1};
    double AP_VH[7] = {1, 1, 1, 1, 1, 1, 1}, AP_VV[7] = {1, 1, 1, 1, 1, 1, 1};
    double WSML_HH = 1.0, WSML_VV = 1.0, WSS_HH = 1.0, WSS_VV = 1.0;
};

/** Extraction of a digital elevation model. */
class QUO_BASE_API DemExtractorConf : public GeneralSAR_ConfigurationRecord {
    QUO_CONFIGURATION_RECORD(DemExtractorConf)
    int32_t LatitudeOversampling = 1, LongitudeOversampling = 1;
    int32_t LatitudeMarginPerc = 10, LongitudeMarginPerc = 10, InterpolationFlag = 1;
    char GeoidCorrectionFilename[512] = "NOT_AVAILABLE";
    char SRTMDirectory[512] = "NOT_AVAILABLE";
};

/** Geocoding. */
class QUO_BASE_API GeocodingConf : public GeneralSAR_ConfigurationRecord {
    QUO_CONFIGURATION_RECORD(GeocodingConf)
    int32_t InterpolationPrecision = 2, InterpolationFilterLength = 11;
    float InterpolationFilterBandwidth = 0.8F;
};

/** Precise coarse-to-fine coregistration. */
class QUO_BASE_API ATPrecise_FitestConf : public GeneralSAR_ConfigurationRecord {
    QUO_CONFIGURATION_RECORD(ATPrecise_FitestConf)
    int32_t RangeMinOverlap = 256, AzimuthMinOverlap = 256, CoarseValidBlocks = 10, FineValidBlocks = 50;
};

/** Resampling onto a master. */
class QUO_BASE_API CoregistrationConf : public GeneralSAR_ConfigurationRecord {
    QUO_CONFIGURATION_RECORD(CoregistrationConf)
    int32_t InterpolationPrecision = 3, InterpolationFilterLength = 11;
    float InterpolationFilterBandwidth = 0.9F;
    int32_t DCDemodulationType = 1;
};

/** Estimation of coherence. */
class QUO_BASE_API CoherenceConf : public GeneralSAR_ConfigurationRecord {
    QUO_CONFIGURATION_RECORD(CoherenceConf)
    int32_t RangeEstimatesFrequencies = 1, AzimuthEstimatesFrequencies = 1;
    float MaxBias = 0.1F, MinimumNumberOfLooks = 10.0F;
    int32_t CoherenceRangeSemiAperture = 2, CoherenceAzimuthSemiAperture = 10;
    int32_t APrioriRangeSemiAperture = 4, APrioriAzimuthSemiAperture = 20;
    int32_t RangeSemiAperture4Frequency = 4, AzimuthSemiAperture4Frequency = 20;
    float ConfidenceLevel = 0.95F, SaturationLevel = 0.95F;
    int32_t AzimuthPresumSamples = 5;
    int32_t BiasMapFlag = 0, APrioriCoherenceFlag = 0, EFFlag = 1, DespeckleFlag = 0;
    int32_t ENLAzimuthAperture = 10, ENLRangeAperture = 10;
};

#undef QUO_CONFIGURATION_RECORD

/** The records of a container, by selector. */
enum GScObject {
    gscAzimuthConf = 0,
    gscDCestConf = 1,
    gscExtractorConf = 2,
    gscGeneralProcessingConf = 3,
    gscFinefitestConf = 4,
    gscEnvisatCalibrationFactors = 5
};

/** Records that are read and written together. A record takes part while it is enabled. The
 * DemExtractorConf has no selector and takes no part: it is read and written by itself. */
class QUO_BASE_API GeneralSAR_configuration {
public:
    GeneralSAR_configuration();

    int GSenable(GScObject object);                       ///< 0; 1 for a value that selects nothing
    int GSdisable(GScObject object);                      ///< 0; 1 for a value that selects nothing
    [[nodiscard]] bool GSexists(GScObject object) const;  ///< whether the record is enabled
    /** The record, enabled or not; null for a value that selects nothing. */
    [[nodiscard]] GeneralSAR_BaseConfiguration* GSget(GScObject object);

    /** writepar() of each enabled record in the order of the selectors, all saved in one step: a failure leaves
     * the file as it was. Returns 0; throws as writepar(). */
    int GSwrite(const char* file, int channel);
    /** Reads all six records in the order of the selectors and enables those that could be read.
     * @return 0; 1 with the ERROR entry "File : NAME DOES NOT EXIST!" when the file cannot be opened; 7. Throws as
     * readpar() at the first record that cannot be read, which stays enabled with those before it. */
    int GSread(const char* file, int channel);
    /** Clones each enabled record into the other container and enables it there. Returns 0. */
    int GSclone(GeneralSAR_configuration* to) const;

    AzimuthConf azimuth;                    ///< gscAzimuthConf
    DCestConf doppler;                      ///< gscDCestConf
    ExtractorConf extractor;                ///< gscExtractorConf
    generalProcessingConf processing;       ///< gscGeneralProcessingConf
    FinefitestConf fine_fit;                ///< gscFinefitestConf
    EnvisatCalibrationFactors calibration;  ///< gscEnvisatCalibrationFactors
    DemExtractorConf dem;                   ///< without selector: neither read nor written

private:
    static constexpr int kSelectors = 6;
    GeneralSAR_BaseConfiguration* table_[kSelectors];
    bool enabled_[kSelectors] = {};
};

/** Something in a configuration file that does not fit its record. */
struct ConfigurationFinding {
    std::string section;  ///< section of the record, or one that no record has
    std::string name;     ///< name of the element; empty where the whole section is meant
    std::string reason;   ///< continues the name: "is missing", "17 lies above 1"
};

/** What a configuration file holds. */
struct ConfigurationReview {
    std::vector<std::string> records;            ///< the records that are there, by name, in the order of the file
    std::vector<ConfigurationFinding> findings;  ///< what does not fit
};

/** Compares a channel of a configuration file with the records that it holds. Findings are sections and elements
 * that no record knows or that stand there more than once, mandatory elements that are missing, wrong counts of
 * values, texts that do not fit or are no numbers, and numbers outside their bounds; reading a record would notice
 * only what is missing. A section "generalProcessingConf" with nothing but shared parameters is not the record of
 * that name.
 *
 * @param[in]  file     name of the configuration file
 * @param[in]  channel  number of the channel, usually 1
 * @param[out] review   replaced, also on failure
 * @return 0, with or without findings; 1 when the file is missing, cannot be read or is no header document; 7. */
QUO_BASE_API int reviewConfiguration(const char* file, int channel, ConfigurationReview& review);

#endif
