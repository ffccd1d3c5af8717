// SPDX-License-Identifier: Apache-2.0
#include "profilelib/profile_content.h"

#include <algorithm>
#include <cstring>
#include <stdexcept>
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

std::uint64_t hash_of(std::string_view section) { return NameHash{}.add(section).value(); }
/** Hash of a key by its name and by what its section's name is known by. */
std::uint64_t hash_of(std::uint32_t section, std::string_view name) {
    char number[sizeof section];
    std::memcpy(number, &section, sizeof section);
    return NameHash{}.add({number, sizeof number}).add(name).value();
}

}  // namespace

void ProfileContent::parse(std::string text) {
    if (text.size() >= kOwned) throw std::length_error{"a parameter file beyond 2 GiB"};
    file_text_ = std::move(text);
    Reader reader{file_text_};
    // What is kept never takes more than what was read: each NUL byte stands for a bracket, "=" or line feed.
    std::size_t end = 0;
    Index section = kNone;
    reader.take_before('[');
    while (!reader.at_end()) {
        if (reader.next() == '[') {
            reader.pass();
            const std::string_view name = reader.take_before(']');
            // A bracket that is never closed makes no section: nothing could find it, and it would not be written.
            if (reader.at_end()) return;
            reader.pass_line();
            const auto place = static_cast<Text>(end);
            keep(kept(name), end);
            section = add_section(place);
        }
        reader.skip_blanks();
        if (reader.next() == '=') {
            reader.pass_line();
            continue;
        }
        // A line feed does not end a key name, and a "[" drops what was read of one: files in use are written so.
        const std::string_view name = reader.take_before("[=");
        if (reader.next() != '=') continue;
        reader.pass();
        const std::string_view value = reader.take_before('\n');
        reader.pass();
        const auto place = static_cast<Text>(end);
        keep(kept(name), end);
        keep(kept(value), end);
        add_key(section, place);
    }
}

void ProfileContent::keep(std::string_view token, std::size_t& end) {
    std::memmove(file_text_.data() + end, token.data(), token.size());
    end += token.size();
    file_text_[end++] = '\0';
}

const char* ProfileContent::find(std::string_view section, std::string_view key) {
    const Slot* const newest = find_section(section);
    const Slot* const found = newest ? find_key(sections_[newest->index].text, key) : nullptr;
    return found ? value_of(found->index) : nullptr;
}

const char* ProfileContent::set(std::string_view section, std::string_view key, std::string_view value) {
    const Slot* const known = find_section(section);
    const Index newest = known ? known->index : add_section(own(std::string{section}));
    const Slot* const found = find_key(sections_[newest].text, key);
    std::string text{key};
    text.append(1, '\0').append(value);
    // A key that only an earlier section of the name holds is not changed but hidden by a new one: programs count
    // on their values standing in the last section.
    if (!found || keys_[found->index].section != newest) return value_of(add_key(newest, own(std::move(text))));
    Text& place = keys_[found->index].text;
    if (place & kOwned)
        owned_[place & ~kOwned].swap(text);
    else
        place = own(std::move(text));
    return value_of(found->index);
}

void ProfileContent::erase_key(std::string_view section, std::string_view key) {
    const Slot* const newest = find_section(section);
    Slot* const found = newest ? find_key(sections_[newest->index].text, key) : nullptr;
    // Earlier sections of the name are not searched: each call takes back at most what the last one set.
    if (!found || keys_[found->index].section != newest->index) return;
    remove_found(found);
    sweep();
}

void ProfileContent::erase_section(std::string_view section) {
    Slot* const slot = find_section(section);
    if (!slot) return;
    Section& newest = sections_[slot->index];
    remove_keys(newest);
    newest.gone = true;
    ++removed_;
    if (newest.hidden != kNone) {
        slot->index = newest.hidden;
    } else {
        newest_sections_.remove(slot);
        release(newest.text);
    }
    sweep();
}

const char* ProfileContent::at(Text text) const {
    return text & kOwned ? owned_[text & ~kOwned].c_str() : file_text_.c_str() + text;
}

const char* ProfileContent::value_of(Index key) const {
    const char* const name = at(keys_[key].text);
    return name + std::strlen(name) + 1;
}

ProfileContent::Text ProfileContent::own(std::string text) {
    if (free_owned_.empty()) {
        owned_.push_back(std::move(text));
        return kOwned | static_cast<Text>(owned_.size() - 1);
    }
    const Text place = free_owned_.back();
    free_owned_.pop_back();
    owned_[place & ~kOwned].swap(text);
    return place;
}

