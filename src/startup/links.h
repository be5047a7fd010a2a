// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

/// Reads the current link (the zoneinfo link) and the latest link. Targets are used as stored:
/// nothing is resolved, and the disk does not change.
///
/// A dataset path is the directory of an installed update, such as /var/db/timezone/tz/2016a.1.2,
/// or empty for the system's own data.
namespace tz {

/// The target of the latest link, not validated; empty if there is no such link. If the link cannot
/// be read, throws the `errno` value, an `int`.
[[nodiscard]] std::string read_latest_link();

/// The dataset path that the current link denotes. If the link cannot be read, throws the `errno`
/// value, an `int`; if it is missing or denotes no dataset, throws as below.
[[nodiscard]] std::string read_current_dataset_path();

/// The dataset path that a current link's `target` denotes. In the directory of updates it is the
/// part of the target before the last "/"; for the system's tz database it is empty. Any other
/// target gives a warning line and throws the `int` -1.
///
/// Example: /var/db/timezone/tz/2016a.1.2/zoneinfo gives /var/db/timezone/tz/2016a.1.2.
[[nodiscard]] std::string dataset_path_from_zoneinfo_link(const std::string& target);

} // namespace tz
