// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_BASE_GENERALSARORBIT_H
#define QUO_BASE_GENERALSARORBIT_H

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "quo_base/api.h"
#include "quo_base/geometry.h"
#include "quo_base/quorelxml_v2.h"

/** @file
 * The platform's orbit: its state vectors as a product header lists them, a continuous model through them, and
 * range-Doppler geolocation on that model.
 *
 * Positions are Earth-fixed x, y, z in metres, velocities x, y, z in m/s; arrays of state vectors hold the three
 * values of each vector in turn. Times are azimuth times in seconds on the library's absolute scale (seconds since
 * 1985). `range` is always the two-way range time in seconds. Doppler is in Hz, positive while the platform
 * approaches the target. Angles are in degrees, latitude is geodetic (WGS84, semi-axes 6378137.0 m and
 * 6356752.314245 m). Ground points of the forward direction lie on the ellipsoid itself, unless a height is given.
 *
 * Results are 0 for success unless said otherwise; outputs are then written, and otherwise stay as they were.
 * Whatever needs a model returns 1 while there is none (no state vectors, or computeApproximateSV() has not yet
 * run since they were made), and 1 for an argument that is null or not finite. Every failure has its entry in the
 * report. One object serves one thread at a time, since it keeps the run of vectors that it used last; `const`
 * members of an orbit that nobody changes may run side by side. */

namespace quo {
class CallerFrame;
class OrbitModel;
struct OrbitSample;
}  // namespace quo

class GSRoi_Obj;
class ROI_Obj;
class geoCoords_Obj;
class polyDC;
class polyFR;
class polyGR2SL;
class polySL2GR;
class polySL2PHI;
class polySL2THETA;

/** State vectors of a product header, with one polynomial through all of them. Section "StateVectorData". */
class QUO_BASE_API SAROrbitStateVectors_Obj : public GeneralSAR_Base {
public:
    SAROrbitStateVectors_Obj();
    ~SAROrbitStateVectors_Obj() override;

    /** Allocates the arrays for nSV_n state vectors, zero-filled; 0 vectors need none. 0; 1 for a negative count,
     * one that 32 bits cannot hold three times, or one that the file being read is too short for; 7. Only 0 leaves
     * arrays behind.
     */
    int createBuffers() override;
    int destroyBuffers() override;
    using GeneralSAR_Base::writehdr;
    /** Writes the section into the header file. 0, or the status of the write. */
    int writehdr(const char* file) override;
    /** Reads the section from the header file, or else from the same file as a parameter file (keys TimeFirst,
     * TimeDelta, nStateVectors, pos, vel).
     * @return 0; 7; 4 when neither form is there or complete. A failure leaves the object without vectors. */
    int readhdr(const char* file) override;

    /** Drops what was there and makes room for `nStateVectors` (>= 0) vectors; the caller fills pSV_m and vSV_mOs.
     * 0, or the status of createBuffers(). */
    int SVCreate(double timeFirst, double timeDelta, int nStateVectors) noexcept;
    /** Releases vectors and polynomials; their number is then 0. Returns 0. */
    int SVDestroy() noexcept;
    /** Fits the polynomials of degree nSV_n - 1: positions, and velocities of their own. 0; 1 without vectors; or
     * the status of orb_interp(). A degree above about 15 follows its samples poorly between them. */
    int SVPolyCompute() noexcept;
    /** Position (m) and velocity (m/s, the derivative of the position polynomial) at time t. */
    int SVGetPos(double t, double* xyz) noexcept;
    int SVGetVel(double t, double* vxyz) noexcept;
    /** The fitted polynomial of one axis (0, 1, 2 for x, y, z): nSV_n coefficients in (t - t0SV_s), highest degree
     * first, m and m/s. Null before SVPolyCompute(). */
    const double* positionPoly(int axis) const noexcept;
    const double* velocityPoly(int axis) const noexcept;
    /** Copies vectors, polynomials and look direction into `other`. 0; 1 for null; 7. */
    int clone(SAROrbitStateVectors_Obj* other) noexcept;

    double* pSV_m = nullptr;    ///< nSV_n x 3 positions, m; owned
    double* vSV_mOs = nullptr;  ///< nSV_n x 3 velocities, m/s; owned
    double t0SV_s = -999.0;     ///< time of the first vector, s
    double dtSV_s = -999.0;     ///< spacing, s
    std::int32_t nSV_n = -999;  ///< number of vectors
    /** Look sign of the product, negative looks left; not part of the section. GeneralSAR::GSread() sets it. */
    std::int32_t LookDirection = 0;

protected:
    void refreshParameters() override;

private:
    void drop_polynomials() noexcept;

