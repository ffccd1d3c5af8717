// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <limits>

#include "diagnosticslib/call_frame.h"
#include "generalSAR/orbit/orbit_points.h"
#include "quo_base/generalSARorbit.h"
#include "quo_base/geo_grid.h"
#include "quorelxmllib/guarded.h"

namespace {

constexpr const char* kSource = "generalSARorbit";
constexpr const char* kNoModel = "There are no state vectors, or no model through them";
constexpr const char* kBadArgument = "An argument is null or not finite";
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

using Obj = GeneralSAROrbit;

bool finite_point(const double xyz[3]) noexcept { return xyz && std::isfinite(xyz[0] + xyz[1] + xyz[2]); }

/** Where a line from S along a unit vector first meets the ellipsoid, as a distance; not-a-number where it passes
 * by. Squashed to the unit sphere, the line S + d u meets it where |s|^2 + 2 d s.w + d^2 |w|^2 = 1. */
double distance_to_ellipsoid(const quo::Vec3& S, const quo::Vec3& u, const quo::Ellipsoid& e) noexcept {
    const double a2 = e.equatorial_m * e.equatorial_m;
    const double uu = dot(u, ellipsoid_gradient(u, e)), us = dot(u, ellipsoid_gradient(S, e));
    const double ss = dot(S, ellipsoid_gradient(S, e)) - a2;
    return (-us - std::sqrt(us * us - uu * ss)) / uu;
}

/** Fills a ground point from the sample at an azimuth and a range time. */
int fill_point(Obj& orbit, double azimuth, double range, geopoint& point) noexcept {
    GrPtGeometry at;
    if (const int status = orbit.SVGetGeometry(azimuth, range, 0.0, &at)) return status;
    const double values[] = {at.latitude_deg, at.longitude_deg, 0.0, at.incidence_deg, at.look_deg};
    std::ranges::copy(values, point.Point);
    point.Latitude = at.latitude_deg;
    point.Longitude = at.longitude_deg;
    point.Height = 0.0;
    point.IncidenceAngle = at.incidence_deg;
    point.LookAngle = at.look_deg;
    return QUO_OK;
}

/** One of the numbers, three at most, that a call fills in; not-a-number where it fails. */
template <typename Call>
double one_of(std::size_t which, Call call) noexcept {
    double values[3] = {kNaN, kNaN, kNaN};
    call(values);
    return values[which];
}

}  // namespace

int Obj::platformAt(quo::CallerFrame frame, double t, quo::OrbitSample* sample) noexcept {
    if (!modelReady()) return frame.fail(QUO_REFUSED, kNoModel);
    if (!std::isfinite(t)) return frame.fail(QUO_REFUSED, kBadArgument);
    place_platform(*model_, model_->cursor(), t, sample);
    return QUO_OK;
}

int Obj::sampleAt(quo::CallerFrame frame, double t, double range, double doppler,
                  quo::OrbitSample* sample) noexcept {
    if (const int status = platformAt(frame, t, sample)) return status;
    const int status = find_ground({range, doppler, lambda_, static_cast<double>(look_sign_)}, sample);
    return status ? frame.callee(status) : QUO_OK;
}

/** Solves a sample under the getter's own name, and lets `read` take from it what was asked for. */
template <typename Read>
int Obj::readSample(const char* getter, bool writable, double t, double range, double doppler, double height,
                    const Read& read) noexcept {
    quo::CallFrame frame{getter, kSource};
    if (!writable) return frame.fail(QUO_REFUSED, kBadArgument);
    quo::OrbitSample sample;
    sample.height_m = height;
    if (const int status = sampleAt(frame, t, range, doppler, &sample)) return status;
    read(sample);
    return frame.success();
}

// --- from a sample to the ground --------------------------------------------------------------------------------

int Obj::sat2earth(const double pos[3], const double vel[3], double range, double* xyz) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::sat2earth", kSource};
    if (!pos || !vel || !xyz) return frame.fail(QUO_REFUSED, kBadArgument);
    const quo::RadarLook look{range, 0.0, lambda_, static_cast<double>(look_sign_)};
    quo::Vec3 point;
    if (const int status = ground_point(quo::load(pos), quo::load(vel), look, quo::kWgs84, &point))
        return frame.callee(status);
    quo::store(point, xyz);
    return frame.success();
}

