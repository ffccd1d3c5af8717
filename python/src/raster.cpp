// SPDX-License-Identifier: Apache-2.0
#include "raster.h"

#include <pybind11/stl.h>

#include <algorithm>
#include <cstdint>
#include <mutex>
#include <optional>
#include <string>

#include "arrays.h"
#include "errors.h"
#include "quo_base/datafile.h"
#include "quo_base/product.h"

namespace quo_python {

namespace {

/** A rectangle of a raster, counted from 0. */
struct Block {
    int first_line, lines, first_sample, samples;
};

/** A raster that is read; any number of threads may do so at a time. */
class Reader {
public:
    /** The raster that `header` describes or, where `raster` is given, the one of that name. */
    Reader(const std::string& header, const std::optional<std::string>& raster)
        : reading_{"reading " + raster.value_or(header.substr(0, std::max(header.size(), kSuffix) - kSuffix))} {
        run("opening a raster", [&] {
            if (const int status = quo_product_open(header.c_str(), raster ? raster->c_str() : nullptr, &product_))
                return status;
            return quo_product_raster(product_, &lines_, &samples_, &cell_type_);
        });
        if (cell_type_ == CELL_NOT_SET) raise(QUO_REFUSED, "the product has no raster");
    }
    ~Reader() {
        if (product_) (void)quo_product_close(product_);
    }
    Reader(Reader&&) = delete;

    [[nodiscard]] int lines() const { return lines_; }
    [[nodiscard]] int samples() const { return samples_; }
    [[nodiscard]] int cell_type() const { return cell_type_; }

    /** Fills an array whose bytes are the block's samples in `cell_type`. */
    void read(const Block& block, int cell_type, py::array to) const {
        if (!to.writeable() || (to.flags() & py::array::c_style) == 0)
            throw py::value_error("a writable C-contiguous array is needed");
        void* const bytes = to.mutable_data();
        const auto room = static_cast<std::size_t>(to.nbytes());
        run(reading_.c_str(), [&] {
            return quo_product_read(product_, block.first_line, block.lines, block.first_sample, block.samples,
                                    cell_type, bytes, room);
        });
    }

private:
    static constexpr std::size_t kSuffix = 4;  // of a header's name beside its raster's
    std::string reading_;
    quo_product* product_ = nullptr;
    int32_t lines_ = 0, samples_ = 0, cell_type_ = CELL_NOT_SET;
};

void need_samples(const py::array& from, const Block& block) {
    need_dimensions(from, 2);
    if (from.shape(0) != block.lines || from.shape(1) != block.samples || (from.flags() & py::array::c_style) == 0)
        throw py::value_error("a C-contiguous array of the block's shape is needed");
}

/** Writes a block into a raster that is there, converted into its type. */
void overwrite(const std::string& raster, const Block& block, int cell_type, const py::array& from) {
    need_samples(from, block);
    const auto* const samples = static_cast<const char*>(from.data());
    run("writing a raster", [&] {
        DataFile file;
        if (const int status = file.read_hdr(raster.c_str())) return status;
        if (block.first_sample < 0 || block.samples > file.NrOfPixelsPerLine - block.first_sample)
            return int{QUO_REFUSED};
        if (const int status = file.open(2)) return status;
        const int written =
            BufferIO{&file, block.first_sample, block.samples, block.first_line, block.lines, cell_type}
                .writebuffer(samples);
        const int closed = file.close();
        return written ? written : closed;
    });
}

/** A new raster, which appears with its description when it is complete, or not at all. */
class Writer {
public:
    Writer(const std::string& name, int lines, int samples, int cell_type, bool big_endian, int row_prefix) {
        file_.setFilename(name.c_str());
        file_.setLines(lines);
        file_.setSamples(samples);
        file_.setType(cell_type);
        file_.setRowPrefix(row_prefix);
        file_.ByteOrder = big_endian ? 1 : 0;
        if (file_.rasterSize() < 0) raise(QUO_REFUSED, "the description makes no raster");
        run_on_file("creating a raster", [&] { return file_.create(); });
        created_ = true;
    }

    /** Writes samples that are in the file's own type and byte order. */
    void write(int first_line, int first_sample, const py::array& from) {
        const Block block{first_line, int_size(from.shape(0)), first_sample, int_size(from.shape(1))};
        need_samples(from, block);
        if (from.itemsize() != file_.pixelsizeof()) throw py::type_error("samples of another size");
        if (first_line < 0 || first_sample < 0 || block.lines > file_.getLines() - first_line ||
            block.samples > file_.getSamples() - first_sample)
            throw py::index_error("the block is not within the raster");
        const auto* const samples = static_cast<const char*>(from.data());
        run_on_file("writing a raster", [&] { return write_lines(block, samples); });
    }
    void commit() {
        run_on_file("completing a raster", [&] { return file_.commit(); });
    }
    void discard() {
        const std::lock_guard guard{writing_};
        file_.close();
    }

private:
    /** One thread at a time; the file itself knows what the system refused it. */
    template <typename Call>
    void run_on_file(const char* doing, Call call) {
        bool gone = false;
        Failure failure = attempt([&] {
            const std::lock_guard guard{writing_};
            gone = created_ && !file_.is_open();
            return gone ? int{QUO_REFUSED} : call();
        });
        if (failure.status == QUO_OK) return;
        failure.system_error = file_.systemError();
        raise(failure, gone ? "the raster is complete or given up" : doing);
    }
    int write_lines(const Block& block, const char* samples) {
        const std::int64_t size = file_.pixelsizeof(), row = file_.getSamples() * size + file_.getRowPrefix();
        const std::int64_t bytes = block.samples * size;
        for (int i = 0; i < block.lines; ++i) {
            move_to((block.first_line + i) * row + file_.getRowPrefix() + block.first_sample * size);
            if (const int status = write_bytes(samples + i * bytes, bytes)) return status;
        }
        return file_.status();
    }
    /** An offset of 0 moves nothing, so the way is counted from the place. */
    void move_to(std::int64_t place) { file_.seek(place - file_.tell(), BufferFile::FROM_CURRENT); }
    int write_bytes(const char* from, std::int64_t count) {
        while (count > 0) {
            const int part = static_cast<int>(std::min<std::int64_t>(count, 1 << 30));
            if (file_.write(from, part) != part) return file_.status() ? file_.status() : int{QUO_WRITE_FAILED};
            from += part;
            count -= part;
        }
        return QUO_OK;
    }

    BufferFile file_;
    bool created_ = false;
    std::mutex writing_;
};

}  // namespace

void bind_raster(py::module_& module) {
    py::class_<Reader>(module, "RasterReader")
        .def(py::init<const std::string&, const std::optional<std::string>&>())
        .def_property_readonly("lines", &Reader::lines)
        .def_property_readonly("samples", &Reader::samples)
        .def_property_readonly("cell_type", &Reader::cell_type)
        .def("read", [](const Reader& self, int line, int lines, int sample, int samples, int cell_type,
                        const py::array& to) {
            self.read({line, lines, sample, samples}, cell_type, to);
        });
    py::class_<Writer>(module, "RasterWriter")
        .def(py::init<const std::string&, int, int, int, bool, int>())
        .def("write", &Writer::write)
        .def("commit", &Writer::commit)
        .def("discard", &Writer::discard, py::call_guard<py::gil_scoped_release>());
    module.def("overwrite", [](const std::string& raster, int line, int lines, int sample, int samples,
                               int cell_type, const py::array& from) {
        overwrite(raster, {line, lines, sample, samples}, cell_type, from);
    });
}

}  // namespace quo_python
