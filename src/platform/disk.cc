// SPDX-License-Identifier: BSD-2-Clause
#include "platform/disk.h"

#include <cstdio>

#include <fcntl.h>
#include <unistd.h>

namespace tz::platform {

int access(const char* path, int mode) {
    return ::access(path, mode);
}

ssize_t readlink(const char* path, char* buffer, std::size_t size) {
    return ::readlink(path, buffer, size);
}

int symlink(const char* target, const char* link_path) {
    return ::symlink(target, link_path);
}

int unlink(const char* path) {
    return ::unlink(path);
}

int remove(const char* path) {
    return std::remove(path);
}

int open(const char* path, int flags, mode_t mode) {
    return ::open(path, flags, mode);
}

int fstat(int descriptor, struct stat* status) {
    return ::fstat(descriptor, status);
}

ssize_t read(int descriptor, void* buffer, std::size_t size) {
    return ::read(descriptor, buffer, size);
}

FTS* fts_open(char* const* roots, int options) {
    return ::fts_open(roots, options, nullptr);
}

FTSENT* fts_read(FTS* walk) {
    return ::fts_read(walk);
}

} // namespace tz::platform
