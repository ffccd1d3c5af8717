// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PROFILE_CONTENT_H
#define QUO_PROFILE_CONTENT_H

#include <cstddef>
#include <cstdint>
#include <deque>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "profilelib/index_table.h"

namespace quo {

/** The sections and keys of one parameter file.
 *
 * To its users it is a list of sections, each a list of keys, searched from the last entry to the first. Sections
 * and keys of one name may stand several times. Look-up, change, addition and removal take constant time
 * nevertheless: a key is only ever added to the newest section of its name, and only ever removed from there, so
 * that all keys of one name in sections of one name form a stack, whose top is the one that a search would find.
 *
 * Files of short keys are many records beside few bytes. The names and values of a file stay where they were read,
 * in the file's text, and a record is four numbers: with the text and the tables, less than eight times the file
 * whatever stands in it.
 *
 * All members may throw std::bad_alloc; the content is then fit for destruction only. */
class ProfileContent {
public:
    ProfileContent() = default;
    ProfileContent(const ProfileContent&) = delete;
    ProfileContent& operator=(const ProfileContent&) = delete;

    /** Takes a file's text, less than 2 GiB, read by the grammar that profile.h describes. To be called once, on
     * an empty content. */
    void parse(std::string text);
    /** Hands the file's text in its written layout to `take(std::string_view)`, in pieces of 64 KiB or little
     * more, as long as that returns true. Whether it did for all of them. */
    template <typename Take>
    bool write(Take take) const;

    /** Value of the last such key in the last section of the name that holds it, or null. */
    [[nodiscard]] const char* find(std::string_view section, std::string_view key);
    /** Sets the key in the newest section of the name, adding what is missing. `value` may be a stored value. */
    const char* set(std::string_view section, std::string_view key, std::string_view value);
    /** Removes the newest such key of the newest section of the name, if that section holds it. */
    void erase_key(std::string_view section, std::string_view key);
    /** Removes the newest section of the name, if there is one. */
    void erase_section(std::string_view section);

private:
    using Index = IndexTable::Index;
    using Slot = IndexTable::Slot;
    static constexpr Index kNone = IndexTable::kNone;
    /** Where a section's name, or a key's name and its value behind it, each with a NUL byte, stand: a place in
     * the file's text, or kOwned and the number of a text of their own. */
    using Text = std::uint32_t;
    static constexpr Text kOwned = Text{1} << 31;

    struct Key {
        Text text;
        Index section;  // kNone once it is removed
        Index next;     // in its section; behind the last key stands the first
        Index hidden;   // the key that a search would find if this one were not there
    };
    struct Section {
        Text text;     // the same for all sections of a name
        Index last;    // key
        Index hidden;  // the section of the same name before this one
        bool gone = false;
    };

    [[nodiscard]] const char* at(Text text) const;
    [[nodiscard]] const char* value_of(Index key) const;
    Text own(std::string text);
    void release(Text text);
    /** Moves a name or value up to the end of those that were kept. */
    void keep(std::string_view token, std::size_t& end);

    Slot* find_section(std::string_view name);
    Slot* find_section(std::string_view name, std::uint64_t hash);
    Slot* find_key(Text section, std::string_view name);
    Slot* find_key(Text section, std::string_view name, std::uint64_t hash);
    void renew_newest_sections();
    void renew_found_keys();
    /** Calls `visit(key)` for the keys of a section in file order as long as it returns true. Whether it did for
     * all. */
    template <typename Visit>
    static bool all_keys(const std::deque<Key>& keys, const Section& section, Visit visit);
    Index add_section(Text text);
    Index add_key(Index section, Text text);
    void remove_found(Slot* slot);
    void remove_keys(const Section& section);
    /** Makes all records anew once most of them are of things that were removed. */
    void sweep();

    std::string file_text_;
    std::deque<std::string> owned_;
    std::vector<Text> free_owned_;
    // Deques, which grow without a second copy of what they hold.
    std::deque<Section> sections_;  // in file order
    std::deque<Key> keys_;
    std::size_t removed_ = 0;     // records of sections and keys that are no more
    IndexTable newest_sections_;  // by name
    IndexTable found_keys_;       // by the names of section and key: what a search finds
};

template <typename Visit>
bool ProfileContent::all_keys(const std::deque<Key>& keys, const Section& section, Visit visit) {
    if (section.last == kNone) return true;
    for (Index key = keys[section.last].next;; key = keys[key].next) {
        if (keys[key].section != kNone && !visit(key)) return false;
        if (key == section.last) return true;
    }
}

template <typename Take>
bool ProfileContent::write(Take take) const {
    constexpr std::size_t kPiece = std::size_t{1} << 16;
    std::string piece;
    const auto take_piece = [&] {
        const bool taken = take(std::string_view{piece});
        piece.clear();
        return taken;
    };
    const auto append_key = [&](Index key) {
        piece.append(at(keys_[key].text)).append(" = ").append(value_of(key)).append("\n");
        return piece.size() < kPiece || take_piece();
    };
    for (const Section& section : sections_) {
        if (section.gone) continue;
        piece.append("\n[").append(at(section.text)).append("]\n");
        if (piece.size() >= kPiece && !take_piece()) return false;
        if (!all_keys(keys_, section, append_key)) return false;
    }
    return take_piece();
}

}  // namespace quo

#endif
