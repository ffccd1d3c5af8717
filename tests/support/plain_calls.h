// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_TESTS_SUPPORT_PLAIN_CALLS_H
#define QUO_TESTS_SUPPORT_PLAIN_CALLS_H

#include "support/escapes.h"
#include "support/session.h"

namespace test {

/** @file
 * Functions as they stand as calls of a session. Each argument is a word:
 *
 *   17.3, text       a number, or a text with \\n, \\r, \\t and \\\\
 *   "1 2 3", "a|b|"  numbers, or texts, that the function reads
 *   ?3, ?8, ?2*8     room for three numbers, each -7 at first; for a text of 8 bytes, all #; for two such texts
 *
 * What a call can have written is told as it stands afterwards, a byte 0 as \0; before it a result that is no
 * whole number. */

template <typename T>
T parsed(const char* word) {
    if constexpr (std::is_floating_point_v<T>) return static_cast<T>(std::strtod(word, nullptr));
    return static_cast<T>(std::strtoll(word, nullptr, 10));
}
/** Bytes as a line of a script. */
inline std::string shown(const std::string& bytes) {
    std::string line;
    for (const char c : bytes) line += c == '\0' ? std::string{"\\0"} : std::string(1, c);
    return line + "\n";
}

/** An argument of some type: a number, numbers, a text, texts. */
template <typename T>
struct Argument {
    explicit Argument(const char* word) : value{parsed<T>(word)} {}
    T get() { return value; }
    static void tell(std::string& /*told*/) {}
    T value;
};
template <typename T>
struct Argument<T*> {
    using Number = std::remove_const_t<T>;
    explicit Argument(const char* word) : there{word != nullptr} {
        std::istringstream list{there ? word : ""};
        for (std::string one; list >> one;) {
            if (one[0] != '?') values.push_back(parsed<Number>(one.c_str()));
            if (one[0] == '?') values.assign(std::stoul(one.substr(1)), static_cast<Number>(-7));
        }
    }
    T* get() { return there ? values.data() : nullptr; }
    void tell(std::string& told) const {
        for (const Number value : values) told += std::is_const_v<T> ? "" : digits(value) + " ";
        if (!told.empty() && told.back() == ' ') told.back() = '\n';
    }
    bool there;
    std::vector<Number> values;
};
template <>
struct Argument<char*> {
    explicit Argument(const char* word) : there{word != nullptr} {
        if (there) text = *word == '?' ? std::string(std::stoul(word + 1), '#') : unescaped(word);
    }
    char* get() { return there ? text.data() : nullptr; }
    void tell(std::string& told) const { told += shown(text); }
    bool there;
    std::string text;
};
template <>
struct Argument<const char*> : Argument<char*> {
    using Argument<char*>::Argument;
    static void tell(std::string& /*told*/) {}
};
template <>
struct Argument<char* const*> {
    explicit Argument(const char* word) : there{word != nullptr} {
        std::istringstream list{there ? word : ""};
        for (std::string one; std::getline(list, one, '|');) {
            if (one[0] != '?') texts.push_back(one);
            if (one[0] == '?')
                texts.assign(std::stoul(one.substr(1)), std::string(std::stoul(one.substr(3)), '#'));
        }
    }
    char* const* get() {
        for (std::string& text : texts) places.push_back(text.data());
        return there ? places.data() : nullptr;
    }
    void tell(std::string& told) const {
        for (const std::string& text : texts) told += shown(text);
    }
    bool there;
    std::vector<std::string> texts;
    std::vector<char*> places;
};
template <>
struct Argument<const char* const*> : Argument<char* const*> {
    using Argument<char* const*>::Argument;
    static void tell(std::string& /*told*/) {}
};

/** Gives a whole number, and tells any other result. */
template <typename Result>
std::int64_t given(const Result& result, std::string& told) {
    if constexpr (std::is_integral_v<Result> || std::is_enum_v<Result>) return static_cast<std::int64_t>(result);
    if constexpr (std::is_floating_point_v<Result>) told += digits(result) + "\n";
    if constexpr (std::is_pointer_v<Result>) told += shown(result ? result : "(null)");
    if constexpr (std::is_class_v<Result>) told += shown(result);
    return 0;
}

using Call = std::function<std::int64_t(const Words& words, std::string& told)>;
using Calls = std::map<std::string, Call>;

template <typename Result, typename... Parameters, std::size_t... kWords>
std::int64_t carried_out(const std::function<Result(Parameters...)>& function, const Words& words,
                         std::string& told, std::index_sequence<kWords...> /*places*/) {
    std::tuple<Argument<Parameters>...> arguments{Argument<Parameters>{words.text(kWords + 1)}...};
    std::int64_t result = 0;
    if constexpr (std::is_void_v<Result>)
        function(std::get<kWords>(arguments).get()...);
    else
        result = given(function(std::get<kWords>(arguments).get()...), told);
    (std::get<kWords>(arguments).tell(told), ...);
    return result;
}
/** A call of whatever takes arguments of these types. */
template <typename Result, typename... Parameters>
Call call_of(std::function<Result(Parameters...)> function) {
    return [function](const Words& words, std::string& told) {
        return carried_out(function, words, told, std::index_sequence_for<Parameters...>{});
    };
}
template <typename Result, typename... Parameters>
Call call_of(Result (*function)(Parameters...)) {
    return call_of(std::function<Result(Parameters...)>{function});
}
/** A call of a member of an object. */
template <typename Object, typename Class, typename Result, typename... Parameters>
Call call_of(Object& object, Result (Class::*member)(Parameters...)) {
    return call_of(std::function<Result(Parameters...)>{
        [&object, member](Parameters... parameters) -> Result { return (object.*member)(parameters...); }});
}
template <typename Object, typename Class, typename Result, typename... Parameters>
Call call_of(const Object& object, Result (Class::*member)(Parameters...) const) {
    return call_of(std::function<Result(Parameters...)>{
        [&object, member](Parameters... parameters) -> Result { return (object.*member)(parameters...); }});
}
/** The names in a list of functions or members, as the preprocessor spells it. */
inline std::vector<std::string> names_in(const std::string& list) {
    std::istringstream words{list};
    std::vector<std::string> names;
    for (std::string word; words >> word; names.back() = names.back().substr(0, names.back().find(',')))
        names.push_back(word.substr(word.rfind(':') + 1));
    return names;
}
/** A call of each, by its name; of members with the object in front. */
template <typename... Functions>
Calls calls_of(const std::vector<std::string>& names, Functions... functions) {
    Calls calls;
    auto name = names.begin();
    ((calls[*name++] = call_of(functions)), ...);
    return calls;
}
template <typename Object, typename... Members>
Calls calls_on(Object& object, const std::vector<std::string>& names, Members... members) {
    Calls calls;
    auto name = names.begin();
    ((calls[*name++] = call_of(object, members)), ...);
    return calls;
}
#define QUO_CALLS(...) test::calls_of(test::names_in(#__VA_ARGS__), __VA_ARGS__)
#define QUO_MEMBERS(object, ...) test::calls_on(object, test::names_in(#__VA_ARGS__), __VA_ARGS__)

/** A session with a report, in a folder of its own, which is the current one. */
class PlainSession : public testing::TestWithParam<std::string> {
protected:
    PlainSession() { std::filesystem::current_path(report_.folder().path()); }
    ~PlainSession() override {
        EXPECT_EQ(report_.entries().size(), told_) << "entries that no line tells";
        std::filesystem::current_path(before_);
    }
    /** Runs it with these calls, and some on files and the report. */
    void run(const char* script, Calls calls);

private:
    std::int64_t tell_entries(std::string& told) {
        for (const auto entries = report_.entries(); told_ < entries.size(); ++told_)
            told += entries[told_].kind + " " + entries[told_].function + ": " + entries[told_].message + "\n";
        return 0;
    }

