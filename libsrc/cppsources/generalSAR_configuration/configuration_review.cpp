// SPDX-License-Identifier: Apache-2.0
#include <cstddef>
#include <map>
#include <memory>
#include <new>
#include <string>
#include <string_view>
#include <utility>

#include "diagnosticslib/call_frame.h"
#include "quo_base/generalSAR_configuration.h"
#include "quorelxmllib/header_document.h"
#include "quorelxmllib/header_session.h"
#include "sarutillib/ground/number_text.h"

namespace {

using Record = GeneralSAR_ConfigurationRecord;

constexpr const char* kSource = "generalSAR_configuration";

using quo::HeaderTree;
using quo::Node;

/** What is wrong with the values of an array, which stand in `val` elements or else in one list; or nothing. */
std::string array_defect(const parElement& element, const HeaderTree& tree, Node node) {
    std::size_t count = 0;
    std::string first_defect;
    const auto see = [&](std::string_view text) {
        ++count;
        if (first_defect.empty()) first_defect = element.defect(text);
    };
    for (Node child = tree.first(node); child != Node::none; child = tree.next(child))
        if (tree.is_named(child, "val")) see(quo::NodeText{tree, child});
    if (count == 0) {
        const quo::NodeText text{tree, node};
        for (std::string_view list = text; !quo::trimmed(list).empty();) {
            const auto comma = list.find(',');
            see(list.substr(0, comma));
            list = comma == std::string_view::npos ? std::string_view{} : list.substr(comma + 1);
        }
    }
    const std::string wrong = element.countDefect(count);
    return wrong.empty() ? first_defect : wrong;
}

/** Compares one section with its record. */
class SectionReview {
public:
    SectionReview(Record& record, std::vector<ConfigurationFinding>& findings)
        : record_{record}, findings_{findings} {
        for (int i = 0; i < record.elementCount(); ++i) add(*record.element(i), true);
        own_ = elements_.size();
        if (record.section() != std::string_view{"generalProcessingConf"}) return;
        for (int i = 0; i < Record::kSharedParameters; ++i) add(record.sharedParameter(i), false);
    }

    /** Whether the section is the record and not the shared parameters alone. */
    bool run(const HeaderTree& tree, Node section) {
        for (Node child = tree.first(section); child != Node::none; child = tree.next(child)) {
            if (tree.is_element(child)) see(tree, child);
        }
        const bool is_record = seen_own_ || elements_.size() == own_;
        if (!is_record) return false;
        for (int i = 0; i < record_.elementCount(); ++i) {
            const char* name = record_.element(i)->name;
            if (!elements_[name].seen) find(name, "is missing");
        }
        return true;
    }

private:
    struct Expected {
        parElement element;
        bool own = false, seen = false;
    };
    void add(const parElement& element, bool own) { elements_[element.name] = {element, own}; }
    void find(std::string_view name, std::string reason) {
        findings_.push_back({record_.section(), std::string{name}, std::move(reason)});
    }
    void see(const HeaderTree& tree, Node node) {
        const std::string_view name = tree.local_name(node);
        const auto found = elements_.find(name);
        if (found == elements_.end() || tree.in_namespace(node)) return find(name, "is unknown");
        Expected& expected = found->second;
        seen_own_ = seen_own_ || expected.own;
        if (std::exchange(expected.seen, true)) return find(name, "stands there more than once");
        std::string reason = expected.element.count > 1 ? array_defect(expected.element, tree, node)
                                                        : expected.element.defect(quo::NodeText{tree, node});
        if (!reason.empty()) find(name, std::move(reason));
    }

    Record& record_;
    std::vector<ConfigurationFinding>& findings_;
    std::map<std::string, Expected, std::less<>> elements_;
    std::size_t own_ = 0;
    bool seen_own_ = false;
};

void review_section(const HeaderTree& tree, Node section, std::map<std::string, bool, std::less<>>& seen,
                    ConfigurationReview& review) {
    const std::string name{tree.local_name(section)};
    const auto record = tree.in_namespace(section) ? nullptr : Record::make(name);
    if (!record) {
        review.findings.push_back({name, "", "is no configuration record"});
    } else if (std::exchange(seen[name], true)) {
        review.findings.push_back({name, "", "stands there more than once"});
    } else if (SectionReview{*record, review.findings}.run(tree, section)) {
        review.records.push_back(name);
    }
}

int review_file(const char* file, int channel, ConfigurationReview& review) {
    std::shared_ptr<quo::HeaderDocument> document;
    if (const int status = quo::HeaderDocument::load(file, document)) return status;
    if (!document->is_header()) return QUO_REFUSED;
    std::map<std::string, bool, std::less<>> seen;
    const HeaderTree& tree = document->tree();
    document->visit(channel, "", [&](Node node) {
        for (Node section = tree.first(node); section != Node::none; section = tree.next(section)) {
            if (tree.is_element(section)) review_section(tree, section, seen, review);
        }
        return true;
    });
    return QUO_OK;
}

}  // namespace

int reviewConfiguration(const char* file, int channel, ConfigurationReview& review) {
    quo::CallFrame frame{"reviewConfiguration", kSource};
    review = {};
    try {
        const int status = file ? review_file(file, channel, review) : QUO_REFUSED;
        if (status == QUO_NO_MEMORY) return quo::fail_unread(frame, status, file);
        if (status == QUO_READ_FAILED) {
            static_cast<void>(quo::fail_unread(frame, status, file));
            return QUO_REFUSED;
        }
        quo::CallFrame::drop_errno();
        if (status == QUO_REFUSED) return frame.fail(status, "The file is missing or no configuration file");
        if (status == QUO_OK) return frame.success();
    } catch (const std::bad_alloc&) {
        quo::CallFrame::drop_errno();
    }
    return frame.fail(QUO_NO_MEMORY, "Memory allocation failure");
}