    std::unique_ptr<double[]> polynomials_;  // x, y, z of the positions, then of the velocities, vectors_ each
    std::int32_t vectors_ = 0;               // that the arrays have room for
    bool fitted_ = false;
};

/** What SVCheck() found wrong with the state vectors. */
struct SVFinding {
    /** What can be wrong. */
    enum Problem : std::uint8_t {
        kTooFew,        ///< fewer than five vectors; size is their number
        kTimes,         ///< first time or spacing not finite, or spacing not positive; size is the spacing
        kNotFinite,     ///< a position or velocity is not finite; size is 0
        kInsideEarth,   ///< the position lies more than 50 km below the ellipsoid's polar radius; size is
                        ///< |position|
        kDuplicate,     ///< the vector stands where its predecessor stands; size is their distance, m
        kPositionStep,  ///< the position is off the curve through its neighbours; size is the distance, m
        kVelocity,      ///< the velocity is not the positions' derivative; size is the difference, m/s
        kGap,           ///< vectors are missing before this one; size is their number, as the step tells
        kOrder,         ///< the vector stands behind its predecessor; size is by how many spacings
    };
    Problem problem;     ///< what is wrong
    std::int32_t index;  ///< number of the vector, from 0; -1 for the list as a whole
    double size;         ///< how far it is off, as told by the problem
    char text[120];      ///< the finding in words
};

/** Image samples for GeneralSAROrbit::sat2earth(): arrays of `count` numbers each. */
struct OrbitSamples {
    std::size_t count;           ///< of the samples, and so of every array
    const double* azimuth_s;     ///< azimuth times
    const double* range_s;       ///< two-way range times
    const double* doppler_hz{};  ///< null for Doppler 0
    const double* height_m{};    ///< heights of the ground points above the ellipsoid; null for 0
};
/** What is wanted of the samples' ground points: arrays for as many numbers, null where one is not wanted. A
 * sample without a ground point gets not-a-number in all of them. Quantities as in GrPtGeometry. */
struct OrbitGround {
    double* latitude_deg{};   ///< geodetic place
    double* longitude_deg{};  ///< -180 to 180
    double* height_m{};       ///< above the ellipsoid
    double* x_m{};            ///< the same place, Earth-fixed
    double* y_m{};            ///< with x_m
    double* z_m{};            ///< with x_m
    double* incidence_deg{};  ///< at the target
    double* look_deg{};       ///< at the platform
    double* fm_rate_hz_s{};   ///< azimuth FM rate
    double* speed_m_s{};      ///< of the platform
    std::int32_t* status{};   ///< what the call for the one sample returns
};
/** Ground points for GeneralSAROrbit::earth2sat(): arrays of `count` numbers each, latitude and longitude or x, y
 * and z. */
struct OrbitTargets {
    std::size_t count;              ///< of the points, and so of every array
    const double* latitude_deg{};   ///< geodetic
    const double* longitude_deg{};  ///< with latitude_deg
    const double* height_m{};       ///< above the ellipsoid, with latitude_deg; null for 0
    const double* x_m{};            ///< Earth-fixed, in place of the three above
    const double* y_m{};            ///< with x_m
    const double* z_m{};            ///< with x_m
    const double* doppler_hz{};     ///< null for Doppler 0
};
/** What is wanted of them; null where it is not. A point that is not seen gets not-a-number. */
struct OrbitSightings {
    double* azimuth_s{};     ///< azimuth times
    double* range_s{};       ///< two-way range times
    std::int32_t* status{};  ///< what the call for the one point returns
};

/** The orbit model: a degree-4 polynomial through every run of five state vectors, and geolocation on it.
 *
 * Between 0.6 and 3.4 spacings after a run's first vector the run stays in use; outside, the run that suits the
 * direction of travel is taken, so that a sweep in either direction changes runs about once per spacing.
 * Velocities are the exact derivative of the position polynomials. Times before the first or after the last vector
 * are extrapolated from the first or last run. */
