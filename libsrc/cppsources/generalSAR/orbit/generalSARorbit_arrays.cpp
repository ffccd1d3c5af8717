// SPDX-License-Identifier: Apache-2.0
#include <algorithm>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <limits>
#include <span>

#include "diagnosticslib/call_frame.h"
#include "diagnosticslib/errno_kept.h"
#include "generalSAR/orbit/orbit_points.h"
#include "quo_base/generalSARorbit.h"
#include "sarutillib/ground/array_extents.h"

// Arrays go through blocks of their own: a block's inputs are all read before its outputs are written, so that an
// output may take the place of an input. What is not refused enters nothing in the report: a million points
// without a solution would fill it.

namespace {

using Obj = GeneralSAROrbit;
constexpr const char* kSource = "generalSARorbit";
constexpr const char* kNoModel = "There are no state vectors, or no model through them";
constexpr const char* kForward = "GeneralSAROrbit::sat2earth";
constexpr const char* kInverse = "GeneralSAROrbit::earth2sat";
constexpr const char* kStates = "GeneralSAROrbit::SVGetStates";
constexpr const char* kMissing = "An array is missing, or points are given twice";
constexpr const char* kBadArrays = "Arrays overlap, or no memory can hold them";
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

int refuse(const char* call, const char* message, int line = __builtin_LINE()) noexcept {
    quo::CallFrame frame{call, kSource, line};
    return frame.fail(QUO_REFUSED, message, line);
}

// --- The arrays of a call ---------------------------------------------------------------------------------------

using quo::lie_well;

/** A piece of the arrays that makes one block. */
struct Piece {
    std::size_t first;
    int count;