int Obj::sat2earth(double t, double range, double* xyz) noexcept { return sat2earth(t, range, 0.0, xyz); }

int Obj::sat2earth(double t, double range, double doppler, double* xyz) noexcept {
    return sat2earth(t, range, doppler, 0.0, xyz);
}

int Obj::sat2earth(double t, double range, double doppler, double height, double* xyz) noexcept {
    return readSample("GeneralSAROrbit::sat2earth", xyz, t, range, doppler, height,
                      [xyz](const quo::OrbitSample& sample) { quo::store(sample.point, xyz); });
}

double* Obj::sat2earth(const double pos[3], const double vel[3], double range) noexcept {
    if (sat2earth(pos, vel, range, point_)) std::fill_n(point_, 3, kNaN);
    return point_;
}

double* Obj::sat2earth(double t, double range) noexcept { return sat2earth(t, range, 0.0); }

double* Obj::sat2earth(double t, double range, double doppler) noexcept {
    if (sat2earth(t, range, doppler, point_)) std::fill_n(point_, 3, kNaN);
    return point_;
}

double Obj::sat2earthX(double t, double range) noexcept { return sat2earthX(t, range, 0.0); }
double Obj::sat2earthX(double t, double range, double doppler) noexcept {
    return one_of(0, [&](double* xyz) { sat2earth(t, range, doppler, xyz); });
}
double Obj::sat2earthY(double t, double range) noexcept { return sat2earthY(t, range, 0.0); }
double Obj::sat2earthY(double t, double range, double doppler) noexcept {
    return one_of(1, [&](double* xyz) { sat2earth(t, range, doppler, xyz); });
}
double Obj::sat2earthZ(double t, double range) noexcept { return sat2earthZ(t, range, 0.0); }
double Obj::sat2earthZ(double t, double range, double doppler) noexcept {
    return one_of(2, [&](double* xyz) { sat2earth(t, range, doppler, xyz); });
}

int Obj::sat2earthSquinted(double t, double range, double squint, double* xyz, double* time) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::sat2earthSquinted", kSource};
    if (!xyz || !time || !std::isfinite(squint)) return frame.fail(QUO_REFUSED, kBadArgument);
    quo::OrbitSample sample;
    sample.height_m = 0.0;
    if (const int status = sampleAt(frame, t, range, 0.0, &sample)) return status;

    const quo::Vec3 line = sample.point - sample.position;
    const quo::Vec3 abeam = 1.0 / norm(line) * line, ahead = 1.0 / norm(sample.velocity) * sample.velocity;
    const double angle = squint / quo::kDegPerRad;
    const quo::Vec3 squinted = std::cos(angle) * abeam + std::sin(angle) * ahead;
    const double distance = distance_to_ellipsoid(sample.position, squinted, quo::kWgs84);
    if (!(distance > 0.0)) return frame.fail(QUO_NUMERIC, "The line of sight does not meet the Earth");
    quo::store(sample.position + distance * squinted, xyz);
    *time = 2.0 / quo::kLightSpeed * distance;
    return frame.success();
}

// --- from the ground to a sample --------------------------------------------------------------------------------

int Obj::earth2satLinear(const double xyz[3], double* t, double* rangeTime) noexcept {
    return earth2satLinear(xyz, t, rangeTime, 0.0);
}

int Obj::earth2satLinear(const double xyz[3], double* t, double* rangeTime, double doppler) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::earth2satLinear", kSource};
    if (!modelReady()) return frame.fail(QUO_REFUSED, kNoModel);
    const double rate = 0.5 * lambda_ * doppler;
    if (!t || !rangeTime || !finite_point(xyz) || !std::isfinite(rate))
        return frame.fail(QUO_REFUSED, kBadArgument);
    quo::PointTimes guess{};
    if (!model_->linear_guess(quo::load(xyz), rate, quo::kFirstRoot, &guess)) return frame.callee(QUO_NOT_SEEN);
    *t = model_->first_time() + guess.since_first_s;
    *rangeTime = guess.range_s;
    return frame.success();
}

