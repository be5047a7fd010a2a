// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <functional>
#include <optional>
#include <string>

#include "fs/descriptor.h"

/// Work on whole directories that another user may own, and may change at the same time. Every step
/// goes from a directory's descriptor to an entry of it, follows no symbolic link, and opens only
/// regular files. `shown` is what messages call the directory. Failures are thrown as
/// std::exception, also when something is not what it was a moment before.
namespace tz::tree {

/// Opens the directory at `path`, and follows links.
[[nodiscard]] fs::descriptor open(const std::string& path);

/// The same, or nothing if there is none.
[[nodiscard]] std::optional<fs::descriptor> open_if_any(const std::string& path);

/// Opens the directory at `path` beneath the open `directory`, through no symbolic link. Nothing if
/// there is none; a link counts as none.
[[nodiscard]] std::optional<fs::descriptor> open_directory(int directory, const std::string& path,
                                                           const std::string& shown);

/// The name of the open `directory`, to which `path` leads; empty for "/". Throws also if `path`
/// leads elsewhere by now.
[[nodiscard]] std::string own_name(const fs::descriptor& directory, const std::string& path);

/// Calls `act` with the name of every entry of the open `directory`.
void for_each_name(const fs::descriptor& directory, const std::string& shown,
                   const std::function<void(const std::string&)>& act);

/// Copies everything below `source` into the empty directory `copy`, which only this user may
/// change, with modes that let everybody read it. Refuses what cannot be part of a dataset: special
/// files, files of another owner than `source`'s that not every user may read, more than 8 levels
/// of directories, symbolic links that lead out of the directory or nowhere, and what changes
/// during the copy.
void copy(const fs::descriptor& source, const fs::descriptor& copy, const std::string& shown);

/// Whether both directories hold the same, byte for byte; owners, modes and times do not count.
/// Only this user may change `own`: what is in it is looked up by its path.
[[nodiscard]] bool equal(const fs::descriptor& theirs, const fs::descriptor& own,
                         const std::string& shown);

/// Whether the regular file `name` in `directory` begins as a compiled zone file.
[[nodiscard]] bool is_zone(int directory, const std::string& name, const std::string& shown);

/// Whether `zoneinfo` has a compiled zone file, other than in posix/ and right/: there no program
/// looks for a zone.
[[nodiscard]] bool holds_zones(const fs::descriptor& zoneinfo, const std::string& shown);

/// The same of the directory at the path; false if the path leads nowhere.
[[nodiscard]] bool holds_zones(const std::string& zoneinfo);

/// Calls `act` with the path of every entry that is not a directory, likewise outside of posix/ and
/// right/.
void for_each_zone_name(const fs::descriptor& zoneinfo, const std::string& shown,
                        const std::function<void(const std::string&)>& act);

/// The number of bytes on the disk that removing everything below `directory` frees.
[[nodiscard]] double size(const fs::descriptor& directory, const std::string& shown);

/// Removes the entry `name` of `directory`, and everything below it on the same mount, however
/// deep. For what cannot be removed it calls `failed` with a path that begins with `shown`, and
/// with `errno` set, and continues. Returns whether the entry is gone.
bool remove(int directory, const std::string& name, const std::string& shown,
            const std::function<void(const std::string&)>& failed);

/// The prefix of the name of everything that is half-made or half-deleted.
inline constexpr char half_made[] = ".tzctl.";

/// An unpredictable name: the prefix and 8 hexadecimal digits.
[[nodiscard]] std::string temporary_name(const std::string& prefix = half_made);

} // namespace tz::tree
