#ifndef QUO_PROFILE_CONTENT_H
#define QUO_PROFILE_CONTENT_H

#include <list>
#include <optional>
#include <string>
#include <string_view>

#include "profilelib/place_table.h"

namespace quo {

/** The sections and keys of one parameter file.
 *
 * To its users it is a list of sections, each a list of keys, searched from the last entry to the first. Sections
 * and keys of one name may stand several times. Look-up, change, addition and removal take constant time
 * nevertheless: a key is only ever added to the newest section of its name, and only ever removed from there, so
 * that all keys of one name in sections of one name form a stack, whose top is the one that a search would find.
 *
 * All members may throw std::bad_alloc; the content is then fit for destruction only. */
class ProfileContent {
public:
    ProfileContent() = default;
    ProfileContent(const ProfileContent&) = delete;
    ProfileContent& operator=(const ProfileContent&) = delete;

    /** Appends the sections and keys of a file's text, read by the grammar that profile.h describes. */
    void parse(std::string_view text);
    /** The file's text in its written layout. */
    [[nodiscard]] std::string text() const;

    /** Value of the last such key in the last section of the name that holds it, or null. */
    [[nodiscard]] const char* find(std::string_view section, std::string_view key);
    /** Sets the key in the newest section of the name, adding what is missing. `value` may be a stored value. */
    const char* set(std::string_view section, std::string_view key, std::string_view value);
    /** Removes the newest such key of the newest section of the name, if that section holds it. */
    void erase_key(std::string_view section, std::string_view key);
    /** Removes the newest section of the name, if there is one. */
    void erase_section(std::string_view section);

private:
    struct Section;
    struct Key;
    using SectionPlace = std::list<Section>::iterator;
    using KeyPlace = std::list<Key>::iterator;

    struct Key {
        SectionPlace section;  // first, so that what a search compares lies close together
        std::string name, value;
        std::optional<KeyPlace> hidden;  // the key that a search would find if this one were not there
    };
    struct Section {
        std::string name;
        std::list<Key> keys;                 // in file order
        std::optional<SectionPlace> hidden;  // the section of the same name before this one
    };
    using SectionSlot = PlaceTable<SectionPlace>::Slot;
    using KeySlot = PlaceTable<KeyPlace>::Slot;

    SectionSlot* find_section(std::string_view name);
    KeySlot* find_key(std::string_view section, std::string_view name);
    SectionPlace add_section(std::string_view name);
    const char* add_key(SectionPlace section, std::string_view name, std::string_view value);
    void remove_found(KeySlot* slot);

    std::list<Section> sections_;               // in file order
    PlaceTable<SectionPlace> newest_sections_;  // by name
    PlaceTable<KeyPlace> found_keys_;           // by the names of section and key: what a search finds
};

}  // namespace quo

#endif
