// SPDX-License-Identifier: Apache-2.0
#include "focus.h"

#include <algorithm>
#include <cstdint>
#include <filesystem>
#include <memory>
#include <optional>
#include <utility>
#include <vector>

#include "../common/blocks.h"
#include "azimuth_focusing.h"
#include "quo_base/debugIO.h"
#include "quo_base/generalSAR.h"
#include "range_compression.h"

namespace example {
namespace {

constexpr double kRangeShare = 0.3;  // of the time that range compression takes, about

/** Tells a parent process, which draws a waitbar, how far the job has come. */
class Waitbar {
public:
    explicit Waitbar(bool wanted) : wanted_{wanted} {
        if (wanted_) waitbar_open("Focusing");
    }
    ~Waitbar() {
        if (wanted_) waitbar_close();
    }
    Waitbar(const Waitbar&) = delete;
    Waitbar& operator=(const Waitbar&) = delete;

    void show(double share) {
        const int percent = static_cast<int>(100.0 * share);
        if (wanted_ && percent != percent_) waitbar_update(static_cast<float>(percent) / 100.0F);
        percent_ = percent;
    }

private:
    bool wanted_;
    int percent_ = -1;
};

/** One run of the processor. */
class Processor {
public:
    Processor(const FocusJob& job, const AzimuthConf& azimuth, const generalProcessingConf& processing)
        : job_{job}, conf_{azimuth}, processing_{processing}, progress_{job.waitbar} {}
    FocusResult run();

private:
    void read_header();
    void check_memory(int lines, int samples) const;
    void make_room(int lines);
    void create(DataFile& raster, const std::string& name, int lines, int samples);
    void finish(DataFile& raster);
    void compress_range();
    void focus_azimuth();
    void write_lines(Block& block, int first, int lines);
    void write_block(Block& block, int line, int sample);
    void write_header();

    class RangeWorker;
    class AzimuthWorker;

    FocusJob job_;
    const AzimuthConf& conf_;
    const generalProcessingConf& processing_;
    Waitbar progress_;
    Stopwatch stopwatch_;
    GeneralSAR product_;
    DopplerBand band_{};
    ROI_Obj data_;  // the compressed data
    DataFile compressed_, image_;
    std::optional<Block> core_;  // the compressed data, where they are kept in memory
    BlockLayout layout_{};
};

void Processor::read_header() {
    const std::string header = job_.raw + ".hdr";
    require(product_.GSread(header.c_str()), header + ": cannot be read");
    constexpr GSObject kNeeded[] = {gsRoi,   gsPolySAR,     gsSamplingConstants, gsOrbit,
                                    gsPulse, gsDataSetInfo, gsBufferFile};
    for (const GSObject object : kNeeded)
        if (!product_.GSexists(object)) throw Failure{header + ": a section that the processor needs is missing"};
    BufferFile& raw = product_.bufferFile;
    std::error_code failure;
    const auto bytes = static_cast<std::int64_t>(std::filesystem::file_size(job_.raw, failure));
    if (failure || raw.rasterSize() < 0 || bytes < raw.rasterSize())
        throw Failure{job_.raw + ": not as long as its header says"};
    if (raw.getLines() != product_.roi.Roi.Lines || raw.getSamples() != product_.roi.Roi.Samples)
        throw Failure{header + ": raster and region differ in size"};
    const SamplingConstants_Obj& sampling = product_.samplingConstants;
    band_.prf_hz = sampling.prf_hz;
    band_.hamming = static_cast<double>(conf_.AzimuthWindowHammingParameter);
    band_.width_hz = sampling.Baz_hz > 0.0 ? sampling.Baz_hz : 0.8 * sampling.prf_hz;
    if (conf_.AzimuthLookBandwidth > 0.0F) band_.width_hz = static_cast<double>(conf_.AzimuthLookBandwidth);
    if (!(band_.prf_hz > 0.0 && band_.width_hz <= band_.prf_hz))
        throw Failure{header + ": no PRF, or too low a PRF"};
}

void Processor::check_memory(int lines, int samples) const {
    const double megabytes = static_cast<double>(lines) * samples * sizeof(fcomplex) / 1048576.0;
    if (megabytes > processing_.Memory)
        throw Failure{"a block takes " + std::to_string(static_cast<int>(megabytes) + 1) +
                      " MB, more than Memory"};
}

void Processor::create(DataFile& raster, const std::string& name, int lines, int samples) {
    require(raster.setFilename(name.c_str()), name + ": the name is too long");
    raster.NrOfLinesPerImage = lines;
    raster.NrOfPixelsPerLine = samples;
    raster.CellType = FLOAT_COMPLEX;
    stopwatch_.time(kWriting, [&] { require(raster.open(1), name + ": cannot be written"); });
}

void Processor::finish(DataFile& raster) {
    stopwatch_.time(kWriting,
                    [&] { require(raster.close(), std::string{raster.FileName} + ": cannot be written"); });
}

/** Lines, or a block of the image, by the place of its first sample; and what a thread has made of them. */
struct Piece {
    int line, sample;
};
struct Done {
    Piece piece;
    Block* block;
    Stopwatch stopwatch;
};

/** What a thread compresses raw lines with. */
class Processor::RangeWorker {
public:
    RangeWorker(Processor& processor, int lines)
        : processor_{processor},
          lines_{lines},
          compression_{processor.product_.pulse, processor.conf_, processor.product_.roi.Roi.Samples, lines} {
        raw_.copyDescription(processor.product_.bufferFile);
        raw_.setFilename(processor.job_.raw.c_str());
        raw_.open(BufferFile::READ);
    }
    [[nodiscard]] const RangeCompression& compression() const { return compression_; }

