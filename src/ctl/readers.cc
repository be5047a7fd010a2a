// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/readers.h"

#include <algorithm>

#include "ctl/way.h"
#include "fs/layout.h"

namespace tz {

std::optional<std::string> local_zone() {
    for (const char* link : {"/etc/localtime", layout::localtime_link}) {
        for (const auto& passed : follow(link).passed) {
            if (auto zone = zone_in(passed.target)) {
                return zone;
            }
        }
    }
    return std::nullopt;
}

std::optional<std::string> zone_in(const std::string& target) {
    const auto directory = target.find("/zoneinfo");
    const auto slash = std::min(target.find('/', directory + 1), target.size() - 1);
    return directory == std::string::npos || slash + 1 == target.size()
               ? std::nullopt
               : std::optional(target.substr(slash + 1));
}

} // namespace tz
