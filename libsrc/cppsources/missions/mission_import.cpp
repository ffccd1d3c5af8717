// SPDX-License-Identifier: Apache-2.0
#include "quo_base/mission_import.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cerrno>
#include <filesystem>
#include <functional>
#include <limits>
#include <memory>
#include <new>
#include <string>
#include <string_view>
#include <system_error>
#include <vector>

#include "diagnosticslib/call_frame.h"
#include "missions/measurement.h"
#include "missions/mission_xml.h"
#include "missions/sentinel1.h"
#include "quorelxmllib/header_session.h"
#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/file_io.h"
#include "sarutillib/ground/own_module.h"

namespace quo {
namespace {

constexpr const char* kSource = "mission_import";
namespace fs = std::filesystem;

[[noreturn]] void refuse(int status, const std::string& line) { throw MissionRefusal{status, line}; }

/** Refuses a file that could not be written, with what the system says of it. */
void require_written(int status, const BufferFile& file, const std::string& name) {
    if (status == QUO_OK) return;
    const int error = file.systemError();
    refuse(status,
           name + ": cannot be written" + (error != 0 ? ": " + std::generic_category().message(error) : ""));
}

// --- The measurement --------------------------------------------------------------------------------------------

/** The function of the module that holds libtiff: the one that QUO_TIFF_MODULE names, else the library's. */
MeasurementEntry measurement_entry() {
    const auto itself = [](MeasurementEntry entry) { return entry; };
    const char* const named = setting("QUO_TIFF_MODULE");
    MeasurementEntry entry = named ? use_module<MeasurementEntry>(named, kMeasurementEntryName, itself) : nullptr;
    if (!entry) entry = use_own_module<MeasurementEntry>("libquo_base_tiff.so", kMeasurementEntryName, itself);
    if (!entry)
        refuse(QUO_REFUSED,
               "libquo_base_tiff.so, which reads measurements, is neither beside the library in quo_base/ nor "
               "named in QUO_TIFF_MODULE");
    return entry;
}

std::unique_ptr<Measurement> open_measurement(const std::string& file, const MissionProduct& product) {
    char why[256] = "";
    std::error_code error;
    if (!fs::is_regular_file(file, error))
        refuse(QUO_REFUSED, file + ": is no regular file");  // a pipe would wait
    std::unique_ptr<Measurement> measurement{
        measurement_entry()(kMeasurementVersion, file.c_str(), why, sizeof why)};
    errno = 0;
    if (!measurement) {
        const std::string named = file + ": ";  // some of libtiff's complaints begin with the name, too
        const std::string_view said{why};
        refuse(QUO_REFUSED, named + (why + (said.starts_with(named) ? named.size() : 0)));
    }
    if (measurement->lines != product.lines || measurement->samples != product.samples)
        refuse(QUO_REFUSED, file + ": has " + std::to_string(measurement->lines) + " lines of " +
                                std::to_string(measurement->samples) + " samples, the annotation says " +
                                std::to_string(product.lines) + " of " + std::to_string(product.samples));
    if ((measurement->type != MeasuredType::kUnsignedShort) != product.is_complex)
        refuse(QUO_REFUSED, file + ": its samples are not what the annotation says");
    return measurement;
}

// --- The raster -------------------------------------------------------------------------------------------------

/** What blocks of a measurement become in the raster: complex samples as they are, unsigned ones as 32-bit
 * integers. */
class BlockWriter {
public:
    BlockWriter(const quo_import_request& request, const std::string& file, Measurement& measurement,
                BufferFile& raster)
        : request_{request}, file_{file}, measurement_{measurement}, raster_{raster} {
        const std::size_t samples =
            static_cast<std::size_t>(measurement.block_lines) * static_cast<std::size_t>(measurement.samples);
        constexpr std::size_t kMost = std::size_t{1} << 26;
        if (samples > kMost)
            refuse(QUO_REFUSED, file + ": its strips or tiles come in blocks of " + std::to_string(samples) +
                                    " samples, more than the " + std::to_string(kMost) +
                                    " that are unpacked at a time");
        block_.resize(samples * bytes_of(measurement.type));
        if (widens()) wide_.resize(samples);
    }

    void copy() {
        tell();
        for (std::int32_t block = 0; std::int64_t{block} * measurement_.block_lines < measurement_.lines; ++block)
            copy(block);
    }

private:
    void copy(std::int32_t block) {
        const std::int64_t first = std::int64_t{block} * measurement_.block_lines;
        if (!measurement_.read(block, block_.data()))
            refuse(QUO_READ_FAILED, file_ + ": is cut short or damaged at line " + std::to_string(first));
        const auto lines =
            static_cast<std::size_t>(std::min<std::int64_t>(measurement_.block_lines, measurement_.lines - first));
        const std::size_t samples = lines * static_cast<std::size_t>(measurement_.samples);
        if (!widens()) return write(block_.data(), samples * bytes_of(measurement_.type));
        const auto* const narrow = reinterpret_cast<const std::uint16_t*>(block_.data());
        std::copy_n(narrow, samples, wide_.begin());
        write(reinterpret_cast<const char*>(wide_.data()), samples * sizeof wide_[0]);
    }
    [[nodiscard]] bool widens() const { return measurement_.type == MeasuredType::kUnsignedShort; }
    void write(const char* bytes, std::size_t count) {
        constexpr std::size_t kPiece = 1 << 24;  // the raster counts bytes in an int
        for (std::size_t done = 0; done < count; done += kPiece) {
            const std::size_t piece = std::min(kPiece, count - done);
            raster_.write(bytes + done, static_cast<int>(piece));
            require_written(raster_.status(), raster_, request_.raster);
            written_ += static_cast<std::int64_t>(piece);
            tell();
        }
    }
    void tell() const {
        if (request_.progress && request_.progress(request_.context, written_, raster_.rasterSize()) != 0)
            refuse(QUO_REFUSED, std::string{request_.raster} + ": the import was ended");
    }

