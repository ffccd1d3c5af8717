#include "quorelxmllib/header_stream.h"

#include <memory>
#include <string>
#include <vector>

#include "quo_base/api.h"
#include "quorelxmllib/header_parser.h"
#include "sarutillib/ground/number_text.h"

namespace quo {
namespace {

std::string_view text_of(const xmlChar* text) { return text ? reinterpret_cast<const char*>(text) : ""; }

/** Chooses the elements that a field path leads to and hands over their texts. */
class Follower : public ElementChoice {
public:
    Follower(int channel, std::string_view field, const std::function<void(std::string_view)>& see)
        : number_{format_int(channel)}, see_{see} {
        if (field.empty()) return;  // leads to the channel
        for (auto slash = field.find('/'); slash != std::string_view::npos; slash = field.find('/')) {
            names_.emplace_back(field.substr(0, slash));
            field.remove_prefix(slash + 1);
        }
        names_.emplace_back(field);  // an empty name leads nowhere
    }

    bool begins(const xmlNode& element, int level) override {
        if (element.ns || level != matched_) return false;
        const std::string_view name = text_of(element.name);
        has_number_ = has_number_ || (level == 1 && name == "NumberOfChannels");
        has_description_ = has_description_ || (level == 1 && name == "Description");
        if (!leads_on(element, name)) return false;
        ++matched_;
        return matched_ == static_cast<int>(names_.size()) + 2;
    }
    void ends(int level) override {
        if (level == matched_ - 1) --matched_;
    }
    void take(const HeaderTree& tree, Node element) override { see_(NodeText{tree, element}); }
    [[nodiscard]] bool was_header() const { return has_number_ && has_description_; }

private:
    [[nodiscard]] bool leads_on(const xmlNode& element, std::string_view name) const {
        if (matched_ == 0) return name == "QuorelXmlDoc";
        if (matched_ > 1) return name == names_[static_cast<std::size_t>(matched_) - 2];
        if (name != "Channel") return false;
        const std::unique_ptr<xmlChar, decltype(xmlFree)> number{
            xmlGetNoNsProp(&element, reinterpret_cast<const xmlChar*>("Number")), xmlFree};
        return text_of(number.get()) == std::string_view{number_};
    }

    const NumberText number_;
    const std::function<void(std::string_view)>& see_;
    std::vector<std::string> names_;
    int matched_ = 0;  // so many elements around the parser's place lead to the field
    bool has_number_ = false, has_description_ = false;
};

}  // namespace

int stream_texts(const char* file, int channel, std::string_view field,
                 const std::function<void(std::string_view)>& see) {
    HeaderSource source;
    if (const int status = source.open(file)) return status;
    Follower follower{channel, field, see};
    if (const int status = parse_header(source, follower)) return status;
    return follower.was_header() ? QUO_OK : QUO_REFUSED;
}

}  // namespace quo
