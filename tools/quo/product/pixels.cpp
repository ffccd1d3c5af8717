// SPDX-License-Identifier: Apache-2.0
#include "pixels.h"

#include <cmath>

#include "failure.h"
#include "product.h"
#include "quo_base/derived_raster.h"
#include "scene.h"

namespace tool {
namespace {

double distance(const GrPtGeometry& a, const GrPtGeometry& b) {
    return norm(quo::load(a.point_m) - quo::load(b.point_m));
}

}  // namespace

bool take_grid(const std::string& header, const GeneralSAR& product, ImageGrid_Obj& grid) {
    const int status = read_image_grid(header.c_str(), product, grid);
    if (status != QUO_OK && status != QUO_REFUSED)
        throw Failure(header + ": section ImageGrid: " + status_text(status));
    return status == QUO_OK;
}

Pixels::Pixels(const std::string& header, GeneralSAR& product) : product_{product} {
    const RasterDescription* const raster = described_raster(product);
    if (raster == nullptr) throw Failure(header + ": describes no raster");
    lines_ = raster->NrOfLinesPerImage;
    samples_ = raster->NrOfPixelsPerLine;
    if (!product.GSexists(gsOrbit)) throw Failure(header + ": no state vectors");
    if (!product.GSexists(gsDataSetInfo)) throw Failure(header + ": no look side (DataSetInfo/LookDirection)");
    if (const std::string uneven = uneven_vectors(product.orbit); !uneven.empty())
        throw Failure(header + ": " + uneven);
    if (!take_grid(header, product, grid_))
        throw Failure(header + ": neither a pixel grid (section ImageGrid) nor a region (section ROI)");
}

void Pixels::drop_bursts(double first_s) {
    grid_.Bursts = 0;
    grid_.BurstStart_s.clear();
    grid_.LinesPerBurst = 0;
    grid_.FirstLine_s = first_s;
    grid_.FirstLine = 0.0;
}

bool Pixels::known(const std::string& header, GeneralSAR& product) {
    ImageGrid_Obj grid;
    return described_raster(product) != nullptr && product.GSexists(gsOrbit) && product.GSexists(gsDataSetInfo) &&
           uneven_vectors(product.orbit).empty() && take_grid(header, product, grid);
}

std::optional<Pixels::Times> Pixels::times(double line, double sample) const {
    Times times{};
    std::int32_t status = QUO_OK;
    const int refused = grid_.pixelTimes({1, &line, &sample}, {&times.azimuth_s, &times.range_s, &status});
    if (refused != QUO_OK || status != QUO_OK) return std::nullopt;
    return times;
}

std::optional<GrPtGeometry> Pixels::geometry(double line, double sample) const {
    const auto at = times(line, sample);
    GrPtGeometry geometry{};
    if (!at || product_.orbit.SVGetGeometry(at->azimuth_s, at->range_s, 0.0, &geometry) != QUO_OK)
        return std::nullopt;
    return geometry;
}

std::optional<Pixels::Spacing> Pixels::ground_spacing() const {
    const double line = 0.5 * (lines_ - 1), sample = 0.5 * (samples_ - 1);
    const auto at = times(line, sample), next = times(line + 1.0, sample);
    // The line after the last one of a burst lies somewhere else.
    const bool goes_on =
        at && next && std::abs(next->azimuth_s - at->azimuth_s - grid_.LineStep_s) < 0.5 * grid_.LineStep_s;
    const auto here = geometry(line, sample), below = geometry(goes_on ? line + 1.0 : line - 1.0, sample),
               beside = geometry(line, sample + 1.0);
    if (!here || !below || !beside) return std::nullopt;
    return Spacing{distance(*here, *below), distance(*here, *beside)};
}

}  // namespace tool
