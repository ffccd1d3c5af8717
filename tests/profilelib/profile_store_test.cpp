#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <filesystem>
#include <optional>
#include <string>
#include <string_view>

#include "list_model.h"
#include "quo_base/profile.h"
#include "support/diagnostics.h"
#include "support/limits.h"

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
    [[nodiscard]] std::string missing(std::string_view name = "missing.par") const { return folder_.file(name); }
    /** How many files stand in the folder: temporary ones must not be left. */
    [[nodiscard]] std::ptrdiff_t entries() const {
        return std::distance(fs::directory_iterator{folder_.path()}, fs::directory_iterator{});
    }

    test::TemporaryFolder folder_;
};

const char* get(const std::string& file, const char* key, const char* section = "s") {
    return GetSetProfileChar(0, section, key, nullptr, file.c_str());
}
const char* set(const std::string& file, const char* key, const char* value, const char* section = "s") {
    return GetSetProfileChar(1, section, key, value, file.c_str());
}
int sync(const std::string& file) { return SyncProfile(file.c_str()); }

TEST_F(ProfileStore, MissingFileIsEmptyAndMadeByTheSync) {
    const test::Report report;
    EXPECT_EQ(get(missing(), "k"), nullptr);
    EXPECT_EQ(errno, 0);
    EXPECT_STREQ(set(missing(), "k", "v"), "v");
    EXPECT_FALSE(fs::exists(missing())) << "written before the sync";
    EXPECT_EQ(sync(missing()), 0);
    EXPECT_EQ(read_text(missing()), "\n[s]\nk = v\n");
    EXPECT_EQ(entries(), 1);
    EXPECT_EQ(report.entries().size(), 0U);
}

TEST_F(ProfileStore, ReadsAFileOnceUntilItIsFreed) {
    const std::string first = file("a.par", "[s]\nk = 1\n"), second = file("b.par", "[s]\nk = 2\n");
    set(first, "k", "changed");
    set(second, "k", "changed");
    write_text(first, "[s]\nk = 3\n");
    EXPECT_STREQ(get(first, "k"), "changed");
    EXPECT_STREQ(get(missing("./a.par"), "k"), "3") << "another text of the path is another file";
    FreeProfile(first.c_str());
    EXPECT_STREQ(get(first, "k"), "3");
    EXPECT_STREQ(get(second, "k"), "changed");
    FreeProfile(missing().c_str());
    FreeProfile(nullptr);
    EXPECT_STREQ(get(second, "k"), "2");
}

TEST_F(ProfileStore, PointersStayValidUntilTheirKeyChanges) {
    const std::string path = file("a.par", "[s]\nk = 17.3\nj = 1\n");
    const char* const value = get(path, "k");
    for (int i = 0; i < 1000; ++i) {
        const std::string name = std::to_string(i);
        set(path, name.c_str(), "1", name.c_str());
        set(path, name.c_str(), "2");
        get(missing(name), "k");
        if (i % 2) DelProfileKey("s", name.c_str(), path.c_str());
        if (i % 3) DelProfileSection(name.c_str(), path.c_str());
    }
    sync(path);
    EXPECT_EQ(get(path, "k"), value);
    EXPECT_STREQ(value, "17.3");
}

TEST_F(ProfileStore, NullArgumentsFindAndWriteNothing) {
    const std::string path = file("a.par", "[s]\nk = 1\n");
    for (const int write : {0, 1}) {
        EXPECT_EQ(GetSetProfileChar(write, nullptr, "k", "v", path.c_str()), nullptr);
        EXPECT_EQ(GetSetProfileChar(write, "s", nullptr, "v", path.c_str()), nullptr);
        EXPECT_EQ(GetSetProfileChar(write, "s", "k", "v", nullptr), nullptr);
    }
    EXPECT_EQ(set(path, "k", nullptr), nullptr);
    EXPECT_STREQ(get(path, "k"), "1");
    DelProfileKey(nullptr, "k", path.c_str());
    DelProfileKey("s", nullptr, path.c_str());
    DelProfileSection(nullptr, path.c_str());
    EXPECT_STREQ(get(path, "k"), "1");
}

TEST_F(ProfileStore, DeletesFromALoadedFileAndElseWarns) {
    const std::string old = "[s]\nk = 1\nj = 2\n[t]\nk = 3\n", path = file("a.par", old);
    EXPECT_EQ(sync(path), 0) << "a file that is not in memory is not written";
    const auto delete_both = [&path] {
        test::CapturedStderr captured;
        DelProfileKey("s", "k", path.c_str());
        DelProfileSection("t", path.c_str());
        return captured.text();
    };
    EXPECT_EQ(delete_both(),
              "Warning: DelProfileKey called before init\nWarning: DelProfileSection called before init\n");
    EXPECT_STREQ(get(path, "k"), "1");
    EXPECT_EQ(delete_both(), "");
    EXPECT_EQ(read_text(path), old) << "written before the sync";
    EXPECT_EQ(sync(path), 0);
    EXPECT_EQ(read_text(path), "\n[s]\nj = 2\n");
}

