// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/ground/file_io.h"

#include <grp.h>

#include "support/diagnostics.h"
#include "support/limits.h"

namespace {

namespace fs = std::filesystem;
using quo::AtomicFile;
using test::read_text;
using test::TemporaryFolder;
using test::write_text;

constexpr std::int64_t kNoLimit = std::numeric_limits<std::int64_t>::max();

TEST(ReadFile, ReadsUpToItsLimitOrSaysWhyNot) {
    const TemporaryFolder folder;
    const std::string name = folder.file("content");
    for (const std::size_t size : {0, 4095, 4096, 4097, 300007}) {
        SCOPED_TRACE(size);
        std::string content(size, '\0');
        for (std::size_t i = 0; i < size; ++i) content[i] = static_cast<char>(i * 37 % 251);
        write_text(name, content);
        const auto limit = static_cast<std::int64_t>(size);
        errno = EIO;
        EXPECT_EQ(quo::read_file(name.c_str(), limit), content);
        EXPECT_EQ(errno, 0);
        EXPECT_EQ(quo::read_file(name.c_str(), kNoLimit), content);
        EXPECT_EQ(quo::file_length(name.c_str()), limit);
        EXPECT_EQ(quo::read_file(name.c_str(), limit - 1), std::nullopt);
        EXPECT_EQ(errno, EFBIG);
    }
    EXPECT_THAT(quo::read_file("/proc/self/status", kNoLimit).value_or(""), testing::HasSubstr("Name:"));
    const std::string missing = folder.file("missing");
    for (const auto& [path, error] : {std::pair{missing.c_str(), ENOENT},
                                      {folder.path().c_str(), EISDIR},
                                      {nullptr, EINVAL},
                                      {"/dev/zero", EFBIG}}) {
        EXPECT_EQ(quo::file_length(path), std::nullopt);
        EXPECT_EQ(quo::read_file(path, 100000), std::nullopt);
        EXPECT_EQ(std::exchange(errno, 0), error);
    }
}

/** A folder with an old header in it. */
class AtomicFileTest : public testing::Test {
protected:
    AtomicFileTest() { write_text(name_, "old"); }
    void TearDown() override { errno = 0; }

    static bool replace(const std::string& name, std::string_view content) {
        AtomicFile file{name.c_str()};
        return file.write(content) && file.commit();
    }
    static struct stat found(const std::string& name) {
        struct stat found {};
        EXPECT_EQ(stat(name.c_str(), &found), 0);
        return found;
    }
    /** The header holds `content`, and `others` entries stand beside it. */
    void expect_header(std::string_view content, std::ptrdiff_t others = 0) const {
        EXPECT_EQ(read_text(name_), content);
        EXPECT_EQ(std::distance(fs::directory_iterator{folder_.path()}, fs::directory_iterator{}), 1 + others);
    }

