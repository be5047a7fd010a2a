// SPDX-License-Identifier: BSD-2-Clause
#include "rehearsal/kernel.h"

#include <cerrno>
#include <cstdio>

// <sys/stat.h> may declare statx(2) differently, so it stays out.
#include <fcntl.h>
#include <linux/fs.h>
#include <linux/openat2.h>
#include <linux/stat.h>
#include <sys/syscall.h>
#include <unistd.h>

#include "fs/descriptor.h"

namespace tz::kernel {
namespace {

struct statx status_of(int directory, const char* path, int flags) {
    struct statx status {};
    if (::syscall(SYS_statx, directory, path, flags, STATX_TYPE, &status) == -1) {
        status = {};
    }
    return status;
}

bool has_any(__u64 attributes, const std::string& path) {
    return (status_of(AT_FDCWD, path.c_str(), AT_SYMLINK_NOFOLLOW).stx_attributes & attributes) !=
           0;
}

int open(int directory, const std::string& path, int flags, __u64 resolve) {
    open_how how{};
    how.flags = static_cast<__u64>(flags);
    how.resolve = resolve;
    return static_cast<int>(::syscall(SYS_openat2, directory, path.c_str(), &how, sizeof how));
}

int rename(int directory, const std::string& from, const std::string& to, unsigned flags) {
    return static_cast<int>(
        ::syscall(SYS_renameat2, directory, from.c_str(), directory, to.c_str(), flags));
}

} // namespace

bool forbids_removal(const std::string& path) {
    return has_any(STATX_ATTR_IMMUTABLE | STATX_ATTR_APPEND, path);
}

bool forbids_new_entries(const std::string& directory) {
    return has_any(STATX_ATTR_IMMUTABLE, directory);
}

bool is_mount_point(const std::string& path) {
    return has_any(STATX_ATTR_MOUNT_ROOT, path);
}

int open_directory_on_same_mount(int directory, const std::string& name) {
    constexpr int flags = O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC;
    const int opened = open(directory, name, flags, RESOLVE_NO_XDEV);
    if (opened != -1 || errno != ENOSYS) {
        return opened;
    }
    fs::descriptor child(::openat(directory, name.c_str(), flags));
    const auto parent_status = status_of(directory, "", AT_EMPTY_PATH);
    const auto status = status_of(child.number(), "", AT_EMPTY_PATH);
    if (child.is_open() && (status.stx_dev_major != parent_status.stx_dev_major ||
                            status.stx_dev_minor != parent_status.stx_dev_minor ||
                            (status.stx_attributes & STATX_ATTR_MOUNT_ROOT) != 0)) {
        errno = EXDEV;
        return -1;
    }
    return child.release();
}

int open_beneath(int directory, const std::string& path) {
    int opened = -1;
    do { // EAGAIN: something was renamed while the kernel resolved ".."
        opened = open(directory, path, O_PATH | O_CLOEXEC, RESOLVE_BENEATH);
    } while (opened == -1 && errno == EAGAIN);
    return opened;
}

int exchange(int directory, const std::string& one, const std::string& other) {
    return rename(directory, one, other, RENAME_EXCHANGE);
}

int rename_to_free_name(int directory, const std::string& from, const std::string& to) {
    const int result = rename(directory, from, to, RENAME_NOREPLACE);
    if (result == 0 || !is_unsupported()) {
        return result;
    }
    if (::faccessat(directory, from.c_str(), F_OK, AT_SYMLINK_NOFOLLOW) == -1) {
        return -1;
    }
    if (::faccessat(directory, to.c_str(), F_OK, AT_SYMLINK_NOFOLLOW) == 0) {
        errno = EEXIST;
    }
    return errno == ENOENT ? ::renameat(directory, from.c_str(), directory, to.c_str()) : -1;
}

bool is_unsupported() {
    return errno == EINVAL || errno == ENOSYS;
}

} // namespace tz::kernel
