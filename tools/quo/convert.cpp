#include <complex>
#include <memory>
#include <vector>

#include "commands.h"
#include "failure.h"
#include "interrupt.h"
#include "progress.h"
#include "raster.h"

namespace tool {
namespace {

struct ConvertOptions {
    std::string in, out, type, order, lines = ":", samples = ":", prefix = "keep";
};

/** The part of a raster that is copied, block by block. */
class Conversion {
public:
    Conversion(const ConvertOptions& options, const DataFile& description)
        : name_{options.in},
          in_{options.in.c_str()},
          lines_{cut_of(options.lines, description.NrOfLinesPerImage, "--lines")},
          samples_{cut_of(options.samples, description.NrOfPixelsPerLine, "--samples")},
          out_{options.out, description} {
        in_.copyDescription(description);
        BufferFile& out = out_.file();
        out.HeaderOffset = 0;
        out.NrOfLinesPerImage = lines_.count();
        out.NrOfPixelsPerLine = samples_.count();
        if (!options.type.empty()) out.CellType = type_of(options.type);
        if (!options.order.empty()) out.ByteOrder = options.order == "m" ? 1 : 0;
        if (options.prefix == "drop") out.RowPrefix = 0;
        if (in_.is_complex() != 0 && out.is_complex() == 0) {
            throw WrongUse("--type " + type_name(out.CellType) + ": complex samples do not become real ones");
        }
    }

    void run() {
        in_.open(BufferFile::READ);
        if (!in_.is_open()) throw Failure(name_ + ": cannot be opened");
        out_.open();
        const int per_block = block_lines(std::int64_t{samples_.count()} * 16, lines_.count());
        Progress progress{Progress::Unit::kBytes};
        const std::int64_t bytes_per_line = std::int64_t{samples_.count()} * out_.file().element_sizeof();
        for (int done = 0; done < lines_.count(); done += per_block) {
            throw_if_interrupted();
            const int lines = std::min(per_block, lines_.count() - done);
            copy_block(done, lines);
            progress.step((done + lines) * bytes_per_line, lines_.count() * bytes_per_line);
        }
        out_.commit();
    }

private:
    void copy_block(int first, int lines) {
        if (out_.file().RowPrefix > 0) copy_prefixes(first, lines);
        const int type = out_.file().CellType;
        if (type == in_.CellType && type >= INT8_COMPLEX) {
            copy_bytes(first, lines);
        } else if (type >= INT8_COMPLEX || in_.CellType >= INT8_COMPLEX) {
            throw WrongUse("8-bit samples are copied as they are, not converted");
        } else if (out_.file().is_complex() != 0 && in_.is_complex() == 0) {
            copy_as_complex(first, lines);
        } else if (out_.file().is_complex() != 0) {
            copy_samples<dcomplex>(first, lines);
        } else if (type == FLOAT32) {
            copy_samples<float>(first, lines);
        } else {
            copy_samples<double>(first, lines);
        }
    }

    template <typename T>
    void copy_samples(int first, int lines) {
        std::vector<T> block(static_cast<std::size_t>(lines) * static_cast<std::size_t>(samples_.count()));
        in_.readbuffer(block.data(), lines_.first + first, lines, samples_.first, samples_.count());
        out_.file().writebuffer(block.data(), first, lines, 0, 0);
    }

    void copy_as_complex(int first, int lines) {
        std::vector<double> real(static_cast<std::size_t>(lines) * static_cast<std::size_t>(samples_.count()));
        in_.readbuffer(real.data(), lines_.first + first, lines, samples_.first, samples_.count());
        const std::vector<dcomplex> block(real.begin(), real.end());
        out_.file().writebuffer(block.data(), first, lines, 0, 0);
    }

    // 8-bit samples have no byte order: their bytes are moved line by line.
    void copy_bytes(int first, int lines) {
        BufferFile& out = out_.file();
        std::vector<char> line(static_cast<std::size_t>(samples_.count()) *
                               static_cast<std::size_t>(out.element_sizeof()));
        const auto move = [](BufferFile& file, std::int64_t to) {
            file.seek(to - file.tell(), BufferFile::FROM_CURRENT);
        };
        const auto offset = [](const BufferFile& file, std::int64_t l, std::int64_t s) {
            return file.HeaderOffset +
                   l * (std::int64_t{file.NrOfPixelsPerLine} * file.element_sizeof() + file.RowPrefix) +
                   file.RowPrefix + s * file.element_sizeof();
        };
        for (int i = 0; i < lines; ++i) {
            move(in_, offset(in_, lines_.first + first + i, samples_.first));
            in_.read(line.data(), static_cast<int>(line.size()));
            move(out, offset(out, first + i, 0));
            out.write(line.data(), static_cast<int>(line.size()));
        }
    }

    void copy_prefixes(int first, int lines) {
        std::vector<char> prefixes(static_cast<std::size_t>(lines) * static_cast<std::size_t>(in_.RowPrefix));
        in_.readprefix(prefixes.data(), lines_.first + first, lines);
        out_.file().writeprefix(prefixes.data(), first, lines);
    }

    std::string name_;
    BufferFile in_;
    Cut lines_, samples_;
    NewRaster out_;
};

int convert(const ConvertOptions& options) {
    DataFile description;
    read_description(options.in, description);
    note_interrupts();
    Conversion{options, description}.run();
    return kFine;
}

}  // namespace

void add_convert(CLI::App& app, Job& job) {
    auto options = std::make_shared<ConvertOptions>();
    CLI::App* command = app.add_subcommand("convert", "Cuts and converts a raster of any size");
    command->add_option("IN", options->in, "Raster with a side file IN.hdr")->required();
    command->add_option("OUT", options->out, "Raster to write; its side file is written last")->required();
    command->add_option("--type", options->type, "Cell type of OUT, such as FLOAT32 or SHORT_COMPLEX");
    command->add_option("--order", options->order, "Byte order of OUT: l little-endian, m big-endian")
        ->check(CLI::IsMember({"l", "m"}));
    command->add_option("--lines", options->lines, "Lines A:B, counted from 0, B excluded");
    command->add_option("--samples", options->samples, "Samples A:B of each line");
    command->add_option("--prefix", options->prefix, "Line prefixes: keep (default) or drop")
        ->check(CLI::IsMember({"keep", "drop"}));
    command->callback([options, &job] { job = [options] { return convert(*options); }; });
}

}  // namespace tool
