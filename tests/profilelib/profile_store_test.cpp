// SPDX-License-Identifier: Apache-2.0
#include "profile_property.h"
#include "quo_base/profile.h"
#include "support/diagnostics.h"

namespace {

using test::read_text;
using test::write_text;

/** A folder of files, and an empty store before and after. */
class ProfileStore : public testing::Test {
protected:
    ProfileStore() { FreeProfile(nullptr); }
    ~ProfileStore() override { FreeProfile(nullptr); }

    /** The name of a file in the folder, with this text in it. */
    std::string file(std::string_view name, std::string_view text) {
        write_text(folder_.path() / name, text);
        return folder_.file(name);
    }
    test::TemporaryFolder folder_;
    const std::string missing_ = folder_.file("missing.par");
};

const char* get(const std::string& file, const char* key, const char* section = "s") {
    return GetSetProfileChar(0, section, key, nullptr, file.c_str());
}
const char* set(const std::string& file, const char* key, const char* value, const char* section = "s") {
    return GetSetProfileChar(1, section, key, value, file.c_str());
}
int sync(const std::string& file) { return SyncProfile(file.c_str()); }

TEST_F(ProfileStore, PointersStayValidUntilTheirKeyChanges) {
    const std::string path = file("a.par", "[s]\nk = 17.3\nj = 1\n");
    const char* const value = get(path, "k");
    for (int i = 0; i < 1000; ++i) {
        const std::string name = std::to_string(i);
        set(path, name.c_str(), "1", name.c_str());
        set(path, name.c_str(), "2");
        get(folder_.file(name), "k");
        if (i % 2) DelProfileKey("s", name.c_str(), path.c_str());
        if (i % 3) DelProfileSection(name.c_str(), path.c_str());
    }
    sync(path);
    EXPECT_EQ(get(path, "k"), value);
    EXPECT_STREQ(value, "17.3");
}

// Doubles go the way that the tests of the number texts cover; floats are narrowed on it.
TEST_F(ProfileStore, FloatsCarrySevenDigits) {
    std::mt19937 random{318309};
    for (int i = 0; i < 2000; ++i) {
        const auto value = std::bit_cast<float>(static_cast<std::uint32_t>(random() % 0x7F800000U));
        std::array<char, 64> text{};
        std::snprintf(text.data(), text.size(), "{%.7g}", static_cast<double>(value));
        WriteMyProfileFloatArray("s", "k", &value, 1, missing_.c_str());
        ASSERT_STREQ(get(missing_, "k"), text.data());
        float found = 0.0F;
        ASSERT_EQ(GetMyProfileFloatArray("s", "k", &found, 1, missing_.c_str()), 0);
        ASSERT_EQ(found, std::strtof(text.data() + 1, nullptr)) << text.data();
        errno = 0;  // strtof's own: it counts a subnormal number as out of range
    }
}

/** A file on the disk, and as plain lists: what the store must show through its functions. */
struct ModelFile {
    std::string path;
    std::optional<property::ListModel> loaded;

    property::ListModel& lists() {
        if (!loaded) loaded.emplace(read_text(path));
        return *loaded;
    }
};

// Few names, which meet each other all the time, and many, which make the tables grow, shrink and wrap around.
TEST_F(ProfileStore, RandomCallsAnswerAsListsWould) {
    std::mt19937 random{141421};
    std::array<ModelFile, 3> files;
    for (const unsigned names : {4U, 40U}) {
        const auto name = [&] { return "n" + std::to_string(random() % names); };
        const auto random_text = [&] {
            std::string text;
            for (auto lines = random() % 40; lines > 0; --lines)
                text += random() % 4 == 0 ? "[" + name() + "]\n" : name() + "=" + name() + "\n";
            return text;
        };
        for (ModelFile& one : files) {
            FreeProfile(one.path.c_str());
            one = {file(std::to_string(&one - files.data()), random_text()), std::nullopt};
        }
        for (int step = 0; step < 10000; ++step) {
            ModelFile& one = files.at(random() % 3);
            const std::string section = name(), key = name(),
                              value(random() % 40, static_cast<char>('a' + random() % 26));
            const auto action = random() % 1000;
            if (action < 500) {
                const char* const found = get(one.path, key.c_str(), section.c_str());
                ASSERT_EQ(found ? std::optional<std::string>{found} : std::nullopt, one.lists().get(section, key));
            } else if (action < 800) {
                ASSERT_EQ(set(one.path, key.c_str(), value.c_str(), section.c_str()), value);
                one.lists().set(section, key, value);
            } else if (action < 940 && one.loaded) {
                DelProfileKey(section.c_str(), key.c_str(), one.path.c_str());
                one.loaded->erase_key(section, key);
            } else if (action < 980 && one.loaded) {
                DelProfileSection(section.c_str(), one.path.c_str());
                one.loaded->erase_section(section);
            } else if (action < 985 && one.loaded) {
                ASSERT_EQ(sync(one.path), 0);
                ASSERT_EQ(read_text(one.path), one.loaded->text());
            } else if (action > 995) {
                FreeProfile(one.path.c_str());
                one.loaded.reset();
                if (random() % 2) write_text(one.path, random_text());
            }
        }
    }
}

}  // namespace
