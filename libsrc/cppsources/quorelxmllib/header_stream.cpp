#include "quorelxmllib/header_stream.h"

#include <libxml/xmlreader.h>

#include <cerrno>
#include <memory>
#include <string>
#include <vector>

#include "quo_base/api.h"
#include "quorelxmllib/header_source.h"
#include "sarutillib/number_text.h"

namespace quo {
namespace {

struct FreeReader {
    void operator()(xmlTextReader* reader) const noexcept { xmlFreeTextReader(reader); }
};
using Reader = std::unique_ptr<xmlTextReader, FreeReader>;

std::string_view text_of(const xmlChar* text) { return text ? reinterpret_cast<const char*>(text) : ""; }

/** Follows the path of the reader and collects the texts at the wanted one. */
class Follower {
public:
    Follower(xmlTextReader* reader, int channel, std::string_view field,
             const std::function<void(std::string_view)>& see)
        : reader_{reader}, number_{format_int(channel)}, see_{see} {
        if (field.empty()) return;  // leads to the channel
        for (auto slash = field.find('/'); slash != std::string_view::npos; slash = field.find('/')) {
            names_.emplace_back(field.substr(0, slash));
            field.remove_prefix(slash + 1);
        }
        names_.emplace_back(field);  // an empty name leads nowhere
    }

    /** Takes the next piece of the file; false for a declaration, which no header may have. */
    bool take() {
        const int depth = xmlTextReaderDepth(reader_);
        switch (xmlTextReaderNodeType(reader_)) {
            case XML_READER_TYPE_DOCUMENT_TYPE:
                return declares_nothing();
            case XML_READER_TYPE_ELEMENT:
                begin(depth);
                if (xmlTextReaderIsEmptyElement(reader_) == 1) end(depth);
                break;
            case XML_READER_TYPE_END_ELEMENT:
                end(depth);
                break;
            case XML_READER_TYPE_TEXT:
            case XML_READER_TYPE_CDATA:
            case XML_READER_TYPE_WHITESPACE:
            case XML_READER_TYPE_SIGNIFICANT_WHITESPACE:
                if (is_wanted()) text_ += text_of(xmlTextReaderConstValue(reader_));
                break;
            default:
                break;
        }
        return true;
    }
    [[nodiscard]] bool was_header() const { return has_number_ && has_description_; }

private:
    [[nodiscard]] bool declares_nothing() const {
        const auto* type = reinterpret_cast<const xmlDtd*>(xmlTextReaderCurrentNode(reader_));
        return !type ||
               (!type->entities && !type->pentities && !type->elements && !type->attributes && !type->notations);
    }
    [[nodiscard]] bool is_wanted() const { return matched_ == depth_of_field(); }
    [[nodiscard]] int depth_of_field() const { return static_cast<int>(names_.size()) + 2; }

    void begin(int depth) {
        if (depth != matched_ || is_wanted()) return;
        const bool in_no_namespace = !xmlTextReaderConstNamespaceUri(reader_);
        const std::string_view name = text_of(xmlTextReaderConstLocalName(reader_));
        if (depth == 1) {
            has_number_ = has_number_ || (in_no_namespace && name == "NumberOfChannels");
            has_description_ = has_description_ || (in_no_namespace && name == "Description");
        }
        if (!in_no_namespace || !leads_on(depth, name)) return;
        ++matched_;
        text_.clear();
    }
    [[nodiscard]] bool leads_on(int depth, std::string_view name) const {
        if (depth == 0) return name == "QuorelXmlDoc";
        if (depth > 1) return name == names_[static_cast<std::size_t>(depth) - 2];
        if (name != "Channel") return false;
        const std::unique_ptr<xmlChar, decltype(xmlFree)> number{
            xmlTextReaderGetAttribute(reader_, reinterpret_cast<const xmlChar*>("Number")), xmlFree};
        return text_of(number.get()) == std::string_view{number_};
    }
    void end(int depth) {
        if (depth != matched_ - 1) return;
        if (is_wanted()) see_(text_);
        --matched_;
    }

    xmlTextReader* reader_;
    const NumberText number_;
    const std::function<void(std::string_view)>& see_;
    std::vector<std::string> names_;
    std::string text_;
    int matched_ = 0;  // so many elements around the reader's place lead to the field
    bool has_number_ = false, has_description_ = false;
};

}  // namespace

int stream_texts(const char* file, int channel, std::string_view field,
                 const std::function<void(std::string_view)>& see) {
    HeaderSource source;
    if (const int status = source.open(file)) return status;
    const XmlErrors errors;
    errno = 0;
    const Reader reader{xmlReaderForIO(HeaderSource::read, nullptr, &source, nullptr, nullptr, kHeaderOptions)};
    if (!reader) return QUO_NO_MEMORY;
    Follower follower{reader.get(), channel, field, see};
    bool accepted = true;
    int more = 1;
    while (accepted && (more = xmlTextReaderRead(reader.get())) == 1) accepted = follower.take();
    if (const int failed = source.status()) return failed;
    if (errors.out_of_memory() || errno == ENOMEM) return QUO_NO_MEMORY;
    return accepted && more == 0 && follower.was_header() ? QUO_OK : QUO_REFUSED;
}

}  // namespace quo
