// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>

namespace tz {

inline constexpr char etc_localtime[] = "/etc/localtime";

/// Where local time is read: /etc/localtime or, where that does not exist, the local-time link.
[[nodiscard]] const char* local_time_path();

/// The machine's zone, such as "Europe/Paris": that of the first link which names one on the way
/// from there. Nothing if no link names a zone.
[[nodiscard]] std::optional<std::string> local_zone();

/// Whether following `path` passes `link`.
[[nodiscard]] bool leads_through(const std::string& path, const char* link);

/// The zone that a link's target names: what follows ".../zoneinfo.../".
///
/// Example: /usr/share/zoneinfo.default/Europe/Paris gives Europe/Paris.
[[nodiscard]] std::optional<std::string> zone_in(const std::string& target);

} // namespace tz