class QUO_BASE_API GeneralSAROrbit : public GeneralSAR_Base {
public:
    /** An empty orbit, wavelength 0.05623564240544047 m, looking right. */
    GeneralSAROrbit();
    /** The same with another wavelength, m. */
    explicit GeneralSAROrbit(double lambda);
    ~GeneralSAROrbit() override;

    /** Allocates positions, velocities and the model's tables for nSV_n state vectors, zero-filled; what was there
     * is dropped, and 0 vectors need nothing. 0; 1 for a negative count, one that 32 bits cannot hold three times,
     * or one that the file being read is too short for; 7. Only 0 leaves arrays behind. */
    int createBuffers() override;
    int destroyBuffers() override;
    using GeneralSAR_Base::writehdr;
    /** Writes the section "StateVectorData" into the header file. 0, or the status of the write. */
    int writehdr(const char* file) override;
    /** Reads the section from the header file, or else from the same file as a parameter file (keys TimeFirst,
     * TimeDelta, nStateVectors, pos, vel), and builds the model.
     * @return 0; 4 when neither form is there or complete; 1 for a parameter file that tells of fewer than five
     * vectors; 7; or the status of computeApproximateSV(). A failure leaves the orbit empty. */
    int readhdr(const char* file) override;
    /** Copies vectors, model, wavelength and look sign into `other`. 0; 1 for null; 7, and `other` is then empty.
     */
    int clone(GeneralSAROrbit* other) noexcept;

    // --- making an orbit -------------------------------------------------------------------------

    /** Radar wavelength, m, > 0; 1 for anything else. */
    int setLambda(double lambda) noexcept;
    double getLambda() const noexcept;
    /** Negative looks left, zero or positive right. Returns 0. */
    int setLookSign(int sign) noexcept;
    int getLookSign() const noexcept;
    /** Drops what was there and makes room for at least five vectors. The caller fills pSV_m and vSV_mOs and calls
     * computeApproximateSV(). 0; 1 ("You must provide at least 5 state vectors!"); or createBuffers()'s status. */
    int SVCreate(double timeFirst, double timeDelta, int nStateVectors) noexcept;
    /** Releases vectors and model; their number is then 0. Returns 0. */
    int SVDestroy() noexcept;
    /** Builds the model from the state vectors; to be called again whenever they, t0SV_s or dtSV_s changed.
     * @return 0; 1 without at least five vectors, or for times that are not finite or a spacing not above 0; or
     * the status of orb_interp(), 10 for a position that is not finite. There is no model after a failure. */
    int computeApproximateSV() noexcept;
    /** Replaces the state vectors by ones at most `spacing` seconds apart (> 0) over the same span, ends included,
     * and builds the model anew; the new spacing is the largest that divides the span into at least four.
     *
     * Five vectors in a run follow an orbit within 0.03 mm at 10 s, but only within 0.25 m at 60 s. The new
     * vectors come from an interpolation of order 8: in positions and velocities of four vectors, or in the
     * positions alone of eight, by whichever the vectors themselves tell to be better. On precise vectors of a
     * real satellite it leaves 0.4 mm at 60 s, 0.7 mm at 90 s and 1.8 mm at 120 s on the mean of three hours, 0.8,
     * 2.0 and 3.8 mm on their roughest stretch; orbitFitError() tells afterwards. Hermite's formula: F. B.
     * Hildebrand, "Introduction to Numerical Analysis", 1974, section 8.2.
     * @return 0; 1 for a spacing that is not positive, without a model, for more than kMostResampled vectors, or
     * for a list with gaps, duplicates or vectors out of order, which the report's entry names; 7. A failure
     * leaves the orbit as it was. */
    int SVResample(double spacing) noexcept;
    /** The same for vectors that are not equally spaced: `times` are their own, nSV_n of them, increasing, in
     * seconds after t0SV_s. (Not absolute: near 1e9 a double has steps of 2.4e-7 s, in which a satellite flies
     * 1.8 mm. A time that is 1 microsecond off costs 7.6 mm.) Needs no model, and gaps are crossed as well as the
     * vectors around them allow. 1 also for times that are not finite or do not increase; 10 for a position that
     * is not finite. */
    int SVResample(double spacing, const double* times) noexcept;
    /** Vectors that SVResample() makes at most: a model of them takes some 220 MB. */
    static constexpr std::int32_t kMostResampled = 1000000;
    /** Estimate of how far the model is off a smooth orbit, m: by how much a run of five misses it where it is
     * used, and what SVResample() may have left in the vectors. The one comes from the fifth differences of the
     * positions, or with five vectors from the fourth of the velocities; the other from how well each vector is
     * met by the four around it, and is known until computeApproximateSV() is called. Half to five times the truth
     * on a real satellite's vectors 30 s to 180 s apart. Not-a-number without a model. */
    double orbitFitError() const noexcept;
    /** Examines the vectors as they stand, with or without a model, and lists what is wrong with them in their
     * order: nSV_n of them, or as many as were allocated, where the number was raised by hand. A step between two
     * vectors that is longer than the list's common one, as the velocities tell, is a gap. A velocity is compared
     * with the derivative of the curve through the neighbouring vectors.
     * @return 0, whatever was found; 7. `findings` is replaced. */
    int SVCheck(std::vector<SVFinding>& findings) const noexcept;

