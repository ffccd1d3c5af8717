// SPDX-License-Identifier: Apache-2.0
/* Headers of whole products: what is read is located, written, and read back the same. */

#include <cmath>
#include <vector>

#include "bytes.h"
#include "quo_base/generalSAR.h"

namespace {

using property::MemoryFile;
using property::require;

/** Samples around an orbit's time go to the ground, and where they lie there, back: what succeeds is finite. */
void locate(const GeneralSAROrbit& orbit) {
    const double middle = orbit.t0SV_s + 0.5 * orbit.dtSV_s * orbit.nSV_n;
    const std::vector<double> times{middle, orbit.t0SV_s, middle + 1.0, NAN}, ranges{0.0055, 0.006, 0.0, 1e300};
    double x[4], y[4], z[4], t[4], range[4];
    std::int32_t forward[4], back[4];
    OrbitGround ground;
    ground.x_m = x;
    ground.y_m = y;
    ground.z_m = z;
    ground.status = forward;
    if (orbit.sat2earth(OrbitSamples{4, times.data(), ranges.data()}, ground) != 0) return;
    OrbitTargets targets{4};
    targets.x_m = x;
    targets.y_m = y;
    targets.z_m = z;
    require(orbit.earth2sat(targets, {t, range, back}) == 0, "ground points are looked for");
    for (int i = 0; i < 4; ++i) {
        require((forward[i] == 0) == std::isfinite(x[i] + y[i] + z[i]), "a point that is found is finite");
        require((back[i] == 0) == std::isfinite(t[i] + range[i]), "a time that is found is finite");
    }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view content{reinterpret_cast<const char*>(data), size};
    const MemoryFile file{content, "product"}, first{"", "first"}, second{"", "second"};
    GeneralSAR product, again;
    if (product.GSread(file.name()) != 0) return 0;
    product.GSdisable(gsDataFile);  // it would be written into the raster's own side file
    if (product.GSexists(gsOrbit)) locate(product.orbit);
    product.GSwrite(first.name());
    if (again.GSread(first.name()) != 0) return 0;
    again.GSdisable(gsDataFile);
    again.GSwrite(second.name());
    require(first.content() == second.content(), "a product that was written is written the same when read back");
    return 0;
}
