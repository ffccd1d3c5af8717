#include "quo_base/derived_raster.h"

#include <cmath>
#include <memory>
#include <string>

#include "diagnosticslib/call_frame.h"
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
        ROI_Obj& region = product_.roi.Roi;
        const bool has_region = product_.GSexists(gsRoi) && region.isNULL() == 0;
        ImageGrid_Obj grid;
        if (grid.readhdr(from) != QUO_OK && (!has_region || grid.setRegion(region) != QUO_OK)) return QUO_OK;
        const int status = grid.cut(how_.first_line, how_.first_sample, how_.line_step, how_.sample_step);
        if (status != QUO_OK) return status;
        if (has_region && fits(region)) move_region(region, grid);
        if (product_.GSexists(gsSamplingConstants)) change_rates(product_.samplingConstants);
        grid.setExactNumbers(true);
        region.setExactNumbers(true);
        if (const int failed = grid.writehdr(header)) return failed;
        return write_changed(header);
    }

private:
    [[nodiscard]] bool fits(const ROI_Obj& region) const {
        const RasterDescription* const old = product_.GSexists(gsBufferFile)
                                                 ? static_cast<const RasterDescription*>(&product_.bufferFile)
                                                 : &product_.dataFile.File;
        return region.Lines == old->NrOfLinesPerImage && region.Samples == old->NrOfPixelsPerLine;
    }
    void move_region(ROI_Obj& region, const ImageGrid_Obj& grid) {
        line_interval_s_ = region.SlowTimeDelta;
        region.SetSlowAxe(grid.Bursts == 0 ? grid.Epoch_s + (grid.FirstLine_s + grid.FirstLine * grid.LineStep_s)
                                           : region.SlowStartTime + how_.first_line * region.SlowTimeDelta,
                          region.SlowTimeDelta * how_.line_step, raster_.NrOfLinesPerImage);
        region.SetFastAxe(region.FastStartTime + how_.first_sample * region.FastTimeDelta,
                          region.FastTimeDelta * how_.sample_step, raster_.NrOfPixelsPerLine);
        moved_ = true;
    }
    void change_rates(SamplingConstants_Obj& sampling) {
        if (how_.sample_step != 1.0 && sampling.Trg_s > 0.0) {
            sampling.Trg_s *= how_.sample_step;
            sampling.frg_hz = 1.0 / sampling.Trg_s;
        }
        // Of a multilooked or burst image the lines are not the pulses.
        if (how_.line_step != 1.0 && sampling.pri_s > 0.0 && almost(sampling.pri_s, line_interval_s_)) {
            sampling.pri_s *= how_.line_step;
            sampling.prf_hz = 1.0 / sampling.pri_s;
        }
    }
    int write_changed(const char* header) {
        if (moved_) (void)product_.roi.writehdr(header);
        if (product_.GSexists(gsSamplingConstants) && (how_.line_step != 1.0 || how_.sample_step != 1.0))
            if (const int status = product_.samplingConstants.writehdr(header)) return status;
        const bool corners = moved_ && product_.GSexists(gsGeoCoords) && product_.GSexists(gsOrbit) &&
                             product_.orbit.SVGetGeoCoords(&product_.geoCoords, &product_.roi) == QUO_OK;
        return corners ? product_.geoCoords.writehdr(header) : QUO_OK;
    }

    GeneralSAR& product_;
    const RasterDescription& raster_;
    const RasterDerivation& how_;
    double line_interval_s_ = 0.0;
    bool moved_ = false;
};

}  // namespace

int commit_derived(BufferFile& raster, const char* header, const RasterDerivation& how) {
    quo::CallFrame frame{"commit_derived", kSource};
    return quo::guarded(frame, [&] {
        char name[512];
        raster.getFilename(name);
        const std::string own = std::string{name} + ".hdr";
        const auto product = std::make_unique<GeneralSAR>();
        if (product->GSread(header) != QUO_OK) return frame.callee(QUO_REFUSED);
        quo::HeaderSession session{own.c_str(), header};
        const int placed = Placed{*product, raster, how}.write(header, own.c_str());
        if (placed != QUO_OK) raster.close();
        if (placed != QUO_OK) return frame.callee(placed);
        if (const int status = raster.commit()) return frame.callee(status);
        return frame.success();
    });
}
