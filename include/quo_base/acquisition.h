// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_ACQUISITION_H
#define QUO_BASE_ACQUISITION_H

#include "quo_base/api.h"
#include "quo_base/quorelxml_v2.h"

/** @file
 * Header objects that describe how an acquisition was sampled, pulsed and weighted.
 *
 * Each object keeps its members in a section of its own of an XML header (channel 1), under the members' names.
 * The header operations return 0, or 1 where the section cannot be read or the file not written. Where the text
 * says so, reading turns to the same file as a parameter file (section of the same name) when the XML section
 * fails; every key is then read, and one that is missing gives 1. A failed read leaves the members read so far
 * changed, the rest as they were. -999 marks an unknown number, "NOT_AVAILABLE" an unknown text. Texts are
 * NUL-terminated and cut to the room of their member. One object serves one thread at a time; its `const` members
 * may run side by side. */

/** How the acquisition was sampled. Section "SamplingConstants"; in parameter files the keys are CarrierFrequency,
 * SamplingRate, RangeBandWidth, RangeTSamplingStep, PRF, PRI, AzimuthBandwidth, BRF, BRI and WaveLength, in the
 * order of the members. No value is derived from another. */
class QUO_BASE_API SamplingConstants_Obj : public GeneralSAR_Base {
public:
    SamplingConstants_Obj();
    int readhdr(const char* file) override;      ///< XML section, else the same file as a parameter file; 0 or 1
    int writehdr(const char* file) override;     ///< replaces the section in the file; 0 or 1
    int clone(SamplingConstants_Obj* to) const;  ///< copies every member; 0

    double fc_hz = -999.0;     ///< carrier frequency, Hz
    double frg_hz = -999.0;    ///< range sampling rate, Hz
    double Brg_hz = -999.0;    ///< range bandwidth, Hz
    double Trg_s = -999.0;     ///< range sampling step, s
    double prf_hz = -999.0;    ///< pulse repetition frequency, Hz
    double pri_s = -999.0;     ///< pulse repetition interval, s
    double Baz_hz = -999.0;    ///< azimuth bandwidth, Hz
    double brf_hz = -999.0;    ///< burst repetition frequency, Hz
    double bri_s = -999.0;     ///< burst repetition interval, s
    double lambda_m = -999.0;  ///< wavelength, m

protected:
    void refreshParameters() override;
};

/** The transmitted pulse, a linear chirp. Section "Pulse"; keys as the members. */
class QUO_BASE_API SARPulse_Obj : public GeneralSAR_Base {
public:
    /** The most samples that a reference chirp may have. A pulse of 100 us sampled at 600 MHz has 60 000: a larger
     * number than this comes from a damaged header. */
    static constexpr int kMaxChirpSamples = 1 << 24;

    SARPulse_Obj();
    int readhdr(const char* file) override;   ///< XML section, else the same file as a parameter file; 0 or 1
    int writehdr(const char* file) override;  ///< replaces the section in the file; 0 or 1
    int clone(SARPulse_Obj* to) const;        ///< copies every member; 0

    /** Number of samples of the reference chirp: PulseLength * PulseSamplingRate, halves rounded up; 0 where
     * generateChirp would refuse. */
    int chirpSamples() const;

    /** Reference chirp: exp(i pi B / T t^2) / sqrt(|N / B fs|) at t = (n - (N - 1) / 2) / fs, n = 0 .. N - 1, with
     * T = PulseLength, B = Bandwidth (negative for a falling chirp) and fs = PulseSamplingRate. The chirp is
     * centred on the middle sample, or between the two middle samples where N is even, and symmetric about it; its
     * energy is |B| / fs. PulseKRate and PulseEnergy are not used.
     *
     * @param[out] chirp  room for chirpSamples() samples; unchanged unless 0 is returned
     * @return 0; 1 with an ERROR entry where the pulse length or the sampling rate is not above 0, N is 0 or above
     *         kMaxChirpSamples, or the bandwidth is such that phase or amplitude have no finite value. A bandwidth
     * of 0 gives samples of 0. */
    int generateChirp(fcomplex* chirp) const;
    /** Writes the reference chirp as a raster of one line of FLOAT_COMPLEX samples, little-endian, and its side
     * file
     * "<file>.hdr".
     *
     * @return 0; 1 where generateChirp() would refuse, or for a name of 512 bytes or more, with nothing written;
     * 5, 7, 9; 1 where only the side file could not be written. Every failure has an entry. */
    int writeChirp(const char* file) const;

    double PulseLength = -999.0;        ///< s
    double Bandwidth = -999.0;          ///< Hz
    double PulseKRate = -999.0;         ///< chirp rate, Hz/s
    double PulseEnergy = -999.0;        ///< energy of the pulse
    double PulseSamplingRate = -999.0;  ///< Hz

protected:
    void refreshParameters() override;
};