    /** Reads a row of the block; 0 for an array that is not given. Rows are full, so that no lane is without a
     * point. */
    void read(const double* from, double* row) const noexcept {
        if (!from) {
            std::fill_n(row, quo::kBlockPoints, 0.0);
            return;
        }
        std::copy_n(from + first, count, row);
        std::fill(row + count, row + quo::kBlockPoints, row[count - 1]);
    }
    template <typename T>
    void write(const T* row, T* to) const noexcept {
        if (to) std::copy_n(row, count, to + first);
    }
};

template <typename Body>
void each_piece(std::size_t count, const Body& body) noexcept {
    for (std::size_t at = 0; at < count; at += quo::kBlockPoints)
        body(Piece{at, static_cast<int>(std::min<std::size_t>(quo::kBlockPoints, count - at))});
}

/** Calls `solve` for the points that a kernel has left, and tells what every point's call returns. */
template <typename Solve>
void solve_rest(const Piece& piece, bool all_solved, const std::int64_t* solved, std::int32_t* to,
                const Solve& solve) noexcept {
    if (all_solved && !to) return;
    std::int32_t status[quo::kBlockPoints] = {};
    if (!all_solved)
        for (int i = 0; i < piece.count; ++i)
            if (solved[i] == 0) status[i] = solve(i);
    piece.write(status, to);
}

// --- The platform -----------------------------------------------------------------------------------------------

bool lie_apart(std::size_t count, const double* times_s, const double* positions_m, const double* velocities_m_s) {
    constexpr std::size_t kVector = 3 * sizeof(double);
    if (count > PTRDIFF_MAX / kVector) return false;
    const quo::Extent times{times_s, sizeof *times_s, count};
    const quo::Extent positions{positions_m, kVector, count}, velocities{velocities_m_s, kVector, count};
    return times.fits() && positions.fits() && velocities.fits() && !times.overlaps(positions) &&
           !times.overlaps(velocities) && !positions.overlaps(velocities);
}

// --- Forward ----------------------------------------------------------------------------------------------------

struct GroundArray {
    double* OrbitGround::*array;
    quo::GroundValue row;
};
constexpr GroundArray kGroundArrays[] = {
    {&OrbitGround::x_m, quo::kX},
    {&OrbitGround::y_m, quo::kY},
    {&OrbitGround::z_m, quo::kZ},
    {&OrbitGround::latitude_deg, quo::kLatitude},
    {&OrbitGround::longitude_deg, quo::kLongitude},
    {&OrbitGround::height_m, quo::kHeight},
    {&OrbitGround::incidence_deg, quo::kIncidence},
    {&OrbitGround::look_deg, quo::kLook},
    {&OrbitGround::fm_rate_hz_s, quo::kFmRate},
    {&OrbitGround::speed_m_s, quo::kSpeed},
};
static_assert(std::size(kGroundArrays) == quo::kGroundValues);

/** Solves one sample of a block as the call for the one sample does. */
int solve_sample(const quo::OrbitModel& model, const quo::OrbitView& view, quo::ForwardBlock& block,
                 int i) noexcept {
    for (auto& row : block.result) row[i] = kNaN;
    if (!std::isfinite(block.t_s[i])) return QUO_REFUSED;
    quo::RunCursor cursor = model.fresh();
    quo::OrbitSample sample;
    sample.height_m = block.height_m[i];
    place_platform(model, cursor, block.t_s[i], &sample);
    if (const int status = find_ground({block.range_s[i], block.doppler_hz[i], view.lambda_m, view.side}, &sample))
        return status;
    const GrPtGeometry at =
        sample_geometry(sample.state(), sample.point, sample.height_m, view.lambda_m, 0.0, quo::kWgs84);
    const double values[] = {at.point_m[0],    at.point_m[1],    at.point_m[2],
                             at.latitude_deg,  at.longitude_deg, to_geodetic(sample.point).height_m,
                             at.incidence_deg, at.look_deg,      at.fm_rate_hz_s,
                             at.speed_m_s};
    for (int row = 0; row < quo::kGroundValues; ++row) block.result[row][i] = values[row];
    return QUO_OK;
}

// --- Inverse ----------------------------------------------------------------------------------------------------

/** The one form in which the points are given, or none. */
enum class Given : std::uint8_t { kPlaces, kPositions, kNothing };
Given given_form(const OrbitTargets& targets) noexcept {
    const bool place = targets.latitude_deg && targets.longitude_deg;
    const bool any_place = targets.latitude_deg || targets.longitude_deg || targets.height_m;
    const bool position = targets.x_m && targets.y_m && targets.z_m;
    const bool any_position = targets.x_m || targets.y_m || targets.z_m;
    if (place && !any_position) return Given::kPlaces;
    return position && !any_place ? Given::kPositions : Given::kNothing;
}

void read_points(const Piece& piece, const OrbitTargets& targets, Given form, quo::InverseBlock& block) noexcept {
    const bool places = form == Given::kPlaces;
    piece.read(places ? targets.latitude_deg : targets.x_m, block.x_m);
    piece.read(places ? targets.longitude_deg : targets.y_m, block.y_m);
    piece.read(places ? targets.height_m : targets.z_m, block.z_m);
    if (!places) return;
    for (int i = 0; i < quo::kBlockPoints; ++i) {
        const quo::Vec3 p = quo::from_geodetic({block.x_m[i], block.y_m[i], block.z_m[i]});
        block.x_m[i] = p.x;
        block.y_m[i] = p.y;
        block.z_m[i] = p.z;
    }
}

/** Solves one point of a block as the call for the one point does. */
int solve_target(const quo::OrbitModel& model, const quo::OrbitView& view, quo::InverseBlock& block,
                 int i) noexcept {
    const quo::Target target{{block.x_m[i], block.y_m[i], block.z_m[i]}, view.lambda_m, block.doppler_hz[i]};
    block.t_s[i] = block.range_s[i] = kNaN;
    if (!std::isfinite(target.point.x + target.point.y + target.point.z) ||
        !std::isfinite(target.range_rate_m_s()))
        return QUO_REFUSED;
    quo::RunCursor cursor = model.fresh();
    return find_times(model, cursor, target, false, &block.t_s[i], &block.range_s[i]);
}

}  // namespace

