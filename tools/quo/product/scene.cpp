// SPDX-License-Identifier: Apache-2.0
#include "scene.h"

#include <algorithm>
#include <cmath>

#include "document.h"
#include "failure.h"
#include "generalSAR/orbit/orbit_check.h"
#include "number.h"
#include "pixels.h"
#include "product.h"
#include "quo_base/generalSAR.h"
#include "sarutillib/ground/letters.h"

namespace tool {
namespace {

bool is_any(const SVFinding& /*finding*/) { return true; }

/** The findings of one sort. */
std::vector<std::string> check(const GeneralSAROrbit& orbit, bool (*sort)(const SVFinding&) = is_any) {
    std::vector<SVFinding> findings;
    std::vector<std::string> texts;
    if (orbit.SVCheck(findings) != 0) return {"the state vectors cannot be checked"};
    for (const SVFinding& finding : findings)
        if (sort(finding)) texts.emplace_back(finding.text);
    return texts;
}

/** Why the model of a header's orbit cannot be built: what is wrong with the vectors, where they can be read at
 * all. */
std::string why_no_orbit(const char* header, int status) {
    SAROrbitStateVectors_Obj vectors;
    forget_system_error();
    const int unread = vectors.readhdr(header);
    if (unread != 0 || vectors.nSV_n < 1) refuse_header(header, unread, "no state vectors that can be read");
    GeneralSAROrbit orbit;
    const auto values = static_cast<std::ptrdiff_t>(vectors.nSV_n) * 3;
    if (orbit.SVCreate(vectors.t0SV_s, vectors.dtSV_s, vectors.nSV_n) != 0)
        return std::to_string(vectors.nSV_n) + " state vectors, at least 5 are needed";
    std::copy_n(vectors.pSV_m, values, orbit.pSV_m);
    std::copy_n(vectors.vSV_mOs, values, orbit.vSV_mOs);
    const auto findings = check(orbit);
    return findings.empty() ? "no orbit from the state vectors, status " + status_text(status) : findings.front();
}

}  // namespace

Scene::Scene(const std::string& header, Vectors vectors) : name_{header} {
    require_header_file(name_);  // the library answers for a missing file as for one that lacks the section
    // In one go: of a file that can be read at one time and not at another, a wavelength that was not found would
    // count as one that is not there.
    GeneralSAR product;
    (void)read_objects(name_, product);
    take_orbit(product);
    if (vectors == Vectors::kEvenOnly) require_even_vectors();
    const double wavelength_m = product.samplingConstants.lambda_m;
    if (product.GSexists(gsSamplingConstants) && wavelength_m > 0.0) use_wavelength(wavelength_m);
    if (product.GSexists(gsDataSetInfo)) use_look_sign(product.dataSetInfo.LookDirection);
}

void Scene::take_orbit(GeneralSAR& product) {
    // Read by itself it tells why there is none.
    const int status = product.GSexists(gsOrbit) ? product.orbit.clone(&orbit_) : orbit_.readhdr(name_.c_str());
    if (status != 0) throw Failure(name_ + ": " + why_no_orbit(name_.c_str(), status));
    if (!product.GSexists(gsOrbit)) throw Failure(name_ + ": cannot be read");
}

void require_solved(int status) {
    if (status != QUO_OK) throw Failure("status " + status_text(status));
}

std::string uneven_vectors(const GeneralSAROrbit& orbit) {
    return quo::joined(check(orbit, quo::is_uneven), "; ");
}

void Scene::require_even_vectors() const {
    const std::string causes = uneven_vectors(orbit_);
    if (!causes.empty()) throw Failure(name_ + ": " + causes);
}

void Scene::use_wavelength(double wavelength_m) {
    if (orbit_.setLambda(wavelength_m) != 0)
        throw WrongUse("--wavelength " + exact(wavelength_m) + ": must be a number of metres above 0");
    wavelength_m_ = wavelength_m;
}

void Scene::use_look_sign(int sign) {
    orbit_.setLookSign(sign);
    look_sign_ = sign;
}

void Scene::take_grid() {
    GeneralSAR product;
    read_product(name_, product);
    if (!tool::take_grid(name_, product, grid_))
        throw Failure(name_ + ": neither a pixel grid (section ImageGrid) nor a region (section ROI)");
}

void Scene::require_wavelength() const {
    if (!wavelength_m_) throw Failure(name_ + ": no wavelength (SamplingConstants/lambda_m); give --wavelength");
}

void Scene::require_look_side() const {
    if (!look_sign_) throw Failure(name_ + ": no look side (DataSetInfo/LookDirection); give --look");
}

void Scene::resample(double spacing_s) {
    if (!(spacing_s > 0.0 && std::isfinite(spacing_s)))
        throw WrongUse("--resample " + exact(spacing_s) + ": the spacing must be a number of seconds above 0");
    const double vectors = (last_time() - first_time()) / spacing_s + 1.0;
    if (vectors > GeneralSAROrbit::kMostResampled)
        throw WrongUse("--resample " + exact(spacing_s) + ": that makes " + rough(vectors) +
                       " state vectors, at most " + std::to_string(GeneralSAROrbit::kMostResampled) + " are made");
    const int status = orbit_.SVResample(spacing_s);
    if (status != 0) throw Failure(name_ + ": cannot re-sample the state vectors, status " + status_text(status));
}

bool Scene::covers(double time_s) const {
    constexpr double kLeeway = 1e-4;  // s
    return time_s >= first_time() - kLeeway && time_s <= last_time() + kLeeway;
}

std::vector<std::string> Scene::findings() const { return check(orbit_); }

}  // namespace tool
