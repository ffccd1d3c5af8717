// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_XML_HEADER_PROPERTY_H
#define QUO_XML_HEADER_PROPERTY_H

/* What holds for header files of any bytes: what is read is written and read back the same, one save gives the
 * bytes of saving twice with libxml2, and the readers stay within their arrays whatever the file says. */

#include <libxml/parser.h>
#include <libxml/tree.h>

#include <array>
#include <cstdint>
#include <cstring>
#include <memory>
#include <string>
#include <string_view>

#include "bytes.h"
#include "quo_base/quorelxml_v2.h"
#include "quorelxmllib/field_table.h"

namespace property {

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
inline constexpr quo::FieldTable kTable{"Shelf",
                                        QUO_FIELD(width, quo::kOptional),
                                        QUO_FIELD(corners, quo::kOptional),
                                        QUO_FIELD(height, quo::kOptional),
                                        QUO_FIELD(n, quo::kOptional),
                                        QUO_FIELD(label, quo::kOptional),
                                        QUO_FIELD(pages, QUO_LENGTH(n, 3), quo::kOptional)};
inline Sample::Sample() { createElementsVector(kTable.size()); }
inline Sample::~Sample() { kTable.destroy_buffers(*this); }
inline int Sample::createBuffers() { return kTable.create_buffers(*this); }
inline int Sample::destroyBuffers() { return kTable.destroy_buffers(*this); }
inline void Sample::refreshParameters() { kTable.register_all(*this); }

class Document : public quorelxml {
public:
    using quorelxml::clearField;
    using quorelxml::quorelxml;
};

/** A document as libxml2 loads it without blanks between elements and saves it; empty where it does not. */
inline std::string saved_by_libxml2(std::string_view text) {
    constexpr int kOptions = XML_PARSE_NOBLANKS | XML_PARSE_NONET | XML_PARSE_NOERROR | XML_PARSE_NOWARNING;
    const std::unique_ptr<xmlDoc, decltype(&xmlFreeDoc)> tree{
        xmlReadMemory(text.data(), static_cast<int>(text.size()), nullptr, nullptr, kOptions), &xmlFreeDoc};
    if (!tree) return "";
    xmlChar* bytes = nullptr;
    int size = 0;
    xmlDocDumpFormatMemoryEnc(tree.get(), &bytes, &size, "UTF-8", 1);
    const std::unique_ptr<xmlChar, decltype(xmlFree)> owned{bytes, xmlFree};
    return {reinterpret_cast<const char*>(bytes), static_cast<std::size_t>(size)};
}

/** Saving must give the bytes of saving twice, before and after `edit`. */
template <typename Edit>
void check_saved(const MemoryFile& file, const std::string& original, Edit edit) {
    Document document{file.name()};
    if (document.write() != 0) {
        require(file.content() == original, "what cannot be read as a header is never replaced");
        return;
    }
    const std::string fresh = [] {
        const MemoryFile none{"", "fresh"};
        require(Document{none.name()}.write() == 0, "a fresh document is saved");
        return none.content();
    }();
    require(file.content() == fresh || file.content() == saved_by_libxml2(saved_by_libxml2(original)),
            "an unchanged document is saved as libxml2 does");
    edit(document);
    require(document.write() == 0, "a changed document is saved");
    const std::string saved = file.content();
    require(saved == saved_by_libxml2(saved), "one save is as good as two");
    require(document.write() == 0 && file.content() == saved, "the document in memory is still whole");
}

/** Reads every way, then writes into the document. */
inline void edit(Document& document) {
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
    for (const auto& room : rooms) require(room.back() == '\0', "a text stays within its room");
    document.writeDouble(1, "Shelf/pages", doubles.data(), 3);
    document.writeInt(1, "Shelf/new/deep", ints.data(), 1);
    document.clearField(1, "Shelf/label");
    document.writeString(1, "Shelf/texts", texts, 2);
}

inline void read_back(const MemoryFile& file) {
    Sample object, again;
    if (!object.readAuxiliaryFile(file.name(), 1, "Shelf")) return;
    object.setExactNumbers(true);
    require(object.writeAuxiliaryFile(file.name(), 1, "Shelf") == 0, "what was read can be written");
    require(again.readAuxiliaryFile(file.name(), 1, "Shelf") && again.n == object.n, "and be read back");
    const auto pages = static_cast<std::size_t>(again.pages ? 3 * again.n : 0);
    for (std::size_t i = 0; i < pages; ++i)
        require(again.pages[i] == object.pages[i] || object.pages[i] != object.pages[i], "numbers come back");
    require(std::strcmp(again.label, object.label) == 0, "texts come back");
}

/** All of it. Throws std::logic_error with what does not hold. */
inline void check(std::string_view content) {
    read_back(MemoryFile{content, "header"});
    check_saved(MemoryFile{content, "header"}, std::string{content}, edit);
}

}  // namespace property

#endif
