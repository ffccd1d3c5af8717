// SPDX-License-Identifier: Apache-2.0
#include "profilelib/profile_store.h"

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <mutex>
#include <type_traits>
#include <utility>

#include "diagnosticslib/saved_in_place.h"
#include "profilelib/out_of_memory.h"
#include "profilelib/profile_look.h"
#include "quo_base/profile.h"
#include "sarutillib/ground/file_io.h"

namespace quo {
namespace {

/** Longest regular file that is read. */
constexpr std::int64_t kLongestFile = std::int64_t{1} << 30;
/** Longest text taken from a pipe or device, some of which never end. */
constexpr std::int64_t kLongestStream = std::int64_t{64} << 20;

}  // namespace

ProfileStore& ProfileStore::instance() {
    // Never destroyed: objects of the host that are destroyed at exit may still read and sync their parameters.
    static ProfileStore& store = *new ProfileStore;
    return store;
}

ProfileContent& ProfileStore::load(std::string_view path) {
    if (File* const known = find(path)) return known->content;
    File& file = files_.emplace_back();
    file.path = path;
    by_path_.emplace(file.path, std::prev(files_.end()));
    read(file);
    current_ = &file;
    return file.content;
}

ProfileContent* ProfileStore::loaded(std::string_view path) {
    File* const file = find(path);
    return file ? &file->content : nullptr;
}

int ProfileStore::sync(std::string_view path) {
    const File* const file = find(path);
    return file && !looks_.contains(path) ? write(*file) : 0;
}

int ProfileStore::sync_all() {
    int status = 0;
    for (const File& file : files_)
        if (!looks_.contains(file.path)) status = write(file);
    // Inverted: callers of this form know -1 as its success.
    return status == 0 ? -1 : 0;
}

void ProfileStore::free(std::string_view path) {
    const auto entry = by_path_.find(path);
    if (entry == by_path_.end()) return;
    const auto file = entry->second;
    if (current_ == &*file) current_ = nullptr;
    by_path_.erase(entry);
    files_.erase(file);
}

void ProfileStore::free_all() {
    current_ = nullptr;
    by_path_.clear();
    files_.clear();
}

ProfileStore::File* ProfileStore::find(std::string_view path) {
    if (current_ && current_->path == path) return current_;
    const auto entry = by_path_.find(path);
    if (entry == by_path_.end()) return nullptr;
    return current_ = &*entry->second;
}

void ProfileStore::read(File& file) {
    const char* const path = file.path.c_str();
    auto text = read_file(path, file_length(path) ? kLongestFile : kLongestStream);
    if (!text && errno == ENOMEM) end_process(kNoMoreMemory);
    file.unread = !text && errno != ENOENT;
    if (text) file.content.parse(std::move(*text));
    errno = 0;
}

int ProfileStore::write(const File& file) {
    if (file.unread) return 1;
    AtomicFile target{file.path.c_str()};
    if (!target.good() && errno == ENOMEM) end_process(kNoMemory);
    if (!target.good()) {
        errno = 0;
        return 1;
    }
    const bool written = file.content.write([&](std::string_view piece) { return target.write(piece); });
    const bool saved = written && target.commit();
    if (saved) warn_if_in_place(target, "SyncProfile", "profile");
    errno = 0;
    return saved ? 0 : -1;
}

bool ProfileStore::begin_look(std::string_view path) {
    const auto looks = looks_.find(path);
    if (looks == looks_.end() && find(path)) return false;
    if (looks != looks_.end()) return ++looks->second > 0;
    looks_.emplace(path, 1);
    return true;
}

void ProfileStore::end_look(std::string_view path) {
    const auto looks = looks_.find(path);
    if (looks == looks_.end() || --looks->second > 0) return;
    free(path);
    looks_.erase(looks);
}

void ProfileStore::keep(std::string_view path) {
    const auto looks = looks_.find(path);
    if (looks != looks_.end()) looks_.erase(looks);
}

std::unique_lock<std::recursive_mutex> profile_access() noexcept {
    // Recursive, since accessors call each other. It has nothing to destroy: the store is used to the very end.
    static std::recursive_mutex lock;
    static_assert(std::is_trivially_destructible_v<std::recursive_mutex>);
    return std::unique_lock{lock};
}

ProfileLook::ProfileLook(const char* file) noexcept {
    const auto access = profile_access();
    if (file && or_end_process(kNoMemory, [&] { return ProfileStore::instance().begin_look(file); })) file_ = file;
}

ProfileLook::~ProfileLook() {
    if (!file_) return;
    const auto access = profile_access();
    ProfileStore::instance().end_look(file_);
}

}  // namespace quo

using quo::ProfileContent;
using quo::ProfileStore;

namespace {

/** Erases from a file that is in memory, where the caller names something; `from(content)` does it. */
template <typename Erase>
void erase(const char* caller, const char* file, bool named, Erase from) noexcept {
    const auto access = quo::profile_access();
    quo::or_end_process(quo::kNoMemory, [&] {
        ProfileContent* const content = file ? ProfileStore::instance().loaded(file) : nullptr;
        if (!content)
            std::fprintf(stderr, "Warning: %s called before init\n", caller);
        else if (named) {
            ProfileStore::instance().keep(file);
            from(*content);
        }
    });
}

}  // namespace

extern "C" const char* GetSetProfileChar(int write, const char* section, const char* key, const char* value,
                                         const char* file) noexcept {
    const auto access = quo::profile_access();
    if (!section || !key || !file || (write && !value)) return nullptr;
    return quo::or_end_process(quo::kNoMemory, [&] {
        ProfileContent& content = ProfileStore::instance().load(file);
        if (write) ProfileStore::instance().keep(file);
        return write ? content.set(section, key, value) : content.find(section, key);
    });
}

extern "C" int SyncProfile(const char* file) noexcept {
    const auto access = quo::profile_access();
    return quo::or_end_process(quo::kNoMemory, [&] {
        return file ? ProfileStore::instance().sync(file) : ProfileStore::instance().sync_all();
    });
}

extern "C" void FreeProfile(const char* file) noexcept {
    const auto access = quo::profile_access();
    quo::or_end_process(quo::kNoMemory, [&] {
        if (file)
            ProfileStore::instance().free(file);
        else
            ProfileStore::instance().free_all();
    });
}

extern "C" void DelProfileKey(const char* section, const char* key, const char* file) noexcept {
    erase("DelProfileKey", file, section && key,
          [&](ProfileContent& content) { content.erase_key(section, key); });
}

extern "C" void DelProfileSection(const char* section, const char* file) noexcept {
    erase("DelProfileSection", file, section, [&](ProfileContent& content) { content.erase_section(section); });
}
