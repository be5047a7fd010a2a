// SPDX-License-Identifier: BSD-2-Clause
#include "platform/imagination.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstdarg>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <optional>
#include <string_view>
#include <system_error>
#include <utility>

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include "platform/data_protection.h"
#include "platform/disk.h"
#include "platform/warn.h"

namespace tz {
namespace {

using kind = imagination::entry::kind;

imagination::changes imagined;
std::vector<std::string> warnings;

struct place {
    std::string path; // no link on the way; empty for the root directory
    kind what = kind::nothing;
    std::string target = {}; // of a link
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

std::string parent_of(const std::string& path) {
    return path.substr(0, path.find_last_of('/'));
}

// What is at a path without links on the way; nothing, with errno set, if that cannot be told.
std::optional<place> look_at(const std::string& path) {
    if (const auto change = imagined.find(path); change != imagined.end()) {
        return place{path, change->second.what, change->second.target};
    }
    struct stat status {};
    if (::lstat(path.c_str(), &status) == -1) {
        return errno == ENOENT ? std::optional(place{path}) : std::nullopt;
    }
    if (S_ISDIR(status.st_mode)) {
        return place{path, kind::directory};
    }
    if (!S_ISLNK(status.st_mode)) {
        return place{path, kind::file};
    }
    std::array<char, PATH_MAX> target{};
    const ssize_t length = ::readlink(path.c_str(), target.data(), target.size());
    if (length == -1) {
        return std::nullopt;
    }
    return place{path, kind::link, {target.data(), static_cast<std::size_t>(length)}};
}

// From a directory to what its entry `name` is; nothing, with errno set, if that cannot be told.
std::optional<place> step(const place& at, const std::string& name) {
    if (name.empty() || name == ".") {
        return at;
    }
    return name == ".." ? place{parent_of(at.path), kind::directory}
                        : look_at(at.path + "/" + name);
}

// The place that an absolute path leads to, element by element, as the kernel goes: the last
// element may be absent, and if it is a link, that is followed or not. Nothing, with errno set, if
// the path leads nowhere.
std::optional<place> find(std::string path, bool follow_last,
                          std::vector<std::string>* passed = nullptr) {
    constexpr int most_links = 40; // that Linux follows
    int links = 0;
    place at{"", kind::directory};
    while (!path.empty()) {
        const auto slash = path.find('/');
        const bool last = slash == std::string::npos;
        const std::string name = path.substr(0, slash);
        path.erase(0, last ? slash : slash + 1);
        auto next = step(at, name);
        if (!next) {
            return std::nullopt;
        }
        if (passed != nullptr) {
            passed->push_back(next->path);
        }
        if (next->what == kind::link && (!last || follow_last)) {
            if (++links > most_links) {
                errno = ELOOP;
                return std::nullopt;
            }
            path.insert(0, next->target + (last ? "" : "/"));
            at.path = path.starts_with('/') ? "" : at.path;
        } else if (last || next->what == kind::directory) {
            at = *std::move(next);
        } else {
            errno = next->what == kind::nothing ? ENOENT : ENOTDIR;
            return std::nullopt;
        }
    }
    return at;
}

bool is_read_only(const place& where) {
    struct statvfs status {};
    return ::statvfs((parent_of(where.path) + "/").c_str(), &status) == 0 &&
           (status.f_flag & ST_RDONLY) != 0;
}

// Whether the entry at `path` has one of these of statx's attributes.
bool has(std::uint64_t attributes, const std::string& path) {
    struct statx status {};
    return ::statx(AT_FDCWD, path.c_str(), AT_SYMLINK_NOFOLLOW, STATX_TYPE, &status) == 0 &&
           (status.stx_attributes & attributes) != 0;
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
    const std::filesystem::directory_iterator children(directory.path, failure);
    return !failure && std::all_of(begin(children), end(children), is_gone) &&
           std::none_of(imagined.begin(), imagined.end(), is_new);
}

// Removes what is at a place; of a directory only an empty one, and only where that is `allowed`.
int remove_entry(const char* path, bool directory_allowed) {
    const auto found = find(path, false);
    if (!found) {
        return -1;
    }
    if (is_read_only(*found)) {
        return fail(EROFS);
    }
    if (found->what == kind::nothing) {
        return fail(ENOENT);
    }
    constexpr auto unchangeable = STATX_ATTR_IMMUTABLE | STATX_ATTR_APPEND; // see chattr(1)
    if (has(unchangeable, parent_of(found->path) + "/") || has(unchangeable, found->path)) {
        return fail(EPERM);
    }
    if (has(STATX_ATTR_MOUNT_ROOT, found->path)) {
        return fail(EBUSY);
    }
    if (found->what == kind::directory && !(directory_allowed && is_empty(*found))) {
        return fail(directory_allowed ? ENOTEMPTY : EISDIR);
    }
    imagined[found->path] = {};
    return succeed();
}

} // namespace

void imagination::forget() {
    imagined.clear();
    warnings.clear();
}

const imagination::changes& imagination::noted() {
    return imagined;
}

std::vector<std::string> imagination::take_warnings() {
    return std::exchange(warnings, {});
}

std::vector<std::string> imagination::way_to(const std::string& path) {
    std::vector<std::string> passed;
    if (!find(path, true, &passed) && errno != ENOENT && errno != ENOTDIR && errno != ELOOP) {
        throw std::system_error(errno, std::generic_category(), path);
    }
    return passed;
}

int platform::access(const char* path, int /*mode*/) {
    const auto found = find(path, true);
    if (!found) {
        return -1;
    }
    return found->what == kind::nothing ? fail(ENOENT) : succeed();
}

ssize_t platform::readlink(const char* path, char* buffer, std::size_t size) {
    const auto found = find(path, false);
    if (!found) {
        return -1;
    }
    if (found->what != kind::link) {
        return fail(found->what == kind::nothing ? ENOENT : EINVAL);
    }
    errno = 0;
    return static_cast<ssize_t>(found->target.copy(buffer, size));
}

int platform::symlink(const char* target, const char* link_path) {
    if (*target == '\0') {
        return fail(ENOENT);
    }
    const auto found = find(link_path, false);
    if (!found) {
        return -1;
    }
    if (found->what != kind::nothing) {
        return fail(EEXIST);
    }
    if (is_read_only(*found)) {
        return fail(EROFS);
    }
    if (has(STATX_ATTR_IMMUTABLE, parent_of(found->path) + "/")) {
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
    const auto found = find(path, true);
    if (!found) {
        return -1;
    }
    const bool writing = (flags & O_ACCMODE) != O_RDONLY;
    if (found->what == kind::nothing && !writing) {
        return fail(ENOENT);
    }
    if (writing && found->what == kind::directory) {
        return fail(EISDIR);
    }
    if (writing && is_read_only(*found)) {
        return fail(EROFS);
    }
    if (found->what == kind::nothing) {
        imagined[found->path] = {kind::file, {}};
    }
    // Nothing is written, and what is imagined holds nothing to be read: for both "/" serves.
    const bool real = !writing && !imagined.contains(found->path);
    return real ? ::open(real_path(*found).c_str(), flags) : ::open("/", O_RDONLY | O_CLOEXEC);
}

FTS* platform::fts_open(char* const* roots, int options) {
    const auto found = find(*roots, true);
    const std::string nowhere =
        "/" + std::string(NAME_MAX + 1, 'x'); // a name that is too long to exist
    std::string there = found && found->what == kind::directory ? real_path(*found) : nowhere;
    const std::array<char*, 2> real_roots{there.data(), nullptr};
    errno = 0;
    return ::fts_open(real_roots.data(), options, nullptr);
}

int platform::open_dprotected_np(const char* path, int flags, int /*protection_class*/,
                                 int /*protection_flags*/, mode_t mode) {
    return open(path, flags, mode);
}

int platform::set_protection_class(int /*descriptor*/, int /*protection_class*/) {
    return 0;
}

void warn(const char* format, ...) {
    const int reason = errno;
    std::va_list values;
    va_start(values, format);
    char* text = nullptr;
    if (::vasprintf(&text, format, values) != -1) {
        warnings.push_back(text + (reason == 0 ? "" : ": " + std::string(std::strerror(reason))));
        std::free(text); // NOLINT(*-no-malloc,*-owning-memory): vasprintf's
    }
    va_end(values);
    errno = reason;
}

} // namespace tz