// Deliberate: the result is that of the file loaded last, inverted.
TEST_F(ProfileStore, SyncOfAllTellsOfTheFileLoadedLast) {
    EXPECT_EQ(SyncProfile(nullptr), -1) << "with nothing in memory";
    const std::string first = missing("a.par"), second = missing("b.par"), folder = folder_.path().string();
    set(first, "k", "1");
    get(second, "k");
    EXPECT_EQ(SyncProfile(nullptr), -1);
    EXPECT_EQ(read_text(first), "\n[s]\nk = 1\n");
    EXPECT_TRUE(fs::exists(second)) << "a file that was only asked for is made, empty";
    set(folder, "k", "1");
    EXPECT_EQ(SyncProfile(nullptr), 0);

    FreeProfile(first.c_str());
    set(first, "k", "2");
    EXPECT_EQ(SyncProfile(nullptr), -1) << "the file that fails was loaded earlier";
    EXPECT_EQ(read_text(first), "\n[s]\nk = 2\n");
}

TEST_F(ProfileStore, FolderIsAnEmptyFileThatCannotBeWritten) {
    const std::string folder = folder_.path().string();
    EXPECT_EQ(get(folder, "k"), nullptr);
    EXPECT_STREQ(set(folder, "k", "v"), "v");
    EXPECT_EQ(sync(folder), 1);
    EXPECT_EQ(errno, 0);
    EXPECT_EQ(set("", "k", "v"), std::string{"v"});
    EXPECT_EQ(sync(""), 1);
}

TEST_F(ProfileStore, DeviceIsNotReplacedAndAnEndlessOneNotWritten) {
    const std::string link = missing("full.par");
    fs::create_symlink("/dev/full", link);
    EXPECT_EQ(get(link, "k"), nullptr);
    set(link, "k", "v");
    EXPECT_EQ(sync(link), 1);
    EXPECT_TRUE(fs::is_symlink(link) && fs::is_character_file(link));
    set("/dev/null", "k", "v");
    EXPECT_EQ(sync("/dev/null"), 0);
    EXPECT_TRUE(fs::is_character_file("/dev/null"));
}

// What is too long to be read must not be replaced by the little that is known of it.
TEST_F(ProfileStore, FileTooLongToBeReadIsNotReplaced) {
    const std::string path = file("raster.bin", "[s]\nk = 1\n");
    constexpr std::uintmax_t kTooLong = (1U << 30) + 1U;
    fs::resize_file(path, kTooLong);
    set(path, "k", "v");
    EXPECT_EQ(sync(path), 1);
    EXPECT_EQ(fs::file_size(path), kTooLong);
}

TEST_F(ProfileStore, FullDiskLeavesTheOldFileWhole) {
    const std::string old = "[s]\nk = 1\nj = 2\n", path = file("a.par", old);
    set(path, "k", "a longer value");
    for (const rlim_t room : {0, 1, 29}) {
        const test::FullDisk disk{room};
        EXPECT_EQ(sync(path), -1) << "with room for " << room << " bytes";
        EXPECT_EQ(SyncProfile(nullptr), 0);
        EXPECT_EQ(errno, 0);
        EXPECT_EQ(read_text(path), old);
        EXPECT_EQ(entries(), 1);
    }
    EXPECT_EQ(sync(path), 0);
    EXPECT_EQ(read_text(path), "\n[s]\nk = a longer value\nj = 2\n");
}

TEST_F(ProfileStore, WhatMayNotBeReadIsEmptyAndWhatMayNotBeWrittenStays) {
    struct Rights {
        mode_t folder, file;
        const char* value;
        bool saved = false;
    };
    // A file that may be written in a folder that may not was refused.
    for (const auto& [folder, mode, value, saved] : {Rights{0555, 0644, "1"}, Rights{0777, 0444, "1"},
                                                     Rights{0777, 0, nullptr}, Rights{0555, 0666, "1", true}}) {
        const test::Report report;
        SCOPED_TRACE(testing::Message() << std::oct << folder << " " << mode);
        const std::string path = file("a.par", "[s]\nk = 1\n");
        chmod(folder_.path().c_str(), folder);
        chmod(path.c_str(), mode);
        {
            const test::OrdinaryUser user;
            EXPECT_STREQ(get(path, "k"), value);
            EXPECT_EQ(errno, 0);
            set(path, "k", "2");
            set(missing(), "k", "2");
            EXPECT_EQ(sync(path), saved ? 0 : 1);
            EXPECT_EQ(sync(missing()), folder == 0555 ? 1 : 0);
            EXPECT_EQ(errno, 0);
        }
        EXPECT_EQ(report.entries("WARNING").size(), saved ? 1U : 0U);
        chmod(folder_.path().c_str(), 0700);
        chmod(path.c_str(), 0600);
        EXPECT_EQ(read_text(path), saved ? "\n[s]\nk = 2\n" : "[s]\nk = 1\n");
        FreeProfile(nullptr);
        fs::remove(missing());
        EXPECT_EQ(entries(), 1);
    }
}

