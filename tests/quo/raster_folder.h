// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_QUO_RASTER_FOLDER_H
#define QUO_TESTS_QUO_RASTER_FOLDER_H

#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <set>
#include <string>

#include "support/raster.h"
#include "tool.h"

namespace test {

/** A folder with rasters of part_value(). */
class RasterFolder : public testing::Test {
protected:
    /** Writes raster and side file; returns the raster's name. */
    std::string make(const char* name, int lines, int samples, int type, int order, int prefix = 0,
                     int offset = 0) {
        DataFile raster;
        describe(raster, name, lines, samples, type, order);
        raster.RowPrefix = prefix;
        raster.HeaderOffset = offset;
        write_text(raster.FileName, raster_bytes(raster));
        EXPECT_EQ(raster.write_hdr(), 0);
        return raster.FileName;
    }
    /** The same of zeros that take no room on the disk. */
    std::string make_sparse(const char* name, int lines, int samples, int type) {
        DataFile raster;
        describe(raster, name, lines, samples, type, 0);
        write_text(raster.FileName, "");
        std::filesystem::resize_file(raster.FileName, static_cast<std::uintmax_t>(raster.rasterSize()));
        EXPECT_EQ(raster.write_hdr(), 0);
        return raster.FileName;
    }
    [[nodiscard]] std::set<std::string> files() const {
        std::set<std::string> names;
        for (const auto& entry : std::filesystem::directory_iterator{folder_.path()}) {
            names.insert(entry.path().filename().string());
        }
        return names;
    }
    [[nodiscard]] std::string file(std::string_view name) const { return folder_.file(name); }

    TemporaryFolder folder_;

private:
    void describe(DataFile& raster, const char* name, int lines, int samples, int type, int order) const {
        raster.setFilename(file(name).c_str());
        raster.NrOfLinesPerImage = lines;
        raster.NrOfPixelsPerLine = samples;
        raster.CellType = type;
        raster.ByteOrder = order;
    }
};

}  // namespace test

#endif
