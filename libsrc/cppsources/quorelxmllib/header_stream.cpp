// SPDX-License-Identifier: Apache-2.0
#include "quorelxmllib/header_stream.h"

#include <algorithm>
#include <cstdint>
#include <string>
#include <utility>
#include <vector>

#include "quo_base/api.h"
#include "quorelxmllib/header_parser.h"
#include "sarutillib/ground/number_text.h"

namespace quo {
namespace {

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

    void starts() override {
        matched_ = 0;
        has_number_ = has_description_ = false;
        seen_before_ = std::max(seen_before_, std::exchange(seen_, 0));
    }
    bool begins(const HeaderTree& tree, Node element, int level) override {
        if (level != matched_) return false;
        has_number_ = has_number_ || (level == 1 && tree.is_named(element, "NumberOfChannels"));
        has_description_ = has_description_ || (level == 1 && tree.is_named(element, "Description"));
        if (!leads_on(tree, element)) return false;
        ++matched_;
        return matched_ == static_cast<int>(names_.size()) + 2;
    }
    void ends(int level) override {
        if (level == matched_ - 1) --matched_;
    }
    void take(const HeaderTree& tree, Node element) override {
        if (++seen_ > seen_before_) see_(NodeText{tree, element});
    }
    [[nodiscard]] bool was_header() const { return has_number_ && has_description_; }

private:
    [[nodiscard]] bool leads_on(const HeaderTree& tree, Node element) const {
        if (matched_ == 0) return tree.is_named(element, "QuorelXmlDoc");
        if (matched_ > 1) return tree.is_named(element, names_[static_cast<std::size_t>(matched_) - 2]);
        return tree.is_named(element, "Channel") && tree.attribute(element, "Number") == std::string_view{number_};
    }

    const NumberText number_;
    const std::function<void(std::string_view)>& see_;
    std::vector<std::string> names_;
    int matched_ = 0;                          // so many elements around the parser's place lead to the field
    std::int64_t seen_ = 0, seen_before_ = 0;  // texts; those handed over when the file was read before
    bool has_number_ = false, has_description_ = false;
};

}  // namespace

int stream_texts(const char* file, int channel, std::string_view field,
                 const std::function<void(std::string_view)>& see) {
    HeaderSource source;
    if (const int status = source.open(file)) return status;
    Follower follower{channel, field, see};
    HeaderTree tree;
    if (const int status = parse_header(source, tree, nullptr, &follower)) return status;
    return follower.was_header() ? QUO_OK : QUO_REFUSED;
}

}  // namespace quo