void ProfileContent::release(Text text) {
    if (!(text & kOwned)) return;
    std::string{}.swap(owned_[text & ~kOwned]);  // an assignment would keep the memory
    free_owned_.push_back(text);
}

ProfileContent::Slot* ProfileContent::find_section(std::string_view name) {
    return find_section(name, hash_of(name));
}
ProfileContent::Slot* ProfileContent::find_section(std::string_view name, std::uint64_t hash) {
    return newest_sections_.find(hash, [&](Index section) { return at(sections_[section].text) == name; });
}

ProfileContent::Slot* ProfileContent::find_key(Text section, std::string_view name) {
    return find_key(section, name, hash_of(section, name));
}
ProfileContent::Slot* ProfileContent::find_key(Text section, std::string_view name, std::uint64_t hash) {
    return found_keys_.find(hash, [&](Index key) {
        return at(keys_[key].text) == name && sections_[keys_[key].section].text == section;
    });
}

// From the last to the first, so that those are found that a search would find.
void ProfileContent::renew_newest_sections() {
    newest_sections_.make_anew();
    for (auto section = static_cast<Index>(sections_.size()); section-- > 0;) {
        if (sections_[section].gone) continue;
        const std::string_view name = at(sections_[section].text);
        const std::uint64_t hash = hash_of(name);
        if (!find_section(name, hash)) newest_sections_.add(section, hash);
    }
}
void ProfileContent::renew_found_keys() {
    found_keys_.make_anew();
    for (auto key = static_cast<Index>(keys_.size()); key-- > 0;) {
        if (keys_[key].section == kNone) continue;
        const Text section = sections_[keys_[key].section].text;
        const std::string_view name = at(keys_[key].text);
        const std::uint64_t hash = hash_of(section, name);
        if (!find_key(section, name, hash)) found_keys_.add(key, hash);
    }
}

ProfileContent::Index ProfileContent::add_section(Text text) {
    const auto section = static_cast<Index>(sections_.size());
    const std::string_view name = at(text);
    const std::uint64_t hash = hash_of(name);
    Slot* const slot = find_section(name, hash);
    const Index hidden = slot ? std::exchange(slot->index, section) : kNone;
    sections_.push_back({slot ? sections_[hidden].text : text, kNone, hidden});
    if (slot) return section;
    if (newest_sections_.is_full())
        renew_newest_sections();
    else
        newest_sections_.add(section, hash);
    return section;
}

ProfileContent::Index ProfileContent::add_key(Index section, Text text) {
    const auto key = static_cast<Index>(keys_.size());
    const Text named = sections_[section].text;
    const std::string_view name = at(text);
    const std::uint64_t hash = hash_of(named, name);
    Slot* const slot = find_key(named, name, hash);
    const Index hidden = slot ? std::exchange(slot->index, key) : kNone;
    keys_.push_back({text, section, key, hidden});
    Index& last = sections_[section].last;
    if (last != kNone) keys_[key].next = std::exchange(keys_[last].next, key);
    last = key;
    if (slot) return key;
    if (found_keys_.is_full())
        renew_found_keys();
    else
        found_keys_.add(key, hash);
    return key;
}

void ProfileContent::remove_found(Slot* slot) {
    Key& key = keys_[slot->index];
    if (key.hidden != kNone)
        slot->index = key.hidden;
    else
        found_keys_.remove(slot);
    release(key.text);
    key.section = kNone;
    ++removed_;
}

void ProfileContent::remove_keys(const Section& section) {
    // A key goes when a search finds it, after those that hide it; they all stand in this section.
    all_keys(keys_, section, [&](Index key) {
        while (keys_[key].section != kNone) remove_found(find_key(section.text, at(keys_[key].text)));
        return true;
    });
}

void ProfileContent::sweep() {
    constexpr std::size_t kFew = 16;
    const std::size_t left = sections_.size() + keys_.size() - removed_;
    if (removed_ < left + kFew) return;
    std::deque<Section> sections;
    std::deque<Key> keys;
    sections_.swap(sections);
    keys_.swap(keys);
    newest_sections_ = found_keys_ = {};
    removed_ = 0;
    for (const Section& old : sections) {
        if (old.gone) continue;
        const Index section = add_section(old.text);
        all_keys(keys, old, [&](Index key) { return add_key(section, keys[key].text) != kNone; });
    }
}

}  // namespace quo
