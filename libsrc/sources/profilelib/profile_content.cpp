#include "profilelib/profile_content.h"

#include <algorithm>
#include <utility>

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
        text.append("\n[").append(section.namesakes->first).append("]\n");
        for (const Key& key : section.keys) text.append(key.name).append(" = ").append(key.value).append("\n");
    }
    return text;
}

const char* ProfileContent::find(std::string_view section, std::string_view key) const {
    const auto namesakes = by_name_.find(section);
    if (namesakes == by_name_.end()) return nullptr;
    const auto entry = namesakes->second.found_keys.find(key);
    return entry == namesakes->second.found_keys.end() ? nullptr : entry->second->value.c_str();
}

const char* ProfileContent::set(std::string_view section, std::string_view key, std::string_view value) {
    const auto namesakes = by_name_.find(section);
    if (namesakes == by_name_.end()) return add_key(add_section(section), key, value);
    auto& [sections, found_keys] = namesakes->second;
    const auto entry = found_keys.find(key);
    // Deliberate: a key that only an earlier section of the name holds is not changed but hidden by a new one.
    if (entry == found_keys.end() || entry->second->section != sections.back())
        return add_key(sections.back(), key, value);
    std::string copy{value};
    entry->second->value.swap(copy);
    return entry->second->value.c_str();
}

void ProfileContent::erase_key(std::string_view section, std::string_view key) {
    const auto namesakes = by_name_.find(section);
    if (namesakes == by_name_.end()) return;
    auto& [sections, found_keys] = namesakes->second;
    const auto entry = found_keys.find(key);
    // Deliberate: earlier sections of the name are not searched.
    if (entry != found_keys.end() && entry->second->section == sections.back()) remove_found(found_keys, entry);
}

void ProfileContent::erase_section(std::string_view section) {
    const auto namesakes = by_name_.find(section);
    if (namesakes == by_name_.end()) return;
    auto& [sections, found_keys] = namesakes->second;
    const SectionPlace newest = sections.back();
    // From the last to the first, each key is the one that a search finds.
    while (!newest->keys.empty()) remove_found(found_keys, found_keys.find(newest->keys.back().name));
    sections_.erase(newest);
    sections.pop_back();
    if (sections.empty()) by_name_.erase(namesakes);
}

ProfileContent::SectionPlace ProfileContent::add_section(std::string_view name) {
    auto namesakes = by_name_.find(name);
    if (namesakes == by_name_.end()) namesakes = by_name_.try_emplace(std::string{name}).first;
    const SectionPlace section = sections_.insert(sections_.end(), Section{&*namesakes, {}});
    namesakes->second.sections.push_back(section);
    return section;
}

const char* ProfileContent::add_key(SectionPlace section, std::string_view name, std::string_view value) {
    const auto [entry, first] = section->namesakes->second.found_keys.try_emplace(std::string{name});
    const auto hidden = first ? std::nullopt : std::optional{entry->second};
    entry->second =
        section->keys.insert(section->keys.end(), Key{entry->first, std::string{value}, section, hidden});
    return entry->second->value.c_str();
}

void ProfileContent::remove_found(Index<KeyPlace>& found_keys, Index<KeyPlace>::iterator entry) {
    const KeyPlace key = entry->second;
    if (key->hidden)
        entry->second = *key->hidden;
    else
        found_keys.erase(entry);
    key->section->keys.erase(key);
}

}  // namespace quo
