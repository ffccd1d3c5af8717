#ifndef QUO_FILE_IO_H
#define QUO_FILE_IO_H

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <memory>
#include <optional>
#include <string>
#include <string_view>

namespace quo {

struct CloseStream {
    void operator()(std::FILE* stream) const noexcept { std::fclose(stream); }
};
/** An open stream, closed when it goes. */
using Stream = std::unique_ptr<std::FILE, CloseStream>;

/** Writes a file in one step: the text goes to a temporary file in the target's folder, commit() flushes it to the
 * disk, renames it over the target and flushes the folder. Until then, and whenever anything fails, the old file
 * stays whole and no temporary file is left. A symbolic link keeps pointing at the replaced file; the old file's
 * permissions are kept. A target that exists and is no regular file (a folder, a device) is refused. */
class AtomicFile {
public:
    explicit AtomicFile(const char* path);
    ~AtomicFile();
    AtomicFile(const AtomicFile&) = delete;
    AtomicFile& operator=(const AtomicFile&) = delete;

    /** Whether the temporary file is open and every write so far succeeded. */
    [[nodiscard]] bool good() const noexcept;
    bool write(std::string_view bytes) noexcept;
    /** Descriptor of the temporary file, for libraries that write by themselves; -1 when not good(). */
    [[nodiscard]] int descriptor() const noexcept;
    /** Makes the new content the file. True when it is on the disk under its final name. */
    [[nodiscard]] bool commit() noexcept;

private:
    std::string target_, temporary_;
    int descriptor_ = -1;
    bool good_ = false;
};

/** The whole content of a regular file (or of a pipe or device up to `limit`), or nothing when it cannot be opened or
 * read, is a folder, or holds more than `limit` bytes. */
std::optional<std::string> read_file(const char* path, std::int64_t limit);

/** Length of a regular file in bytes, or nothing. */
std::optional<std::int64_t> file_length(const char* path) noexcept;

}  // namespace quo

#endif
