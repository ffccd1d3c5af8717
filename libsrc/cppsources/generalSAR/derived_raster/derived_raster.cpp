// SPDX-License-Identifier: Apache-2.0
#include "quo_base/derived_raster.h"

#include <algorithm>
#include <cmath>
#include <memory>
#include <string>

#include "diagnosticslib/call_frame.h"
#include "generalSAR/derived_raster/corner_points.h"
#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_session.h"
#include "sarutillib/ground/bounded_text.h"

namespace {

constexpr const char* kSource = "derived_raster";

bool almost(double a, double b) { return std::abs(a - b) <= 1e-9 * std::abs(b); }

/** The sections of a product that place its raster, made to fit a derived one. */
class Placed {
public:
    Placed(GeneralSAR& product, const RasterDescription& raster, const RasterDerivation& how)
        : product_{product}, raster_{raster}, how_{how} {}

    /** Of a header that has neither grid nor region nothing is written. */
    int write(const char* from, const char* header) {
        const int found = read_image_grid(from, product_, grid_);
        if (found != QUO_OK) return found == QUO_REFUSED ? QUO_OK : found;
        change_rates(product_.samplingConstants);
        const int status = grid_.cut(how_.first_line, how_.first_sample, how_.line_step, how_.sample_step);
        if (status != QUO_OK) return status;
        moved_ = product_.GSexists(gsRoi);
        if (moved_)
            if (const int unplaced =
                    grid_.getRegion(&product_.roi.Roi, raster_.NrOfLinesPerImage, raster_.NrOfPixelsPerLine))
                return unplaced;
        for (GeneralSAR_Base* const object :
             {static_cast<GeneralSAR_Base*>(&grid_), static_cast<GeneralSAR_Base*>(&product_.roi.Roi),
              static_cast<GeneralSAR_Base*>(&product_.samplingConstants),
              static_cast<GeneralSAR_Base*>(&product_.pulse)})
            object->setExactNumbers(true);
        if (const int failed = grid_.writehdr(header)) return failed;
        return write_changed(header);
    }

private:
    /** Those that are the image's own: of ground range, and of multilooked or burst images, they are the
     * recording's. */
    void change_rates(SamplingConstants_Obj& sampling) {
        if (!product_.GSexists(gsSamplingConstants)) return;
        if (how_.sample_step != 1.0 && grid_.GroundLists == 0 && almost(sampling.Trg_s, grid_.SampleStep_s)) {
            double& chirp_hz = product_.pulse.PulseSamplingRate;
            const bool chirp = almost(chirp_hz, sampling.frg_hz);
            sampling.Trg_s *= how_.sample_step;
            sampling.frg_hz = 1.0 / sampling.Trg_s;
            sampling.Brg_hz = std::min(sampling.Brg_hz, sampling.frg_hz);
            if (chirp) chirp_hz = sampling.frg_hz;
            rates_ = true;
        }
        if (how_.line_step != 1.0 && almost(sampling.pri_s, grid_.LineStep_s)) {
            sampling.pri_s *= how_.line_step;
            sampling.prf_hz = 1.0 / sampling.pri_s;
            sampling.Baz_hz = std::min(sampling.Baz_hz, sampling.prf_hz);
            rates_ = true;
        }
    }
    int write_changed(const char* header) {
        if (moved_) (void)product_.roi.writehdr(header);
        if (rates_)
            if (const int status = product_.samplingConstants.writehdr(header)) return status;
        if (rates_ && product_.GSexists(gsPulse))
            if (const int status = product_.pulse.writehdr(header)) return status;
        // The data set tells the look side.
        const bool corners =
            moved_ && product_.GSexists(gsGeoCoords) && product_.GSexists(gsOrbit) &&
            product_.GSexists(gsDataSetInfo) &&
            quo::place_corners(grid_, raster_.NrOfLinesPerImage, raster_.NrOfPixelsPerLine, product_) == QUO_OK;
        return corners ? product_.geoCoords.writehdr(header) : QUO_OK;
    }

    GeneralSAR& product_;
    const RasterDescription& raster_;
    const RasterDerivation& how_;
    ImageGrid_Obj grid_;
    bool moved_ = false, rates_ = false;
};

/** The unfinished raster goes, unless it is finished. */
struct Unfinished {
    BufferFile& raster;
    ~Unfinished() { raster.close(); }
};

}  // namespace

const RasterDescription* described_raster(const GeneralSAR& product) noexcept {
    if (product.GSexists(gsBufferFile)) return &product.bufferFile;
    const DataFile& older = product.dataFile.File;  // always present, described or not
    return older.NrOfLinesPerImage != 0 && older.NrOfPixelsPerLine != 0 ? &older : nullptr;
}

int read_image_grid(const char* header, const GeneralSAR& product, ImageGrid_Obj& grid) noexcept {
    quo::CallFrame frame{"read_image_grid", kSource};
    int status = grid.readhdr(header);
    if (status == QUO_REFUSED) status = region_image_grid(product, grid);
    if (status == QUO_REFUSED) return frame.silent(QUO_REFUSED);
    return status == QUO_OK ? frame.success() : frame.callee(status);
}

int region_image_grid(const GeneralSAR& product, ImageGrid_Obj& grid) noexcept {
    quo::CallFrame frame{"region_image_grid", kSource};
    const RasterDescription* const raster = described_raster(product);
    const ROI_Obj& region = product.roi.Roi;
    const bool fits = raster == nullptr || raster->NrOfLinesPerImage == 0 ||
                      (region.Lines == raster->NrOfLinesPerImage && region.Samples == raster->NrOfPixelsPerLine);
    if (!product.GSexists(gsRoi) || region.isNULL() != 0 || !fits) return frame.silent(QUO_REFUSED);
    if (const int failed = grid.setRegion(region)) return frame.callee(failed);
    return frame.success();
}

int commit_derived(BufferFile& raster, const char* header, const RasterDerivation& how) {
    quo::CallFrame frame{"commit_derived", kSource};
    const Unfinished unfinished{raster};
    if (!(how.line_step > 0.0 && how.sample_step > 0.0)) return frame.fail(QUO_REFUSED, "The steps are above 0");
    return quo::guarded(frame, [&] {
        char name[512];
        raster.getFilename(name);
        const std::string own = std::string{name} + ".hdr";
        const auto product = std::make_unique<GeneralSAR>();
        const quo::HeaderSession source{header};
        // A product of which a part was lost on the way would be made to fit in a part only.
        if (const int read = product->GSread(header)) return frame.callee(read);
        if (source.failures() > 0) return frame.callee(QUO_REFUSED);
        const quo::HeaderSession session{own.c_str(), header};
        const int placed = Placed{*product, raster, how}.write(header, own.c_str());
        if (placed != QUO_OK) return frame.callee(placed);
        if (const int status = raster.commit()) return frame.callee(status);
        return frame.success();
    });
}
