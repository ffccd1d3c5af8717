// SPDX-License-Identifier: Apache-2.0
#include "quo_base/derived_raster.h"

#include <algorithm>
#include <cmath>
#include <memory>
#include <span>
#include <string>
#include <vector>

#include "diagnosticslib/call_frame.h"
#include "generalSAR/derived_raster/corner_points.h"
#include "quo_base/generalSAR.h"
#include "quo_base/image_grid.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_document.h"
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
    int write(const char* from, const char* header, quo::HeaderSession& session) {
        const int found = read_image_grid(from, product_, grid_);
        if (found == QUO_REFUSED) return write_corners(header, session);
        if (found != QUO_OK) return found;
        change_rates(product_.samplingConstants);
        const int status = grid_.cut(how_.first_line, how_.first_sample, how_.line_step, how_.sample_step);
        if (status != QUO_OK) return status;
        const std::int32_t bursts = grid_.Bursts;
        keep_own_bursts();
        const ROI_Obj& region = product_.roi.Roi;
        const double began_s = region.SlowStartTime, within_s = 0.5 * region.SlowTimeDelta;
        moved_ = product_.GSexists(gsRoi);
        if (moved_)
            if (const int unplaced =
                    grid_.getRegion(&product_.roi.Roi, raster_.NrOfLinesPerImage, raster_.NrOfPixelsPerLine))
                return unplaced;
        follow_swath(product_.swathInfo, bursts, began_s, within_s);
        grid_.setExactNumbers(true);
        product_.roi.Roi.setExactNumbers(true);
        if (const int failed = grid_.writehdr(header)) return failed;
        return write_changed(header, session);
    }

