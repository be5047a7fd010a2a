// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <ctime>
#include <optional>
#include <string>
#include <vector>

#include "ctl/zones.h"

namespace tz {

/// What the caller wants compared: "system", "current", "latest", the version of an installed
/// update, or a directory, which must contain a slash.
struct operand {
    /// Opens a directory by the caller's path, so construct it before another root directory is
    /// entered. The directory holds an update, the system's own data, or the zones themselves.
    /// Throws std::exception.
    explicit operand(const std::string& word);

    std::string text;
    std::optional<zone_directory> opened;
};

struct comparison {
    std::string from;
    std::string to;
    std::time_t start = 0; // inclusive
    std::time_t end = 0;   // exclusive
    std::optional<std::string> local_zone;
    std::optional<std::string> next_local_zone; // if the next start replaces the local-time link
    bool local_time_follows = true;             // whether local time is read from the data compared
    zone_differences found;
    std::string obstacle; // why nothing could be compared
};

/// Compares two datasets from now on, for ten years: the current one and what the next start makes
/// current; or the current one and the operand; or both operands. Leaves the image, because it
/// needs the machine's "/proc". Throws std::exception.
[[nodiscard]] comparison compare(std::vector<operand> operands);

/// What the next start changes for clocks. If nothing can be compared because something is missing
/// or refused, `obstacle` is the message. Throws other failures. Leaves the image, too.
[[nodiscard]] comparison effect_of_next_start();

} // namespace tz
