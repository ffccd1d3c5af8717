#ifndef QUO_TOOL_RASTER_H
#define QUO_TOOL_RASTER_H

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include "quo_base/datafile.h"

namespace tool {

/** Reads a raster's side file and makes sure that the raster is there and as long as described. Throws Failure. */
void read_description(const std::string& name, DataFile& raster);

/** Name of a cell type as in side files ("INT32_COMPLEX" for the one without a name there), or its number. */
std::string type_name(int cell_type);
/** The cell type of a name in any letter case. Throws WrongUse for another. */
int type_of(std::string_view name);

/** Part of an axis: first index and the one after the last. */
struct Cut {
    int first, last;
    [[nodiscard]] int count() const { return last - first; }
};
/** Reads "A:B", each end optional, counted from 0, B excluded. Throws WrongUse where it is no part of 0..length.
 */
Cut cut_of(std::string_view text, int length, const char* option);

/** How many lines make a block of some megabytes. */
int block_lines(std::int64_t bytes_per_line, int lines);

/** A raster under construction: written beside its final name, named and described by commit(). Whatever happens
 * before, an older raster of that name stays whole and the unfinished one is taken away. */
class NewRaster {
public:
    /** The description is `like` but for what the caller changes in file() before the first write. */
    NewRaster(const std::string& name, const RasterDescription& like);
    ~NewRaster();
    NewRaster(const NewRaster&) = delete;
    NewRaster& operator=(const NewRaster&) = delete;

    BufferFile& file() { return file_; }
    /** Creates the file, of its final length. */
    void open();
    /** The raster is complete: it takes its name, then its side file is written. */
    void commit();

private:
    std::string name_, unfinished_;
    BufferFile file_;
};

}  // namespace tool

#endif
