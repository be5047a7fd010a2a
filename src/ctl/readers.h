// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>

namespace tz {

inline constexpr char etc_localtime[] = "/etc/localtime";

/// The machine's zone, such as "Europe/Paris": that of the first link which names one on the way
/// from /etc/localtime, or else from the local-time link. Nothing if no link names a zone.
[[nodiscard]] std::optional<std::string> local_zone();

/// Whether following `path` passes the current link.
[[nodiscard]] bool leads_through_current_link(const std::string& path);

/// Whether local time is read through the current link: from /etc/localtime or, where that does not
/// exist, from the local-time link.
[[nodiscard]] bool local_time_follows();

/// The zone that a link's target names: what follows ".../zoneinfo.../".
///
/// Example: /usr/share/zoneinfo.default/Europe/Paris gives Europe/Paris.
[[nodiscard]] std::optional<std::string> zone_in(const std::string& target);

} // namespace tz