    Done compress(const Piece& piece) {
        Stopwatch stopwatch;
        const int count = std::min(lines_, processor_.product_.roi.Roi.Lines - piece.line);
        stopwatch.time(kReading, [&] { read(piece.line, count); });
        compression_.compress(stopwatch);
        if (processor_.core_) stopwatch.time(kWriting, [&] { keep(piece.line, count); });
        return {piece, &compression_.block(), stopwatch};
    }

private:
    void read(int first, int lines) {
        Block& block = compression_.block();
        const int count = processor_.product_.roi.Roi.Samples;
        for (int line = 0; line < lines; ++line) {
            fcomplex* samples = block.line(line);
            raw_.readbuffer(samples, first + line, 1, 0, 0);
            std::fill(samples + count, samples + block.samples(), fcomplex{});
        }
        std::fill(block.line(lines), block.line(block.lines()), fcomplex{});
    }

    void keep(int first, int lines) {
        Block& core = *processor_.core_;
        for (int line = 0; line < lines; ++line)
            std::copy_n(compression_.block().line(line), core.samples(), core.line(first + line));
    }

    Processor& processor_;
    int lines_;
    BufferFile raw_;
    RangeCompression compression_;
};

/** Writes compressed lines into the intermediate raster. */
void Processor::write_lines(Block& block, int first, int lines) {
    BufferIO region{&compressed_, 0, data_.Samples, first, lines, FLOAT_COMPLEX};
    require(region.writebuffer(reinterpret_cast<const char*>(block.data()), block.samples()),
            std::string{compressed_.FileName} + ": cannot be written");
}

/** Where the compressed data are to stand: in memory, or in a raster. */
void Processor::make_room(int lines) {
    if (processing_.Flag_incore == 0) return create(compressed_, compressed_raster(job_), lines, data_.Samples);
    check_memory(lines, data_.Samples);
    core_.emplace(lines, data_.Samples);
}

/** Compresses the raw lines. */
void Processor::compress_range() {
    const int raw_samples = product_.roi.Roi.Samples, lines = product_.roi.Roi.Lines;
    // Several in the room of a block in azimuth, which there are few of: the threads end at nearly the same time.
    const std::int64_t block_size = std::int64_t{conf_.LinesInBlock} * conf_.SamplesInBlock / 4;
    const int block_lines = static_cast<int>(std::clamp<std::int64_t>(block_size / raw_samples, 1, lines));
    check_memory(block_lines, raw_samples);
    std::vector<std::unique_ptr<RangeWorker>> workers;
    stopwatch_.time(kPlanning, [&] {
        for (int i = 0; i < job_.threads; ++i)
            workers.push_back(std::make_unique<RangeWorker>(*this, block_lines));
    });

    const RangeCompression& compression = workers.front()->compression();
    data_.SetSlowAxe(product_.roi.Roi.SlowStartTime, 1.0 / band_.prf_hz, lines);
    data_.SetFastAxe(product_.roi.Roi.FastStartTime + compression.delay_s(), product_.roi.Roi.FastTimeDelta,
                     compression.samples());
    make_room(lines);
    int line = 0;
    const auto next = [&]() -> std::optional<Piece> {
        if (line >= lines) return std::nullopt;
        return Piece{std::exchange(line, line + block_lines), 0};
    };
    const auto write = [&](const Done& done) {
        stopwatch_.add(done.stopwatch);
        const int first = done.piece.line;
        if (!core_)
            stopwatch_.time(kWriting,
                            [&] { write_lines(*done.block, first, std::min(block_lines, lines - first)); });
        progress_.show(kRangeShare * first / lines);
    };
    auto worker = workers.begin();
    blocks::in_order(
        job_.threads, next,
        [&] { return [own = (worker++)->get()](const Piece& piece) { return own->compress(piece); }; }, write);
    if (!core_) finish(compressed_);
}

/** What a thread focuses blocks with. Its orbit is as freshly read for every block, whoever had the one before. */
class Processor::AzimuthWorker {
public:
    explicit AzimuthWorker(Processor& processor)
        : processor_{processor}, focusing_{processor.layout_, processor.band_, processor.data_.FastTimeDelta} {
        const std::string header = processor.job_.raw + ".hdr", raster = compressed_raster(processor.job_);
        require(product_.GSread(header.c_str()), header + ": cannot be read");
        if (processor.core_) return;
        compressed_.copyDescription(processor.compressed_);
        require(compressed_.setFilename(raster.c_str()), raster);
        require(compressed_.open(0), raster + ": cannot be read");
    }