    // --- the orbit at a time ---------------------------------------------------------------------

    /** Position (three values, m) and velocity (m/s, the derivative of the position polynomial) at time t. */
    int SVGetPos(double t, double* xyz) noexcept;
    int SVGetVel(double t, double* vxyz) noexcept;
    /** The same into a result that belongs to the orbit, one for positions and one for velocities, and holds until
     * the next such call; three not-a-numbers after a failure. */
    double* SVGetPos(double t) noexcept;
    double* SVGetVel(double t) noexcept;
    /** Takes the run of five that suits time t, where the present one does not. */
    int updatePolys(double t) noexcept;
    /** How often another run was taken since the model was built. */
    std::int64_t polyUpdates() const noexcept;
    /** Whether the z velocity of the first state vector is above 0; false without vectors. */
    bool isAscending() const noexcept;

    // --- from a sample to the ground -------------------------------------------------------------
    //
    // Status 10 where no ground point is seen: the range is shorter than the height or reaches beyond the horizon,
    // or the velocity does not allow the Doppler.

    /** Ground point seen from a given position with a given velocity, Doppler 0. Needs no state vectors. */
    int sat2earth(const double pos[3], const double vel[3], double range, double* xyz) noexcept;
    /** Ground point seen at time t; Doppler 0 unless given. */
    int sat2earth(double t, double range, double* xyz) noexcept;
    int sat2earth(double t, double range, double doppler, double* xyz) noexcept;
    /** The same at a geodetic height, m, as gr_pt_at_height() finds it; height 0 gives the bits of the form above.
     */
    int sat2earth(double t, double range, double doppler, double height, double* xyz) noexcept;
    /** The point on the ellipsoid into the orbit's result point, which holds until the next such call; three
     * not-a-numbers after a failure. */
    double* sat2earth(const double pos[3], const double vel[3], double range) noexcept;
    double* sat2earth(double t, double range) noexcept;
    double* sat2earth(double t, double range, double doppler) noexcept;
    /** One coordinate, m; not-a-number after a failure. */
    double sat2earthX(double t, double range) noexcept;
    double sat2earthX(double t, double range, double doppler) noexcept;
    double sat2earthY(double t, double range) noexcept;
    double sat2earthY(double t, double range, double doppler) noexcept;
    double sat2earthZ(double t, double range) noexcept;
    double sat2earthZ(double t, double range, double doppler) noexcept;
    /** Where a squinted line of sight meets the ellipsoid.
     *
     * The line is the one to the zero-Doppler point of (t, range), turned by `squint` degrees towards the
     * velocity: cos(squint) (line of sight) + sin(squint) (unit velocity).
     * @param[in]  t       azimuth time, s since 1985
     * @param[in]  range   two-way range time of the zero-Doppler point, s
     * @param[in]  squint  degrees, positive forwards
     * @param[out] xyz     ground point
     * @param[out] time    two-way range time along the squinted line, s
     * @return 0; 10 also where the line passes the Earth by. */
    int sat2earthSquinted(double t, double range, double squint, double* xyz, double* time) noexcept;

    // --- from the ground to a sample -------------------------------------------------------------
    //
    // Status 12 where the point is not seen with that Doppler between the first and the last state vector. Up to
    // 1e-4 s beyond them counts as between. Doppler 0 unless given.

