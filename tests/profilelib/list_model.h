#ifndef QUO_TESTS_LIST_MODEL_H
#define QUO_TESTS_LIST_MODEL_H

#include <algorithm>
#include <optional>
#include <random>
#include <string>
#include <string_view>
#include <vector>

namespace test {

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

/** Random files and choices, the same on every machine. */
class Dice {
public:
    explicit Dice(unsigned seed) : engine_{seed} {}
    unsigned below(unsigned bound) { return static_cast<unsigned>(engine_() % bound); }
    /** A text of characters from `alphabet`. */
    std::string text(std::string_view alphabet, unsigned longest) {
        std::string made(below(longest + 1), '\0');
        for (char& c : made) c = alphabet[below(static_cast<unsigned>(alphabet.size()))];
        return made;
    }
    std::string bytes(unsigned longest) {
        std::string made(below(longest + 1), '\0');
        for (char& c : made) c = static_cast<char>(below(256));
        return made;
    }

private:
    std::mt19937 engine_;  // its sequence is fixed by the standard, those of the distributions are not
};

}  // namespace test

#endif
