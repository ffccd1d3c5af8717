// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_SWATH_H
#define QUO_BASE_SWATH_H

#include <cstdint>
#include <vector>

#include "quo_base/api.h"
#include "quo_base/datafile.h"
#include "quo_base/quorelxml_v2.h"

/** @file
 * Header objects for the timing of a swath's bursts and for its elevation antenna pattern.
 *
 * Sections stand in channel 1 of an XML header, elements bear the members' names. -999 marks an unknown number.
 * Operations return 0, or a failing status with an entry in the report. A failed read leaves the members read so
 * far changed, the rest as they were. Vectors hold what was loaded or made; they are not part of the XML
 * sections. One object serves one thread at a time; its `const` members may run side by side. */

/** Timing of a swath: its bursts and the changes of its sampling window. Section "SwathInfo"; in parameter files
 * also the key Swst_changes_bursts. */
class QUO_BASE_API SwathInfo : public GeneralSAR_Base {
public:
    /** The most changes of the sampling window that are believed: a larger number comes from a damaged header. */
    static constexpr int kMaxSwstChanges = 1 << 20;
    /** Bytes before the samples of each line in the rasters of readBurstTimes(). */
    static constexpr int kLineHeader = 17;

    SwathInfo();
    /** Reads the XML section, which holds no change bursts, else the same file as a parameter file with as many
     * values under Swst_changes_bursts as Swst_changes tells. 0; 1; 7. */
    int readhdr(const char* file) override;
    int writehdr(const char* file) override;  ///< replaces the section in the file; 0 or a failing status
    using GeneralSAR_Base::writehdr;
    /** Makes Swst_changes_bursts anew, Swst_changes zeros where that is above 0. 0; 1 for more than
     * kMaxSwstChanges; 7. Only 0 leaves an array behind. */
    int createBuffers() override;
    int destroyBuffers() override;   ///< empties both arrays; Swst_changes becomes 0
    int clone(SwathInfo* to) const;  ///< copies every member, the arrays too; 0 or 7

    /** Reads the start time of every burst from the header of its first line.
     *
     * The description comes from "<raster>.hdr": this object's section and the raster's. Every line of the raster
     * is kLineHeader bytes, which begin with an MJD record, and the samples; the lines of a burst follow one
     * another, and so do the bursts.
     * @param raster  name of the raster
     * @return 0, with Bursts times in BurstStartTimes; 1 for a description that makes no bursts; 4 where the file
     * is shorter than they need, which is found before memory is taken; 7; 9; or the status of reading one of the
     * descriptions. BurstStartTimes stays as it was unless 0 is returned. */
    int readBurstTimes(const char* raster);

    std::int32_t Rank = -999;                       ///< pulses between transmission and reception
    double Rgate_bias = -999.0;                     ///< bias of the range gate, s
    std::int32_t Echoes_per_burst = -999;           ///< echoes of one burst
    std::int32_t Lines_per_burst = -999;            ///< raster lines of one burst
    std::int32_t Bursts = -999;                     ///< number of bursts
    std::int32_t Order = -999;                      ///< place of the swath in the burst cycle
    double Acquisition_Start_Time = -999.0;         ///< s since 1985
    std::int32_t Swst_changes = -999;               ///< changes of the sampling window start time
    double ProcessorGain = 1.0;                     ///< factor
    double NoisePower = -999.0;                     ///< mean power of the noise
    double ChirpPower = -999.0;                     ///< power of the reference chirp
    std::vector<std::int32_t> Swst_changes_bursts;  ///< bursts at which the sampling window changes
    std::vector<double> BurstStartTimes;            ///< s since 1985; filled by readBurstTimes()

protected:
    void refreshParameters() override;
};

/** The elevation antenna pattern: its angles in the section "AntennaPattern", its samples as one line of floats in
 * a raster file of their own. */
class QUO_BASE_API AntennaPattern_Obj : public GeneralSAR_Base {
public:
    /** The most samples that are believed: a larger number comes from a damaged header. */
    static constexpr int kMaxPatternSamples = 1 << 20;
    /** What an annex file holds; see getPatternENVI(). */
    static constexpr int kAnnexSwaths = 8, kAnnexPolarizations = 4, kAnnexSamples = 201;

    AntennaPattern_Obj();
    /** Reads the XML section, else the same file as a parameter file, then the description of the pattern file,
     * which is named like the header less its last four characters (".hdr"); PatternSamples becomes its number of
     * samples. The samples themselves are left to getPatternArray(). 0; 1; 7. */
    int readhdr(const char* file) override;
    /** Writes the description of the pattern file with PatternSamples samples, and the XML section beside it, both
     * into "<pattern file>.hdr". 0 or a failing status. */
    int writehdr() override;
    int writehdr(const char* file) override;  ///< writes the XML section only; 0 or a failing status
    /** Makes Pattern anew, PatternSamples zeros ("not loaded"). 0; 1 for more than kMaxPatternSamples; 7. Only 0
     * leaves an array behind. */
    int createBuffers() override;
    int destroyBuffers() override;            ///< empties Pattern; PatternSamples becomes 0
    int clone(AntennaPattern_Obj* to) const;  ///< copies every member, array and description too; 0 or 7

    /** The samples: those in memory, or where the first of them is exactly 0 ("not loaded") those of the pattern
     * file, which then stay in memory too.
     * @param[out] pattern  room for PatternSamples floats; unchanged unless 0 is returned
     * @return 0; 1 where PatternSamples makes no pattern or the file holds complex samples; 4, 7, 9. */
    int getPatternArray(float* pattern);
    /** Writes Pattern as line 0 of the pattern file, whose description becomes one line of PatternSamples floats.
     * The description's side file is left to writehdr(). 0; 1 without a pattern of PatternSamples samples; 5, 9.
     */
    int WritePatternArray();
    /** Loads the pattern of one swath and polarization from an annex file.
     *
     * The file has a main header of 1247 and a specific header of 378 bytes; the decimal number that starts 231
     * bytes into the latter is the offset of the data set. That is kAnnexSwaths * kAnnexPolarizations records, the
     * polarizations of a swath one after the other. A record is big-endian floats: start angle and step in
     * degrees, then kAnnexSamples two-way gains.
     * @param annex_file    name of the file
     * @param swath         0 to 7, as DataSetInfo_Obj::getISNbr numbers them
     * @param polarization  0 to 3, as DataSetInfo_Obj::getPolarizationNbr numbers them
     * @return 0, with the angles, PatternSamples and Pattern set; 1 for another swath or polarization or an offset
     *         that is no number or negative; 4 for a file that is too short; 7; 9. Members change with 0 only. */
    int getPatternENVI(const char* annex_file, int swath, int polarization);

    double StartAngle = -999.0;       ///< elevation angle of the first sample, degrees
    double DeltaAngle = -999.0;       ///< step between samples, degrees
    std::int32_t PatternSamples = 0;  ///< number of samples
    std::vector<float> Pattern;       ///< the samples
    DataFile PatternFile;             ///< the pattern file

protected:
    void refreshParameters() override;
};

#endif
