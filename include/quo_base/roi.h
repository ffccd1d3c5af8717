// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_ROI_H
#define QUO_BASE_ROI_H

#include "quo_base/api.h"
#include "quo_base/quorelxml_v2.h"

/** @file
 * Regions of interest: rectangles of an image, described in time or in samples and lines.
 *
 * The fast axis is range: two-way range time in seconds, counted in samples. The slow axis is azimuth: seconds
 * since 1 January 1985, counted in lines. Indices count from 0 at the start of an axis. Arithmetic never
 * overflows: counts and indices stop at the bounds of a 32-bit integer, and an axis whose interval is 0, or a time
 * that is no number, answers 0. One object serves one thread at a time; its `const` members may run
 * side by side. */

/** One corner of a region: a time on either axis. */
struct ROI_Time {
    double FastTime;  ///< range time, s
    double SlowTime;  ///< azimuth time, s
};

/** A rectangle of an image in time. A new region is empty. */
class QUO_BASE_API ROI_Obj : public GeneralSAR_Base {
public:
    ROI_Obj();

    /** Sets one axis: its start, its interval and its number of samples or lines; its length becomes delta * n.
     * Return 0. */
    int SetFastAxe(double start, double delta, int n);
    int SetSlowAxe(double start, double delta, int n);

    /** Empties the region: no samples, no lines; start, interval and length stay. Returns 0. */
    int ResetROI();
    /** 1 when the region holds no sample or no line, else 0. */
    int isNULL() const;

    /** Index of the sample or line nearest to a time, halves away from zero; negative before the start. */
    int GetFastIndex(double time) const;
    int GetSlowIndex(double time) const;
    /** Number of samples or lines in a length of time, s, halves away from zero. */
    int GetFastRange(double length) const;
    int GetSlowRange(double length) const;

    /** The corners. Up and down move along the fast axis, left and right along the slow axis, so that
     * the upper right corner is the first sample of the last line. */
    ROI_Time GetUpLeft() const;
    ROI_Time GetUpRight() const;
    ROI_Time GetDownLeft() const;
    ROI_Time GetDownRight() const;
    ROI_Time GetCenter() const;

    /** Reads the region from the section `name` of an XML header (channel 1), else from the section of that name
     * of a parameter file with the members' names as keys.
     *
     * @return 0 or 1. In a parameter file the key Samples alone decides; any other key that is missing
     * leaves its member as it was. */
    int read_roi(const char* file, const char* name);
    /** Writes the region as the section `name` of an XML header (channel 1), which replaces an older one. Returns
     * 0 even where the file cannot be written; the report tells. */
    int write_roi(const char* file, const char* name);

    /** What two regions share, on a's grid intervals (those of b are ignored).
     *
     * @param[in]  a, b  the regions
     * @param[out] out   may be a or b. Where nothing is shared it is empty, with start and length as computed (the
     *                  lengths are then 0 or negative).
     * @return 0; 1 for a null pointer */
    static int IntersectROI(const ROI_Obj* a, const ROI_Obj* b, ROI_Obj* out);

    /** Copies every member into another region. Returns 0. */
    int clone(ROI_Obj* to) const;

    double FastStartTime = 0.0;   ///< range time of the first sample, s
    double SlowStartTime = 0.0;   ///< azimuth time of the first line, s
    double FastTimeLength = 0.0;  ///< s; FastTimeDelta * Samples where SetFastAxe set it
    double SlowTimeLength = 0.0;  ///< s; SlowTimeDelta * Lines where SetSlowAxe set it
    double FastTimeDelta = 0.0;   ///< s per sample
    double SlowTimeDelta = 0.0;   ///< s per line
    int Samples = 0;              ///< number of samples on the fast axis
    int Lines = 0;                ///< number of lines on the slow axis

protected:
    void refreshParameters() override;
};

/** A region that knows the file it is kept in. */
class QUO_BASE_API FileROI_Obj : public ROI_Obj {
public:
    /** A region without a file. */
    FileROI_Obj() = default;
    FileROI_Obj(const char* file, const char* name) { SetFile(file, name); }

    /** Names the file, an XML header or a parameter file, and the section of the region in it.
     * @return 0; 1 where a name has 512 bytes or more, which leaves both unchanged */
    int SetFile(const char* file, const char* name);

    using ROI_Obj::read_roi;
    /** Reads the region from its file, as the form with arguments does. Returns 0, or 1 where no file is named. */
    int read_roi();

    char FileName[512] = "";        ///< the file; empty where none is named
    char SectionName[512] = "ROI";  ///< the section that holds the region
};

/** A rectangle of an image in samples and lines. Section "ROI_Coords" of an XML header, or of a parameter file
 * with the members' names as keys; all four are mandatory. */
class QUO_BASE_API ROI_Coords : public GeneralSAR_Base {
public:
    ROI_Coords();

    int readhdr(const char* file) override;   ///< XML section, else the same file as a parameter file; 0 or 1
    int writehdr(const char* file) override;  ///< replaces the section in the file; 0 or 1
    int clone(ROI_Coords* to) const;          ///< copies every member; 0

    /** The same rectangle in time, on the grid of the image whose first sample and line have index 0. The start,
     * intervals, lengths and counts of `out` are set; `out` may be `image`. Returns 0, or 1 for a null pointer. */
    int GetROI(const ROI_Obj* image, ROI_Obj* out) const;

    int FirstSample = 0;  ///< counted from 0
    int FirstLine = 0;    ///< counted from 0
    int Samples = 0;      ///< number of samples
    int Lines = 0;        ///< number of lines

protected:
    void refreshParameters() override;
};

#endif
