// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PYTHON_ORBIT_H
#define QUO_PYTHON_ORBIT_H

#include <pybind11/pybind11.h>

#include <cstdint>
#include <memory>
#include <optional>

#include "quo_base/generalSARorbit.h"

namespace quo_python {

namespace py = pybind11;

/** State vectors, not owned. */
struct StateVectors {
    double first_s, spacing_s;
    std::int32_t count;
    const double *positions_m, *velocities_m_s;  ///< three values of each vector in turn
};

/** An orbit that nobody changes: any number of threads may use it without the interpreter's lock. */
class Orbit {
public:
    /** Without wavelength or look side, what needs them is refused. */
    static Orbit make(const StateVectors& vectors, std::optional<double> wavelength_m, std::optional<int> look);
    [[nodiscard]] Orbit resampled(double spacing_s) const;

    [[nodiscard]] StateVectors vectors() const;
    [[nodiscard]] const GeneralSAROrbit& model() const { return *model_; }
    [[nodiscard]] std::optional<double> wavelength() const { return wavelength_; }
    [[nodiscard]] std::optional<int> look() const { return look_; }
    /** A model that one thread may use for calls that change its run of vectors. */
    [[nodiscard]] std::unique_ptr<GeneralSAROrbit> own_model() const;

private:
    std::shared_ptr<GeneralSAROrbit> model_;
    std::optional<double> wavelength_;
    std::optional<int> look_;
};

void bind_orbit(py::module_& module);

}  // namespace quo_python

#endif
