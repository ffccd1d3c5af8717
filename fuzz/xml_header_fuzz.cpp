/* Header files from any bytes: what is read must be written and read back the same, one save must give the bytes
 * of saving twice, and the readers must stay within their arrays whatever the file says. */

#include <libxml/parser.h>
#include <libxml/tree.h>
#include <unistd.h>

#include <array>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <memory>
#include <string>
#include <string_view>

#include "quo_base/quorelxml_v2.h"
#include "quorelxmllib/field_table.h"

namespace {

/** A header object with a field of every kind. */
class Sample : public GeneralSAR_Base {
public:
    Sample();
    ~Sample() override;
    int createBuffers() override;
    int destroyBuffers() override;

    double width = -999.0, corners[4] = {};
    float height = 0.0F;
    std::int32_t n = 0;
    char label[512] = "";
    std::unique_ptr<double[]> pages;

protected:
    void refreshParameters() override;
};
using Obj = Sample;
constexpr quo::FieldTable kTable{"Shelf",
                                 QUO_FIELD(width, quo::kOptional),
                                 QUO_FIELD(corners, quo::kOptional),
                                 QUO_FIELD(height, quo::kOptional),
                                 QUO_FIELD(n, quo::kOptional),
                                 QUO_FIELD(label, quo::kOptional),
                                 QUO_FIELD(pages, QUO_LENGTH(n, 3), quo::kOptional)};
Sample::Sample() { createElementsVector(kTable.size()); }
Sample::~Sample() { kTable.destroy_buffers(*this); }
int Sample::createBuffers() { return kTable.create_buffers(*this); }
int Sample::destroyBuffers() { return kTable.destroy_buffers(*this); }
void Sample::refreshParameters() { kTable.register_all(*this); }

void require(bool holds) {
    if (!holds) std::abort();
}

/** A file in memory, under a name of this process. */
class HeaderFile {
public:
    explicit HeaderFile(std::string_view content)
        : name_{"/dev/shm/quo_fuzz_" + std::to_string(getpid()) + ".xml"} {
        std::ofstream{name_, std::ios::binary} << content;
    }
    ~HeaderFile() { unlink(name_.c_str()); }
    HeaderFile(const HeaderFile&) = delete;
    HeaderFile& operator=(const HeaderFile&) = delete;

    [[nodiscard]] const char* name() const { return name_.c_str(); }
    [[nodiscard]] std::string content() const {
        std::ifstream stream{name_, std::ios::binary};
        return {std::istreambuf_iterator<char>{stream}, {}};
    }

private:
    std::string name_;
};

/** A document whose tree can be reached. */
class Document : public quorelxml {
public:
    [[nodiscard]] xmlDoc* tree() const {
        const auto* const node = static_cast<xmlNode*>(getNode(1, ""));
        return node ? node->doc : nullptr;
    }
    using quorelxml::clearField;
};

using Bytes = std::unique_ptr<xmlChar, decltype(xmlFree)>;

std::string saved(xmlDoc* tree) {
    xmlChar* text = nullptr;
    int size = 0;
    xmlDocDumpFormatMemoryEnc(tree, &text, &size, "UTF-8", 1);
    const Bytes owned{text, xmlFree};
    return {reinterpret_cast<const char*>(text), static_cast<std::size_t>(size)};
}

std::string reopened(const std::string& text) {
    constexpr int kOptions = XML_PARSE_NOBLANKS | XML_PARSE_NONET | XML_PARSE_NOERROR | XML_PARSE_NOWARNING;
    xmlDoc* tree = xmlReadMemory(text.data(), static_cast<int>(text.size()), nullptr, nullptr, kOptions);
    require(tree != nullptr);
    std::string again = saved(tree);
    xmlFreeDoc(tree);
    return again;
}

/** Reads every way, then writes into the document and saves it. */
void edit(const HeaderFile& file) {
    Document document;
    require(document.initXmlFile(file.name()) == 0);
    std::array<double, 3> doubles{};
    std::array<float, 3> floats{};
    std::array<std::int32_t, 3> ints{};
    std::array<std::array<char, 9>, 2> rooms{};
    char* const texts[] = {rooms[0].data(), rooms[1].data()};
    for (const char* field : {"Shelf/pages", "Shelf/corners", "Shelf", "Shelf/label"}) {
        document.readDouble(1, field, doubles.data(), 3);
        document.readFloat(1, field, floats.data(), 3);
        document.readInt(1, field, ints.data(), 3);
        document.readString(1, field, texts, 2, rooms[0].size());
    }
    for (const auto& room : rooms) require(room.back() == '\0');
    document.writeDouble(1, "Shelf/pages", doubles.data(), 3);
    document.writeInt(1, "Shelf/new/deep", ints.data(), 1);
    document.clearField(1, "Shelf/label");
    document.writeString(1, "Shelf/texts", texts, 2);
    if (xmlDoc* tree = document.tree()) {
        const std::string expected = reopened(saved(tree));
        require(document.write() == 0 && file.content() == expected);
    }
}

void read_back(const HeaderFile& file) {
    Sample object, again;
    if (!object.readAuxiliaryFile(file.name(), 1, "Shelf")) return;
    object.setExactNumbers(true);
    require(object.writeAuxiliaryFile(file.name(), 1, "Shelf") == 0);
    require(again.readAuxiliaryFile(file.name(), 1, "Shelf") && again.n == object.n);
    const auto pages = static_cast<std::size_t>(again.pages ? 3 * again.n : 0);
    for (std::size_t i = 0; i < pages; ++i)
        require(again.pages[i] == object.pages[i] || object.pages[i] != object.pages[i]);
    require(std::strcmp(again.label, object.label) == 0);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    const std::string_view content{reinterpret_cast<const char*>(data), size};
    read_back(HeaderFile{content});
    edit(HeaderFile{content});
    return 0;
}
