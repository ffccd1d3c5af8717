// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PROFILE_STORE_H
#define QUO_PROFILE_STORE_H

#include <functional>
#include <list>
#include <map>
#include <mutex>
#include <string>
#include <string_view>
#include <unordered_map>

#include "profilelib/profile_content.h"

namespace quo {

/** The parameter files that the process has touched. Members may throw std::bad_alloc. */
class ProfileStore {
public:
    /** The one store of the process. Whoever uses it, or a value in it, holds profile_access() meanwhile. */
    static ProfileStore& instance();

    /** The content of a file, which is read from the disk if it is not in memory. */
    ProfileContent& load(std::string_view path);
    /** The content of a file if it is in memory, else null. */
    ProfileContent* loaded(std::string_view path);

    /** Writes one file back; the results are those of SyncProfile with a path. */
    int sync(std::string_view path);
    /** Writes all files back; the result is that of SyncProfile with null. */
    int sync_all();

    void free(std::string_view path);
    void free_all();

    /** For ProfileLook. True, unless the file is in memory for another reason; each look is then ended by
     * end_look(). The last to end forgets
     * the file, unless somebody has changed what stands in it. Until then it is not written back. */
    bool begin_look(std::string_view path);
    void end_look(std::string_view path);
    /** Notes that the file is not only looked into. */
    void keep(std::string_view path);

private:
    struct File {
        std::string path;
        ProfileContent content;
        bool unread = false;  // it may be there but could not be read: what stands in it must not be replaced
    };

    File* find(std::string_view path);
    static void read(File& file);
    static int write(const File& file);

    std::list<File> files_;  // in the order of loading
    std::unordered_map<std::string_view, std::list<File>::iterator> by_path_;
    std::map<std::string, int, std::less<>> looks_;  // how many there are into a file
    File* current_ = nullptr;                        // the one used last, which most calls ask for again
};

/** Keeps other threads off the store as long as the result stands; a thread that has it may take it again. */
[[nodiscard]] std::unique_lock<std::recursive_mutex> profile_access() noexcept;

}  // namespace quo

#endif
