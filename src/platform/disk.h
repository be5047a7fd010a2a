// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <cstddef>

#include <fts.h>
#include <sys/stat.h>
#include <sys/types.h>

// Otherwise a start would fail on files beyond 2 GiB, and on files written after January 2038.
static_assert(sizeof(off_t) == 8 && sizeof(ino_t) == 8 && sizeof(time_t) == 8,
              "this needs a C library with 64-bit offsets, inode numbers and times");

/// The few calls with which a start looks at the disk and changes it. Each is the call of the C
/// library that it is named after: arguments, results and `errno` are the same.
///
/// They exist twice, and each program links one set: tzreconcile that in disk.cc; tzctl a
/// simulation (rehearsal/imagination.h), with which it predicts a start by running it.
namespace tz::platform {

int access(const char* path, int mode);
ssize_t readlink(const char* path, char* buffer, std::size_t size);
int symlink(const char* target, const char* link_path);
int unlink(const char* path);
int remove(const char* path);
int open(const char* path, int flags, mode_t mode = 0);
int fstat(int descriptor, struct stat* status);
ssize_t read(int descriptor, void* buffer, std::size_t size);
FTS* fts_open(char* const* roots, int options);
FTSENT* fts_read(FTS* walk);

} // namespace tz::platform