    Done focus(const Piece& piece) {
        Stopwatch stopwatch;
        const BlockLayout& layout = processor_.layout_;
        const ROI_Obj& data = processor_.data_;
        const int line = layout.first_line + piece.line;  // counted like raw lines
        const int first_sample = piece.sample - layout.guard_samples;
        if (piece.line != strip_line_) begin_strip(piece.line, line);
        stopwatch.time(kReading, [&] { read(line + layout.lead_lines, first_sample); });
        require(product_.orbit.computeApproximateSV(), "the orbit");
        focusing_.focus(product_, *histories_, data.FastStartTime + first_sample * data.FastTimeDelta,
                        strip_.SlowStartTime + 0.5 * strip_.SlowTimeLength, stopwatch);
        return {piece, &focusing_.block(), stopwatch};
    }

private:
    void begin_strip(int strip_line, int line) {
        const BlockLayout& layout = processor_.layout_;
        const ROI_Obj& data = processor_.data_;
        strip_line_ = strip_line;
        data.clone(&strip_);
        strip_.SetSlowAxe(data.SlowStartTime + line * data.SlowTimeDelta, data.SlowTimeDelta,
                          std::min(layout.step_lines, layout.lines - strip_line));
        require(product_.orbit.computeApproximateSV(), "the orbit");
        histories_.emplace(product_, strip_, processor_.job_.height_m);
    }

    /** Reads what there is of a block; beyond the borders there are zeros. */
    void read(int first_line, int first_sample) {
        Block& block = focusing_.block();
        const ROI_Obj& data = processor_.data_;
        const int top = std::max(0, first_line), left = std::max(0, first_sample);
        const int bottom = std::min(data.Lines, first_line + block.lines());
        const int right = std::min(data.Samples, first_sample + block.samples());
        if (bottom - top < block.lines() || right - left < block.samples())
            std::fill_n(block.data(), block.size(), fcomplex{});
        fcomplex* corner = block.line(top - first_line) + (left - first_sample);
        if (processor_.core_) {
            for (int line = top; line < bottom; ++line, corner += block.samples())
                std::copy_n(processor_.core_->line(line) + left, right - left, corner);
            return;
        }
        BufferIO region{&compressed_, left, right - left, top, bottom - top, FLOAT_COMPLEX};
        require(region.readbuffer(reinterpret_cast<char*>(corner), block.samples()),
                std::string{compressed_.FileName} + ": cannot be read");
    }