    /** Closed-form first guess of time and range time, extrapolated from the end runs for points beyond the orbit.
     *
     * With a Doppler it takes one of the two times at which |Doppler| is right: the later one where vx > 0, the
     * earlier one where vx < 0, whatever the Doppler's sign. 12 where the velocity does not allow the Doppler. */
    int earth2satLinear(const double xyz[3], double* t, double* rangeTime) noexcept;
    int earth2satLinear(const double xyz[3], double* t, double* rangeTime, double doppler) noexcept;
    /** Time and range time at which the point is seen: first guess, then Newton's method on the run of five that
     * serves that time, to 1e-8 s. Where the solution lies outside the middle of that run, it is found once more
     * on the run that serves there, so that sat2earth() at that time starts from the same curve. Where the first
     * guess leads nowhere, the search goes on from the other first guess over the whole orbit, from the state
     * vector nearest to the point, and last wherever the Doppler equation changes sign from vector to vector; of
     * several such times the one seen from nearest is taken, and Newton's method ends on the run that serves it.
     * On an orbit so long that straight flight is no guess (four fifths of a revolution) the nearest vector comes
     * first, so that the nearest pass is found.
     *
     * Range and Doppler are all that is asked: neither the look side nor the horizon plays a part. A point to the
     * left of a platform that looks right is found, and so is one that the Earth hides.
     *
     * A run stays in use while the time lies in its middle, so that the result hangs on the calls before: not at
     * all where the model is good, by up to 0.285 m along the orbit where the vectors stand 60 s apart (the two
     * runs that serve a time are so far apart). SVResample() removes it.
     * @return 0; 1 without a model, with both outputs -1.0; 12. */
    int earth2sat(const double xyz[3], double* t, double* rangeTime) noexcept;
    int earth2sat(const double xyz[3], double* t, double* rangeTime, double doppler) noexcept;
    /** As earth2sat(), with the first guess found on the coarse polynomial through the whole orbit. Where the
     * orbit is longer than 3 rad of its circle, that polynomial leads to the far side of the Earth: it is left out
     * then, and the search begins where earth2sat() goes when its first guess leads nowhere. */
    int earth2satPrecise(const double xyz[3], double* t, double* rangeTime) noexcept;
    int earth2satPrecise(const double xyz[3], double* t, double* rangeTime, double doppler) noexcept;
    /** One output of earth2sat(): -1.0 without a model, not-a-number after another failure. */
    double earth2satRange(const double xyz[3]) noexcept;
    double earth2satRange(double x, double y, double z) noexcept;
    double earth2satAzimuth(const double xyz[3]) noexcept;
    double earth2satAzimuth(double x, double y, double z) noexcept;

    // --- many points at once ---------------------------------------------------------------------
    //
    // Every point takes the run that the orbit takes for it when its model has just been made, whatever was asked
    // before: it gets what the call for the one point then gives, the angles of a place within 1e-13 degrees and
    // everything else to the bit. So results hang neither on the length of the arrays nor on what stands beside a
    // point, and arrays may be cut into pieces at will. Nothing in the orbit changes: calls on one orbit may run
    // side by side on any number of threads, as long as nobody calls anything else of it that is not const.
    //
    // An output may be the very array of an input, but must not overlap with one otherwise, nor with another
    // output. Points without a solution are told by their status, not in the report, which a million of them would
    // fill; a call that is refused makes its entry.

    /** Ground points of samples.
     * @return 0, also where samples have none, or there are none; 1 without a model, for a missing array of
     * azimuth or range times, for arrays that overlap or that no memory can hold. Nothing is written then. */
    int sat2earth(const OrbitSamples& samples, const OrbitGround& ground) const noexcept;
    /** When ground points are seen.
     * @return 0, also where points are not, or there are none; 1 without a model, for points that are not given in
     * exactly one of the two forms, for arrays that overlap or that no memory can hold. Nothing is written then.
     */
    int earth2sat(const OrbitTargets& targets, const OrbitSightings& seen) const noexcept;
    /** Where the platform is at times: positions, m, and velocities, m/s, the derivative of the position
     * polynomial; x, y and z of each time in turn, null where they are not wanted, three not-a-numbers for a time
     * that is not finite.
     * @return 0; 1 without a model, for missing times, for arrays that overlap at all or that no memory can hold.
     * Nothing is written then. */
    int SVGetStates(std::size_t count, const double* times_s, double* positions_m,
                    double* velocities_m_s) const noexcept;

    // --- geometry of a sample --------------------------------------------------------------------
    //
    // Of the ground point that sat2earth() finds. The short forms return not-a-number after a failure. All of it
    // comes from one solution of the point: who asks for more than one part gets them at once from
    // SVGetGeometry().

