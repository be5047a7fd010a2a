// SPDX-License-Identifier: BSD-2-Clause
#include "startup/localtime_link.h"

#include <string>
#include <string_view>

#include "fs/layout.h"
#include "fs/operations.h"
#include "platform/disk.h"
#include "platform/warn.h"

namespace tz {
namespace {

void replace_localtime_link(const std::string& target) {
    // Unlike fs::remove, this prints nothing, and also deletes an empty directory.
    (void)platform::remove(layout::localtime_link);
    fs::create_symlink(target, layout::localtime_link);
}

// Whether the link stays or was corrected. Throws if it could not be read or corrected.
bool keep_or_correct_localtime_link() {
    std::string target = fs::read_symlink(layout::localtime_link);
    if (target.starts_with(layout::zoneinfo_link)) {
        return true;
    }
    constexpr std::string_view legacy = layout::legacy_zoneinfo;
    if (!target.starts_with(legacy)) {
        return false;
    }
    target.replace(0, legacy.size(), layout::zoneinfo_link);
    warn("Correcting localtime link to %s", target.c_str());
    if (!fs::exists(target)) {
        return false;
    }
    replace_localtime_link(target);
    return true;
}

} // namespace

void repair_localtime_link() {
    try {
        if (keep_or_correct_localtime_link()) {
            return;
        }
    } catch (...) {
        // Every failure leads to the default zone, with the warning line below.
    }
    warn("localtime link invalid; resetting to %s", layout::default_zone);
    replace_localtime_link(std::string(layout::zoneinfo_link) + "/" + layout::default_zone);
}

} // namespace tz
