// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_FILE_IO_H
#define QUO_FILE_IO_H

#include <sys/stat.h>

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>

namespace quo {

/* Everything here leaves errno at 0 when it succeeds. After a failure errno tells why: the caller reports or drops
 * it. Nothing throws. */

struct CloseStream {
    void operator()(std::FILE* stream) const noexcept { std::fclose(stream); }
};
/** An open stream, closed when it goes. */
using Stream = std::unique_ptr<std::FILE, CloseStream>;

/** A file descriptor, closed when it goes; errno stays as it was. */
class Descriptor {
public:
    Descriptor() noexcept = default;
    explicit Descriptor(int number) noexcept : number_{number} {}
    ~Descriptor() { (void)close(); }
    Descriptor(Descriptor&& other) noexcept : number_{other.number_} { other.number_ = -1; }
    Descriptor& operator=(Descriptor&& other) noexcept {
        std::swap(number_, other.number_);
        return *this;
    }

    explicit operator bool() const noexcept { return number_ >= 0; }
    [[nodiscard]] int get() const noexcept { return number_; }
    /** Closes it early; false (and errno, if it was 0) when what was written may not have arrived. */
    bool close() noexcept;

private:
    int number_ = -1;
};

/** Writes a file in one step: the text goes to a temporary file in the target's folder, commit() flushes it to the
 * disk, renames it over the target and flushes the folder. Until then, and whenever anything fails, the old file
 * stays whole and no temporary file is left; the one of a process that was killed goes with the next save of the
 * same file. A symbolic link keeps pointing at the replaced file, a hard link is broken. The old file's
 * permissions are kept, its owner and its group too, each where the process may.
 *
 * Where no file can be put in the target's place (a folder without the right to write, somebody else's file in a
 * folder like /tmp, a file mounted by itself, a character device) but the target itself can be written, the
 * content is collected elsewhere and commit() writes it in place: less safe, since a failure within that last step
 * can leave a mixture, but nothing is lost for want of rights. in_place() tells, so that the caller can warn. A
 * target that exists and is none of these (a folder, a pipe), that may not be written, or whose name the file
 * system cannot hold is refused. */
class AtomicFile {
public:
    explicit AtomicFile(const char* path) noexcept;
    ~AtomicFile();
    AtomicFile(const AtomicFile&) = delete;
    AtomicFile& operator=(const AtomicFile&) = delete;

    /** Whether the temporary file is open and every write so far succeeded. */
    [[nodiscard]] bool good() const noexcept { return static_cast<bool>(file_); }
    /** Appends to the temporary file at once (no buffer: hand over large pieces). The first failure discards it.
     */
    bool write(std::string_view bytes) noexcept;
    /** Writes at a place of its own, for content that comes out of order; otherwise as write(). */
    bool write_at(std::int64_t place, std::string_view bytes) noexcept;
    /** Descriptor of the temporary file, for reading and writing, for libraries that write by themselves; -1 when
     * not good(). A caller whose library fails just does not commit. */
    [[nodiscard]] int descriptor() const noexcept { return file_.get(); }
    /** Makes the new content the file. True when it is on the disk under its final name. Only when the very last
     * step, flushing the folder, fails is the new file in place although this answers false. */
    [[nodiscard]] bool commit() noexcept;
    /** Whether the target is (or was) written in place. */
    [[nodiscard]] bool in_place() const noexcept { return in_place_; }

private:
    friend bool commit_pair(AtomicFile& first, AtomicFile& second) noexcept;

    /** What became of the file that this one replaces: nothing is kept of it, temporary_ is it, or there was none.
     */
    enum class Old : std::uint8_t { kGone, kKept, kAbsent };

    bool open(std::string path);
    bool create_temporary(unsigned mode);
    bool create_in_slot(const std::string& name, unsigned mode);
    bool collect_elsewhere();
    bool flush_content() const noexcept;
    bool replace() noexcept;
    bool replace_keeping_old();
    bool replace_beside_second(const struct stat& old);
    bool copy_old(const std::string& second, const struct stat& old);
    void take_back() noexcept;
    bool put_back_content() noexcept;
    bool overwrite() noexcept;
    bool finish() noexcept;
    void discard() noexcept;

    Descriptor folder_, file_;
    Descriptor target_;             ///< what is written in place, or the old file while it may have to come back
    std::string name_, temporary_;  ///< names within the folder; temporary_ is empty when none exists
    bool in_place_ = false;
    Old old_ = Old::kGone;
};

/** Makes two files that belong together, such as a raster and its description, new in one go: where the second
 * cannot be replaced, the first gets its old content back. Answers as commit() does. Where one of them is written
 * in place, so that its old content could not come back, that one is the last; where both are, the first stays new
 * when the second fails. A process that is killed between the two replacements leaves the new first beside the old
 * second. */
[[nodiscard]] bool commit_pair(AtomicFile& first, AtomicFile& second) noexcept;

/** The whole content of a regular file (or of a pipe or device up to `limit`), or nothing when it cannot be opened
 * or read, is a folder, or holds more than `limit` bytes or than memory can. */
std::optional<std::string> read_file(const char* path, std::int64_t limit) noexcept;

/** Length of a regular file in bytes, or nothing. */
std::optional<std::int64_t> file_length(const char* path) noexcept;

}  // namespace quo

#endif
