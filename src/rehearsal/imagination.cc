// SPDX-License-Identifier: BSD-2-Clause
#include "rehearsal/imagination.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <map>
#include <new>
#include <optional>
#include <string_view>
#include <system_error>
#include <utility>

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/sendfile.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include "fs/layout.h"
#include "platform/data_protection.h"
#include "platform/disk.h"
#include "platform/warn.h"
#include "rehearsal/kernel.h"
#include "rehearsal/regular_file.h"

namespace tz {
namespace {

enum class kind { nothing, link, directory, file }; // `file` is anything else

struct entry {
    kind what = kind::nothing;
    std::string target = {}; // of a link
};

std::map<std::string, entry> imagined; // by paths that do not lead through links
std::vector<std::string> warnings;
int unforeseen = 0; // the first `errno` that does not describe the disk's state
std::string unforeseen_at;
std::string last_opened;
std::new_handler former_new_handler = nullptr;

struct place {
    std::string path; // no link on the way; empty for the root directory
    entry is;
};

std::string real_path(const place& where) {
    return where.path.empty() ? "/" : where.path;
}

int fail(int error) {
    errno = error;
    return -1;
}

int succeed(int result = 0) {
    errno = 0;
    return result;
}

// Called after a real call has failed. Notes an `errno` that does not describe the disk's state.
void note_failure(const std::string& path) {
    constexpr std::array of_the_disk{ENOENT, ENOTDIR, ELOOP, ENAMETOOLONG};
    if (unforeseen == 0 && std::count(of_the_disk.begin(), of_the_disk.end(), errno) == 0) {
        unforeseen = errno;
        unforeseen_at = path;
    }
}

std::string parent_of(const std::string& path) {
    return path.substr(0, path.find_last_of('/'));
}

// What is at a path without links on the way; nothing, with errno set, if that is unknown.
std::optional<place> look_at(const std::string& path) {
    if (const auto change = imagined.find(path); change != imagined.end()) {
        return place{path, change->second};
    }
    struct stat status {};
    if (::lstat(path.c_str(), &status) == -1) {
        note_failure(path);
        return errno == ENOENT ? std::optional(place{path, {}}) : std::nullopt;
    }
    if (!S_ISLNK(status.st_mode)) {
        return place{path, {S_ISDIR(status.st_mode) ? kind::directory : kind::file}};
    }
    std::array<char, PATH_MAX> target{};
    const ssize_t length = ::readlink(path.c_str(), target.data(), target.size());
    if (length == -1) {
        note_failure(path);
        return std::nullopt;
    }
    return place{path, {kind::link, {target.data(), static_cast<std::size_t>(length)}}};
}

// What the entry `name` of a directory is; nothing, with errno set, if that is unknown.
std::optional<place> look_in(const place& directory, const std::string& name) {
    if (name.empty() || name == ".") {
        return directory;
    }
    return name == ".." ? place{parent_of(directory.path), {kind::directory}}
                        : look_at(directory.path + "/" + name);
}

// The place that an absolute path leads to, element by element, as the kernel goes: the last
// element may be absent, and if it is a link, that is followed or not. Nothing, with errno set, if
// the path leads nowhere.
std::optional<place> place_of(std::string path, bool follow_last) {
    constexpr int most_links = 40; // the limit of Linux
    int links = 0;
    place at{"", {kind::directory}};
    while (!path.empty()) {
        const auto slash = path.find('/');
        const bool last = slash == std::string::npos;
        const std::string name = path.substr(0, slash);
        path.erase(0, last ? slash : slash + 1);
        auto next = look_in(at, name);
        if (!next) {
            return std::nullopt;
        }
        if (next->is.what == kind::link && (!last || follow_last)) {
            if (++links > most_links) {
                errno = ELOOP;
                return std::nullopt;
            }
            path.insert(0, next->is.target + (last ? "" : "/"));
            at.path = path.starts_with('/') ? "" : at.path;
        } else if (last || next->is.what == kind::directory) {
            at = *std::move(next);
        } else {
            errno = next->is.what == kind::nothing ? ENOENT : ENOTDIR;
            return std::nullopt;
        }
    }
    return at;
}

bool is_read_only(const place& where) {
    struct statvfs status {};
    const std::string directory = parent_of(where.path) + "/";
    if (::statvfs(directory.c_str(), &status) == -1) {
        note_failure(directory);
        return false;
    }
    return (status.f_flag & ST_RDONLY) != 0;
}

bool is_empty(const place& directory) {
    const auto is_gone = [](const auto& child) {
        const auto change = imagined.find(child.path());
        return change != imagined.end() && change->second.what == kind::nothing;
    };
    const auto is_new = [&](const auto& change) {
        return parent_of(change.first) == directory.path && change.second.what != kind::nothing;
    };
    std::error_code failure;
    std::filesystem::directory_iterator child(directory.path, failure);
    while (!failure && child != end(child) && is_gone(*child)) {
        child.increment(failure);
    }
    if (failure) {
        errno = failure.value();
        note_failure(directory.path);
    }
    return !failure && child == end(child) &&
           std::none_of(imagined.begin(), imagined.end(), is_new);
}

// Removes what is at a path; a directory only if it is empty and `directory_allowed`.
int remove_entry(const char* path, bool directory_allowed) {
    const auto found = place_of(path, false);
    if (!found) {
        return -1;
    }
    if (is_read_only(*found)) {
        return fail(EROFS);
    }
    if (found->is.what == kind::nothing) {
        return fail(ENOENT);
    }
    if (kernel::forbids_removal(parent_of(found->path) + "/") ||
        kernel::forbids_removal(found->path)) {
        return fail(EPERM);
    }
    if (kernel::is_mount_point(found->path)) {
        return fail(EBUSY);
    }
    if (found->is.what == kind::directory && !(directory_allowed && is_empty(*found))) {
        return fail(directory_allowed ? ENOTEMPTY : EISDIR);
    }
    imagined[found->path] = {};
    return succeed();
}

// The links in an update may lead to any file. A start makes no use of such a file's contents, so
// tzctl does not open it.
bool leads_out_of_updates(const std::string& path, const place& found) {
    const auto updates = place_of(layout::updates_directory, true);
    return path.starts_with(layout::updates_directory) && updates &&
           !found.path.starts_with(updates->path);
}

// A descriptor from which nothing can be read, and to which nothing can be written.
int open_nothing() {
    const int nothing = ::open("/", O_RDONLY | O_CLOEXEC);
    if (nothing == -1) {
        note_failure("/");
    }
    return nothing;
}

// A descriptor for a file's contents: of the file itself, or of a copy of a large one's beginning.
int open_contents(const std::string& path) {
    constexpr off_t most = 1 << 20;
    fs::descriptor file = open_regular_file(AT_FDCWD, path);
    if (!file.is_open()) {
        note_failure(path);
        return errno == ENOENT ? open_nothing() : -1;
    }
    struct stat status {};
    if (::fstat(file.number(), &status) == 0 && status.st_size <= most) {
        return file.release();
    }
    fs::descriptor beginning(::memfd_create("beginning", MFD_CLOEXEC));
    if (::sendfile(beginning.number(), file.number(), nullptr, most) == -1 ||
        ::lseek(beginning.number(), 0, SEEK_SET) == -1) {
        note_failure(path);
        return -1;
    }
    return beginning.release();
}

} // namespace

imagination::session::session(std::string image) : image_(std::move(image)) {
    warnings.clear(); // of looks without a session
    former_new_handler = std::set_new_handler([] {
        unforeseen = ENOMEM;
        throw std::bad_alloc();
    });
}

imagination::session::~session() {
    std::set_new_handler(former_new_handler);
    imagined.clear();
    warnings.clear();
    unforeseen_at.clear();
    unforeseen = 0;
}

// NOLINTBEGIN(readability-convert-member-functions-to-static): they need a session
std::optional<std::string> imagination::session::target_of(const char* link) const {
    std::array<char, PATH_MAX> target{};
    const ssize_t length = platform::readlink(link, target.data(), target.size());
    return length == -1
               ? std::nullopt
               : std::optional<std::string>({target.data(), static_cast<std::size_t>(length)});
}

bool imagination::session::leads_to_zone(const char* path) const {
    const fs::descriptor file(platform::open(path, O_RDONLY | O_CLOEXEC, 0));
    struct stat status {};
    std::array<char, 4> magic{};
    return file.is_open() && platform::fstat(file.number(), &status) == 0 &&
           S_ISREG(status.st_mode) &&
           platform::read(file.number(), magic.data(), magic.size()) == ssize_t{magic.size()} &&
           std::string_view(magic.data(), magic.size()) == "TZif";
}

std::vector<std::string> imagination::session::take_warnings() {
    return std::exchange(warnings, {});
}

void imagination::session::check() const {
    if (unforeseen != 0) {
        throw std::system_error(unforeseen, std::generic_category(), image_ + unforeseen_at);
    }
}

// NOLINTEND(readability-convert-member-functions-to-static)

int platform::access(const char* path, int /*mode*/) {
    const auto found = place_of(path, true);
    if (!found) {
        return -1;
    }
    return found->is.what == kind::nothing ? fail(ENOENT) : succeed();
}

ssize_t platform::readlink(const char* path, char* buffer, std::size_t size) {
    const auto found = place_of(path, false);
    if (!found) {
        return -1;
    }
    if (found->is.what != kind::link) {
        return fail(found->is.what == kind::nothing ? ENOENT : EINVAL);
    }
    errno = 0;
    return static_cast<ssize_t>(found->is.target.copy(buffer, size));
}

int platform::symlink(const char* target, const char* link_path) {
    if (*target == '\0') {
        return fail(ENOENT);
    }
    const auto found = place_of(link_path, false);
    if (!found) {
        return -1;
    }
    if (found->is.what != kind::nothing) {
        return fail(EEXIST);
    }
    if (is_read_only(*found)) {
        return fail(EROFS);
    }
    if (kernel::forbids_new_entries(parent_of(found->path) + "/")) {
        return fail(EPERM);
    }
    imagined[found->path] = {kind::link, target};
    return succeed();
}

int platform::unlink(const char* path) {
    return remove_entry(path, false);
}

int platform::remove(const char* path) {
    return remove_entry(path, true);
}

int platform::open(const char* path, int flags, mode_t /*mode*/) {
    const auto found = place_of(path, true);
    if (!found) {
        return -1;
    }
    const bool writing = (flags & O_ACCMODE) != O_RDONLY;
    if (found->is.what == kind::nothing && !writing) {
        return fail(ENOENT);
    }
    if (writing && found->is.what == kind::directory) {
        return fail(EISDIR);
    }
    if (writing && is_read_only(*found)) {
        return fail(EROFS);
    }
    if (found->is.what == kind::nothing) {
        imagined[found->path] = {kind::file};
    }
    const bool has_contents = !writing && found->is.what == kind::file &&
                              !imagined.contains(found->path) &&
                              !leads_out_of_updates(path, *found);
    last_opened = found->path;
    return has_contents ? open_contents(found->path) : open_nothing();
}

int platform::fstat(int descriptor, struct stat* status) {
    const int result = ::fstat(descriptor, status);
    if (result == -1) {
        note_failure(last_opened);
    }
    return result;
}

ssize_t platform::read(int descriptor, void* buffer, std::size_t size) {
    const ssize_t length = ::read(descriptor, buffer, size);
    if (length == -1) {
        note_failure(last_opened);
    }
    return length;
}

FTS* platform::fts_open(char* const* roots, int options) {
    const auto found = place_of(*roots, true);
    const std::string nowhere =
        "/" + std::string(NAME_MAX + 1, 'x'); // a name that is too long to exist
    std::string there = found && found->is.what == kind::directory ? real_path(*found) : nowhere;
    const std::array<char*, 2> real_roots{there.data(), nullptr};
    last_opened = *roots;
    FTS* const walk = ::fts_open(real_roots.data(), options, nullptr);
    if (walk == nullptr) {
        note_failure(*roots);
    }
    return walk;
}

FTSENT* platform::fts_read(FTS* walk) {
    errno = 0; // only errno shows that fts could not read a directory
    FTSENT* const found = ::fts_read(walk);
    if (found != nullptr &&
        (found->fts_info == FTS_DNR || found->fts_info == FTS_ERR || found->fts_info == FTS_NS)) {
        errno = found->fts_errno;
    } else if (found != nullptr && found->fts_info == FTS_SLNONE) {
        errno = EIO; // fts has lost the reason why the directory, which is no link, has no status
    }
    if (errno != 0) {
        note_failure(found == nullptr ? last_opened : found->fts_path);
    }
    return found;
}

int platform::open_dprotected_np(const char* path, int flags, int /*protection_class*/,
                                 int /*protection_flags*/, mode_t mode) {
    return open(path, flags, mode);
}

int platform::set_protection_class(int /*descriptor*/, int /*protection_class*/) {
    return 0;
}

void warn(const char* format, ...) {
    constexpr std::size_t most = 4096;
    const int reason = errno;
    std::va_list values;
    va_start(values, format);
    std::array<char, most + 1> text{};
    (void)std::vsnprintf(text.data(), text.size(), format, values);
    va_end(values);
    warnings.push_back(text.data() +
                       (reason == 0 ? "" : ": " + std::string(std::strerror(reason))));
    errno = reason;
}

} // namespace tz
