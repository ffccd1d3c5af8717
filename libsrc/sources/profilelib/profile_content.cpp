#include "profilelib/profile_content.h"

#include <algorithm>
#include <utility>

#include "profilelib/name_hash.h"

namespace quo {
namespace {

/** A name or value as it is kept: up to the first NUL byte, as any string, without blanks at both ends. */
std::string_view kept(std::string_view token) {
    token = token.substr(0, token.find('\0'));
    token.remove_prefix(std::min(token.find_first_not_of(' '), token.size()));
    return token.substr(0, token.find_last_not_of(' ') + 1);
}

/** A file's text while it is read. */
class Reader {
public:
    explicit Reader(std::string_view text) : rest_{text} {}

    [[nodiscard]] bool at_end() const { return rest_.empty(); }
    /** The character that comes next; a NUL byte at the end. */
    [[nodiscard]] char next() const { return at_end() ? '\0' : rest_.front(); }
    void skip_blanks() { rest_.remove_prefix(std::min(rest_.find_first_not_of(' '), rest_.size())); }
    /** Takes everything before the next of `stops`, or before the end. */
    std::string_view take_before(std::string_view stops) {
        const std::string_view taken = rest_.substr(0, rest_.find_first_of(stops));
        rest_.remove_prefix(taken.size());
        return taken;
    }
    std::string_view take_before(char stop) {
        const std::string_view taken = rest_.substr(0, rest_.find(stop));
        rest_.remove_prefix(taken.size());
        return taken;
    }
    /** Passes over one character, if there is one. */
    void pass() { rest_.remove_prefix(at_end() ? 0 : 1); }
    /** Passes over everything up to and with the line feed. */
    void pass_line() {
        take_before('\n');
        pass();
    }

private:
    std::string_view rest_;
};

}  // namespace

void ProfileContent::parse(std::string_view text) {
    Reader reader{text};
    SectionPlace section = sections_.end();
    reader.take_before('[');
    while (!reader.at_end()) {
        if (reader.next() == '[') {
            reader.pass();
            const std::string_view name = reader.take_before(']');
            // A bracket that is never closed makes no section: nothing could find it, and it would not be written.
            if (reader.at_end()) return;
            section = add_section(kept(name));
            reader.pass_line();
        }
        reader.skip_blanks();
        if (reader.next() == '=') {
            reader.pass_line();
            continue;
        }
        // Deliberate: a line feed does not end a key name, and a "[" drops what was read of one.
        const std::string_view name = reader.take_before("[=");
        if (reader.next() != '=') continue;
        reader.pass();
        const std::string_view value = reader.take_before('\n');
        reader.pass();
        add_key(section, kept(name), kept(value));
    }
}

std::string ProfileContent::text() const {
    std::string text;
    for (const Section& section : sections_) {
        text.append("\n[").append(section.name).append("]\n");
        for (const Key& key : section.keys) text.append(key.name).append(" = ").append(key.value).append("\n");
    }
    return text;
}

const char* ProfileContent::find(std::string_view section, std::string_view key) {
    const KeySlot* const found = find_key(section, key);
    return found ? found->place->value.c_str() : nullptr;
}

const char* ProfileContent::set(std::string_view section, std::string_view key, std::string_view value) {
    const SectionSlot* const known = find_section(section);
    const SectionPlace newest = known ? known->place : add_section(section);
    const KeySlot* const found = find_key(section, key);
    // Deliberate: a key that only an earlier section of the name holds is not changed but hidden by a new one.
    if (!found || found->place->section != newest) return add_key(newest, key, value);
    std::string copy{value};
    found->place->value.swap(copy);
    return found->place->value.c_str();
}

void ProfileContent::erase_key(std::string_view section, std::string_view key) {
    const SectionSlot* const newest = find_section(section);
    KeySlot* const found = find_key(section, key);
    // Deliberate: earlier sections of the name are not searched.
    if (found && found->place->section == newest->place) remove_found(found);
}

void ProfileContent::erase_section(std::string_view section) {
    SectionSlot* const slot = find_section(section);
    if (!slot) return;
    const SectionPlace newest = slot->place;
    // From the last to the first, each key is the one that a search finds.
    while (!newest->keys.empty()) remove_found(find_key(section, newest->keys.back().name));
    if (newest->hidden)
        slot->place = *newest->hidden;
    else
        newest_sections_.remove(slot);
    sections_.erase(newest);
}

ProfileContent::SectionSlot* ProfileContent::find_section(std::string_view name) {
    return newest_sections_.find(NameHash{}.add(name).value(),
                                 [name](SectionPlace section) { return section->name == name; });
}

ProfileContent::KeySlot* ProfileContent::find_key(std::string_view section, std::string_view name) {
    return found_keys_.find(NameHash{}.add(section).add(name).value(), [section, name](KeyPlace key) {
        return key->name == name && key->section->name == section;
    });
}

ProfileContent::SectionPlace ProfileContent::add_section(std::string_view name) {
    const SectionPlace section = sections_.insert(sections_.end(), Section{std::string{name}, {}, {}});
    if (SectionSlot* const slot = find_section(name))
        section->hidden = std::exchange(slot->place, section);
    else
        newest_sections_.add(NameHash{}.add(name).value(), section);
    return section;
}

const char* ProfileContent::add_key(SectionPlace section, std::string_view name, std::string_view value) {
    std::list<Key>& keys = section->keys;
    const KeyPlace key = keys.insert(keys.end(), Key{section, std::string{name}, std::string{value}, {}});
    if (KeySlot* const slot = find_key(section->name, name))
        key->hidden = std::exchange(slot->place, key);
    else
        found_keys_.add(NameHash{}.add(section->name).add(name).value(), key);
    return key->value.c_str();
}

void ProfileContent::remove_found(KeySlot* slot) {
    const KeyPlace key = slot->place;
    if (key->hidden)
        slot->place = *key->hidden;
    else
        found_keys_.remove(slot);
    key->section->keys.erase(key);
}

}  // namespace quo