int Obj::locate(quo::CallerFrame frame, const double xyz[3], double doppler, bool precise, double* t,
                double* rangeTime) noexcept {
    if (!t || !rangeTime) return frame.fail(QUO_REFUSED, kBadArgument);
    if (!modelReady()) {
        *t = *rangeTime = -1.0;
        return frame.fail(QUO_REFUSED, kNoModel);
    }
    if (!finite_point(xyz) || !std::isfinite(0.5 * lambda_ * doppler))
        return frame.fail(QUO_REFUSED, kBadArgument);
    const quo::Target target{quo::load(xyz), lambda_, doppler};
    return quo::pass_on(frame, quo::find_times(*model_, model_->cursor(), target, precise, t, rangeTime));
}

int Obj::earth2sat(const double xyz[3], double* t, double* rangeTime) noexcept {
    return earth2sat(xyz, t, rangeTime, 0.0);
}

int Obj::earth2sat(const double xyz[3], double* t, double* rangeTime, double doppler) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::earth2sat", kSource};
    return locate(frame, xyz, doppler, false, t, rangeTime);
}

int Obj::earth2satPrecise(const double xyz[3], double* t, double* rangeTime) noexcept {
    return earth2satPrecise(xyz, t, rangeTime, 0.0);
}

int Obj::earth2satPrecise(const double xyz[3], double* t, double* rangeTime, double doppler) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::earth2satPrecise", kSource};
    return locate(frame, xyz, doppler, true, t, rangeTime);
}

double Obj::earth2satRange(const double xyz[3]) noexcept {
    return one_of(1, [&](double* times) { earth2sat(xyz, times, times + 1); });
}
double Obj::earth2satRange(double x, double y, double z) noexcept {
    const double xyz[3] = {x, y, z};
    return earth2satRange(xyz);
}
double Obj::earth2satAzimuth(const double xyz[3]) noexcept {
    return one_of(0, [&](double* times) { earth2sat(xyz, times, times + 1); });
}
double Obj::earth2satAzimuth(double x, double y, double z) noexcept {
    const double xyz[3] = {x, y, z};
    return earth2satAzimuth(xyz);
}

// --- geometry of a sample ---------------------------------------------------------------------------------------

int Obj::SVGetGeometry(double t, double range, double doppler, GrPtGeometry* geometry) noexcept {
    return SVGetGeometry(t, range, doppler, 0.0, geometry);
}

int Obj::SVGetGeometry(double t, double range, double doppler, double height, GrPtGeometry* geometry) noexcept {
    return readSample("GeneralSAROrbit::SVGetGeometry", geometry, t, range, doppler, height,
                      [&](const quo::OrbitSample& sample) {
                          *geometry = quo::sample_geometry(sample.state(), sample.point, height, lambda_, 0.0,
                                                           quo::kWgs84);
                      });
}

// A single part costs a fraction of the whole: each getter works out its own alone.

int Obj::SVGetLatLon(double t, double range, double doppler, double* latitude, double* longitude) noexcept {
    return readSample("GeneralSAROrbit::SVGetLatLon", latitude && longitude, t, range, doppler, 0.0,
                      [&](const quo::OrbitSample& sample) {
                          const GeodeticPoint place = to_geodetic(sample.point, quo::kWgs84);
                          *latitude = place.latitude_deg;
                          *longitude = place.longitude_deg;
                      });
}

int Obj::SVGetAngles(double t, double range, double doppler, double* incidence, double* look) noexcept {
    return readSample("GeneralSAROrbit::SVGetAngles", incidence && look, t, range, doppler, 0.0,
                      [&](const quo::OrbitSample& sample) {
                          *incidence = quo::incidence_deg(sample.position, sample.point, quo::kWgs84);
                          *look = quo::look_angle_deg(sample.position, sample.point);
                      });
}

int Obj::SVGetFR(double t, double range, double doppler, double* rate) noexcept {
    return readSample("GeneralSAROrbit::SVGetFR", rate, t, range, doppler, 0.0,
                      [&](const quo::OrbitSample& sample) {
                          *rate = quo::fm_rate_hz_s(sample.state(), sample.point, lambda_, 0.0);
                      });
}

