#include <array>
#include <filesystem>

#include "apart.h"
#include "commands.h"
#include "output.h"
#include "raster.h"
#include "sarutillib/ground/quoted_xml.h"

namespace tool {
namespace {

// GDAL's names of the cell types; it does not know complex samples of 8 bits.
constexpr std::array<std::string_view, 10> kGdalTypes{"CFloat32", "Float32", "CFloat64", "Float64", "CInt32",
                                                      "Int32",    "CInt16",  "Int16",    "",        "Byte"};

std::string element(const char* name, const std::string& content) {
    return std::string{"    <"} + name + ">" + content + "</" + name + ">\n";
}

std::string vrt_text(const DataFile& raster, const std::string& name) {
    const std::int64_t size = raster.element_sizeof();
    const std::int64_t line = size * raster.NrOfPixelsPerLine + raster.RowPrefix;
    std::string text = "<VRTDataset rasterXSize=\"" + std::to_string(raster.NrOfPixelsPerLine) +
                       "\" rasterYSize=\"" + std::to_string(raster.NrOfLinesPerImage) +
                       "\">\n  <VRTRasterBand dataType=\"" +
                       std::string{kGdalTypes[static_cast<std::size_t>(raster.CellType)]} +
                       "\" band=\"1\" subClass=\"VRTRawRasterBand\">\n";
    if (raster.CellType == INT8) {
        text += "    <Metadata domain=\"IMAGE_STRUCTURE\"><MDI key=\"PIXELTYPE\">SIGNEDBYTE</MDI></Metadata>\n";
    }
    text += "    <SourceFilename relativeToVRT=\"1\">" + quo::quoted_xml(name) + "</SourceFilename>\n";
    text += element("ImageOffset", std::to_string(raster.HeaderOffset + raster.RowPrefix));
    text += element("PixelOffset", std::to_string(size));
    text += element("LineOffset", std::to_string(line));
    text += element("ByteOrder", raster.ByteOrder == 1 ? "MSB" : "LSB");
    return text + "  </VRTRasterBand>\n</VRTDataset>\n";
}

int write_vrt(const std::string& name) {
    DataFile raster;
    read_description(name, raster);
    if (raster.CellType == INT8_COMPLEX) throw Failure(name + ": GDAL has no type for INT8_COMPLEX");
    require_apart(raster_files(name), {name + ".vrt"});
    write_output(name + ".vrt", vrt_text(raster, std::filesystem::path{name}.filename().string()));
    return kFine;
}

}  // namespace

void add_vrt(Command& program) {
    auto [command, name] =
        add_verb(program, "vrt", "Writes RASTER.vrt beside a raster, which GDAL opens", write_vrt);
    command.needs("RASTER", name, "Raster with a side file RASTER.hdr");
}

}  // namespace tool