private:
    /** Those that are the image's own: of ground range, and of multilooked or burst images, they are the
     * recording's. */
    void change_rates(SamplingConstants_Obj& sampling) {
        if (!product_.GSexists(gsSamplingConstants)) return;
        SpectralWindows_Obj& windows = product_.spectralWindows;
        bool rates = false;
        if (how_.sample_step != 1.0 && grid_.GroundLists == 0 && almost(sampling.Trg_s, grid_.SampleStep_s)) {
            double& chirp_hz = product_.pulse.PulseSamplingRate;
            const bool chirp = almost(chirp_hz, sampling.frg_hz);
            sampling.Trg_s *= how_.sample_step;
            sampling.frg_hz = 1.0 / sampling.Trg_s;
            sampling.Brg_hz = std::min(sampling.Brg_hz, sampling.frg_hz);
            if (chirp) chirp_hz = sampling.frg_hz;
            bound(gsSpectralWindows, {&windows.RgLookBandwidth, 1}, sampling.frg_hz);
            bound(gsDataSetInfo, product_.dataSetInfo.RangeBandwidth, sampling.frg_hz);
            rates = true;
        }
        if (how_.line_step != 1.0 && almost(sampling.pri_s, grid_.LineStep_s)) {
            sampling.pri_s *= how_.line_step;
            sampling.prf_hz = 1.0 / sampling.pri_s;
            sampling.Baz_hz = std::min(sampling.Baz_hz, sampling.prf_hz);
            bound(gsSpectralWindows, {&windows.AzLookBandwidth, 1}, sampling.prf_hz);
            rates = true;
        }
        if (rates) changed_.push_back(&sampling);
        if (rates && product_.GSexists(gsPulse)) changed_.push_back(&product_.pulse);
    }
    /** A band is no wider than the rate at which it is sampled. The pulse's stays what was sent. */
    void bound(GSObject object, std::span<double> bands_hz, double rate_hz) {
        if (!product_.GSexists(object) || std::ranges::max(bands_hz) <= rate_hz) return;
        for (double& band_hz : bands_hz) band_hz = std::min(band_hz, rate_hz);
        changed_.push_back(product_.GSget(object));
    }
    /** Leaves out the bursts of which the raster has no line; one alone makes an image without bursts, whose lines
     * can be sampled anew. */
    void keep_own_bursts() {
        if (grid_.Bursts == 0) return;
        const double first = std::floor((grid_.FirstLine + 0.5) / grid_.LinesPerBurst),
                     end = std::ceil((grid_.FirstLine + raster_.NrOfLinesPerImage - 0.5) / grid_.LinesPerBurst);
        if (!(first >= 0.0 && first < end && end <= grid_.Bursts) || end - first == grid_.Bursts) return;
        auto& starts = grid_.BurstStart_s;
        starts.erase(starts.begin() + static_cast<std::ptrdiff_t>(end), starts.end());
        starts.erase(starts.begin(), starts.begin() + static_cast<std::ptrdiff_t>(first));
        grid_.FirstLine -= first * grid_.LinesPerBurst;
        grid_.FirstLine_s = starts.front();
        if (starts.size() == 1) {
            starts.clear();
            grid_.LinesPerBurst = 0;
        }
        grid_.Bursts = static_cast<std::int32_t>(starts.size());
    }
    /** What a swath tells of an image is the derived one's where it was the whole one's. */
    void follow_swath(SwathInfo& swath, std::int32_t bursts, double began_s, double within_s) {
        if (!product_.GSexists(gsSwathInfo)) return;
        const bool counts = bursts != grid_.Bursts && swath.Bursts == bursts;
        const bool start = moved_ && std::abs(swath.Acquisition_Start_Time - began_s) < within_s &&
                           product_.roi.Roi.SlowStartTime != began_s;
        if (counts) {
            swath.Bursts = grid_.Bursts;
            swath.Lines_per_burst = grid_.LinesPerBurst;
        }
        if (start) swath.Acquisition_Start_Time = product_.roi.Roi.SlowStartTime;
        if (counts || start) changed_.push_back(&swath);
    }

    int write_changed(const char* header, quo::HeaderSession& session) {
        if (moved_) (void)product_.roi.writehdr(header);
        for (GeneralSAR_Base* const object : changed_) {
            object->setExactNumbers(true);
            if (const int status = object->writehdr(header)) return status;
        }
        return write_corners(header, session);
    }
    /** Corner points that cannot be placed anew would be those of another image. */
    int write_corners(const char* header, quo::HeaderSession& session) {
        if (!product_.GSexists(gsGeoCoords)) return QUO_OK;
        // The data set tells the look side.
        const bool placed =
            moved_ && product_.GSexists(gsOrbit) && product_.GSexists(gsDataSetInfo) &&
            quo::place_corners(grid_, raster_.NrOfLinesPerImage, raster_.NrOfPixelsPerLine, product_) == QUO_OK;
        if (placed) return product_.geoCoords.writehdr(header);
        if (covers_all()) return QUO_OK;
        int status = QUO_OK;
        if (const auto document = session.document(status)) document->remove_all(1, "GroundCornersPoints");
        return status;
    }
    /** Whether the first and last pixels are where they were, to a pixel. */
    [[nodiscard]] bool covers_all() const {
        const RasterDescription* const whole = described_raster(product_);
        const auto covers = [](double first, double step, int count, int all) {
            const double last = first + step * (count - 1.0);
            return std::abs(first) < 1.0 && std::abs(last - (all - 1.0)) < std::max(1.0, step);
        };
        return whole != nullptr &&
               covers(how_.first_line, how_.line_step, raster_.NrOfLinesPerImage, whole->NrOfLinesPerImage) &&
               covers(how_.first_sample, how_.sample_step, raster_.NrOfPixelsPerLine, whole->NrOfPixelsPerLine);
    }

    GeneralSAR& product_;
    const RasterDescription& raster_;
    const RasterDerivation& how_;
    ImageGrid_Obj grid_;
    std::vector<GeneralSAR_Base*> changed_;
    bool moved_ = false;
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
    return quo::pass_on(frame, grid.setRegion(region));
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
        quo::HeaderSession session{own.c_str(), header};
        const int placed = Placed{*product, raster, how}.write(header, own.c_str(), session);
        if (placed != QUO_OK) return frame.callee(placed);
        return quo::pass_on(frame, raster.commit());
    });
}