/** No file can be opened, as in a process that has used up its descriptors. */
class NoDescriptors {
public:
    NoDescriptors() {
        getrlimit(RLIMIT_NOFILE, &before_);
        const int next = dup(STDERR_FILENO);
        close(next);
        const rlimit limit{static_cast<rlim_t>(next), before_.rlim_max};
        setrlimit(RLIMIT_NOFILE, &limit);
    }
    ~NoDescriptors() { setrlimit(RLIMIT_NOFILE, &before_); }
    NoDescriptors(const NoDescriptors&) = delete;
    NoDescriptors& operator=(const NoDescriptors&) = delete;

private:
    rlimit before_{};
};

// A file that could not be read counted as empty: a save replaced all of it by the little that was set.
TEST_F(ProfileStore, WhatCouldNotBeReadIsNotReplaced) {
    const std::string old = "[s]\nk = 1\n[t]\nj = 2\n", path = file("a.par", old);
    const auto set_a_key = [&path] {
        EXPECT_EQ(get(path, "j", "t"), nullptr);
        EXPECT_STREQ(set(path, "k", "2"), "2");
        EXPECT_EQ(errno, 0);
    };
    chmod(folder_.path().c_str(), 0777);
    for (const mode_t mode : {0666, 0222}) {
        SCOPED_TRACE(testing::Message() << std::oct << mode);
        chmod(path.c_str(), mode);
        const test::OrdinaryUser user;
        if (mode == 0666) {
            const NoDescriptors none;
            set_a_key();
        } else {
            set_a_key();
        }
        EXPECT_EQ(sync(path), 1);
        EXPECT_EQ(SetParInt(path.c_str(), "k", 0, nullptr, 0, "s"), 0) << "the status of the write";
        EXPECT_EQ(SyncProfile(nullptr), 0);
        FreeProfile(nullptr);
    }
    chmod(path.c_str(), 0600);
    EXPECT_EQ(read_text(path), old);
    EXPECT_STREQ(get(path, "j", "t"), "2");
    EXPECT_EQ(entries(), 1);
}

TEST_F(ProfileStore, BinaryNoiseLoadsAndStaysStable) {
    test::Dice dice{271828};
    for (int round = 0; round < 30; ++round) {
        const std::string path = file(std::to_string(round), dice.bytes(20000));
        set(path, "k", "v");
        const test::ListModel model{read_text(path)};
        ASSERT_EQ(sync(path), 0);
        ASSERT_TRUE(read_text(path).starts_with(model.text())) << "round " << round;
        FreeProfile(path.c_str());
        ASSERT_STREQ(get(path, "k"), "v");
    }
}

/** A file on the disk, and as plain lists: what the store must show through its functions. */
struct ModelFile {
    std::string path;
    std::optional<test::ListModel> loaded;

    test::ListModel& lists() {
        if (!loaded) loaded.emplace(read_text(path));
        return *loaded;
    }
};

TEST_F(ProfileStore, RandomCallsAnswerAsListsWould) {
    test::Dice dice{141421};
    const auto name = [&dice] { return std::string(1, "abcd"[dice.below(4)]); };
    const auto random_text = [&] {
        std::string text;
        for (unsigned lines = dice.below(40); lines > 0; --lines)
            text += dice.below(4) == 0 ? "[" + name() + "]\n" : name() + "=" + name() + "\n";
        return text;
    };
    std::array<ModelFile, 3> files;
    for (ModelFile& one : files) one.path = file(std::to_string(&one - files.data()), random_text());

    for (int step = 0; step < 20000; ++step) {
        ModelFile& one = files.at(dice.below(3));
        const std::string section = name(), key = name(), value = dice.text("xyz", 40);
        const unsigned action = dice.below(1000);
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
        } else if (action < 987 && one.loaded) {
            ASSERT_EQ(sync(one.path), 0);
            ASSERT_EQ(read_text(one.path), one.loaded->text());
        } else if (action > 992) {
            FreeProfile(one.path.c_str());
            one.loaded.reset();
            if (dice.below(2)) write_text(one.path, random_text());
        }
    }
}

}  // namespace
