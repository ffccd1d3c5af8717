// SPDX-License-Identifier: Apache-2.0
#include "sarutillib/ground/file_io.h"

#include <fcntl.h>
#include <sys/file.h>
#include <sys/mman.h>
#include <sys/random.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstdio>
#include <exception>
#include <utility>

#include "sarutillib/ground/bounded_text.h"
#include "sarutillib/ground/transfer.h"

namespace quo {
namespace {

constexpr int kMostLinks = 40;         // as many as the kernel follows
constexpr unsigned kSlots = 4;         // temporary names that are looked through for those of killed processes
constexpr unsigned kOldSlot = kSlots;  // and one for an old file that may have to come back
constexpr int kTemporaryTries = 32;    // of random names, where more processes than slots save one file at once
constexpr mode_t kPermissions = 0777;  // set-user and set-group bits go, as they do whenever a file is written

bool refuse(int error) noexcept {
    errno = error;
    return false;
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

/** The same for every process that saves a file of this name, so that each finds what another left behind. */
std::string slot_name(std::string_view name, unsigned slot) {
    std::uint64_t hash = 0xcbf29ce484222325;  // FNV-1a
    for (const char c : name) hash = (hash ^ static_cast<unsigned char>(c)) * 0x100000001b3;
    std::array<char, 40> text;
    return {text.data(), format_bounded(text.data(), text.size(), ".quo-%016llx-%u.tmp",
                                        static_cast<unsigned long long>(hash), slot)};
}

std::string random_name() {
    unsigned long long number = 0;
    (void)::getrandom(&number, sizeof number, 0);
    std::array<char, 40> text;
    return {text.data(), format_bounded(text.data(), text.size(), ".quo-%016llx.tmp", number)};
}

/** Whether `name` is still the name of the open file; where it is not, errno is ENOENT. */
bool is_entry(int folder, const std::string& name, int file) noexcept {
    struct stat entry {
    }, opened{};
    if (::fstat(file, &opened) != 0 || ::fstatat(folder, name.c_str(), &entry, AT_SYMLINK_NOFOLLOW) != 0)
        return false;
    return (entry.st_dev == opened.st_dev && entry.st_ino == opened.st_ino) || refuse(ENOENT);
}

bool lock(int file) noexcept {
    return retried([=] { return ::flock(file, LOCK_EX | LOCK_NB); }) == 0;
}

/** Takes away a temporary file whose process is gone: living ones hold a lock on theirs. Never follows a link and
 * never waits. */
void sweep(int folder, const std::string& name) noexcept {
    constexpr int kFlags = O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC;
    Descriptor left;
    // Some network file systems lock only what is open for writing; some files may only be read, or only written.
    for (const int access : {O_RDWR, O_RDONLY, O_WRONLY})
        if (!left) left = Descriptor{::openat(folder, name.c_str(), access | kFlags)};
    struct stat found {};
    if (left && ::fstat(left.get(), &found) == 0 && S_ISREG(found.st_mode) && lock(left.get()) &&
        is_entry(folder, name, left.get()))
        (void)::unlinkat(folder, name.c_str(), 0);
}

/** A file without a name, on the disk where it can be, since rasters are large. */
Descriptor nameless_file() noexcept {
    Descriptor file{::open(P_tmpdir, O_TMPFILE | O_RDWR | O_CLOEXEC, 0600)};
    if (!file) file = Descriptor{::memfd_create("quo", MFD_CLOEXEC)};
    return file;
}

/** Whether a target may still be written in place when making or renaming a file beside it fails like this. A full
 * disk is not among them: there an old file is worth more than half a new one. */
bool forbids_replacing(int error) noexcept {
    return error == EACCES || error == EPERM || error == EROFS || error == EBUSY;
}

/** Some file systems cannot flush a folder and need not: that is no failure. */
bool flush_folder(int folder) noexcept {
    return retried([=] { return ::fsync(folder); }) == 0 || errno == EINVAL || errno == ENOTSUP || errno == EBADF;
}

/** Gives a new file the owner, group and permissions of the one it replaces. Owner and group are tried each on its
 * own: only a privileged process can pass on a foreign owner, but any member can pass on the group, without which
 * a file shared by the group would be lost to the others. Whoever comes in through another group than the old one
 * gets the rights of all others. The permissions come last because a change of owner clears some. */
bool adopt(int file, const struct stat& old) noexcept {
    constexpr auto kSame = static_cast<uid_t>(-1);
    struct stat now {};
    if (::fstat(file, &now) != 0) return false;
    if (now.st_uid != old.st_uid) (void)::fchown(file, old.st_uid, kSame);
    const bool same_group = now.st_gid == old.st_gid || ::fchown(file, kSame, old.st_gid) == 0;
    errno = 0;
    const mode_t mode = old.st_mode & kPermissions;
    return ::fchmod(file, same_group ? mode : (mode & ~mode_t{070}) | (mode & 07U) << 3U) == 0;
}

/** Calls `put(bytes, done)` with what is left of `bytes` until all are written. */
template <typename Put>
bool put_all(std::string_view bytes, Put put) noexcept {
    const Transfer moved = move_all(bytes.size(), [&](std::size_t done, std::size_t left) {
        return put(bytes.substr(done, left), static_cast<off_t>(done));
    });
    if (moved.refused) return false;
    return moved.bytes == bytes.size() || refuse(ENOSPC);
}

bool write_all(int file, std::string_view bytes) noexcept {
    return put_all(bytes, [=](std::string_view rest, off_t) { return ::write(file, rest.data(), rest.size()); });
}

Transfer read_all(int file, std::int64_t place, char* to, std::size_t size) noexcept {
    return move_all(size, [=](std::size_t done, std::size_t left) {
        return ::pread(file, to + done, left, place + static_cast<off_t>(done));
    });
}

/** Writes the first `length` bytes of one file, which are all of it, to where the other stands. */
bool copy_content(int from, std::int64_t length, int to) {
    std::string room(std::size_t{1} << 20U, '\0');
    const auto read = [=](std::int64_t place, char* piece, std::size_t size) {
        return read_all(from, place, piece, size);
    };
    const auto write = [=](std::string_view piece) { return write_all(to, piece); };
    errno = 0;
    return copy_pieces(length, room, read, write) == Copied::kWhole || refuse(errno != 0 ? errno : EIO);
}

/** Overwrites an open file. Room for what it grows by is taken before its first byte changes. */
bool overwrite_content(int from, int to) {
    struct stat source {
    }, target{};
    if (::fstat(from, &source) != 0 || ::fstat(to, &target) != 0) return false;
    if (!S_ISREG(target.st_mode)) return copy_content(from, source.st_size, to);
    const off_t grows_by = source.st_size - target.st_size;
    const auto take_room = [=] { return ::fallocate(to, FALLOC_FL_KEEP_SIZE, target.st_size, grows_by); };
    if (grows_by > 0 && retried(take_room) != 0 && errno != EOPNOTSUPP && errno != ENOSYS) return false;
    return copy_content(from, source.st_size, to) &&
           retried([&] { return ::ftruncate(to, source.st_size); }) == 0 &&
           retried([&] { return ::fsync(to); }) == 0;
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
    if (S_ISCHR(old.st_mode)) return collect_elsewhere();
    if (!S_ISREG(old.st_mode)) return refuse(S_ISDIR(old.st_mode) ? EISDIR : EINVAL);
    if (::faccessat(folder_.get(), name_.c_str(), W_OK, AT_EACCESS) != 0) return false;
    // Nobody else may read the new content before it carries the old file's permissions.
    if (create_temporary(0600)) return adopt(file_.get(), old);
    return forbids_replacing(errno) && collect_elsewhere();
}

bool AtomicFile::create_temporary(unsigned mode) {
    bool made = false;
    for (unsigned slot = 0; slot < kSlots; ++slot) {
        const std::string name = slot_name(name_, slot);
        sweep(folder_.get(), name);
        if (!made) made = create_in_slot(name, mode);
        if (!made && errno != EEXIST) return false;
    }
    sweep(folder_.get(), slot_name(name_, kOldSlot));
    for (int tries = 0; !made && tries < kTemporaryTries; ++tries) {
        made = create_in_slot(random_name(), mode);
        if (!made && errno != EEXIST) return false;
    }
    return made;
}

bool AtomicFile::create_in_slot(const std::string& name, unsigned mode) {
    temporary_ = name;  // needs memory, for want of which no file must stay behind
    file_ = Descriptor{::openat(folder_.get(), name.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, mode)};
    if (!file_) temporary_.clear();
    if (!file_) return false;
    // Between its making and its locking another process can take the file for one that was left behind. Where
    // there are no locks nothing is swept either.
    if (lock(file_.get()) || errno != EWOULDBLOCK) {
        if (is_entry(folder_.get(), name, file_.get())) return true;
        if (errno != ENOENT) {  // nobody can tell
            discard();
            return false;
        }
    }
    temporary_.clear();
    file_ = Descriptor{};
    return refuse(EEXIST);
}

bool AtomicFile::collect_elsewhere() {
    target_ = Descriptor{::openat(folder_.get(), name_.c_str(), O_WRONLY | O_NOFOLLOW | O_NOCTTY | O_CLOEXEC)};
    if (target_) file_ = nameless_file();
    in_place_ = good();
    return good();
}

void AtomicFile::discard() noexcept {
    const int error_before = errno;
    file_ = Descriptor{};
    target_ = Descriptor{};
    if (!temporary_.empty()) (void)::unlinkat(folder_.get(), temporary_.c_str(), 0);
    temporary_.clear();
    errno = error_before;
}

bool AtomicFile::write(std::string_view bytes) noexcept {
    if (!good()) return false;
    if (!write_all(file_.get(), bytes)) {
        discard();
        return false;
    }
    errno = 0;
    return true;
}

bool AtomicFile::write_at(std::int64_t place, std::string_view bytes) noexcept {
    if (!good()) return false;
    const auto put = [&](std::string_view rest, off_t done) {
        return ::pwrite(file_.get(), rest.data(), rest.size(), place + done);
    };
    if (!put_all(bytes, put)) {
        discard();
        return false;
    }
    errno = 0;
    return true;
}

bool AtomicFile::flush_content() const noexcept {
    if (!good()) return refuse(errno != 0 ? errno : EBADF);
    return in_place_ || retried([&] { return ::fsync(file_.get()); }) == 0;
}

/** Puts the new file into the old one's place. */
bool AtomicFile::replace() noexcept {
    if (in_place_) return overwrite();
    if (::renameat(folder_.get(), temporary_.c_str(), folder_.get(), name_.c_str()) == 0) {
        temporary_.clear();
        return true;
    }
    return forbids_replacing(errno) && overwrite();
}

/** As replace(), but the old file is kept under the temporary name, locked so that nobody sweeps it. */
bool AtomicFile::replace_keeping_old() {
    const int folder = folder_.get();
    struct stat old {};
    const bool seen = ::fstatat(folder, name_.c_str(), &old, AT_SYMLINK_NOFOLLOW) == 0;
    if (!seen && errno != ENOENT) return false;  // taken for absent, it would be removed by taking back
    if (in_place_ || (seen && !S_ISREG(old.st_mode))) return replace();
    if (!seen) {
        const bool replaced = replace();
        if (replaced && !in_place_) old_ = Old::kAbsent;
        return replaced;
    }
    target_ = Descriptor{::openat(folder, name_.c_str(), O_WRONLY | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC)};
    if (target_) (void)lock(target_.get());
    if (::renameat2(folder, temporary_.c_str(), folder, name_.c_str(), RENAME_EXCHANGE) != 0)
        return replace_beside_second(old);
    old_ = Old::kKept;
    return true;
}

/** The same where the file system cannot exchange names: the old file gets a second one, or at least a copy. */
bool AtomicFile::replace_beside_second(const struct stat& old) {
    const int folder = folder_.get();
    std::string second = slot_name(name_, kOldSlot);
    sweep(folder, second);
    if (::linkat(folder, name_.c_str(), folder, second.c_str(), 0) != 0 && !copy_old(second, old)) return false;
    const bool replaced = replace();
    if (replaced && !in_place_) {
        temporary_ = std::move(second);
        old_ = Old::kKept;
    } else {
        (void)::unlinkat(folder, second.c_str(), 0);
    }
    return replaced;
}

bool AtomicFile::copy_old(const std::string& second, const struct stat& old) {
    const int folder = folder_.get();
    const Descriptor from{::openat(folder, name_.c_str(), O_RDONLY | O_NOFOLLOW | O_CLOEXEC)};
    if (!from) return false;
    Descriptor to{::openat(folder, second.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600)};
    if (!to) return false;
    (void)lock(to.get());
    if (!adopt(to.get(), old) || !copy_content(from.get(), old.st_size, to.get())) {
        const int error = errno;
        (void)::unlinkat(folder, second.c_str(), 0);
        return refuse(error);
    }
    target_ = std::move(to);
    return true;
}

/** Undoes a replacement that kept the old file; where there was none, the new one goes. Where the names cannot be
 * changed back, the old content is written over the new one; if that fails too, the old file stays beside it. */
void AtomicFile::take_back() noexcept {
    const int error_before = errno;
    const int folder = folder_.get();
    if (old_ == Old::kAbsent) (void)::unlinkat(folder, name_.c_str(), 0);
    const bool back = old_ == Old::kKept && ::renameat(folder, temporary_.c_str(), folder, name_.c_str()) == 0;
    if (back || (old_ == Old::kKept && !put_back_content())) temporary_.clear();
    errno = error_before;
}

/** Writes the old content, kept under the temporary name, into the file that was put in its place. */
bool AtomicFile::put_back_content() noexcept {
    try {
        const Descriptor old{::openat(folder_.get(), temporary_.c_str(), O_RDONLY | O_NOFOLLOW | O_CLOEXEC)};
        return old && ::lseek(file_.get(), 0, SEEK_SET) == 0 && overwrite_content(old.get(), file_.get());
    } catch (const std::exception&) {
        return false;
    }
}

bool AtomicFile::overwrite() noexcept {
    constexpr int kFlags = O_WRONLY | O_NOFOLLOW | O_NOCTTY | O_CLOEXEC;
    in_place_ = true;
    try {
        target_ = target_ ? std::move(target_) : Descriptor{::openat(folder_.get(), name_.c_str(), kFlags)};
        return target_ && overwrite_content(file_.get(), target_.get());
    } catch (const std::exception&) {
        return refuse(ENOMEM);
    }
}

/** After the replacement: what is left of the old file goes, and the folder reaches the disk. */
bool AtomicFile::finish() noexcept {
    discard();
    errno = 0;
    if (!in_place_ && !flush_folder(folder_.get())) return false;
    errno = 0;
    return true;
}

bool AtomicFile::commit() noexcept {
    const bool done = flush_content() && replace();
    if (!done) discard();
    return done && finish();
}

bool commit_pair(AtomicFile& first, AtomicFile& second) noexcept {
    if (first.in_place_ && !second.in_place_) return commit_pair(second, first);
    try {
        if (first.flush_content() && second.flush_content() && first.replace_keeping_old()) {
            if (second.replace()) {
                const bool reached = first.finish();
                return second.finish() && reached;
            }
            first.take_back();
        }
    } catch (const std::exception&) {
        errno = ENOMEM;
    }
    first.discard();
    second.discard();
    return false;
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
