// SPDX-License-Identifier: Apache-2.0
/* Polynomials and coregistration, from headers and parameter files of any bytes. */

#include <algorithm>
#include <cmath>
#include <cstdlib>

#include "bytes.h"
#include "quo_base/Coregist.h"
#include "quo_base/SARpolynomials.h"

namespace {

using property::MemoryFile;
using property::require;

bool same(double a, double b) { return a == b || (std::isnan(a) && std::isnan(b)); }

/** The choice among the Doppler polynomials at a time is that of a walk along the list. */
void check_choice(const polySAR& polynomials, double azimuth_time) {
    if (polynomials.ndc <= 0) return;
    const polyDC* const first = polynomials.DC.get();
    const polyDC* const last = first + polynomials.ndc;
    const polyDC* const chosen =
        std::find_if(first, last, [&](const polyDC& p) { return p.taz0 >= azimuth_time; });
    double expected = 0.0, got = 0.0;
    (chosen == last ? last - 1 : chosen)->EvaluatePoly(0.005, azimuth_time, &expected);
    require(polynomials.EvaluateDC(0.005, azimuth_time, &got) == 0 && same(got, expected), "the walk's choice");
}

void check_polynomials(const MemoryFile& file, double azimuth_time) {
    polySAR polynomials, again;
    if (polynomials.readhdr(file.name()) != 0) return;
    check_choice(polynomials, azimuth_time);
    double value = 0.0;
    polynomials.EvaluateFRinterp(0.005, azimuth_time, &value);
    polynomials.EvaluateGR2SL(1e5, azimuth_time, &value);
    const MemoryFile written{"", "written"};
    polynomials.setExactNumbers(true);
    require(polynomials.writehdr(written.name()) == 0 && again.readhdr(written.name()) == 0,
            "polynomials come back");
    require(again.ndc == polynomials.ndc && again.nsl2phi == polynomials.nsl2phi, "so many of them");
}

void check_coregistration(const MemoryFile& file) {
    Coregist mapping;
    if (mapping.readpar(file.name()) != 0) return;
    double range = 0.0, azimuth = 0.0, back[2] = {7.0, 7.0};
    mapping.evaluateSLtime(0.005, mapping.taz0 + 1.0, &range, &azimuth);
    if (mapping.evaluateMAtime(range, azimuth, back, back + 1) != 0)
        require(back[0] == 7.0 && back[1] == 7.0, "no inverse leaves the outputs");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    property::Bytes bytes{{reinterpret_cast<const char*>(data), size}};
    const double azimuth_time = std::strtod(std::string{bytes.take_until('\n')}.c_str(), nullptr);
    const MemoryFile file{bytes.rest(), "mapping"};
    check_polynomials(file, azimuth_time);
    check_coregistration(file);
    return 0;
}
