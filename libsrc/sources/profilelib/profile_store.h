#ifndef QUO_PROFILE_STORE_H
#define QUO_PROFILE_STORE_H

#include <list>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

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

    /** For ProfileLook. True, unless the file is in memory or being looked into already; end_look() then forgets
     * the file, in whatever order looks end. `path` stands until then. */
    bool begin_look(std::string_view path);
    void end_look(std::string_view path);

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
    std::vector<std::string_view> looked_into_;  // each by the look that began it
    File* current_ = nullptr;                    // the one used last, which most calls ask for again
};

}  // namespace quo

#endif
