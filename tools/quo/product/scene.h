// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TOOL_SCENE_H
#define QUO_TOOL_SCENE_H

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

#include "quo_base/generalSARorbit.h"
#include "quo_base/image_grid.h"

class GeneralSAR;

namespace tool {

/** Throws Failure where an orbit could not do what it was asked for as a whole. */
void require_solved(int status);

/** What keeps state vectors from standing one spacing apart: gaps, duplicates, vectors out of order, in words.
 * Every time behind such a place would be wrong. Empty where they do. */
std::string uneven_vectors(const GeneralSAROrbit& orbit);

/** What a product header says about the geometry: its orbit, with wavelength and look side already set where the
 * header knows them. Options of the command line take precedence. */
class Scene {
public:
    /** What is taken of a list of state vectors with gaps, duplicates or vectors out of order. */
    enum class Vectors : std::uint8_t { kEvenOnly, kAsTheyAre };

    /** Reads a header. Throws Failure where the file cannot be read or holds no usable orbit: also one whose state
     * vectors are not one spacing apart from each other, as every time would be wrong behind the place. */
    explicit Scene(const std::string& header, Vectors vectors = Vectors::kEvenOnly);

    const std::string& name() const { return name_; }
    GeneralSAROrbit& orbit() { return orbit_; }
    const GeneralSAROrbit& orbit() const { return orbit_; }

    /** Sets the wavelength in m; throws WrongUse where it is not above 0. */
    void use_wavelength(double wavelength_m);
    void use_look_sign(int sign);
    std::optional<double> wavelength_m() const { return wavelength_m_; }
    std::optional<int> look_sign() const { return look_sign_; }
    /** Throws Failure where neither header nor option told it: a guess would give plausible wrong numbers. */
    void require_wavelength() const;
    void require_look_side() const;

    /** Takes the pixel grid of the header; throws Failure where it has neither grid nor region. */
    void take_grid();
    /** The one that was taken. */
    const ImageGrid_Obj& grid() const { return grid_; }

    /** Brings the state vectors to at most so many seconds apart; see GeneralSAROrbit::SVResample. */
    void resample(double spacing_s);

    double first_time() const { return orbit_.t0SV_s; }
    double last_time() const { return orbit_.t0SV_s + orbit_.dtSV_s * (orbit_.nSV_n - 1); }
    /** Whether the time lies between the first and the last state vector, with the 1e-4 s of leeway that the
     * inverse geolocation gives. Beyond, the orbit would be extrapolated. */
    bool covers(double time_s) const;

    /** What is wrong with the state vectors, in words. */
    std::vector<std::string> findings() const;

private:
    void take_orbit(GeneralSAR& product);
    void require_even_vectors() const;

    std::string name_;
    GeneralSAROrbit orbit_;
    ImageGrid_Obj grid_;
    std::optional<double> wavelength_m_;
    std::optional<int> look_sign_;
};

}  // namespace tool

#endif
