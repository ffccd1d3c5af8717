// SPDX-License-Identifier: Apache-2.0
#include "orbit.h"

#include <pybind11/stl.h>

#include <algorithm>
#include <limits>
#include <string>
#include <vector>

#include "arrays.h"
#include "errors.h"
#include "quo_base/geometry.h"

namespace quo_python {

Orbit Orbit::make(const StateVectors& vectors, std::optional<double> wavelength_m, std::optional<int> look) {
    Orbit orbit;
    orbit.model_ = std::make_shared<GeneralSAROrbit>();
    orbit.wavelength_ = wavelength_m;
    orbit.look_ = look;
    run("making an orbit", [&] {
        GeneralSAROrbit& model = *orbit.model_;
        if (const int status = model.SVCreate(vectors.first_s, vectors.spacing_s, vectors.count)) return status;
        const auto numbers = 3 * static_cast<std::size_t>(vectors.count);
        std::copy_n(vectors.positions_m, numbers, model.pSV_m);
        std::copy_n(vectors.velocities_m_s, numbers, model.vSV_mOs);
        if (const int status = wavelength_m ? model.setLambda(*wavelength_m) : int{QUO_OK}) return status;
        (void)model.setLookSign(look.value_or(1));
        return model.computeApproximateSV();
    });
    return orbit;
}

std::unique_ptr<GeneralSAROrbit> Orbit::own_model() const {
    auto copy = std::make_unique<GeneralSAROrbit>();
    run("copying an orbit", [&] { return model_->clone(copy.get()); });
    return copy;
}

Orbit Orbit::resampled(double spacing_s) const {
    Orbit finer = *this;
    finer.model_ = own_model();
    run("re-sampling an orbit", [&] { return finer.model_->SVResample(spacing_s); });
    return finer;
}

StateVectors Orbit::vectors() const {
    return {model_->t0SV_s, model_->dtSV_s, model_->nSV_n, model_->pSV_m, model_->vSV_mOs};
}

namespace {

Orbit orbit_of_arrays(double first_s, double spacing_s, const Doubles& positions, const Doubles& velocities,
                      std::optional<double> wavelength_m, std::optional<int> look) {
    need_dimensions(positions, 2);
    if (positions.shape(1) != 3 || shape_of(positions) != shape_of(velocities))
        throw py::value_error("positions and velocities need the shape (vectors, 3)");
    return Orbit::make({first_s, spacing_s, int_size(positions.shape(0)), positions.data(), velocities.data()},
                       wavelength_m, look);
}

Doubles vectors_of(const Orbit& orbit, const double* StateVectors::*which) {
    const StateVectors vectors = orbit.vectors();
    return Doubles{std::vector<py::ssize_t>{vectors.count, 3}, vectors.*which};
}

// --- Arrays of points -------------------------------------------------------------------------------------------

struct GroundOutput {
    const char* name;
    double* OrbitGround::*array;
};
constexpr GroundOutput kGround[] = {
    {"latitude", &OrbitGround::latitude_deg},
    {"longitude", &OrbitGround::longitude_deg},
    {"height", &OrbitGround::height_m},
    {"x", &OrbitGround::x_m},
    {"y", &OrbitGround::y_m},
    {"z", &OrbitGround::z_m},
    {"incidence", &OrbitGround::incidence_deg},
    {"look", &OrbitGround::look_deg},
    {"fm_rate", &OrbitGround::fm_rate_hz_s},
    {"speed", &OrbitGround::speed_m_s},
};

void need(bool known, const char* missing) {
    if (!known) raise(QUO_REFUSED, missing);
}
constexpr const char* kNoWavelength = "the wavelength is not known";
constexpr const char* kNoLook = "the look side is not known";

/** The outputs of these names, in a dictionary, and "status". */
py::dict to_ground(const Orbit& orbit, const std::vector<std::string>& names, const Doubles& azimuth_s,
                   const Doubles& range_s, const OptionalDoubles& doppler_hz, const OptionalDoubles& height_m) {
    const py::ssize_t count = azimuth_s.size();
    const OrbitSamples samples{static_cast<std::size_t>(count), azimuth_s.data(), data_of(range_s, count),
                               data_of(doppler_hz, count), data_of(height_m, count)};
    OrbitGround ground;
    py::dict made;
    for (const GroundOutput& output : kGround) {
        if (std::find(names.begin(), names.end(), output.name) == names.end()) continue;
        Doubles array{shape_of(azimuth_s)};
        ground.*output.array = array.mutable_data();
        made[output.name] = array;
    }
    if (made.size() != names.size()) throw py::value_error("an unknown or repeated quantity");
    Array<std::int32_t> status{shape_of(azimuth_s)};
    ground.status = status.mutable_data();
    made["status"] = status;
    need(orbit.look().has_value(), kNoLook);
    need(orbit.wavelength() || (!doppler_hz && !ground.fm_rate_hz_s), kNoWavelength);
    run("locating samples", [&] { return orbit.model().sat2earth(samples, ground); });
    return made;
}

/** Azimuth times, range times and statuses of places: latitude, longitude, height or, `fixed`, x, y, z. */
py::tuple to_radar(const Orbit& orbit, bool fixed, const Doubles& first, const Doubles& second,
                   const OptionalDoubles& third, const OptionalDoubles& doppler_hz) {
    const py::ssize_t count = first.size();
    OrbitTargets targets{.count = static_cast<std::size_t>(count), .doppler_hz = data_of(doppler_hz, count)};
    (fixed ? targets.x_m : targets.latitude_deg) = first.data();
    (fixed ? targets.y_m : targets.longitude_deg) = data_of(second, count);
    (fixed ? targets.z_m : targets.height_m) = data_of(third, count);
    Doubles azimuth_s{shape_of(first)}, range_s{shape_of(first)};
    Array<std::int32_t> status{shape_of(first)};
    const OrbitSightings seen{azimuth_s.mutable_data(), range_s.mutable_data(), status.mutable_data()};
    need(orbit.wavelength() || !doppler_hz, kNoWavelength);
    run("finding when places are seen", [&] { return orbit.model().earth2sat(targets, seen); });
    return py::make_tuple(azimuth_s, range_s, status);
}

enum class Vector : std::uint8_t { kPosition, kVelocity };

/** Three values for each time; not-a-number where the time is no number. */
Doubles along(const Orbit& orbit, Vector which, const Doubles& times_s) {
    std::vector<py::ssize_t> shape = shape_of(times_s);
    shape.push_back(3);
    Doubles vectors{shape};
    double* const to = vectors.mutable_data();
    run("following an orbit", [&, count = static_cast<std::size_t>(times_s.size()), times = times_s.data()] {
        const bool position = which == Vector::kPosition;
        return orbit.model().SVGetStates(count, times, position ? to : nullptr, position ? nullptr : to);
    });
    return vectors;
}

/** What is wrong with the vectors: number of the vector, size, text of each. */
py::list check(const Orbit& orbit) {
    std::vector<SVFinding> findings;
    run("examining state vectors", [&] { return orbit.model().SVCheck(findings); });
    py::list told;
    for (const SVFinding& finding : findings)
        told.append(py::make_tuple(finding.index, finding.size, finding.text));
    return told;
}

Doubles earth_fixed(const Doubles& latitude_deg, const Doubles& longitude_deg, const Doubles& height_m) {
    if (latitude_deg.size() != longitude_deg.size() || latitude_deg.size() != height_m.size())
        throw py::value_error("arrays of different sizes");
    auto shape = shape_of(latitude_deg);
    shape.push_back(3);
    Doubles xyz_m{shape};
    double* to = xyz_m.mutable_data();
    const py::gil_scoped_release released;
    for (py::ssize_t i = 0; i < latitude_deg.size(); ++i, to += 3)
        quo::store(quo::from_geodetic({latitude_deg.data()[i], longitude_deg.data()[i], height_m.data()[i]}), to);
    return xyz_m;
}

}  // namespace

void bind_orbit(py::module_& module) {
    const auto array = py::arg().noconvert();
    module.def("earth_fixed", &earth_fixed, array, array, array);
    py::class_<Orbit>(module, "Orbit")
        .def(py::init(&orbit_of_arrays), py::arg(), py::arg(), array, array, py::arg(), py::arg())
        .def("resampled", &Orbit::resampled)
        .def("check", &check)
        .def("to_ground", &to_ground, py::arg(), array, array, array, array)
        .def("to_radar", &to_radar, py::arg(), array, array, array, array)
        .def(
            "positions_at",
            [](const Orbit& self, const Doubles& times) { return along(self, Vector::kPosition, times); }, array)
        .def(
            "velocities_at",
            [](const Orbit& self, const Doubles& times) { return along(self, Vector::kVelocity, times); }, array)
        .def_property_readonly("first_time", [](const Orbit& self) { return self.vectors().first_s; })
        .def_property_readonly("spacing", [](const Orbit& self) { return self.vectors().spacing_s; })
        .def_property_readonly("positions",
                               [](const Orbit& self) { return vectors_of(self, &StateVectors::positions_m); })
        .def_property_readonly("velocities",
                               [](const Orbit& self) { return vectors_of(self, &StateVectors::velocities_m_s); })
        .def_property_readonly("wavelength", &Orbit::wavelength)
        .def_property_readonly("look", &Orbit::look)
        .def_property_readonly("ascending", [](const Orbit& self) { return self.model().isAscending(); })
        .def_property_readonly("fit_error", [](const Orbit& self) { return self.model().orbitFitError(); });
}

}  // namespace quo_python
