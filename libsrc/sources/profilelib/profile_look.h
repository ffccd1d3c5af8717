// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PROFILE_LOOK_H
#define QUO_PROFILE_LOOK_H

namespace quo {

/** A look into a file as a parameter file, for an object that reads either form of a header. When it ends, the
 * file is forgotten unless it was in memory before: a header that stayed among the parameter files would be
 * written back as one by the next SyncProfile of all. A look within a look into the same file changes nothing, so
 * that whoever reads many objects from a file looks into it once for all of them; a file that nobody asks for is
 * not read. */
class ProfileLook {
public:
    /** `file` is kept by address; null looks into nothing. */
    explicit ProfileLook(const char* file) noexcept;
    ~ProfileLook();
    ProfileLook(const ProfileLook&) = delete;
    ProfileLook& operator=(const ProfileLook&) = delete;

private:
    const char* file_ = nullptr;  // null where this look is to forget nothing
};

}  // namespace quo

#endif
