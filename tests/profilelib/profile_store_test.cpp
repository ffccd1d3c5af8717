#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <filesystem>
#include <optional>
#include <string>
#include <string_view>

#include "list_model.h"
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

TEST_F(ProfileStore, MissingFileIsEmptyAndQuiet) {
    const test::Report report;
    EXPECT_EQ(get(missing(), "k"), nullptr);
    EXPECT_EQ(errno, 0);
    EXPECT_FALSE(fs::exists(missing()));
    EXPECT_EQ(report.entries().size(), 0U);
}

TEST_F(ProfileStore, WritesANewFile) {
    EXPECT_STREQ(set(missing(), "k", "v"), "v");
    EXPECT_FALSE(fs::exists(missing())) << "written before the sync";
    EXPECT_EQ(sync(missing()), 0);
    EXPECT_EQ(read_text(missing()), "\n[s]\nk = v\n");
    EXPECT_EQ(entries(), 1);
}

TEST_F(ProfileStore, ReadsTheDiskOnceUntilFreed) {
    const std::string path = file("a.par", "[s]\nk = 1\n");
    EXPECT_STREQ(get(path, "k"), "1");
    write_text(path, "[s]\nk = 2\n");
    EXPECT_STREQ(get(path, "k"), "1");
    FreeProfile(path.c_str());
    EXPECT_STREQ(get(path, "k"), "2");
}

TEST_F(ProfileStore, FreeingLosesChangesAndOnlyThoseOfItsFile) {
    const std::string first = file("a.par", "[s]\nk = 1\n"), second = file("b.par", "[s]\nk = 2\n");
    set(first, "k", "changed");
    set(second, "k", "changed");
    FreeProfile(first.c_str());
    EXPECT_STREQ(get(first, "k"), "1");
    EXPECT_STREQ(get(second, "k"), "changed");
    FreeProfile(missing().c_str());
    FreeProfile(nullptr);
    EXPECT_STREQ(get(second, "k"), "2");
}

TEST_F(ProfileStore, KnowsAFileByTheTextOfItsPath) {
    const std::string path = file("a.par", "[s]\nk = 1\n"), other = missing("./a.par");
    set(path, "k", "2");
    EXPECT_STREQ(get(other, "k"), "1");
}