    const quo_import_request& request_;
    const std::string& file_;
    Measurement& measurement_;
    BufferFile& raster_;
    std::int64_t written_ = 0;  // bytes
    std::vector<char> block_;
    std::vector<std::int32_t> wide_;
};

int cell_type(MeasuredType type) {
    switch (type) {
        case MeasuredType::kShortComplex:
            return SHORT_COMPLEX;
        case MeasuredType::kFloatComplex:
            return FLOAT_COMPLEX;
        case MeasuredType::kUnsignedShort:
            return INT32;
    }
    return CELL_NOT_SET;
}

void describe_raster(const Measurement& measurement, const char* name, BufferFile& raster) {
    raster.setFilename(name);
    raster.setLines(measurement.lines);
    raster.setSamples(measurement.samples);
    raster.setType(cell_type(measurement.type));
}

/** A link in the place of the raster, whose old file stays beside it until the link is kept. */
class LinkedRaster {
public:
    LinkedRaster(const std::string& measurement, const std::string& raster)
        : raster_{raster}, beside_{raster + ".link." + std::to_string(getpid())} {
        std::error_code error;
        const fs::path target = fs::absolute(measurement, error);
        if (!error) fs::create_symlink(target, beside_, error);
        if (!error) put_in_place(error);
        errno = 0;
        if (!error) return;
        remove(beside_);
        refuse(QUO_WRITE_FAILED, raster + ": cannot be made a link: " + error.message());
    }
    /** Unless it is kept, the raster is again what it was. */
    ~LinkedRaster() {
        if (!kept_ && exchanged_) (void)exchange();
        remove(kept_ || exchanged_ ? beside_ : raster_);
        errno = 0;
    }
    LinkedRaster(LinkedRaster&&) = delete;
    void keep() { kept_ = true; }

private:
    [[nodiscard]] bool exchange() const {
        return renameat2(AT_FDCWD, beside_.c_str(), AT_FDCWD, raster_.c_str(), RENAME_EXCHANGE) == 0;
    }
    void put_in_place(std::error_code& error) {
        std::error_code unknown;
        const fs::file_type there = fs::symlink_status(raster_, unknown).type();
        if (there == fs::file_type::not_found) return fs::rename(beside_, raster_, error);
        if (there != fs::file_type::regular && there != fs::file_type::symlink) {
            error = std::make_error_code(std::errc::file_exists);
            return;
        }
        exchanged_ = exchange();
        if (!exchanged_) error.assign(errno, std::generic_category());
    }
    static void remove(const std::string& file) {
        std::error_code ignored;
        fs::remove(file, ignored);
    }

    std::string raster_, beside_;
    bool exchanged_ = false, kept_ = false;
};

// --- The header -------------------------------------------------------------------------------------------------

/** The antenna pattern is a raster of its own, beside the product's: its header object takes the raster of its
 * header for the pattern. It takes its place after the product, so that an older one stays as long as that does.
 */
class PatternRaster {
public:
    PatternRaster(const std::string& name, AntennaPattern_Obj& pattern)
        : name_{name}, header_{name + ".hdr"}, pattern_{pattern}, raster_{name.c_str()} {
        if (pattern.PatternSamples == 0) return;
        raster_.setLines(1);
        raster_.setSamples(pattern.PatternSamples);
        raster_.setType(FLOAT32);
        require(raster_.create());
        raster_.writebuffer(pattern.Pattern.data(), 0, 1, 0, 0);
        require(raster_.status());
    }
    void commit() {
        if (pattern_.PatternSamples == 0) return remove_older();
        const HeaderSession session{header_.c_str()};
        require(pattern_.writehdr(header_.c_str()));
        require(raster_.commit());
    }

private:
    /** The pattern of a product that was imported under this name before. */
    void remove_older() const {
        std::error_code error;
        AntennaPattern_Obj older;  // what somebody else has called so is none
        if (!fs::exists(header_, error) || older.readhdr(header_.c_str()) != QUO_OK) return;
        for (const std::string& file : {name_, header_})
            if (!error) fs::remove(file, error);
        errno = 0;
        if (error) refuse(QUO_WRITE_FAILED, name_ + ": an older import's, cannot be removed: " + error.message());
    }
    void require(int status) const {
        require_written(status, raster_, name_ + ", the raster of the product's antenna pattern");
    }

