#include "sarutillib/file_io.h"

#include <fcntl.h>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <csignal>
#include <cstdint>
#include <filesystem>
#include <string>

#include "support/diagnostics.h"

namespace {

namespace fs = std::filesystem;
using quo::AtomicFile;
using test::read_text;
using test::TemporaryFolder;
using test::write_text;

constexpr std::int64_t kNoLimit = std::numeric_limits<std::int64_t>::max();

mode_t mode_of(const std::string& name) {
    struct stat found {};
    EXPECT_EQ(stat(name.c_str(), &found), 0);
    return found.st_mode & 07777;
}

std::size_t entries(const fs::path& folder) {
    return static_cast<std::size_t>(std::distance(fs::directory_iterator{folder}, fs::directory_iterator{}));
}

bool replace(const std::string& name, std::string_view content) {
    AtomicFile file{name.c_str()};
    return file.write(content) && file.commit();
}

/** Makes writes beyond a file size fail, as a full disk would. */
class FileSizeLimit {
public:
    explicit FileSizeLimit(rlim_t bytes) : ignored_{std::signal(SIGXFSZ, SIG_IGN)} {
        getrlimit(RLIMIT_FSIZE, &before_);
        const rlimit now{bytes, before_.rlim_max};
        setrlimit(RLIMIT_FSIZE, &now);
    }
    ~FileSizeLimit() {
        setrlimit(RLIMIT_FSIZE, &before_);
        (void)std::signal(SIGXFSZ, ignored_);
    }
    FileSizeLimit(const FileSizeLimit&) = delete;
    FileSizeLimit& operator=(const FileSizeLimit&) = delete;

private:
    void (*ignored_)(int);
    rlimit before_{};
};

/** Drops the superuser's rights as long as it lives. */
class OrdinaryUser {
public:
    OrdinaryUser() { EXPECT_EQ(seteuid(getuid() == 0 ? 65534 : getuid()), 0); }
    ~OrdinaryUser() { EXPECT_EQ(seteuid(getuid()), 0); }
    OrdinaryUser(const OrdinaryUser&) = delete;
    OrdinaryUser& operator=(const OrdinaryUser&) = delete;
};

TEST(ReadFile, ReadsUpToItsLimit) {
    const TemporaryFolder folder;
    for (const std::size_t size : {0, 1, 4095, 4096, 4097, 300007}) {
        SCOPED_TRACE(size);
        std::string content(size, '\0');
        for (std::size_t i = 0; i < size; ++i) content[i] = static_cast<char>(i * 37 % 251);
        write_text(folder.file("content"), content);
        const auto limit = static_cast<std::int64_t>(size);
        errno = EIO;
        EXPECT_EQ(quo::read_file(folder.file("content").c_str(), limit), content);
        EXPECT_EQ(errno, 0);
        EXPECT_EQ(quo::read_file(folder.file("content").c_str(), kNoLimit), content);
        EXPECT_EQ(quo::file_length(folder.file("content").c_str()), limit);
        EXPECT_EQ(quo::read_file(folder.file("content").c_str(), limit - 1), std::nullopt);
        EXPECT_EQ(errno, EFBIG);
    }
}

TEST(ReadFile, ReadsWhatHasNoLength) {
    int ends[2];
    ASSERT_EQ(pipe(ends), 0);
    const std::string content(20000, 'q');
    ASSERT_EQ(write(ends[1], content.data(), content.size()), 20000);
    close(ends[1]);
    const std::string name = "/proc/self/fd/" + std::to_string(ends[0]);
    EXPECT_EQ(quo::file_length(name.c_str()), std::nullopt);
    EXPECT_EQ(quo::read_file(name.c_str(), kNoLimit), content);
    close(ends[0]);

    EXPECT_THAT(quo::read_file("/proc/self/status", kNoLimit).value_or(""), testing::HasSubstr("Name:"));
    EXPECT_EQ(quo::read_file("/dev/zero", 100000), std::nullopt);
    EXPECT_EQ(errno, EFBIG);
}

TEST(ReadFile, GivesNothingWhereNothingCanBeRead) {
    const TemporaryFolder folder;
    struct Case {
        std::string name;
        int error;
    };
    for (const auto& [name, error] : {Case{folder.file("missing"), ENOENT}, Case{folder.file(""), EISDIR}}) {
        EXPECT_EQ(quo::read_file(name.c_str(), kNoLimit), std::nullopt);
        EXPECT_EQ(errno, error);
        EXPECT_EQ(quo::file_length(name.c_str()), std::nullopt);
    }
    EXPECT_EQ(quo::read_file(nullptr, kNoLimit), std::nullopt);
    EXPECT_EQ(quo::file_length(nullptr), std::nullopt);
    // More than any memory: a status, not an end of the process.
    write_text(folder.file("sparse"), "");
    fs::resize_file(folder.file("sparse"), std::uintmax_t{1} << 43);
    EXPECT_EQ(quo::file_length(folder.file("sparse").c_str()), std::int64_t{1} << 43);
    errno = 0;
}

TEST(AtomicFile, ReplacesAFileInOneStep) {
    const TemporaryFolder folder;
    const std::string name = folder.file("header.xml");
    write_text(name, "old");
    errno = EIO;
    AtomicFile file{name.c_str()};
    ASSERT_TRUE(file.good());
    EXPECT_TRUE(file.write("new "));
    EXPECT_EQ(::write(file.descriptor(), "con", 3), 3);
    EXPECT_TRUE(file.write("tent"));
    EXPECT_EQ(read_text(name), "old");
    EXPECT_TRUE(file.commit());
    EXPECT_EQ(errno, 0);
    EXPECT_EQ(read_text(name), "new content");
    EXPECT_EQ(entries(folder.path()), 1U);

    EXPECT_FALSE(file.good());
    EXPECT_EQ(file.descriptor(), -1);
    EXPECT_FALSE(file.write("more"));
    EXPECT_FALSE(file.commit());
    EXPECT_EQ(read_text(name), "new content");
    errno = 0;
}

TEST(AtomicFile, LeavesNothingBehindWithoutACommit) {
    const TemporaryFolder folder;
    const std::string name = folder.file("header.xml");
    write_text(name, "old");
    EXPECT_TRUE((AtomicFile{name.c_str()}.write("new")));
    EXPECT_TRUE((AtomicFile{folder.file("other.xml").c_str()}.write("new")));
    EXPECT_EQ(read_text(name), "old");
    EXPECT_EQ(entries(folder.path()), 1U);
}

TEST(AtomicFile, GivesTheOldPermissionsOrTheUsualOnes) {
    const TemporaryFolder folder;
    const std::string name = folder.file("header.xml");
    const mode_t before = umask(027);
    EXPECT_TRUE(replace(name, "new"));
    EXPECT_EQ(mode_of(name), 0640U);
    for (const mode_t mode : {0604, 0666, 0600, 0755}) {
        chmod(name.c_str(), mode);
        EXPECT_TRUE(replace(name, "newer"));
        EXPECT_EQ(mode_of(name), mode);
    }
    umask(before);
}

TEST(AtomicFile, KeepsSymbolicLinks) {
    const TemporaryFolder folder;
    fs::create_directory(folder.file("data"));
    fs::create_symlink("data/header.xml", folder.file("link"));
    fs::create_symlink("link", folder.file("link_to_link"));
    fs::create_symlink(folder.file("link_to_link"), folder.file("data/up"));
    for (const char* name : {"link", "link_to_link", "data/up"}) {  // the first still leads nowhere
        EXPECT_TRUE(replace(folder.file(name), name));
        EXPECT_TRUE(fs::is_symlink(folder.file(name)));
        EXPECT_EQ(read_text(folder.file("data/header.xml")), name);
    }
    EXPECT_EQ(entries(folder.path()), 3U);
    EXPECT_EQ(entries(folder.path() / "data"), 2U);
}

TEST(AtomicFile, WritesBesideARelativeName) {
    const TemporaryFolder folder;
    const fs::path before = fs::current_path();
    fs::current_path(folder.path());
    AtomicFile file{"header.xml"};
    fs::current_path(before);  // the folder stays the one of the beginning
    EXPECT_TRUE(file.write("new") && file.commit());
    EXPECT_EQ(read_text(folder.file("header.xml")), "new");
}

TEST(AtomicFile, RefusesWhatIsNoFileToReplace) {
    const TemporaryFolder folder;
    fs::create_directory(folder.file("folder"));
    fs::create_symlink("loop", folder.file("loop"));
    mkfifo(folder.file("pipe").c_str(), 0600);
    const std::size_t before = entries(folder.path());
    const std::string names[] = {folder.file("folder"),
                                 folder.file("folder/"),
                                 folder.file("."),
                                 folder.file("loop"),
                                 folder.file("pipe"),
                                 folder.file("missing/header.xml"),
                                 folder.file("pipe/x"),
                                 folder.file(std::string(256, 'x')),
                                 folder.file("missing") + '/',
                                 "/dev/null",
                                 ""};
    for (const std::string& name : names) {
        SCOPED_TRACE(name);
        errno = 0;
        AtomicFile file{name.c_str()};
        EXPECT_FALSE(file.good());
        EXPECT_NE(errno, 0);
        EXPECT_FALSE(file.write("new"));
        EXPECT_FALSE(file.commit());
    }
    EXPECT_FALSE(AtomicFile{nullptr}.good());
    EXPECT_EQ(entries(folder.path()), before);
    EXPECT_TRUE(replace(folder.file(std::string(255, 'x')), "the longest name"));
    errno = 0;
}

TEST(AtomicFile, RefusesAFileThatMayNotBeWritten) {
    const TemporaryFolder folder;
    const std::string name = folder.file("header.xml");
    write_text(name, "protected");
    chmod(name.c_str(), 0444);
    chmod(folder.path().c_str(), 0777);
    {
        const OrdinaryUser user;
        EXPECT_FALSE(AtomicFile{name.c_str()}.good());
        EXPECT_EQ(errno, EACCES);
        EXPECT_TRUE(replace(folder.file("other"), "new"));
        chmod(folder.file("other").c_str(), 0666);
    }
    EXPECT_EQ(read_text(name), "protected");
    EXPECT_EQ(entries(folder.path()), 2U);
    errno = 0;
}

// The disk fills up at every byte of the new content: all of it arrives or the old file stays.
TEST(AtomicFile, KeepsTheOldFileWhicheverWriteFails) {
    const TemporaryFolder folder;
    const std::string name = folder.file("header.xml");
    const std::string content = "first piece, second piece, third piece";
    for (rlim_t room = 0; room <= content.size(); ++room) {
        SCOPED_TRACE(room);
        write_text(name, "old");
        bool replaced = false;
        int error = 0;
        {
            const FileSizeLimit limit{room};
            AtomicFile file{name.c_str()};
            bool written = true;
            for (std::size_t at = 0; at < content.size(); at += 13) written = file.write(content.substr(at, 13));
            replaced = file.commit();
            error = errno;
            EXPECT_EQ(written, replaced);
        }
        EXPECT_EQ(replaced, room == content.size());
        EXPECT_EQ(error, replaced ? 0 : EFBIG);
        EXPECT_EQ(read_text(name), replaced ? content : "old");
        EXPECT_EQ(entries(folder.path()), 1U);
    }
    errno = 0;
}

TEST(AtomicFile, FailsCleanlyWhenTheTargetTurnsIntoAFolder) {
    const TemporaryFolder folder;
    const std::string name = folder.file("header.xml");
    AtomicFile file{name.c_str()};
    fs::create_directory(name);
    EXPECT_TRUE(file.write("new"));
    EXPECT_FALSE(file.commit());
    EXPECT_NE(errno, 0);
    EXPECT_TRUE(fs::is_directory(name));
    EXPECT_EQ(entries(folder.path()), 1U);
    errno = 0;
}

}  // namespace
