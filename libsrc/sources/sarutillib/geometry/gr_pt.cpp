// SPDX-License-Identifier: Apache-2.0
#include "quo_base/gr_pt.h"

#include "diagnosticslib/call_frame.h"
#include "sarutillib/geometry/geometry_kernels.h"

namespace {

using quo::CallerFrame;
using quo::CallFrame;
using quo::Ellipsoid;
using quo::OrbitState;
using quo::Vec3;

// Reports name this source so; programs that read them look for it.
constexpr char kSource[] = R"(..\..\..\libsrc\sources\sarutillib\gr_pt)";

int fail_start(CallerFrame frame, int status) noexcept {
    return frame.fail(status, status == QUO_REFUSED ? "Unusable platform, range, wavelength or ellipsoid"
                                                    : "No ground point at this range and Doppler");
}

/** Enters what the search of a starting point has to say, where its caller ran the kernel on its own. */
int report_start(int status, int line = __builtin_LINE()) noexcept {
    CallFrame frame{"gr_pt0", kSource, line};
    return fail_start({frame, line}, status);
}

}  // namespace

extern "C" void make_versor(const double v[3], double unit[3]) noexcept {
    const Vec3 a = quo::load(v);
    const double length = quo::norm(a);
    quo::store(length > 0.0 ? Vec3{a.x / length, a.y / length, a.z / length} : Vec3{}, unit);
}

extern "C" void v1pv2(const double a[3], const double b[3], double r[3]) noexcept {
    quo::store(quo::cross(quo::load(a), quo::load(b)), r);
}

extern "C" int gr_pt0(double P[3], const double S[3], const double V[3], double tau, double fd, double lambda,
                      double omega, double side, double a, double b) noexcept {
    CallFrame frame{"gr_pt0", kSource};
    const Vec3 position = quo::load(S), velocity = quo::load(V);
    Vec3 point;
    if (const int status = quo::ground_point(position, quo::relative_velocity(position, velocity, omega),
                                             {tau, fd, lambda, side}, {a, b}, &point))
        return fail_start(frame, status);
    quo::store(point, P);
    return frame.success();
}

extern "C" int gr_pt(double P[3], const double S[3], const double V[3], double tau, double fd, double lambda,
                     double omega, double side, double a, double b) noexcept {
    CallFrame frame{"gr_pt", kSource};
    Vec3 point;
    if (const int status =
            turning_ground_point(quo::load(S), quo::load(V), {tau, fd, lambda, side}, omega, {a, b}, &point))
        return frame.callee(report_start(status));
    quo::store(point, P);
    return frame.success();
}

extern "C" int gr_pt_at_height(double P[3], const double S[3], const double V[3], double tau, double fd,
                               double lambda, double omega, double side, double height, double a,
                               double b) noexcept {
    CallFrame frame{"gr_pt_at_height", kSource};
    Vec3 point;
    if (const int status = ground_point_at_height(quo::load(S), quo::load(V), {tau, fd, lambda, side}, omega,
                                                  height, {a, b}, &point))
        return frame.callee(report_start(status));
    quo::store(point, P);
    return frame.success();
}

extern "C" int gr_pt_lat_lon(double tc, double /*dt*/, double t, double tau, double fd, double lambda, double side,
                             double omega, const double cx[5], const double cy[5], const double cz[5], double a,
                             double b, GrPtGeometry* out) noexcept {
    CallFrame frame{"gr_pt_lat_lon", kSource};
    const OrbitState sat = quo::orbit_state({cx, cy, cz}, t - tc);
    const Ellipsoid earth{a, b};
    Vec3 point;
    if (const int status =
            turning_ground_point(sat.position, sat.velocity, {tau, fd, lambda, side}, omega, earth, &point))
        return frame.callee(report_start(status));
    *out = quo::sample_geometry(sat, point, 0.0, lambda, omega, earth);
    return frame.success();
}

extern "C" int inv_grpt_opt(double* t, double* tau, void* /*scratch*/, const double cx[5], const double cy[5],
                            const double cz[5], const double P[3], double span, double lambda,
                            double fd) noexcept {
    CallFrame frame{"inv_grpt_opt", kSource};
    quo::ImageTime seen;
    if (const int status = quo::image_time({cx, cy, cz}, quo::load(P), 0.5 * span, {0.0, span}, lambda, fd, &seen))
        return frame.fail(status, "The point is not seen within the orbit segment");
    *t = seen.t_s;
    *tau = seen.tau_s;
    return frame.success();
}
