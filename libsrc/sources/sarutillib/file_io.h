#ifndef QUO_FILE_IO_H
#define QUO_FILE_IO_H

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
 * stays whole and no temporary file is left. A symbolic link keeps pointing at the replaced file; the old file's
 * permissions, and its owner where the process may, are kept. A target that exists and is no regular file (a
 * folder, a device), that may not be written, or whose name the file system cannot hold is refused. */
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
    /** Descriptor of the temporary file, for libraries that write by themselves; -1 when not good(). A caller
     * whose library fails just does not commit. */
    [[nodiscard]] int descriptor() const noexcept { return file_.get(); }
    /** Makes the new content the file. True when it is on the disk under its final name. Only when the very last
     * step, flushing the folder, fails is the new file in place although this answers false. */
    [[nodiscard]] bool commit() noexcept;

private:
    bool open(std::string path);
    bool create_temporary(unsigned mode);
    void discard() noexcept;

    Descriptor folder_, file_;
    std::string name_, temporary_;  ///< names within the folder; temporary_ is empty when none exists
};

/** The whole content of a regular file (or of a pipe or device up to `limit`), or nothing when it cannot be opened
 * or read, is a folder, or holds more than `limit` bytes or than memory can. */
std::optional<std::string> read_file(const char* path, std::int64_t limit) noexcept;

/** Length of a regular file in bytes, or nothing. */
std::optional<std::int64_t> file_length(const char* path) noexcept;

}  // namespace quo

#endif
