#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <iterator>
#include <string>
#include <utility>

#include "quo_base/profile.h"
#include "support/diagnostics.h"

namespace {

using testing::ElementsAre;

constexpr const char* kFile = "/nowhere/a.par";  // exists in memory only
constexpr const char* kKey = "Length";

struct Data {
    int ints[2] = {17, 29};
    int64_t wide[2] = {17, 29};
    float floats[2] = {17.5F, 29.5F};
    double doubles[2] = {17.5, 29.5};
    char text[8] = "";
    bool operator==(const Data& other) const = default;
};
Data data;
auto& [ints, wide, floats, doubles, text] = data;
char* const strings[2] = {text, text};

/** A function with all its arguments but the key. */
template <typename Function, typename... Arguments>
auto call(Function function, Arguments... arguments) {
    return [=](const char* key) { return function("s", key, arguments..., kFile); };
}

/** A wrapper, and what it says between its first words and the file when there is no value or no key. */
struct Wrapper {
    std::function<void(const char* key)> call;
    const char *function, *end;
};
const Wrapper kReaders[] = {
    {call(GetCheckMyProfileString, text, 8), "GetMyProfileString", ""},
    {call(GetCheckMyProfileStringArray, strings, 2, 8), "GetMyProfileStringArray", ""},
    {call(GetCheckMyProfileIntArray, ints, 2), "GetMyProfileIntArray", ""},
    {call(GetCheckMyProfileInt64Array, wide, 2), "GetMyProfileInt64Array", ""},
    {call(GetCheckMyProfileLongArray, ints, 2), "GetMyProfileIntArray", ""},
    {call(GetCheckMyProfileFloatArray, floats, 2), "GetMyProfileFloatArray", ""},
    {call(GetCheckMyProfileDoubleArray, doubles, 2), "WriteMyProfileDouble", ""},
};
const Wrapper kWriters[] = {
    {call(WriteCheckMyProfileString, "17.3"), "WriteMyProfileString", ", string 17.3"},
    {call(WriteCheckMyProfileIntArray, ints, 2), "WriteMyProfileIntArray", ""},
    {call(WriteCheckMyProfileInt64Array, wide, 2), "WriteMyProfileInt64Array", ""},
    {call(WriteCheckMyProfileInt, -17), "WriteMyProfileInt", ", value -17"},
    {call(WriteCheckMyProfileInt64, 9007199254740993), "WriteMyProfileInt64", ", value 9007199254740993.000000"},
    {call(WriteCheckMyProfileLongArray, ints, 2), "WriteMyProfileLongArray", ""},
    {call(WriteCheckMyProfileDouble, 17.3), "WriteMyProfileDouble", ", value 17.300000"},
    {call(WriteCheckMyProfileFloatArray, floats, 2), "WriteMyProfileDouble", ""},
    {call(WriteCheckMyProfileDoubleArray, doubles, 2), "WriteMyProfileDouble", ""},
};

void expect_end(const Wrapper& wrapper, const char* key) {
    EXPECT_EXIT(wrapper.call(key), testing::ExitedWithCode(1),
                testing::Eq(std::string{"Error in "} + wrapper.function + ": section s, key " + (key ? key : "") +
                            wrapper.end + ", file " + kFile + "\n"));
}

TEST(ProfileCheck, EndsTheProcessUnlessTheValueIsThere) {
    for (const Wrapper& reader : kReaders) {
        expect_end(reader, kKey);
        GetSetProfileChar(1, "s", kKey, &reader == &kReaders[1] ? R"({"3" "4"})" : "{3 4}", kFile);
        reader.call(kKey);
        // The plain function gives the number of strings read for its status: one too few is a failure, none at
        // all is not.
        GetSetProfileChar(1, "s", kKey, R"({"3"})", kFile);
        if (&reader != &kReaders[0]) expect_end(reader, kKey);
        GetSetProfileChar(1, "s", kKey, "{}", kFile);
        if (&reader == &kReaders[1]) reader.call(kKey);
        FreeProfile(kFile);
    }
    for (const Wrapper& writer : kWriters) {
        expect_end(writer, nullptr);
        writer.call(kKey);
        EXPECT_NE(GetSetProfileChar(0, "s", kKey, nullptr, kFile), nullptr);
        FreeProfile(kFile);
    }
}

using Plain = std::function<int(const char* key)>;

TEST(ProfilePlain, SaysNothingOfAMissingKeyAndWarnsOfRefusedWrites) {
    const test::Report report;
    const Plain readers[] = {call(GetMyProfileString, text, 8),      call(GetMyProfileStringArray, strings, 2, 8),
                             call(GetMyProfileIntArray, ints, 2),    call(GetMyProfileInt64Array, wide, 2),
                             call(GetMyProfileLongArray, ints, 2),   call(GetMyProfileFloatArray, floats, 2),
                             call(GetProfileDoubleArray, doubles, 2)};
    const Data before = data;
    for (const Plain& read : readers) EXPECT_EQ(read(kKey), 10);
    EXPECT_TRUE(data == before);
    EXPECT_EQ(report.entries().size(), 0U);

    const char* const word = "t";
    GetSetProfileChar(1, "s", kKey, "{\"1\" 2}", kFile);
    const std::pair<Plain, const char*> refused[] = {{call(WriteMyProfileStringQuote, word), nullptr},
                                                     {call(WriteMyProfileStringArray, &word, 1), nullptr},
                                                     {call(WriteMyProfileStringMatrix, &word, 1, 1), nullptr},
                                                     {call(WriteMyProfileDoubleMatrix, doubles, 1, 1), nullptr},
                                                     {call(WriteMyProfileIntArray, nullptr, 2), kKey},
                                                     {call(WriteMyProfileString, nullptr), kKey},
                                                     {call(WriteMyProfileStringQuote, nullptr), kKey},
                                                     {call(GetMyProfileIntArray, nullptr, 2), kKey},
                                                     {call(GetMyProfileStringArray, nullptr, 1, 10), kKey}};
    for (const auto& [refuse, key] : refused) EXPECT_EQ(refuse(key), 10);
    EXPECT_EQ(report.entries("WARNING").size(), std::size(refused));
    EXPECT_EQ(report.entries().front().message, "Parameter writing failed - SEC: s, KEY: , FILE: /nowhere/a.par");
    EXPECT_EQ(report.entries().front().function, "WriteMyProfileStringQuote");
    EXPECT_STREQ(GetSetProfileChar(0, "s", kKey, nullptr, kFile), "{\"1\" 2}");
}

TEST(ProfilePar, SetFormsReachTheDiskAtOnceAndGetFormsReadThem) {
    const test::TemporaryFolder folder;
    const std::string path = folder.file("a.par");
    const char* const file = path.c_str();
    data = {};
    EXPECT_EQ(SetParString(file, "Name", -1, "a b", 0, "s") + SetParInt(file, "Int", 2, ints, 0, "s") +
                  SetParFloat(file, "Float", 2, floats, 0, "s") + SetParDouble(file, "Double", 2, doubles, 0, "t"),
              0);
    const std::string written =
        "\n[s]\nName = a b\nInt = {17 29}\nFloat = {17.5 29.5}\n\n[t]\nDouble = {17.5 29.5}\n";
    EXPECT_EQ(test::read_text(path), written);

    FreeProfile(file);
    std::string name(513, '#');
    Data read{{}, {}, {}, {}, ""};
    EXPECT_EQ(GetParString(file, "Name", 3, name.data(), 0, "s") + GetParInt(file, "Int", 2, read.ints, 0, "s") +
                  GetParFloat(file, "Float", 2, read.floats, 0, "s") +
                  GetParDouble(file, "Double", 2, read.doubles, 0, "t"),
              0);
    EXPECT_EQ(name, "a b" + std::string(509, '\0') + "#") << "in 512 bytes, whatever the count";
    EXPECT_THAT(read.ints, ElementsAre(17, 29));
    EXPECT_THAT(read.floats, ElementsAre(17.5F, 29.5F));
    EXPECT_THAT(read.doubles, ElementsAre(17.5, 29.5));
    EXPECT_EQ(GetParDouble(file, "Double", 2, read.doubles, 0, "s"), 10);

    // The status is that of the write. A missing path must not turn into the sync of every file.
    GetSetProfileChar(1, "s", "Name", "v", file);
    EXPECT_EQ(SetParInt(kFile, kKey, 2, ints, 0, "s"), 0) << "though it cannot be synced";
    EXPECT_EQ(SetParInt(kFile, nullptr, 2, ints, 0, "s") + SetParInt(nullptr, kKey, 2, ints, 0, "s"), 20);
    EXPECT_EQ(test::read_text(path), written);
}

}  // namespace
