// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>

namespace tz {

/// The machine's zone, such as "Europe/Paris": what follows ".../zoneinfo.../" in the first target
/// that names one on the way from /etc/localtime, or else from the local-time link. Nothing if
/// neither names a zone.
[[nodiscard]] std::optional<std::string> local_zone();

/// The zone that a link's target names in that form.
[[nodiscard]] std::optional<std::string> zone_in(const std::string& target);

} // namespace tz