    /** The whole geometry of a sample, with the bits that the calls below give. `geometry` is unchanged on
     * failure. */
    int SVGetGeometry(double t, double range, double doppler, GrPtGeometry* geometry) noexcept;
    /** The same at a geodetic height, m: of the point that sat2earth() finds there, with the normal of its place
     * for the incidence angle. Height 0 gives the bits of the form above. */
    int SVGetGeometry(double t, double range, double doppler, double height, GrPtGeometry* geometry) noexcept;
    /** Geodetic latitude, and longitude from -180 to 180. */
    int SVGetLatLon(double t, double range, double doppler, double* latitude, double* longitude) noexcept;
    int SVGetLatLon(double t, double range, double* latitude, double* longitude) noexcept;
    double SVGetLat(double t, double range, double doppler) noexcept;
    double SVGetLat(double t, double range) noexcept;
    double SVGetLon(double t, double range, double doppler) noexcept;
    double SVGetLon(double t, double range) noexcept;
    /** Incidence angle, between the line of sight and the ellipsoid's normal at the target; look angle, at the
     * platform from the direction to the Earth's centre. */
    int SVGetAngles(double t, double range, double doppler, double* incidence, double* look) noexcept;
    int SVGetAngles(double t, double range, double* incidence, double* look) noexcept;
    double SVGetAnglesIncidence(double t, double range, double doppler) noexcept;
    double SVGetAnglesIncidence(double t, double range) noexcept;
    double SVGetAnglesLook(double t, double range, double doppler) noexcept;
    double SVGetAnglesLook(double t, double range) noexcept;
    /** Azimuth FM rate d(Doppler)/dt, Hz/s; negative at broadside. */
    int SVGetFR(double t, double range, double doppler, double* rate) noexcept;
    int SVGetFR(double t, double range, double* rate) noexcept;
    double SVGetFR(double t, double range, double doppler) noexcept;
    double SVGetFR(double t, double range) noexcept;
    /** Platform speed over the rotating Earth, m/s. */
    int SVGetSatSpeed(double t, double range, double doppler, double* speed) noexcept;
    int SVGetSatSpeed(double t, double range, double* speed) noexcept;
    double SVGetSatSpeed(double t, double range, double doppler) noexcept;
    double SVGetSatSpeed(double t, double range) noexcept;

    /** Fills the points of a product's geographic description from the corners and the middle of its region,
     * Doppler 0, height 0; its grid spacing stays.
     *
     * With P1 = (first line, near range), P2 = (first line, far range), P3 = (last line, near range) and P4 =
     * (last line, far range), the start plus the length being the last, NorthWest, NorthEast, SouthWest and
     * SouthEast receive P3, P4, P1 and P2 on an ascending orbit, else P2, P1, P4 and P3: right for a platform that
     * looks to the right. The points are made in the order P1 to P4, Center; a failure leaves those before it
     * filled.
     * @return 0; 1 for null; or the status of SVGetGeometry() */
    int SVGetGeoCoords(geoCoords_Obj* grid, const GSRoi_Obj* roi) noexcept;

    // --- polynomials derived from the orbit ------------------------------------------------------
    // Least-squares fits of the geometry over a region's fast and slow start and length. `dc` tells the Doppler of
    // every sample. 1 for a region or Doppler that is null, 10 for a fit that does not give finite numbers, else
    // the status of the sampled geometry, of polfit() or of lfitd(). An output that is null is skipped; all
    // outputs are unchanged on failure.
    //
    // The forms in range alone sample the middle of the region's azimuth times: 10 range times from the start to
    // start + length (50 in _v2), a parabola through them in c0, c1 and c4, the others 0, taz0 = 0. Its value is
    // the same at any azimuth time. trg0 is the region's fast start (dc's trg0 in _v2). Where the region has no
    // extent in range, polfit() leaves the mean as a constant polynomial, with 0.
    //
    // The forms in both times sample 100 range times by 50 azimuth times, both ends included, and fit all seven
    // coefficients; trg0 is the region's fast start, taz0 its slow start. 10 where a length is 0.
    //
    // How far parabolas / forms in both times stay from the geometry at zero Doppler within their region,
    // parabolas at the middle azimuth time (gr2sl's range times as slant ranges):
    //
    //  height, slant range, incidence         FM rate        angles             sl2gr         gr2sl
    //  700 km, 53 km, 31 to 37 degrees        0.04 Hz/s      0.008 / 0.0006 deg   80 / 5 m    12 / 0.7 m
    //  700 km, 157 km, 31 to 46 degrees       0.8 Hz/s       0.1 / 0.005 deg     900 / 40 m   200 / 1.5 m
    //  12.5 km, 1.6 km, 21 to 37 degrees      0.0025 Hz/s    0.13 / 0.009 deg     27 / 2 m    1.8 / 0.007 m

