// SPDX-License-Identifier: Apache-2.0

// Blocks of 512 lines x 8192 samples from and to the page cache, beside bare pread and pwrite of the same bytes
// and, where its headers are installed, beside GDAL; and small buffered reads beside memcpy.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <unistd.h>

#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <string>
#include <vector>

#include "quo_base/ckerr.h"
#include "quo_base/datafile.h"
#include "ratio_reporter.h"
#ifdef QUO_HAVE_GDAL
#include <gdal.h>
#endif

namespace {

constexpr int kLines = 512, kSamples = 8192, kBlocks = 8;

/** A raster in a temporary file, big-endian, gone at exit. */
struct TemporaryRaster {
    explicit TemporaryRaster(int type) {
        char name[] = "/tmp/quo_raster_bench_XXXXXX";
        const int descriptor = mkstemp(name);
        path = name;
        file.NrOfLinesPerImage = kLines * kBlocks;
        file.NrOfPixelsPerLine = kSamples;
        file.CellType = type;
        file.ByteOrder = 1;
        file.setFilename(name);
        bytes = static_cast<std::size_t>(kLines) * kSamples * static_cast<std::size_t>(file.pixelsizeof());
        const std::vector<char> zeros(bytes, 1);
        for (int i = 0; i < kBlocks; ++i) {
            if (write(descriptor, zeros.data(), bytes) != static_cast<ssize_t>(bytes)) std::abort();
        }
        close(descriptor);
    }
    ~TemporaryRaster() {
        file.close();
        unlink(path.c_str());
    }
    TemporaryRaster(const TemporaryRaster&) = delete;
    TemporaryRaster& operator=(const TemporaryRaster&) = delete;
    std::string path;
    BufferFile file;
    std::size_t bytes;  // of a block
};

void count(benchmark::State& state, std::size_t bytes) {
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * static_cast<int64_t>(bytes));
}

template <typename T, int Type>
void read_block(benchmark::State& state) {
    TemporaryRaster raster{Type};
    std::vector<T> block(static_cast<std::size_t>(kLines) * kSamples);
    raster.file.open(BufferFile::READ);
    int next = 0;
    for (auto _ : state) {
        raster.file.readbuffer(block.data(), kLines * (next++ % kBlocks), kLines, 0, 0);
        benchmark::DoNotOptimize(block.data());
    }
    count(state, raster.bytes);
}

template <int Type>
void read_bare(benchmark::State& state) {
    const TemporaryRaster raster{Type};
    std::vector<char> block(raster.bytes);
    const int descriptor = open(raster.path.c_str(), O_RDONLY);
    int next = 0;
    for (auto _ : state) {
        const auto offset = static_cast<off_t>(raster.bytes) * (next++ % kBlocks);
        if (pread(descriptor, block.data(), block.size(), offset) < 0) state.SkipWithError("pread");
        benchmark::DoNotOptimize(block.data());
    }
    close(descriptor);
    count(state, raster.bytes);
}

template <typename T, int Type>
void write_block(benchmark::State& state) {
    TemporaryRaster raster{Type};
    const std::vector<T> block(static_cast<std::size_t>(kLines) * kSamples, T(1.25F));
    raster.file.open(BufferFile::READ_WRITE);
    int next = 0;
    for (auto _ : state) raster.file.writebuffer(block.data(), kLines * (next++ % kBlocks), kLines, 0, 0);
    count(state, raster.bytes);
}

template <int Type>
void write_bare(benchmark::State& state) {
    const TemporaryRaster raster{Type};
    const std::vector<char> block(raster.bytes, 1);
    const int descriptor = open(raster.path.c_str(), O_WRONLY);
    int next = 0;
    for (auto _ : state) {
        const auto offset = static_cast<off_t>(raster.bytes) * (next++ % kBlocks);
        if (pwrite(descriptor, block.data(), block.size(), offset) < 0) state.SkipWithError("pwrite");
    }
    close(descriptor);
    count(state, raster.bytes);
}

#ifdef QUO_HAVE_GDAL
/** The raster as GDAL sees it. */
class GdalBand {
public:
    GdalBand(const TemporaryRaster& raster, const char* type) : description_{raster.path + ".vrt"} {
        GDALAllRegister();
        // Every block comes from the page cache, as for the other readers: what GDAL keeps itself is less than the
        // file.
        GDALSetCacheMax64(std::int64_t{1} << 25);
        const std::string size = std::to_string(raster.file.pixelsizeof());
        std::ofstream{description_} << "<VRTDataset rasterXSize=\"" << kSamples << "\" rasterYSize=\""
                                    << kLines * kBlocks << "\"><VRTRasterBand dataType=\"" << type
                                    << "\" band=\"1\" subClass=\"VRTRawRasterBand\"><SourceFilename>"
                                    << raster.path << "</SourceFilename><PixelOffset>" << size
                                    << "</PixelOffset><LineOffset>" << kSamples * raster.file.pixelsizeof()
                                    << "</LineOffset><ByteOrder>MSB</ByteOrder></VRTRasterBand></VRTDataset>";
        data_set_ = GDALOpen(description_.c_str(), GA_Update);
    }
    ~GdalBand() {
        if (data_set_) GDALClose(data_set_);
        unlink(description_.c_str());
    }
    GdalBand(const GdalBand&) = delete;
    GdalBand& operator=(const GdalBand&) = delete;