TEST_F(ProfileStore, PointersStayValidUntilTheirKeyChanges) {
    const std::string path = file("a.par", "[s]\nk = 17.3\nj = 1\n");
    const char* const value = get(path, "k");
    for (int i = 0; i < 1000; ++i) {
        const std::string name = std::to_string(i);
        set(path, name.c_str(), "1", name.c_str());
        set(path, name.c_str(), "2");
        get(missing(name), "k");
    }
    set(path, "j", "2");
    DelProfileKey("s", "j", path.c_str());
    DelProfileSection("500", path.c_str());
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

TEST_F(ProfileStore, DeletesKeysAndSectionsOfALoadedFile) {
    const std::string path = file("a.par", "[s]\nk = 1\nj = 2\n[t]\nk = 3\n");
    get(path, "k");
    DelProfileKey("s", "k", path.c_str());
    DelProfileSection("t", path.c_str());
    EXPECT_EQ(read_text(path), "[s]\nk = 1\nj = 2\n[t]\nk = 3\n") << "written before the sync";
    EXPECT_EQ(sync(path), 0);
    EXPECT_EQ(read_text(path), "\n[s]\nj = 2\n");
}

TEST_F(ProfileStore, DeletingBeforeTheFileIsReadWarnsAndChangesNothing) {
    const std::string path = file("a.par", "[s]\nk = 1\n");
    test::CapturedStderr captured;
    DelProfileKey("s", "k", path.c_str());
    DelProfileSection("s", path.c_str());
    EXPECT_EQ(captured.text(),
              "Warning: DelProfileKey called before init\nWarning: DelProfileSection called before init\n");
    EXPECT_STREQ(get(path, "k"), "1");
}

TEST_F(ProfileStore, SyncOfAFileThatIsNotInMemoryWritesNothing) {
    const std::string path = file("a.par", "as it was");
    EXPECT_EQ(sync(path), 0);
    EXPECT_EQ(sync(missing()), 0);
    EXPECT_EQ(read_text(path), "as it was");
    EXPECT_FALSE(fs::exists(missing()));
}

TEST_F(ProfileStore, SyncOfAllWritesEveryFileAndInvertsTheResult) {
    EXPECT_EQ(SyncProfile(nullptr), -1) << "with nothing in memory";
    const std::string first = file("a.par", "[s]\nk = 1\n"), second = missing("b.par");
    set(first, "k", "2");
    get(second, "k");
    EXPECT_EQ(SyncProfile(nullptr), -1);
    EXPECT_EQ(read_text(first), "\n[s]\nk = 2\n");
    EXPECT_TRUE(fs::exists(second)) << "a file that was only asked for is made, empty";
}

TEST_F(ProfileStore, SyncOfAllTellsOfTheFileLoadedLast) {
    const std::string writable = missing("a.par"), folder = folder_.path().string();
    set(writable, "k", "1");
    set(folder, "k", "1");
    EXPECT_EQ(SyncProfile(nullptr), 0);
    EXPECT_EQ(read_text(writable), "\n[s]\nk = 1\n");

    FreeProfile(writable.c_str());
    set(writable, "k", "2");
    EXPECT_EQ(SyncProfile(nullptr), -1) << "the file that fails was loaded earlier";
    EXPECT_EQ(read_text(writable), "\n[s]\nk = 2\n");
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

TEST_F(ProfileStore, ReadsAPipe) {
    std::array<int, 2> ends{};
    ASSERT_EQ(pipe(ends.data()), 0);
    const std::string_view text = "[s]\nk = 17.3\n";
    ASSERT_EQ(write(ends[1], text.data(), text.size()), static_cast<ssize_t>(text.size()));
    close(ends[1]);
    EXPECT_STREQ(get("/dev/fd/" + std::to_string(ends[0]), "k"), "17.3");
    close(ends[0]);
}

TEST_F(ProfileStore, EndlessDeviceIsEmptyAndNotReplaced) {
    const std::string link = missing("full.par");
    fs::create_symlink("/dev/full", link);
    EXPECT_EQ(get(link, "k"), nullptr);
    set(link, "k", "v");
    EXPECT_EQ(sync(link), 1);
    EXPECT_EQ(fs::read_symlink(link), "/dev/full");
    EXPECT_TRUE(fs::is_character_file(link));
}

// What is too long to be read must not be replaced by the little that is known of it.
TEST_F(ProfileStore, FileTooLongToBeReadIsNotReplaced) {
    const std::string path = file("raster.bin", "[s]\nk = 1\n");
    constexpr std::uintmax_t kTooLong = (1U << 30) + 1U;
    fs::resize_file(path, kTooLong);
    EXPECT_EQ(get(path, "k"), nullptr);
    set(path, "k", "v");
    EXPECT_EQ(sync(path), 1);
    EXPECT_EQ(fs::file_size(path), kTooLong);
}

/** No file may grow beyond so many bytes: what a full disk does to a write. */
class FullDisk {
public:
    explicit FullDisk(rlim_t bytes) : handler_{std::signal(SIGXFSZ, SIG_IGN)} {
        getrlimit(RLIMIT_FSIZE, &before_);
        const rlimit limit{bytes, before_.rlim_max};
        setrlimit(RLIMIT_FSIZE, &limit);
    }
    ~FullDisk() {
        setrlimit(RLIMIT_FSIZE, &before_);
        std::signal(SIGXFSZ, handler_);
    }
    FullDisk(const FullDisk&) = delete;
    FullDisk& operator=(const FullDisk&) = delete;

private:
    rlimit before_{};
    void (*handler_)(int);
};

TEST_F(ProfileStore, FullDiskLeavesTheOldFileWhole) {
    const std::string old = "[s]\nk = 1\nj = 2\n", path = file("a.par", old);
    set(path, "k", "a longer value");
    const std::string wanted = "\n[s]\nk = a longer value\nj = 2\n";
    for (std::size_t room = 0; room < wanted.size(); ++room) {
        const FullDisk disk{room};
        ASSERT_EQ(sync(path), -1) << "with room for " << room << " bytes";
        ASSERT_EQ(SyncProfile(nullptr), 0);
        ASSERT_EQ(errno, 0);
        ASSERT_EQ(read_text(path), old);
        ASSERT_EQ(entries(), 1);
    }
    EXPECT_EQ(sync(path), 0);
    EXPECT_EQ(read_text(path), wanted);
}

/** Gives up what lets the superuser read and write everywhere. */
void become_nobody() {
    constexpr unsigned kNobody = 65534;
    if (geteuid() == 0 && (setegid(kNobody) != 0 || seteuid(kNobody) != 0)) _exit(99);
}

TEST_F(ProfileStore, ReadOnlyFolderLeavesTheOldFileWhole) {
    const std::string old = "[s]\nk = 1\n", path = file("a.par", old), new_file = missing();
    fs::permissions(folder_.path(), fs::perms{0555});
    EXPECT_EXIT(
        {
            become_nobody();
            set(path, "k", "2");
            set(new_file, "k", "2");
            _exit(10 * sync(path) + sync(new_file));
        },
        testing::ExitedWithCode(11), "");
    fs::permissions(folder_.path(), fs::perms::owner_all);
    EXPECT_EQ(read_text(path), old);
    EXPECT_EQ(entries(), 1);
}

TEST_F(ProfileStore, UnreadableFileIsEmptyAndAReadOnlyOneIsNotReplaced) {
    const std::string path = file("a.par", "[s]\nk = 1\n");
    fs::permissions(folder_.path(), fs::perms::all);
    fs::permissions(path, fs::perms::none);
    EXPECT_EXIT(
        {
            become_nobody();
            if (get(path, "k") || errno != 0) _exit(2);
            set(path, "j", "2");
            _exit(sync(path) == 1 ? 0 : 3);
        },
        testing::ExitedWithCode(0), "");
    fs::permissions(path, fs::perms::owner_all);
    EXPECT_EQ(read_text(path), "[s]\nk = 1\n");
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

/** Files on the disk, as plain lists: what the store must show through its functions. */
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
    std::array<ModelFile, 3> files;
    for (ModelFile& one : files)
        one.path = file(std::to_string(&one - files.data()), "[a]\nb = 1\n[c]\nb=2\n[a]\nc=3\nc=4\n\nd=5\n");
    const auto name = [&dice] { return std::string(1, "abcde"[dice.below(5)]); };

    for (int step = 0; step < 20000; ++step) {
        ModelFile& one = files.at(dice.below(3));
        const std::string section = name(), key = name(), value = dice.text("xyz =[]", 40);
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
        } else if (action > 995) {
            FreeProfile(one.path.c_str());
            one.loaded.reset();
        }
    }
}

}  // namespace
