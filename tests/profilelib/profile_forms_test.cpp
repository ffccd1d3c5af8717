#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <array>
#include <cstdint>
#include <string>

#include "quo_base/profile.h"
#include "support/diagnostics.h"

namespace {

using testing::ElementsAre;

constexpr const char* kFile = "/nowhere/a.par";  // exists in memory only
constexpr const char* kKey = "Length";

int ints[2] = {17, 29};
int64_t wide[2] = {17, 29};
float floats[2] = {17.5F, 29.5F};
double doubles[2] = {17.5, 29.5};
char text[8] = "";
char* const strings[2] = {text, text};

/** A wrapper's call, with a key that the store refuses when writing and does not have when reading. */
struct Wrapper {
    const char* name;
    void (*call)(const char* key);
    const char* message;
};
const Wrapper kWrappers[] = {
    {"GetString", [](const char* key) { GetCheckMyProfileString("s", key, text, 8, kFile); },
     "Error in GetMyProfileString: section s, key Length, file /nowhere/a.par\n"},
    {"GetStringArray", [](const char* key) { GetCheckMyProfileStringArray("s", key, strings, 2, 8, kFile); },
     "Error in GetMyProfileStringArray: section s, key Length, file /nowhere/a.par\n"},
    {"GetIntArray", [](const char* key) { GetCheckMyProfileIntArray("s", key, ints, 2, kFile); },
     "Error in GetMyProfileIntArray: section s, key Length, file /nowhere/a.par\n"},
    {"GetInt64Array", [](const char* key) { GetCheckMyProfileInt64Array("s", key, wide, 2, kFile); },
     "Error in GetMyProfileInt64Array: section s, key Length, file /nowhere/a.par\n"},
    {"GetLongArray", [](const char* key) { GetCheckMyProfileLongArray("s", key, ints, 2, kFile); },
     "Error in GetMyProfileIntArray: section s, key Length, file /nowhere/a.par\n"},
    {"GetFloatArray", [](const char* key) { GetCheckMyProfileFloatArray("s", key, floats, 2, kFile); },
     "Error in GetMyProfileFloatArray: section s, key Length, file /nowhere/a.par\n"},
    {"GetDoubleArray", [](const char* key) { GetCheckMyProfileDoubleArray("s", key, doubles, 2, kFile); },
     "Error in WriteMyProfileDouble: section s, key Length, file /nowhere/a.par\n"},
    {"String", [](const char* key) { WriteCheckMyProfileString("s", key, "17.3", kFile); },
     "Error in WriteMyProfileString: section s, key , string 17.3, file /nowhere/a.par\n"},
    {"IntArray", [](const char* key) { WriteCheckMyProfileIntArray("s", key, ints, 2, kFile); },
     "Error in WriteMyProfileIntArray: section s, key , file /nowhere/a.par\n"},
    {"Int64Array", [](const char* key) { WriteCheckMyProfileInt64Array("s", key, wide, 2, kFile); },
     "Error in WriteMyProfileInt64Array: section s, key , file /nowhere/a.par\n"},
    {"Int", [](const char* key) { WriteCheckMyProfileInt("s", key, -17, kFile); },
     "Error in WriteMyProfileInt: section s, key , value -17, file /nowhere/a.par\n"},
    {"Int64", [](const char* key) { WriteCheckMyProfileInt64("s", key, 9007199254740993, kFile); },
     "Error in WriteMyProfileInt64: section s, key , value 9007199254740993.000000, file /nowhere/a.par\n"},
    {"LongArray", [](const char* key) { WriteCheckMyProfileLongArray("s", key, ints, 2, kFile); },
     "Error in WriteMyProfileLongArray: section s, key , file /nowhere/a.par\n"},
    {"Double", [](const char* key) { WriteCheckMyProfileDouble("s", key, 17.3, kFile); },
     "Error in WriteMyProfileDouble: section s, key , value 17.300000, file /nowhere/a.par\n"},
    {"FloatArray", [](const char* key) { WriteCheckMyProfileFloatArray("s", key, floats, 2, kFile); },
     "Error in WriteMyProfileDouble: section s, key , file /nowhere/a.par\n"},
    {"DoubleArray", [](const char* key) { WriteCheckMyProfileDoubleArray("s", key, doubles, 2, kFile); },
     "Error in WriteMyProfileDouble: section s, key , file /nowhere/a.par\n"},
};

class ProfileCheck : public testing::TestWithParam<Wrapper> {};

TEST_P(ProfileCheck, EndsTheProcessUnlessTheValueIsThere) {
    const std::string name = GetParam().name;
    const bool reads = name.starts_with("Get");
    EXPECT_EXIT(GetParam().call(reads ? kKey : nullptr), testing::ExitedWithCode(1),
                testing::Eq(GetParam().message));
    EXPECT_EQ(GetSetProfileChar(0, "s", kKey, nullptr, kFile), nullptr);
    if (reads) GetSetProfileChar(1, "s", kKey, name == "GetStringArray" ? R"({"3" "4"})" : "{3 4}", kFile);
    GetParam().call(kKey);
    EXPECT_NE(GetSetProfileChar(0, "s", kKey, nullptr, kFile), nullptr);
    FreeProfile(kFile);
}
INSTANTIATE_TEST_SUITE_P(Wrappers, ProfileCheck, testing::ValuesIn(kWrappers),
                         [](const auto& row) { return std::string{row.param.name}; });

// The plain function gives the number of strings read for its status: one too few is a failure, none at all is
// not.
TEST(ProfileReadCheck, TooFewElementsEndTheProcess) {
    GetSetProfileChar(1, "s", kKey, "{3}", kFile);
    EXPECT_EXIT(GetCheckMyProfileIntArray("s", kKey, ints, 2, kFile), testing::ExitedWithCode(1),
                "Error in GetMyProfileIntArray");
    GetSetProfileChar(1, "s", kKey, R"({"3"})", kFile);
    EXPECT_EXIT(GetCheckMyProfileStringArray("s", kKey, strings, 2, 8, kFile), testing::ExitedWithCode(1),
                "Error in GetMyProfileStringArray");
    GetSetProfileChar(1, "s", kKey, "{}", kFile);
    GetCheckMyProfileStringArray("s", kKey, strings, 2, 8, kFile);
}

TEST(ProfilePar, SetFormsReachTheDiskAtOnceAndGetFormsReadThem) {
    const test::TemporaryFolder folder;
    const std::string path = folder.file("a.par");
    const char* const file = path.c_str();
    EXPECT_EQ(SetParString(file, "Name", -1, "a b", 0, "s"), 0);
    EXPECT_EQ(test::read_text(path), "\n[s]\nName = a b\n");
    EXPECT_EQ(SetParInt(file, "Int", 2, ints, 0, "s"), 0);
    EXPECT_EQ(SetParFloat(file, "Float", 2, floats, 0, "s"), 0);
    EXPECT_EQ(SetParDouble(file, "Double", 2, doubles, 0, "t"), 0);
    EXPECT_EQ(test::read_text(path),
              "\n[s]\nName = a b\nInt = {17 29}\nFloat = {17.5 29.5}\n\n[t]\nDouble = {17.5 29.5}\n");

    FreeProfile(file);
    char name[512];
    std::array<int, 2> int_values{};
    std::array<float, 2> float_values{};
    std::array<double, 2> double_values{};
    EXPECT_EQ(GetParString(file, "Name", -1, name, 0, "s"), 0);
    EXPECT_EQ(GetParInt(file, "Int", 2, int_values.data(), 0, "s"), 0);
    EXPECT_EQ(GetParFloat(file, "Float", 2, float_values.data(), 0, "s"), 0);
    EXPECT_EQ(GetParDouble(file, "Double", 2, double_values.data(), 0, "t"), 0);
    EXPECT_STREQ(name, "a b");
    EXPECT_THAT(int_values, ElementsAre(17, 29));
    EXPECT_THAT(float_values, ElementsAre(17.5F, 29.5F));
    EXPECT_THAT(double_values, ElementsAre(17.5, 29.5));
    EXPECT_EQ(GetParDouble(file, "Double", 2, double_values.data(), 0, "s"), 10);
}

TEST(ProfilePar, StringsAreCutTo511Bytes) {
    GetSetProfileChar(1, "s", kKey, std::string(600, 'v').c_str(), kFile);
    std::string buffer(513, '#');
    EXPECT_EQ(GetParString(kFile, kKey, 3, buffer.data(), 0, "s"), 0);
    EXPECT_EQ(buffer, std::string(511, 'v') + std::string("\0#", 2));
}

// The status is that of the write. A missing path must not turn into the sync of every file.
TEST(ProfilePar, SetFormsReturnTheStatusOfTheWrite) {
    const test::TemporaryFolder folder;
    const std::string path = folder.file("a.par");
    GetSetProfileChar(1, "s", kKey, "v", path.c_str());
    EXPECT_EQ(SetParInt(kFile, kKey, 2, ints, 0, "s"), 0) << "though it cannot be synced";
    EXPECT_EQ(SetParInt(kFile, nullptr, 2, ints, 0, "s"), 10);
    EXPECT_EQ(SetParInt(nullptr, kKey, 2, ints, 0, "s"), 10);
    EXPECT_EQ(test::read_text(path), "");
}

}  // namespace