/** Attitude and antenna of the sensor. Section "SensorAttitude"; keys as the members. */
class QUO_BASE_API SensorAttitude_Obj : public GeneralSAR_Base {
public:
    SensorAttitude_Obj();
    int readhdr(const char* file) override;   ///< XML section, else the same file as a parameter file; 0 or 1
    int writehdr(const char* file) override;  ///< replaces the section in the file; 0 or 1
    int clone(SensorAttitude_Obj* to) const;  ///< copies every member; 0

    /** Loads DroopGain and Temperature of one swath from an annex file.
     *
     * The file has a main header of 1247 and a specific header of 378 bytes; the decimal number that starts 231
     * bytes into the latter is the offset of the data set, of 171648 bytes. From its byte 171232 on it has 68
     * bytes per swath: the temperature as a float and the gains as doubles, all big-endian.
     * @param annex_file  name of the file
     * @param swath       0 to 4; any other has no gains: both members stay as they are, with 0
     * @return 0; 1 for an offset that is no number or negative; 4 for a file that is too short; 7; 9. Members
     * change with 0 only. */
    int getDroopGain(const char* annex_file, int swath);

    double Eq_speed = -999.0;       ///< equivalent speed, m/s
    double Eq_distance = -999.0;    ///< equivalent distance, m
    double Mean_DC = -999.0;        ///< mean Doppler centroid, Hz
    double SquintAngle = -999.0;    ///< degrees
    double AntennaLength = -999.0;  ///< m
    double DroopGain[8] = {};       ///< antenna droop gains
    double Temperature = -999.0;    ///< temperature of the antenna that the gains hold for

protected:
    void refreshParameters() override;
};

/** The spectral weighting that the processor applied. Section "SpectralWindows"; keys as the members. */
class QUO_BASE_API SpectralWindows_Obj : public GeneralSAR_Base {
public:
    SpectralWindows_Obj();
    int readhdr(const char* file) override;    ///< XML section, else the same file as a parameter file; 0 or 1
    int writehdr(const char* file) override;   ///< replaces the section in the file; 0 or 1
    int clone(SpectralWindows_Obj* to) const;  ///< copies every member; 0

    char AzMatchedFilterType[512] = "NOT_AVAILABLE";  ///< azimuth window
    char RgMatchedFilterType[512] = "NOT_AVAILABLE";  ///< range window
    double RgMatchedFilterCoef = -999.0;              ///< coefficient of the range window
    double AzMatchedFilterCoef = -999.0;              ///< coefficient of the azimuth window
    double RgLookBandwidth = -999.0;                  ///< range bandwidth of one look, Hz
    double AzLookBandwidth = -999.0;                  ///< azimuth bandwidth of one look, Hz

protected:
    void refreshParameters() override;
};

/** The part of the image that a quick-look shows. Section "QuickLook", elements QL_FirstSample, QL_Samples,
 * QL_FirstLine, QL_Lines, QL_AzimuthML and QL_RangeML. */
class QUO_BASE_API QuickLook_Obj : public GeneralSAR_Base {
public:
    QuickLook_Obj();
    /** XML section only. A product without a quick-look is as good as one with: returns 0 whatever happens;
     * members that could not be read keep their values. */
    int readhdr(const char* file) override;
    int writehdr(const char* file) override;  ///< replaces the section in the file; 0 or 1
    /** Copies first sample, first line, samples and lines: the part of the image. The two multilook factors of the
     * target stay its own. Returns 0. */
    int clone(QuickLook_Obj* to) const;

    int QL_FirstSample = 0;  ///< first sample shown, counted from 0
    int QL_FirstLine = 0;    ///< first line shown, counted from 0
    int QL_Samples = 0;      ///< number of samples
    int QL_Lines = 0;        ///< number of lines
    int QL_AzimuthML = 1;    ///< azimuth multilook factor
    int QL_RangeML = 1;      ///< range multilook factor

protected:
    void refreshParameters() override;
};

/** One ground point of a product's geographic description. Section "GroundCornersPoints/<point name>", where the
 * five values travel as the array Point; in a parameter file they stand in the section "Coordinates", under the
 * point's name. The angles are in degrees. */
class QUO_BASE_API geopoint : public GeneralSAR_Base {
public:
    geopoint();

    using GeneralSAR_Base::readhdr;
    using GeneralSAR_Base::writehdr;
    /** Reads the XML section, else the parameter file, into Point, and Point into the named members.
     *
     * @return 0, also where neither could be read: a point may be missing from a grid. The named members then
     * become what Point held. */
    int readhdr(const char* file, const char* point);
    /** Copies the named members into Point and replaces the point's section in the file; 0 or 1. */
    int writehdr(const char* file, const char* point);
    int clone(geopoint* to) const;  ///< copies the named members and Point; 0

    double Latitude = -999.0;        ///< geodetic
    double Longitude = -999.0;       ///< positive east
    double Height = -999.0;          ///< above the ellipsoid, m
    double IncidenceAngle = -999.0;  ///< at the target, against the ellipsoid normal
    double LookAngle = -999.0;       ///< at the satellite, from the direction to the Earth's centre
    /** The values as they stand in a file, in the order of the members above. */
    double Point[5] = {-999.0, -999.0, -999.0, -999.0, -999.0};

protected:
    void refreshParameters() override;
};

#endif
