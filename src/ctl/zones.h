// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <ctime>
#include <functional>
#include <string>
#include <vector>

#include "fs/descriptor.h"

namespace tz {

/// What a clock shows besides the time of day, for example {3600, false, "CET"}.
struct local_type {
    long offset = 0; // seconds east of UTC
    bool daylight_saving = false;
    std::string abbreviation; // its first 32 bytes

    bool operator==(const local_type&) const = default;
};

/// The first moment at which two datasets disagree on a zone, and the local type in each.
struct zone_change {
    std::string zone;
    std::time_t at = 0;
    local_type before;
    local_type after;
};

/// Zones are named by relative paths, such as "Europe/Paris", and sorted by name.
struct zone_differences {
    std::vector<std::string> compared; // readable zones that both have
    std::vector<zone_change> changed;
    std::vector<std::string> added;
    std::vector<std::string> removed;
    /// Files that begin as a zone, or are one in the other dataset, but cannot be read as one.
    /// Programs silently use UTC then, so such files are not compared.
    std::vector<std::string> unreadable_before;
    std::vector<std::string> unreadable_after;
};

/// The compiled zones of a dataset, opened for a comparison.
struct zone_directory {
    std::string name; // of the dataset: its version, or a directory's base name
    std::string path; // as the caller types it
    fs::descriptor descriptor;
};

using zone_progress = std::function<void(std::size_t done, std::size_t all)>;

/// Compares what the C library reads for each zone, from `start` (inclusive) to `end` (exclusive).
/// The first disagreement is exact to the second. It goes unnoticed only within a period of less
/// than half a week, after which a dataset returns to the same local type.
///
/// Zones are regular files that begin with "TZif", at most 8 directories deep, and symbolic links
/// to such files that stay inside the directory; except "posix", "right" and "posixrules".
///
/// Calls `progress` before each file, and passes on what that throws. Needs "/proc". Changes
/// the environment variable TZ. Throws std::system_error with the path of what cannot be read, and
/// std::runtime_error if the two directories hold more than 65536 names.
[[nodiscard]] zone_differences compare_zones(const zone_directory& from, const zone_directory& to,
                                             std::time_t start, std::time_t end,
                                             const zone_progress& progress);

} // namespace tz
