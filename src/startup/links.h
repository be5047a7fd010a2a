// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

/// What the current link (the zoneinfo link) and the latest link say. Targets are taken as stored:
/// nothing is resolved, and nothing on disk is changed.
///
/// A dataset path is the directory of an installed update, such as /var/db/timezone/tz/2016a.1.2,
/// or empty for the system's own data.
namespace tz {

/// The target of the latest link, not validated; empty if there is no such link. Throws the `errno`
/// value, an `int`, of any other failure to read it.
[[nodiscard]] std::string read_latest_link();

/// The dataset path that the current link denotes. Throws the `errno` value, an `int`, if the link
/// cannot be read, and as below if it is missing or denotes nothing.
[[nodiscard]] std::string read_current_dataset_path();

/// The dataset path that a current link's `target` denotes: of the directory of an update, all up
/// to the last "/"; of the system's tz database, the empty path. Any other target gives a warning
/// line and throws the `int` -1.
///
/// Example: /var/db/timezone/tz/2016a.1.2/zoneinfo gives /var/db/timezone/tz/2016a.1.2.
[[nodiscard]] std::string dataset_path_from_zoneinfo_link(const std::string& target);

} // namespace tz