    bool read(int block, void* to, GDALDataType type) const { return move(GF_Read, block, to, type); }
    bool write(int block, void* from, GDALDataType type) const {
        const bool written = move(GF_Write, block, from, type);
        if (written) GDALFlushCache(data_set_);
        return written;
    }

private:
    bool move(GDALRWFlag way, int block, void* memory, GDALDataType type) const {
        return data_set_ && GDALRasterIO(GDALGetRasterBand(data_set_, 1), way, 0, kLines * block, kSamples, kLines,
                                         memory, kSamples, kLines, type, 0, 0) == CE_None;
    }

    std::string description_;
    GDALDatasetH data_set_ = nullptr;
};

template <typename T, int Type, bool (GdalBand::*Move)(int, void*, GDALDataType) const>
void move_with_gdal(benchmark::State& state) {
    const TemporaryRaster raster{Type};
    const bool is_complex = Type == SHORT_COMPLEX;
    const GdalBand band{raster, is_complex ? "CInt16" : "Float32"};
    std::vector<T> block(static_cast<std::size_t>(kLines) * kSamples, T(1.25F));
    int next = 0;
    for (auto _ : state) {
        if (!(band.*Move)(next++ % kBlocks, block.data(), is_complex ? GDT_CFloat32 : GDT_Float32))
            state.SkipWithError("GDAL");
        benchmark::DoNotOptimize(block.data());
    }
    count(state, raster.bytes);
}
BENCHMARK(move_with_gdal<fcomplex, SHORT_COMPLEX, &GdalBand::read>)->Name("gdal_short_complex");
BENCHMARK(move_with_gdal<float, FLOAT32, &GdalBand::read>)->Name("gdal_float");
BENCHMARK(move_with_gdal<fcomplex, SHORT_COMPLEX, &GdalBand::write>)->Name("gdal_write_short_complex");
#endif

// Not a constant for the compiler: both sides copy pieces of a length told at run time.
volatile int piece_length = 512;
void read_pieces(benchmark::State& state) {
    TemporaryRaster raster{FLOAT32};
    const int length = piece_length;
    char piece[512];
    for (auto _ : state) {
        raster.file.open(BufferFile::READ);
        raster.file.initbuffer(1 << 16, 0);
        while (raster.file.read(piece, length) == length) benchmark::DoNotOptimize(piece);
    }
    count(state, raster.bytes * kBlocks);
}
// As many pieces, of as many different bytes.
void copy_pieces(benchmark::State& state) {
    const std::vector<char> file(std::size_t{kBlocks} * kLines * kSamples * 4, 1);
    const auto length = static_cast<std::size_t>(piece_length);
    char piece[512];
    for (auto _ : state) {
        for (std::size_t at = 0; at < file.size(); at += length) {
            std::memcpy(piece, file.data() + at, length);
            benchmark::DoNotOptimize(piece);
        }
    }
    count(state, file.size());
}

BENCHMARK(read_block<fcomplex, SHORT_COMPLEX>)->Name("read_short_complex");
BENCHMARK(read_bare<SHORT_COMPLEX>)->Name("pread_short_complex");
BENCHMARK(read_block<float, FLOAT32>)->Name("read_float");
BENCHMARK(read_bare<FLOAT32>)->Name("pread_float");
BENCHMARK(write_block<fcomplex, SHORT_COMPLEX>)->Name("write_short_complex");
BENCHMARK(write_bare<SHORT_COMPLEX>)->Name("pwrite_short_complex");
BENCHMARK(read_pieces);
BENCHMARK(copy_pieces);

}  // namespace

int main(int argc, char** argv) {
    init_ckerr_locking();
    const int status = bench::run(
        argc, argv,
        {{"read SHORT_COMPLEX to fcomplex / pread", "read_short_complex", "pread_short_complex", 1.0 / 0.45},
         {"read FLOAT32 swapped / pread", "read_float", "pread_float", 1.0 / 0.75},
         {"read SHORT_COMPLEX to fcomplex / GDAL", "read_short_complex", "gdal_short_complex", 0.25},
         {"read FLOAT32 swapped / GDAL", "read_float", "gdal_float", 0.25},
         {"write fcomplex to SHORT_COMPLEX / pwrite", "write_short_complex", "pwrite_short_complex", 2.0},
         {"write fcomplex to SHORT_COMPLEX / GDAL", "write_short_complex", "gdal_write_short_complex", 0.33},
         {"buffered pieces of 512 bytes / memcpy", "read_pieces", "copy_pieces", 2.0}});
    exit_ckerr();
    return status;
}
