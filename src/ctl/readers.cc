// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/readers.h"

#include <algorithm>

#include <sys/stat.h>

#include "ctl/failure.h"
#include "ctl/root.h"
#include "ctl/updates.h"
#include "ctl/way.h"
#include "fs/layout.h"

namespace tz {

std::optional<std::string> local_zone() {
    for (const char* link : {etc_localtime, layout::localtime_link}) {
        for (const auto& passed : follow(link).passed) {
            if (auto zone = zone_in(passed.target)) {
                return zone;
            }
        }
    }
    return std::nullopt;
}

bool leads_through_current_link(const std::string& path) {
    struct stat current {};
    const int result = ::lstat(layout::zoneinfo_link, &current);
    check(result == -1 && is_missing() ? 0 : result, in_image(layout::zoneinfo_link));
    return result == 0 && follow(path).passes({current.st_dev, current.st_ino});
}

bool local_time_follows() {
    return leads_through_current_link(updates::exists(etc_localtime) ? etc_localtime
                                                                     : layout::localtime_link);
}

std::optional<std::string> zone_in(const std::string& target) {
    const auto directory = target.find("/zoneinfo");
    const auto slash = std::min(target.find('/', directory + 1), target.size() - 1);
    return directory == std::string::npos || slash + 1 == target.size()
               ? std::nullopt
               : std::optional(target.substr(slash + 1));
}

} // namespace tz