    Processor& processor_;
    AzimuthFocusing focusing_;
    GeneralSAR product_;
    DataFile compressed_;
    int strip_line_ = -1;
    ROI_Obj strip_;
    std::optional<RangeHistories> histories_;
};

/** Writes the image lines of a block. The transforms are cyclic: the image line that would stand before the block
 * stands at its end. */
void Processor::write_block(Block& block, int line, int sample) {
    const int lines = std::min(layout_.step_lines, layout_.lines - line);
    const int samples = std::min(layout_.step_samples, layout_.samples - sample);
    for (int done = 0; done < lines;) {
        const int place = ((done - layout_.lead_lines) % block.lines() + block.lines()) % block.lines();
        const int count = std::min(lines - done, block.lines() - place);
        BufferIO region{&image_, sample, samples, line + done, count, FLOAT_COMPLEX};
        require(region.writebuffer(reinterpret_cast<const char*>(block.line(place) + layout_.guard_samples),
                                   block.samples()),
                job_.image + ": cannot be written");
        done += count;
    }
}

/** Focuses the intermediate raster into the image: strip by strip of image lines, each from near to far. */
void Processor::focus_azimuth() {
    layout_ = lay_out(product_, conf_, data_, band_, job_.height_m);
    check_memory(layout_.block_lines, layout_.block_samples);
    std::vector<std::unique_ptr<AzimuthWorker>> workers;
    stopwatch_.time(kPlanning, [&] {
        for (int i = 0; i < job_.threads; ++i) workers.push_back(std::make_unique<AzimuthWorker>(*this));
    });
    create(image_, job_.image, layout_.lines, layout_.samples);
    Piece piece{0, 0};
    const auto next = [&]() -> std::optional<Piece> {
        if (piece.line >= layout_.lines) return std::nullopt;
        const Piece present = piece;
        piece.sample += layout_.step_samples;
        if (piece.sample >= layout_.samples) piece = {piece.line + layout_.step_lines, 0};
        return present;
    };
    const auto write = [&](const Done& done) {
        stopwatch_.add(done.stopwatch);
        stopwatch_.time(kWriting, [&] { write_block(*done.block, done.piece.line, done.piece.sample); });
        const int strip = std::min(layout_.step_lines, layout_.lines - done.piece.line);
        const double lines = done.piece.line + strip * static_cast<double>(done.piece.sample) / layout_.samples;
        progress_.show(kRangeShare + (1.0 - kRangeShare) * lines / layout_.lines);
    };
    auto worker = workers.begin();
    blocks::in_order(
        job_.threads, next, [&] { return [own = (worker++)->get()](const Piece& at) { return own->focus(at); }; },
        write);
    finish(image_);
    if (processing_.EraseTemp != 0 && !core_)
        stopwatch_.time(kWriting, [&] { std::filesystem::remove(compressed_.FileName); });
}

/** Writes the image's product header: that of the raw data, with what focusing changed. */
void Processor::write_header() {
    GeneralSAR& product = product_;
    product.roi.Roi.SetSlowAxe(data_.SlowStartTime + layout_.first_line * data_.SlowTimeDelta, data_.SlowTimeDelta,
                               layout_.lines);
    product.roi.Roi.SetFastAxe(data_.FastStartTime, data_.FastTimeDelta, layout_.samples);
    product.dataSetInfo.SetImageType(DataSetInfo_Obj::dsAzimuthFocused);
    product.spectralWindows.AzMatchedFilterCoef = band_.hamming;
    product.spectralWindows.RgMatchedFilterCoef = static_cast<double>(conf_.RangeWindowHammingParameter);
    product.spectralWindows.AzLookBandwidth = band_.width_hz;
    product.spectralWindows.RgLookBandwidth = product.samplingConstants.Brg_hz;
    require(product.orbit.SVGetGeoCoords(&product.geoCoords, &product.roi), "the image's corners");
    product.bufferFile.setFilename(job_.image.c_str());
    product.bufferFile.copyDescription(image_);

    product.GSdisable(gsDataFile);  // the same section as the raster's
    product.GSenable(gsSpectralWindows);
    product.GSenable(gsGeoCoords);
    write_product(product, job_.image + ".hdr");
}

FocusResult Processor::run() {
    read_header();
    compress_range();
    focus_azimuth();
    write_header();
    progress_.show(1.0);
    return {layout_.lines, layout_.samples, layout_.block_lines, layout_.block_samples, stopwatch_};
}

}  // namespace

FocusResult focus(const FocusJob& job, const AzimuthConf& azimuth, const generalProcessingConf& processing) {
    return Processor{job, azimuth, processing}.run();
}

}  // namespace example
