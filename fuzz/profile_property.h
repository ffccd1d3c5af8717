// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_FUZZ_PROFILE_PROPERTY_H
#define QUO_FUZZ_PROFILE_PROPERTY_H

/* What holds for any bytes as a parameter file, and for any text as a value: the fuzzer and the tests both ask. */

#include <algorithm>
#include <array>
#include <cstddef>
#include <cstdint>
#include <iterator>
#include <optional>
#include <set>
#include <string>
#include <string_view>
#include <vector>

#include "profilelib/profile_content.h"
#include "quo_base/profile.h"

namespace property {

/** What a parameter file means, told the slow way: one character after the other, lists searched from the end. */
class ListModel {
public:
    struct Key {
        std::string name, value;
    };
    struct Section {
        std::optional<std::string> name;  // none while the bracket is open
        std::vector<Key> keys;
    };

    explicit ListModel(std::string_view text) {
        enum { kBefore, kName, kSkip, kLineStart, kKey, kValue } state = kBefore;
        std::string token;
        for (const char c : text) {
            if (c == '[' && (state == kBefore || state == kLineStart || state == kKey)) {
                sections.emplace_back();
                token.clear();
                state = kName;
            } else if (state == kName && c == ']') {
                sections.back().name = trimmed(token);
                state = kSkip;
            } else if (state == kSkip && c == '\n') {
                state = kLineStart;
                token.clear();
            } else if (state == kLineStart && c == '=') {
                state = kSkip;
            } else if (state == kKey && c == '=') {
                sections.back().keys.push_back({trimmed(token), ""});
                token.clear();
                state = kValue;
            } else if (state == kValue && c == '\n') {
                sections.back().keys.back().value = trimmed(token);
                token.clear();
                state = kLineStart;
            } else if (state != kBefore && state != kSkip && !(state == kLineStart && c == ' ')) {
                token += c;
                if (state == kLineStart) state = kKey;
            }
        }
        if (state == kValue) sections.back().keys.back().value = trimmed(token);
    }

    [[nodiscard]] std::optional<std::string> get(std::string_view section, std::string_view key) const {
        for (auto s = sections.rbegin(); s != sections.rend(); ++s) {
            if (s->name != section) continue;
            for (auto k = s->keys.rbegin(); k != s->keys.rend(); ++k)
                if (k->name == key) return k->value;
        }
        return std::nullopt;
    }
    void set(std::string_view section, std::string_view key, std::string_view value) {
        Section* target = newest(section);
        if (!target) target = &sections.emplace_back(Section{std::string{section}, {}});
        const auto k = newest_key(*target, key);
        if (k != target->keys.end())
            k->value = value;
        else
            target->keys.push_back({std::string{key}, std::string{value}});
    }
    void erase_key(std::string_view section, std::string_view key) {
        Section* const target = newest(section);
        if (!target) return;
        const auto k = newest_key(*target, key);
        if (k != target->keys.end()) target->keys.erase(k);
    }
    void erase_section(std::string_view section) {
        if (Section* const target = newest(section)) sections.erase(sections.begin() + (target - sections.data()));
    }
    [[nodiscard]] std::string text() const {
        std::string all;
        for (const Section& section : sections) {
            if (!section.name) continue;
            all += "\n[" + *section.name + "]\n";
            for (const Key& key : section.keys) all += key.name + " = " + key.value + "\n";
        }
        return all;
    }

    std::vector<Section> sections;  // in file order

private:
    static std::string trimmed(const std::string& token) {
        std::string text = token.c_str();  // a NUL byte ends every string
        while (text.ends_with(' ')) text.pop_back();
        while (text.starts_with(' ')) text.erase(0, 1);
        return text;
    }
    Section* newest(std::string_view name) {
        const auto s =
            std::find_if(sections.rbegin(), sections.rend(), [&](auto& one) { return one.name == name; });
        return s == sections.rend() ? nullptr : &*s;
    }
    static std::vector<Key>::iterator newest_key(Section& section, std::string_view name) {
        auto& keys = section.keys;
        const auto k = std::find_if(keys.rbegin(), keys.rend(), [&](auto& one) { return one.name == name; });
        return k == keys.rend() ? keys.end() : std::prev(k.base());
    }
};

inline std::string written(const quo::ProfileContent& content) {
    std::string text;
    content.write([&text](std::string_view piece) { return text += piece, true; });
    return text;
}

/** What is wrong with the way a text is read as a parameter file, answered for and written back; empty where
 * nothing is. Each name that stands in it, and one that does not, must be answered as the lists do. */
inline std::string content_breach(const std::string& text) {
    quo::ProfileContent content, again;
    const ListModel model{text};
    content.parse(text);
    if (written(content) != model.text()) return "written otherwise";
    std::set<std::string> names{"none"}, keys{"none"};
    for (const auto& section : model.sections) {
        if (section.name) names.insert(*section.name);
        for (const auto& key : section.keys) keys.insert(key.name);
    }
    if (names.size() * keys.size() > 10000) return "";  // a fuzzer's long file would take seconds
    for (const auto& name : names)
        for (const auto& key : keys) {
            const char* const found = content.find(name, key);
            if ((found ? std::optional<std::string>{found} : std::nullopt) != model.get(name, key))
                return "[" + name + "] " + key + " is answered otherwise";
        }
    // An empty key name, which only a NUL byte leaves, does not read back.
    again.parse(written(content));
    return text.find('\0') != text.npos || written(again) == written(content) ? "" : "reads back otherwise";
}

/** The same of the readers of typed values: they must stay within their arrays whatever a value looks like. The
 * address sanitizer watches what stands behind the arrays' spare last elements. */
inline std::string value_breach(const std::string& value) {
    constexpr const char* kFile = "/nowhere/property.par";
    constexpr int kCount = 3, kRoom = 5;
    GetSetProfileChar(1, "s", "k", value.c_str(), kFile);
    std::array<int, kCount + 1> ints{};
    std::array<int64_t, kCount + 1> wide{};
    std::array<float, kCount + 1> floats{};
    std::array<double, kCount + 1> doubles{};
    std::array<std::array<char, kRoom + 1>, kCount + 1> rooms{};
    char* const strings[kCount] = {rooms[0].data(), rooms[1].data(), rooms[2].data()};
    GetMyProfileIntArray("s", "k", ints.data(), kCount, kFile);
    GetMyProfileInt64Array("s", "k", wide.data(), kCount, kFile);
    GetMyProfileFloatArray("s", "k", floats.data(), kCount, kFile);
    GetProfileDoubleArray("s", "k", doubles.data(), kCount, kFile);
    GetMyProfileStringArray("s", "k", strings, kCount, kRoom, kFile);
    GetMyProfileString("s", "k", rooms.back().data(), kRoom, kFile);
    DelProfileSection("s", kFile);
    if (ints.back() != 0 || wide.back() != 0 || floats.back() != 0.0F || doubles.back() != 0.0)
        return "numbers run over";
    const bool within = std::ranges::all_of(rooms, [](const auto& room) { return room[kRoom - 1] == '\0'; });
    return within ? "" : "a string runs over";
}

}  // namespace property

#endif
