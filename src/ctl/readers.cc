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
    for (const auto& passed : follow(local_time_path()).passed) {
        if (auto zone = zone_in(passed.target)) {
            return zone;
        }
    }
    return std::nullopt;
}

const char* local_time_path() {
    return updates::exists(etc_localtime) ? etc_localtime : layout::localtime_link;
}

bool leads_through(const std::string& path, const char* link) {
    struct stat status {};
    const int result = ::lstat(link, &status);
    check(result == -1 && is_missing() ? 0 : result, in_image(link));
    return result == 0 && follow(path).passes({status.st_dev, status.st_ino});
}

std::optional<std::string> zone_in(const std::string& target) {
    const auto directory = target.find("/zoneinfo");
    const auto slash = std::min(target.find('/', directory + 1), target.size());
    const auto zone = target.find_first_not_of('/', slash);
    return directory == std::string::npos || zone == std::string::npos
               ? std::nullopt
               : std::optional(target.substr(zone));
}

} // namespace tz