int Obj::SVGetSatSpeed(double t, double range, double doppler, double* speed) noexcept {
    return readSample("GeneralSAROrbit::SVGetSatSpeed", speed, t, range, doppler, 0.0,
                      [&](const quo::OrbitSample& sample) { *speed = norm(sample.velocity); });
}

int Obj::SVGetLatLon(double t, double range, double* latitude, double* longitude) noexcept {
    return SVGetLatLon(t, range, 0.0, latitude, longitude);
}
int Obj::SVGetAngles(double t, double range, double* incidence, double* look) noexcept {
    return SVGetAngles(t, range, 0.0, incidence, look);
}
int Obj::SVGetFR(double t, double range, double* rate) noexcept { return SVGetFR(t, range, 0.0, rate); }
int Obj::SVGetSatSpeed(double t, double range, double* speed) noexcept {
    return SVGetSatSpeed(t, range, 0.0, speed);
}

double Obj::SVGetLat(double t, double range, double doppler) noexcept {
    return one_of(0, [&](double* place) { SVGetLatLon(t, range, doppler, place, place + 1); });
}
double Obj::SVGetLat(double t, double range) noexcept { return SVGetLat(t, range, 0.0); }
double Obj::SVGetLon(double t, double range, double doppler) noexcept {
    return one_of(1, [&](double* place) { SVGetLatLon(t, range, doppler, place, place + 1); });
}
double Obj::SVGetLon(double t, double range) noexcept { return SVGetLon(t, range, 0.0); }
double Obj::SVGetAnglesIncidence(double t, double range, double doppler) noexcept {
    return one_of(0, [&](double* angles) { SVGetAngles(t, range, doppler, angles, angles + 1); });
}
double Obj::SVGetAnglesIncidence(double t, double range) noexcept { return SVGetAnglesIncidence(t, range, 0.0); }
double Obj::SVGetAnglesLook(double t, double range, double doppler) noexcept {
    return one_of(1, [&](double* angles) { SVGetAngles(t, range, doppler, angles, angles + 1); });
}
double Obj::SVGetAnglesLook(double t, double range) noexcept { return SVGetAnglesLook(t, range, 0.0); }
double Obj::SVGetFR(double t, double range, double doppler) noexcept {
    return one_of(0, [&](double* rate) { SVGetFR(t, range, doppler, rate); });
}
double Obj::SVGetFR(double t, double range) noexcept { return SVGetFR(t, range, 0.0); }
double Obj::SVGetSatSpeed(double t, double range, double doppler) noexcept {
    return one_of(0, [&](double* speed) { SVGetSatSpeed(t, range, doppler, speed); });
}
double Obj::SVGetSatSpeed(double t, double range) noexcept { return SVGetSatSpeed(t, range, 0.0); }

int Obj::SVGetGeoCoords(geoCoords_Obj* grid, const GSRoi_Obj* roi) noexcept {
    quo::CallFrame frame{"GeneralSAROrbit::SVGetGeoCoords", kSource};
    if (!grid || !roi) return frame.fail(QUO_REFUSED, "An argument is null");
    const ROI_Obj& region = roi->Roi;
    const bool up = isAscending();
    const struct {
        double along, across;  // parts of the region's lengths
        geopoint& point;
    } points[] = {{0.0, 0.0, up ? grid->SouthWest : grid->NorthEast},
                  {0.0, 1.0, up ? grid->SouthEast : grid->NorthWest},
                  {1.0, 0.0, up ? grid->NorthWest : grid->SouthEast},
                  {1.0, 1.0, up ? grid->NorthEast : grid->SouthWest},
                  {0.5, 0.5, grid->Center}};
    for (const auto& [along, across, point] : points) {
        const double azimuth = region.SlowStartTime + along * region.SlowTimeLength;
        const double range = region.FastStartTime + across * region.FastTimeLength;
        if (const int status = fill_point(*this, azimuth, range, point)) return frame.callee(status);
    }
    return frame.success();
}
