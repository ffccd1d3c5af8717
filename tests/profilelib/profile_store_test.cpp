#include <gtest/gtest.h>

#include <array>
#include <cerrno>
#include <filesystem>
#include <optional>
#include <random>
#include <string>
#include <string_view>

#include "profile_property.h"
#include "quo_base/profile.h"
#include "support/diagnostics.h"

namespace {

namespace fs = std::filesystem;
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

TEST_F(ProfileStore, KeepsAFileFromTheFirstCallUntilItIsFreed) {
    const std::string path = file("a.par", "[s]\nk = 1\n[t]\nk = 3\n");
    EXPECT_EQ(sync(path), 0) << "a file that is not in memory is not written";
    for (const char* told :
         {"Warning: DelProfileKey called before init\nWarning: DelProfileSection called before init\n", ""}) {
        test::CapturedStderr captured;
        DelProfileKey("s", "k", path.c_str());
        DelProfileSection("t", path.c_str());
        EXPECT_EQ(captured.text(), told);
        EXPECT_EQ(get(path, "k") != nullptr, *told != '\0');
    }
    write_text(path, "[s]\nk = 2\n");
    EXPECT_EQ(get(path, "k"), nullptr);
    EXPECT_STREQ(get(folder_.file("./a.par"), "k"), "2") << "another text of the path is another file";
    EXPECT_EQ(sync(path), 0);
    EXPECT_EQ(read_text(path), "\n[s]\n");
}

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

TEST_F(ProfileStore, NullArgumentsFindAndWriteNothing) {
    const std::string path = file("a.par", "[s]\nk = 1\n");
    const char *const name = path.c_str(), *const arguments[][4] = {{nullptr, "k", "v", name},
                                                                    {"s", nullptr, "v", name},
                                                                    {"s", "k", "v", nullptr}};
    for (const auto& [section, key, value, in] : arguments)
        EXPECT_TRUE(!GetSetProfileChar(0, section, key, value, in) &&
                    !GetSetProfileChar(1, section, key, value, in));
    EXPECT_EQ(set(path, "k", nullptr), nullptr);
    get(path, "k");
    DelProfileKey(nullptr, "k", name);
    DelProfileKey("s", nullptr, name);
    DelProfileSection(nullptr, name);
    EXPECT_STREQ(get(path, "k"), "1");
}

// The result is that of the file loaded last, inverted: callers know it so.
TEST_F(ProfileStore, SyncOfAllTellsOfTheFileLoadedLast) {
    EXPECT_EQ(SyncProfile(nullptr), -1) << "with nothing in memory";
    const std::string first = folder_.file("a.par"), second = folder_.file("b.par");
    get(second, "k");
    set(folder_.path().string(), "k", "1");
    EXPECT_EQ(SyncProfile(nullptr), 0);
    EXPECT_TRUE(fs::exists(second)) << "a file that was only asked for is made, empty";
    set(first, "k", "2");
    EXPECT_EQ(SyncProfile(nullptr), -1) << "the file that fails was loaded earlier";
    EXPECT_EQ(read_text(first), "\n[s]\nk = 2\n");
}

// What is too long to be read must not be replaced by the little that is known of it, nor a folder or a device.
TEST_F(ProfileStore, ReplacesNothingThatIsNoParameterFile) {
    constexpr std::uintmax_t kTooLong = (1U << 30) + 1U;
    const std::string raster = file("raster.bin", "[s]\nk = 1\n"), link = folder_.file("full.par");
    fs::resize_file(raster, kTooLong);
    fs::create_symlink("/dev/full", link);
    for (const std::string& path :
         {folder_.path().string(), std::string{}, link, raster, std::string{"/dev/null"}}) {
        EXPECT_EQ(get(path, "k"), nullptr) << path;
        EXPECT_STREQ(set(path, "k", "v"), "v");
        EXPECT_EQ(sync(path), path == "/dev/null" ? 0 : 1) << path;
        EXPECT_EQ(errno, 0);
    }
    EXPECT_TRUE(fs::is_symlink(link) && fs::is_character_file(link) && fs::is_character_file("/dev/null"));
    EXPECT_EQ(fs::file_size(raster), kTooLong);
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
