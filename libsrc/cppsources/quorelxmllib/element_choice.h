// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ELEMENT_CHOICE_H
#define QUO_ELEMENT_CHOICE_H

#include <cstdint>
#include <vector>

#include "quorelxmllib/header_tree.h"

namespace quo {

/** Chooses the elements of a document that are kept, one after the other, while it is being read. */
class ElementChoice {
public:
    virtual ~ElementChoice() = default;
    /** The document is read from its start; what was handed over before will be once more. */
    virtual void starts() = 0;
    /** An element, of which the tree has its name and attributes, begins so many levels below the root; whether it
     * is kept, with all it holds. */
    virtual bool begins(const HeaderTree& tree, Node element, int level) = 0;
    /** An element that was not within a kept one ends. */
    virtual void ends(int level) = 0;
    /** An element that was kept is complete. It is forgotten afterwards. */
    virtual void take(const HeaderTree& tree, Node element) = 0;
};

/** Keeps a tree that is being read down to the open elements and what lies in a chosen one. Without a choice the
 * tree keeps everything. */
class TreeFilter {
public:
    TreeFilter(HeaderTree& tree, ElementChoice* choice) : tree_{tree}, choice_{choice} {
        if (choice) choice->starts();
    }
    /** Whether what the innermost open element holds is kept. */
    [[nodiscard]] bool keeps() const noexcept { return !choice_ || kept_level_ >= 0; }

    /** An element was appended, with its attributes, to a tree that had kept so many bytes of texts before and
     * with its name. The name stays when the element goes, for its siblings mostly share it, unless there are
     * many. */
    void begin(Node element, std::uint32_t before_name, std::uint32_t with_name) {
        constexpr std::uint32_t kManyNames = 64U << 10U;
        if (!choice_) return;
        if (kept_level_ < 0 && choice_->begins(tree_, element, level())) kept_level_ = level();
        text_bytes_.push_back(with_name < kManyNames ? with_name : before_name);
    }
    /** The innermost open element is complete. */
    void end(Node element) {
        if (!choice_) return;
        const std::uint32_t text_bytes = text_bytes_.back();
        text_bytes_.pop_back();
        if (kept_level_ >= 0 && kept_level_ < level()) return;
        if (kept_level_ == level()) choice_->take(tree_, element);
        kept_level_ = -1;
        choice_->ends(level());
        tree_.forget_last(element, text_bytes);
    }

private:
    [[nodiscard]] int level() const noexcept { return static_cast<int>(text_bytes_.size()); }

    HeaderTree& tree_;
    ElementChoice* choice_;
    std::vector<std::uint32_t> text_bytes_;  // that stay when the open elements are complete, outermost first
    int kept_level_ = -1;                    // of the chosen element that is open
};

}  // namespace quo

#endif