int Obj::sat2earth(const OrbitSamples& samples, const OrbitGround& ground) const noexcept {
    if (!modelReady()) return refuse(kForward, kNoModel);
    if (samples.count > 0 && (!samples.azimuth_s || !samples.range_s)) return refuse(kForward, kMissing);
    const double* const inputs[] = {samples.azimuth_s, samples.range_s, samples.doppler_hz, samples.height_m};
    double* outputs[quo::kGroundValues];
    std::ranges::transform(kGroundArrays, outputs, [&](const GroundArray& a) { return ground.*a.array; });
    if (!lie_well(inputs, outputs, ground.status, samples.count)) return refuse(kForward, kBadArrays);

    const quo::ErrnoKept kept;  // a first guess may draw the root of a negative number
    const quo::OrbitModel& model = *model_;
    const quo::OrbitView view = model.view(lambda_, static_cast<double>(look_sign_));
    const quo::ArrayKernels& kernels = quo::array_kernels();
    quo::ForwardBlock block;
    block.with_heights = samples.height_m;
    block.want_place = ground.latitude_deg || ground.longitude_deg || ground.height_m;
    block.want_angles = ground.incidence_deg || ground.look_deg;
    block.want_rate = ground.fm_rate_hz_s;
    block.want_speed = ground.speed_m_s;
    each_piece(samples.count, [&](const Piece& piece) {
        piece.read(samples.azimuth_s, block.t_s);
        piece.read(samples.range_s, block.range_s);
        piece.read(samples.doppler_hz, block.doppler_hz);
        piece.read(samples.height_m, block.height_m);
        const bool all = kernels.forward(view, piece.count, block);
        solve_rest(piece, all, block.solved, ground.status,
                   [&](int i) { return solve_sample(model, view, block, i); });
        for (const auto& [array, row] : kGroundArrays) piece.write(block.result[row], ground.*array);
    });
    return QUO_OK;
}

int Obj::earth2sat(const OrbitTargets& targets, const OrbitSightings& seen) const noexcept {
    if (!modelReady()) return refuse(kInverse, kNoModel);
    const Given form = given_form(targets);
    if (targets.count > 0 && form == Given::kNothing) return refuse(kInverse, kMissing);
    const double* const inputs[] = {targets.latitude_deg, targets.longitude_deg, targets.height_m,  targets.x_m,
                                    targets.y_m,          targets.z_m,           targets.doppler_hz};
    double* const outputs[] = {seen.azimuth_s, seen.range_s};
    if (!lie_well(inputs, outputs, seen.status, targets.count)) return refuse(kInverse, kBadArrays);

    const quo::ErrnoKept kept;  // a first guess may draw the root of a negative number
    const quo::OrbitModel& model = *model_;
    const quo::OrbitView view = model.view(lambda_, static_cast<double>(look_sign_));
    const quo::ArrayKernels& kernels = quo::array_kernels();
    const bool guessable = guessed_straight(model);
    quo::InverseBlock block;
    if (!guessable) std::ranges::fill(block.solved, 0);
    each_piece(targets.count, [&](const Piece& piece) {
        read_points(piece, targets, form, block);
        piece.read(targets.doppler_hz, block.doppler_hz);
        const bool all = guessable && kernels.inverse(view, piece.count, block);
        solve_rest(piece, all, block.solved, seen.status,
                   [&](int i) { return solve_target(model, view, block, i); });
        piece.write(block.t_s, seen.azimuth_s);
        piece.write(block.range_s, seen.range_s);
    });
    return QUO_OK;
}

int Obj::SVGetStates(std::size_t count, const double* times_s, double* positions_m,
                     double* velocities_m_s) const noexcept {
    if (!modelReady()) return refuse(kStates, kNoModel);
    if (count > 0 && !times_s) return refuse(kStates, kMissing);
    if (!lie_apart(count, times_s, positions_m, velocities_m_s)) return refuse(kStates, kBadArrays);
    for (std::size_t i = 0; i < count; ++i) {
        quo::OrbitSample sample{};
        sample.position = sample.velocity = {kNaN, kNaN, kNaN};
        quo::RunCursor cursor = model_->fresh();
        if (std::isfinite(times_s[i])) place_platform(*model_, cursor, times_s[i], &sample);
        if (positions_m) quo::store(sample.position, positions_m + 3 * i);
        if (velocities_m_s) quo::store(sample.velocity, velocities_m_s + 3 * i);
    }
    return QUO_OK;
}