    const TemporaryFolder folder_;
    const std::string name_ = folder_.file("header.xml");
};

TEST_F(AtomicFileTest, ReplacesAFileInOneStep) {
    errno = EIO;
    const fs::path before = fs::current_path();
    fs::current_path(folder_.path());
    AtomicFile file{"header.xml"};
    fs::current_path(before);
    EXPECT_TRUE(file.write("old ") && file.write_at(0, "new"));
    EXPECT_EQ(::write(file.descriptor(), "con", 3), 3);
    EXPECT_TRUE(file.write("tent"));
    expect_header("old", 1);
    EXPECT_TRUE(file.commit());
    EXPECT_EQ(errno, 0);
    EXPECT_TRUE(AtomicFile{name_.c_str()}.write("not committed"));
    EXPECT_FALSE(file.good() || file.write("more") || file.commit());
    EXPECT_EQ(file.descriptor(), -1);
    expect_header("new content");
}

TEST_F(AtomicFileTest, KeepsPermissionsAndSymbolicLinks) {
    const mode_t before = umask(027);
    EXPECT_TRUE(replace(folder_.file("new"), "new"));
    EXPECT_EQ(found(folder_.file("new")).st_mode & 07777, 0640U);
    for (const mode_t mode : {0604, 0666, 0600, 0755}) {
        chmod(name_.c_str(), mode);
        EXPECT_TRUE(replace(name_, "old"));
        EXPECT_EQ(found(name_).st_mode & 07777, mode);
    }
    umask(before);
    fs::create_directory(folder_.file("data"));
    fs::create_symlink("data/other.xml", folder_.file("link"));  // leads nowhere yet
    fs::create_symlink("link", folder_.file("link_to_link"));
    fs::create_symlink(folder_.file("link_to_link"), folder_.file("data/up"));
    for (const char* name : {"link", "link_to_link", "data/up"}) {
        EXPECT_TRUE(replace(folder_.file(name), name));
        EXPECT_TRUE(fs::is_symlink(folder_.file(name)));
        EXPECT_EQ(read_text(folder_.file("data/other.xml")), name);
    }
    expect_header("old", 4);
}

TEST_F(AtomicFileTest, RefusesWhatIsNoFileToReplace) {
    fs::create_directory(folder_.file("folder"));
    fs::create_symlink("loop", folder_.file("loop"));
    mkfifo(folder_.file("pipe").c_str(), 0600);
    for (const char* name :
         {"folder", "folder/", ".", "loop", "pipe", "missing/header.xml", "pipe/x", "missing/"}) {
        errno = 0;
        AtomicFile file{folder_.file(name).c_str()};
        EXPECT_NE(errno, 0);
        EXPECT_FALSE(file.good() || file.write("new") || file.commit()) << name;
    }
    EXPECT_FALSE(AtomicFile{""}.good() || replace(folder_.file(std::string(256, 'x')), "too long a name"));
    EXPECT_FALSE(AtomicFile{nullptr}.good());
    expect_header("old", 3);
    EXPECT_TRUE(replace(folder_.file(std::string(255, 'x')), "the longest name"));
}

// Refused, the change was lost although the file itself could be written.
TEST_F(AtomicFileTest, WritesInPlaceWhereNothingCanBeReplaced) {
    chmod(name_.c_str(), 0666);
    for (const mode_t closed : {0555, 01777}) {  // nothing may be made, or replaced
        chmod(folder_.path().c_str(), closed);
        for (const char* content : {"longer than the old one", "x"}) {
            const test::OrdinaryUser user;
            AtomicFile file{name_.c_str()};
            EXPECT_TRUE(file.write(content) && file.commit() && file.in_place());
            expect_header(content);
        }
    }
    AtomicFile null{"/dev/null"};
    EXPECT_TRUE(null.write("swallowed") && null.commit() && null.in_place());
    EXPECT_TRUE(fs::is_character_file("/dev/null"));
}

// Owner and group were taken over together or not at all: the group lost a file as soon as another member saved
// it.
TEST_F(AtomicFileTest, LeavesAFileToItsGroup) {
    constexpr gid_t kGroup = 2000, kOther = 1001;
    if (geteuid() != 0 || chown(name_.c_str(), 1000, kGroup) != 0) GTEST_SKIP() << "needs the administrator";
    chmod(name_.c_str(), 0660);
    chmod(folder_.path().c_str(), 0777);
    const pid_t child = fork();
    if (child == 0) {
        const bool member = setgroups(1, &kGroup) == 0 && setegid(kOther) == 0 && seteuid(kOther) == 0;
        _exit(member && replace(name_, "new") ? 0 : 1);
    }
    int status = -1;
    EXPECT_TRUE(waitpid(child, &status, 0) == child && status == 0);
    EXPECT_TRUE(found(name_).st_gid == kGroup && (found(name_).st_mode & 07777) == 0660);
    expect_header("new");
}

// The next save of a file sweeps what killed processes left, but never a living one's.
TEST_F(AtomicFileTest, SweepsWhatKilledProcessesLeft) {
    const pid_t child = fork();
    if (child == 0) _exit((new AtomicFile{name_.c_str()})->write("half") ? 0 : 1);
    waitpid(child, nullptr, 0);
    expect_header("old", 1);
    AtomicFile living{name_.c_str()};
    EXPECT_TRUE(living.write("first") && replace(name_, "second"));
    expect_header("second", 1);
    EXPECT_TRUE(living.commit());
    expect_header("first");
}

// A raster is of no use with the description of another.
TEST_F(AtomicFileTest, ReplacesBothFilesOfAPairOrNone) {
    const std::string other = folder_.file("other");
    for (const bool fails : {true, false}) {
        fs::remove_all(other);
        AtomicFile first{name_.c_str()}, second{other.c_str()};
        EXPECT_TRUE(first.write("new") && second.write("its description"));
        if (fails) fs::create_directory(other);
        EXPECT_EQ(commit_pair(first, second), !fails);
        EXPECT_EQ(fs::is_directory(other), fails);
        expect_header(fails ? "old" : "new", 1);
    }
}

}  // namespace