    /** Azimuth FM rate, Hz/s. */
    int SVGetFRpoly(const ROI_Obj* roi, const polyDC* dc, polyFR* fr) noexcept;
    /** The same from 50 samples around dc's trg0. A trg0 that lies seconds away from the region, such as -999,
     * costs digits: the value is then good to 4e-16 |c4| trg0^2. */
    int SVGetFRpoly_v2(const ROI_Obj* roi, const polyDC* dc, polyFR* fr) noexcept;
    /** Incidence and look angle, degrees, in range alone. */
    int SVGetSlantToAnglesPolys(const ROI_Obj* roi, const polyDC* dc, polySL2THETA* theta,
                                polySL2PHI* phi) noexcept;
    /** Incidence and look angle, degrees, in both times. */
    int SVGetTimeToAnglesPolys(const ROI_Obj* roi, const polyDC* dc, polySL2THETA* theta,
                               polySL2PHI* phi) noexcept;
    /** Ground range, m, from the point at trg0 on, and back, in range alone. The ground range is the sum of the
     * chords between neighbouring samples.
     *
     * gr2sl takes the ground range in place of the range time after trg0: EvaluatePoly(trg0 + ground range, any
     * azimuth time) is the range time after trg0, s. */
    int SVGetGroundToSlantPolys(const ROI_Obj* roi, const polyDC* dc, polySL2GR* sl2gr, polyGR2SL* gr2sl) noexcept;
    /** The same in both times, every azimuth time's ground range beginning at trg0. gr2sl reaches as far as the
     * shortest of the azimuth times' ground ranges. */
    int SVGetGroundToTimePolys(const ROI_Obj* roi, const polyDC* dc, polySL2GR* sl2gr, polyGR2SL* gr2sl) noexcept;

    /** Rotation into the along-track frame of velocity v, row by row, and the speed with the sign of v's x
     * component (positive for 0).
     *
     * With yaw = atan(-vy / vx) and pitch = atan(-vz / (sign(vx) hypot(vx, vy))) the rows are
     * (cos yaw cos pitch, sin yaw, cos yaw sin pitch), (-sin yaw cos pitch, cos yaw, -sin yaw sin pitch) and
     * (-sin pitch, 0, cos pitch). A vector's coordinate along R's first column is its along-track coordinate,
     * which divided by `speed` is the time of travel. For v = 0: the identity, speed 0. 0; 1 for a v that is not
     * finite.
     */
    static int computeRotationMatrix(const double v[3], double R[9], double* speed) noexcept;

    double* pSV_m = nullptr;    ///< nSV_n x 3 positions, m; owned
    double* vSV_mOs = nullptr;  ///< nSV_n x 3 velocities, m/s; owned
    double t0SV_s = -999.0;     ///< time of the first vector, s
    double dtSV_s = -999.0;     ///< spacing, s
    std::int32_t nSV_n = 0;     ///< number of vectors

protected:
    void refreshParameters() override;

private:
    bool modelReady() const noexcept;
    int platformAt(quo::CallerFrame frame, double t, quo::OrbitSample* sample) noexcept;
    int sampleAt(quo::CallerFrame frame, double t, double range, double doppler,
                 quo::OrbitSample* sample) noexcept;
    template <typename Read>
    int readSample(const char* getter, bool writable, double t, double range, double doppler, double height,
                   const Read& read) noexcept;
    int locate(quo::CallerFrame frame, const double xyz[3], double doppler, bool precise, double* t,
               double* rangeTime) noexcept;

    std::unique_ptr<quo::OrbitModel> model_;  // tables for allocated vectors; filled by computeApproximateSV()
    std::int32_t vectors_ = 0;                // that the arrays have room for
    double lambda_ = 0.05623564240544047;
    std::int32_t look_sign_ = 1;
    double position_[3] = {}, velocity_[3] = {}, point_[3] = {};
};

#endif
