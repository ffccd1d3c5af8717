// SPDX-License-Identifier: Apache-2.0
#include "quo_base/datafile.h"

#include "support/diagnostics.h"

namespace {

void describe(RasterDescription& raster, int lines, int samples, int type, int order, int prefix, int64_t offset) {
    raster.NrOfLinesPerImage = lines;
    raster.NrOfPixelsPerLine = samples;
    raster.CellType = type;
    raster.ByteOrder = order;
    raster.RowPrefix = prefix;
    raster.HeaderOffset = offset;
}

std::vector<int64_t> values_of(const RasterDescription& raster) {
    return {raster.NrOfLinesPerImage, raster.NrOfPixelsPerLine, raster.HeaderOffset,
            raster.RowPrefix,         raster.ByteOrder,         raster.CellType};
}

// One side file for both classes: what either writes, either reads.
TEST(SideFile, ComesBackFieldByFieldInBothClasses) {
    const test::Report report;
    const std::string name = report.file("scene.raw"), side = name + ".hdr";
    DataFile data, read, cloned;
    BufferFile buffer{name.c_str()}, buffer_cloned;
    data.setFilename(name.c_str());
    describe(data, 17, 23, SHORT_COMPLEX, 1, 5, 1234);
    ASSERT_EQ(data.write_hdr(), 0);
    EXPECT_EQ(buffer.readhdr(side.c_str()) + buffer.readhdr() + buffer.writehdr(), 0);
    EXPECT_EQ(values_of(buffer), values_of(data));
    buffer.NrOfLinesPerImage = 803;
    ASSERT_EQ(buffer.writehdr(side.c_str()), 0);
    read.BufferSize = 100;
    ASSERT_EQ(read.read_hdr(name.c_str()), 0);
    EXPECT_EQ(read.BufferSize, 0);
    EXPECT_EQ(cloned.clone(&read) + buffer_cloned.clone(&buffer), 0);
    for (const auto& same : {values_of(read), values_of(cloned), values_of(buffer_cloned)})
        EXPECT_EQ(same, values_of(buffer));
    char copied[512];
    buffer_cloned.getFilename(copied);
    EXPECT_EQ(copied, name);
    EXPECT_EQ(cloned.FileName, name);
    test::write_text(side, "[RasterInfo]\nHeaderOffset = 77\n");  // the older form, from which the rest is missing
    EXPECT_EQ(read.read_hdr(name.c_str()), 1);
    EXPECT_EQ(*static_cast<const std::int32_t*>(read.element(2)->pointer), 77);
}

// Raster and side file. A copy to a new name was open to all whatever its source was; and only the rasters were
// held apart: a copy could take the place of its source's side file, or its side file that of the source.
TEST(Copies, GrantNoMoreAndReplaceNothingOfTheirSource) {
    const test::Report report;
    const test::CapturedStderr silent;
    DataFile data;
    BufferFile buffer;
    describe(data, 1, 3, INT8, 0, 0, 0);
    buffer.copyDescription(data);
    const auto copy = [&](const std::string& from, const std::string& to, int overwrite = 1) {
        data.setFilename(from.c_str());
        buffer.setFilename(from.c_str());
        const int status = data.copy(to.c_str(), overwrite);
        EXPECT_EQ(buffer.copy(to.c_str(), overwrite), status);
        return status;
    };
    const std::string in = report.file("in"), side = in + ".hdr", looped = report.file("looped");
    test::write_text(in, "old");
    const mode_t umask_before = umask(022);
    for (const auto& [source, wanted] : {std::pair{0600U, 0600U}, {0640, 0640}, {0666, 0644}, {0440, 0640}}) {
        const std::string made = report.file("mode" + std::to_string(source));
        chmod(in.c_str(), source);
        EXPECT_EQ(copy(in, made), 0);
        struct stat found {};
        EXPECT_TRUE(stat(made.c_str(), &found) == 0 && (found.st_mode & 0777U) == wanted) << source;
        EXPECT_EQ(test::read_text(made), "old");
        EXPECT_EQ(copy(in, made, 0), 1) << "not to be overwritten";
    }
    umask(umask_before);
    chmod(in.c_str(), 0600);

    std::filesystem::create_symlink("in.hdr", report.file("shared.hdr"));
    std::filesystem::create_symlink("looped", looped + ".hdr");
    const std::pair<std::string, std::string> onto[] = {
        {in, in}, {in, side}, {side, in}, {in, report.file("shared")}, {in, looped}};
    for (const auto& [from, to] : onto) {
        for (const std::string& file : {in, side, looped}) test::write_text(file, "old");
        EXPECT_EQ(copy(from, to), 1) << from << " to " << to;
        for (const std::string& file : {in, side, looped}) EXPECT_EQ(test::read_text(file), "old");
    }
}

// The last line of 6 GB takes no more memory than itself, and the hole stays a hole.
TEST(BufferIORegions, ReachBeyondFourGigabytes) {
    const test::Report report;
    DataFile file;
    describe(file, 110000, 8000, FLOAT_COMPLEX, 0, 64, 1000);
    file.setFilename(report.file("sparse.raw").c_str());
    test::write_text(file.FileName, "");
    ASSERT_GT(file.rasterSize(), int64_t{6} << 30);
    std::filesystem::resize_file(file.FileName, static_cast<std::uintmax_t>(file.rasterSize()));
    ASSERT_EQ(file.open(3), 0);
    std::vector<fcomplex> line(8000), back(8000);
    for (std::size_t i = 0; i < line.size(); ++i) line[i] = {static_cast<float>(i), -1.0F};
    BufferIO region{&file, 0, 8000, 109999, 1, FLOAT_COMPLEX};
    ASSERT_EQ(region.writebuffer(reinterpret_cast<const char*>(line.data()), 8000), 0);
    ASSERT_EQ(region.readbuffer(reinterpret_cast<char*>(back.data()), 8000), 0);
    EXPECT_EQ(back, line);
    struct stat status {};
    EXPECT_TRUE(stat(file.FileName, &status) == 0 && status.st_blocks * 512 < 1 << 20);
}

}  // namespace