    std::string name_, header_;
    AntennaPattern_Obj& pattern_;
    BufferFile raster_;
};

/** Refuses to replace a file of the product itself, and what a link leads to: an older import may have left one to
 * a measurement. Only a link takes the place of a link. */
void require_apart(const quo_import_request& request, const MissionFiles& files) {
    const std::string raster = request.raster, orbit{text_or_empty(request.orbit_file)};
    std::error_code unknown;
    if (request.link == 0 && fs::is_symlink(raster, unknown))
        refuse(QUO_REFUSED, raster + ": is a link to " + fs::read_symlink(raster, unknown).string() +
                                ", whose samples would be replaced; remove it first, or name another raster");
    for (const std::string& out : {raster, raster + ".hdr", raster + ".antenna", raster + ".antenna.hdr"})
        for (const std::string& in : {files.measurement, files.annotation, files.manifest, orbit}) {
            std::error_code error;
            const bool renewed = request.link != 0 && out == raster && fs::is_symlink(out, error);
            if (!in.empty() && !renewed && fs::equivalent(in, out, error) && !error)
                refuse(QUO_REFUSED, std::string{out}.append(": is, or is a link to, ").append(in));
        }
    errno = 0;
}

void link_product(const MissionFiles& files, const Measurement& measurement, const std::string& raster_name,
                  BufferFile& raster, const std::function<void()>& describe) {
    if (measurement.plain_from < 0 || measurement.plain_from > std::numeric_limits<std::int32_t>::max() ||
        measurement.type == MeasuredType::kUnsignedShort)
        refuse(QUO_REFUSED,
               files.measurement + ": its samples cannot be used where they are; import without a link");
    raster.HeaderOffset = measurement.plain_from;
    raster.ByteOrder = measurement.big_endian ? 1 : 0;
    if (file_length(files.measurement.c_str()).value_or(0) < raster.rasterSize())
        refuse(QUO_READ_FAILED, files.measurement + ": is cut short");
    const std::string header = raster_name + ".hdr";
    HeaderSession session{header.c_str()};
    describe();
    AtomicFile side{header.c_str()};
    if (!side.good() || !session.save(side)) refuse(QUO_WRITE_FAILED, header + ": cannot be written");
    LinkedRaster link{files.measurement, raster_name};
    if (!side.commit()) refuse(QUO_WRITE_FAILED, header + ": cannot be written");
    link.keep();
}

void import_product(const MissionReader& reader, const quo_import_request& request, quo_import_result& result) {
    const auto given = [](const char* text) { return std::string{text ? text : ""}; };
    const std::string raster_name = request.raster, header = raster_name + ".hdr";
    const MissionFiles files = reader.find(request.source, given(request.swath), given(request.polarization));
    require_apart(request, files);
    const auto product = std::make_unique<MissionProduct>();
    reader.describe(files, given(request.orbit_file), *product);
    const auto measurement = open_measurement(files.measurement, *product);

    BufferFile& raster = product->header.bufferFile;
    describe_raster(*measurement, request.raster, raster);
    // Before the pattern's, so that a folder that takes no files is told of the name that was asked for.
    BufferFile copy;
    copy.clone(&raster);
    if (request.link == 0) require_written(copy.create(), copy, raster_name);
    PatternRaster pattern{raster_name + ".antenna", product->header.antennaPattern};
    const auto describe = [&] {
        product->header.GSenable(gsBufferFile);
        write_mission_header(*product, header);
    };
    if (request.link != 0) {
        link_product(files, *measurement, raster_name, raster, describe);
    } else {
        BlockWriter{request, files.measurement, *measurement, copy}.copy();
        const HeaderSession session{header.c_str()};
        describe();
        require_written(copy.commit(), copy, raster_name);
    }
    pattern.commit();
    result.lines = product->lines;
    result.samples = product->samples;
    result.linked = request.link != 0 ? 1 : 0;
    result.ties = product->ties;
}

/** What every mission's function of the interface does. */
int import_from(const MissionReader& reader, const char* function, const quo_import_request* request,
                quo_import_result* result) noexcept {
    CallFrame frame{function, kSource};
    if (!result) return frame.fail(QUO_REFUSED, "There is no place for the result");
    *result = {};
    const auto fail = [&](int status, const char* line) {
        copy_bounded(result->message, line);
        return frame.fail(status, line);
    };
    if (!request || text_or_empty(request->source).empty() || text_or_empty(request->raster).empty())
        return fail(QUO_REFUSED, "The product or the raster has no name");
    try {
        import_product(reader, *request, *result);
        return frame.success();
    } catch (const MissionRefusal& refusal) {
        return fail(refusal.status(), refusal.what());
    } catch (const std::bad_alloc&) {
        return fail(QUO_NO_MEMORY, "Memory allocation failure");
    } catch (const std::exception& other) {  // std::filesystem, of a name that it cannot take
        return fail(QUO_REFUSED, other.what());
    }
}

}  // namespace
}  // namespace quo

int quo_import_sentinel1(const quo_import_request* request, quo_import_result* result) noexcept {
    return quo::import_from(quo::kSentinel1, "quo_import_sentinel1", request, result);
}
