// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

/// Calls of Linux that not every C library declares. Results and `errno` are those of the calls.
namespace tz::kernel {

/// Whether chattr(1) forbids removing the entry at `path`, or new entries in `directory`. Like
/// is_mount_point, false where the file system does not report it. Links are not followed.
[[nodiscard]] bool forbids_removal(const std::string& path);
[[nodiscard]] bool forbids_new_entries(const std::string& directory);
[[nodiscard]] bool is_mount_point(const std::string& path);

/// Opens the directory `name` in `directory`, but no symbolic link and no mount point (EXDEV).
/// Linux before 5.6 detects only mount points of other file systems.
[[nodiscard]] int open_directory_on_same_mount(int directory, const std::string& name);

/// Opens with O_PATH what `path` leads to. Follows symbolic links, but only beneath `directory`
/// (EXDEV). Fails on Linux before 5.6 (ENOSYS).
[[nodiscard]] int open_beneath(int directory, const std::string& path);

/// Exchanges two entries of `directory`, of any types, in one step.
int exchange(int directory, const std::string& one, const std::string& other);

/// Renames an entry of `directory`, unless there is one of the new name (EEXIST). Where the file
/// system cannot do both in one step, an entry that appears in between may be replaced.
int rename_to_free_name(int directory, const std::string& from, const std::string& to);

/// Whether `errno` says that the kernel or the file system lacks what was asked for.
[[nodiscard]] bool is_unsupported();

} // namespace tz::kernel
