#ifndef QUO_PROFILE_STORE_H
#define QUO_PROFILE_STORE_H

#include <list>
#include <string>
#include <string_view>
#include <unordered_map>

#include "profilelib/profile_content.h"

namespace quo {

/** The parameter files that the process has touched. Members may throw std::bad_alloc. */
class ProfileStore {
public:
    /** The one store of the process. */
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

private:
    struct File {
        std::string path;
        ProfileContent content;
        bool unread = false;  // it is there, but reading it broke off: what stands in it must not be replaced
    };

    File* find(std::string_view path);
    static void read(File& file);
    static int write(const File& file);

    std::list<File> files_;  // in the order of loading
    std::unordered_map<std::string_view, std::list<File>::iterator> by_path_;
    File* current_ = nullptr;  // the one used last, which most calls ask for again
};

}  // namespace quo

#endif