    const std::filesystem::path before_ = std::filesystem::current_path();
    Report report_;
    std::size_t told_ = 0;
};

/** The status with which a process of its own ends that makes a call. */
inline std::int64_t ended(const Call& call, const Words& words, std::string& told) {
    const pid_t process = fork();
    if (process == 0) _exit(call(words, told) == 0 ? 99 : 98);
    int status = 0;
    waitpid(process, &status, 0);
    return WEXITSTATUS(status);
}

inline void PlainSession::run(const char* script, Calls calls) {
    namespace fs = std::filesystem;
    calls["text"] = [](auto& words, auto&) { return write_text(words.text(1), unescaped(words.text(2))), 0; };
    calls["show"] = [](auto& words, auto& told) { return told = shown(read_text(words.text(1))), 0; };
    calls["length"] = [](auto& words, auto&) { return static_cast<std::int64_t>(fs::file_size(words.text(1))); };
    calls["resize"] = [](auto& words, auto&) { return truncate(words.text(1), words.number(2)); };
    calls["remove"] = [](auto& words, auto&) { return std::remove(words.text(1)); };
    calls["link"] = [](auto& words, auto&) { return symlink(words.text(2), words.text(1)); };
    calls["leads"] = [](auto& words, auto& told) { return told = shown(fs::read_symlink(words.text(1))), 0; };
    calls["report"] = [this](auto&, auto& told) { return tell_entries(told); };
    for (const auto& [name, call] : Calls{calls}) {
        calls["ends:" + name] = [call = call](auto& words, auto& told) { return ended(call, words, told); };
        calls["starves:" + name] = [this, call = call](auto& words, auto& told) {
            fail_every_allocation([&] { return told.clear(), static_cast<int>(call(words, told)); });
            return told_ = report_.entries().size(), 0;
        };
    }
    run_session(script, GetParam(), [&](const Words& words, std::string& told) {
        const std::int64_t result = calls.at(words.text(0))(words, told);
        EXPECT_EQ(errno, 0) << words.text(0);
        return result;
    });
}

}  // namespace test

#endif
