#include "sarutillib/file_io.h"

#include <fcntl.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <climits>
#include <exception>
#include <utility>

#include "sarutillib/bounded_text.h"

namespace quo {
namespace {

constexpr int kMostLinks = 40;         // as many as the kernel follows
constexpr int kTemporaryTries = 32;    // names are random: a second try is already rare
constexpr mode_t kPermissions = 0777;  // set-user and set-group bits go, as they do whenever a file is written

bool refuse(int error) noexcept {
    errno = error;
    return false;
}

/** Runs a system call again as long as a signal interrupts it. */
template <typename Call>
auto retried(Call call) noexcept {
    auto result = call();
    while (result < 0 && errno == EINTR) result = call();
    return result;
}

/** The folder and the last name of a path. */
struct Place {
    std::string folder, name;
};
Place split(const std::string& path) {
    const auto slash = path.rfind('/');
    if (slash == std::string::npos) return {".", path};
    return {path.substr(0, slash + 1), path.substr(slash + 1)};
}

/** Text of a symbolic link, or nothing when `path` is none. */
std::optional<std::string> link_text(const std::string& path) {
    std::string text(PATH_MAX, '\0');
    const ssize_t length = ::readlink(path.c_str(), text.data(), text.size());
    if (length < 0) return std::nullopt;
    text.resize(static_cast<std::size_t>(length));
    return text;
}

/** Where a write to `path` ends up: links in the last place are followed, also to a file yet to be made. */
std::optional<std::string> follow_links(std::string path) {
    for (int links = 0; links <= kMostLinks; ++links) {
        auto next = link_text(path);
        if (!next) return path;
        path = next->starts_with('/') || path.find('/') == std::string::npos ? *next : split(path).folder + *next;
    }
    errno = ELOOP;
    return std::nullopt;
}

/** A folder that may be written but not listed can be worked in; only its flush is then left to the system. */
Descriptor open_folder(const std::string& folder) noexcept {
    constexpr int kFlags = O_DIRECTORY | O_CLOEXEC;
    Descriptor opened{::open(folder.c_str(), O_RDONLY | kFlags)};
    if (!opened && errno == EACCES) opened = Descriptor{::open(folder.c_str(), O_PATH | kFlags)};
    return opened;
}

std::string temporary_name() {
    unsigned long long number = 0;
    (void)::getrandom(&number, sizeof number, 0);
    char name[40];
    return {name, format_bounded(name, sizeof name, ".quo-%016llx.tmp", number)};
}

/** Some file systems cannot flush a folder and need not: that is no failure. */
bool flush_folder(int folder) noexcept {
    return retried([=] { return ::fsync(folder); }) == 0 || errno == EINVAL || errno == ENOTSUP || errno == EBADF;
}

/** Gives a new file the owner and permissions of the one it replaces. Only a privileged process can pass on a
 * foreign owner; the permissions come second because a change of owner clears some. */
bool adopt(int file, const struct stat& old) noexcept {
    struct stat now {};
    if (::fstat(file, &now) != 0) return false;
    if (now.st_uid != old.st_uid || now.st_gid != old.st_gid)
        if (::fchown(file, old.st_uid, old.st_gid) != 0) errno = 0;
    return ::fchmod(file, old.st_mode & kPermissions) == 0;
}

/** Reads to the end into `text`, at most `limit` bytes. */
bool read_to_end(int file, std::int64_t expected, std::int64_t limit, std::string& text) {
    constexpr std::int64_t kLeast = 4096;
    // One byte more than is expected shows the end without another round.
    text.resize(static_cast<std::size_t>(std::min(std::max(expected, kLeast), limit)) + 1);
    std::size_t used = 0;
    for (;;) {
        const ssize_t got = retried([&] { return ::read(file, text.data() + used, text.size() - used); });
        if (got < 0) return false;
        if (got == 0) break;
        used += static_cast<std::size_t>(got);
        if (used > static_cast<std::uint64_t>(limit)) return refuse(EFBIG);
        if (used == text.size())
            text.resize(std::min<std::uint64_t>(2 * static_cast<std::uint64_t>(used),
                                                static_cast<std::uint64_t>(limit) + 1));
    }
    text.resize(used);
    return true;
}

bool read_whole(const char* path, std::int64_t limit, std::string& text) {
    const Descriptor file{path ? retried([=] { return ::open(path, O_RDONLY | O_CLOEXEC); }) : -1};
    if (!file) return path ? false : refuse(EINVAL);
    struct stat found {};
    if (::fstat(file.get(), &found) != 0) return false;
    if (S_ISDIR(found.st_mode)) return refuse(EISDIR);
    if (limit < 0 || found.st_size > limit) return refuse(EFBIG);
    return read_to_end(file.get(), found.st_size, limit, text);
}

}  // namespace

bool Descriptor::close() noexcept {
    if (number_ < 0) return true;
    const int error_before = errno;
    const bool closed = ::close(std::exchange(number_, -1)) == 0;
    if (closed || error_before != 0) errno = error_before;
    return closed;
}

AtomicFile::AtomicFile(const char* path) noexcept {
    try {
        if (path ? open(path) : refuse(EINVAL))
            errno = 0;
        else
            discard();
    } catch (const std::exception&) {
        errno = ENOMEM;
        discard();
    }
}

AtomicFile::~AtomicFile() { discard(); }

bool AtomicFile::open(std::string path) {
    const auto followed = follow_links(std::move(path));
    if (!followed) return false;
    Place place = split(*followed);
    if (place.name.empty()) return refuse(followed->empty() ? ENOENT : EISDIR);

    folder_ = open_folder(place.folder);
    if (!folder_) return false;
    name_ = std::move(place.name);
    struct stat old {};
    if (::fstatat(folder_.get(), name_.c_str(), &old, AT_SYMLINK_NOFOLLOW) != 0)
        return errno == ENOENT && create_temporary(0666);
    if (!S_ISREG(old.st_mode)) return refuse(S_ISDIR(old.st_mode) ? EISDIR : EINVAL);
    if (::faccessat(folder_.get(), name_.c_str(), W_OK, AT_EACCESS) != 0) return false;
    // Nobody else may read the new content before it carries the old file's permissions.
    return create_temporary(0600) && adopt(file_.get(), old);
}

bool AtomicFile::create_temporary(unsigned mode) {
    for (int tries = 0; tries < kTemporaryTries; ++tries) {
        temporary_ = temporary_name();
        file_ =
            Descriptor{::openat(folder_.get(), temporary_.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, mode)};
        if (file_) return true;
        if (errno != EEXIST) break;
    }
    temporary_.clear();
    return false;
}

void AtomicFile::discard() noexcept {
    const int error_before = errno;
    (void)file_.close();
    if (!temporary_.empty()) (void)::unlinkat(folder_.get(), temporary_.c_str(), 0);
    temporary_.clear();
    errno = error_before;
}

bool AtomicFile::write(std::string_view bytes) noexcept {
    if (!good()) return false;
    while (!bytes.empty()) {
        const ssize_t done = retried([&] { return ::write(file_.get(), bytes.data(), bytes.size()); });
        if (done <= 0) {
            if (done == 0) errno = ENOSPC;
            discard();
            return false;
        }
        bytes.remove_prefix(static_cast<std::size_t>(done));
    }
    errno = 0;
    return true;
}

bool AtomicFile::commit() noexcept {
    if (!good()) return refuse(errno != 0 ? errno : EBADF);
    errno = 0;
    if (retried([&] { return ::fsync(file_.get()); }) != 0 || !file_.close() ||
        ::renameat(folder_.get(), temporary_.c_str(), folder_.get(), name_.c_str()) != 0) {
        discard();
        return false;
    }
    temporary_.clear();
    if (!flush_folder(folder_.get())) return false;
    errno = 0;
    return true;
}

std::optional<std::string> read_file(const char* path, std::int64_t limit) noexcept {
    try {
        std::string text;
        if (!read_whole(path, limit, text)) return std::nullopt;
        errno = 0;
        return text;
    } catch (const std::exception&) {
        errno = ENOMEM;
        return std::nullopt;
    }
}

std::optional<std::int64_t> file_length(const char* path) noexcept {
    struct stat found {};
    if (!path || ::stat(path, &found) != 0 || !S_ISREG(found.st_mode)) return std::nullopt;
    errno = 0;
    return found.st_size;
}

}  // namespace quo
