// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "fs/descriptor.h"

/// The installed updates: the directories in the directory of updates that are named by a version.
/// Everything else there is ignored. All of this reads the real disk, not the simulation, and
/// throws std::exception if that fails.
namespace tz::updates {

/// The path of the update of this version.
[[nodiscard]] std::string path_of(const std::string& version);

/// The versions of the installed updates, in the order of their names.
[[nodiscard]] std::vector<std::string> installed(const fs::descriptor& directory);

/// The versions of the installed updates that are not in use: no link of the state directory leads
/// to them or through them. Throws also if the current link names no dataset, or if the latest link
/// is not a link, because it is then unknown what is in use.
[[nodiscard]] std::vector<std::string> removable(const fs::descriptor& directory);

/// Whether there is an entry, of any type, at the path.
[[nodiscard]] bool exists(const std::string& path);

/// The target of a link; nothing if there is no link at the path.
[[nodiscard]] std::optional<std::string> target_of(const std::string& link);

} // namespace tz::updates
