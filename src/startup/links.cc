// SPDX-License-Identifier: BSD-2-Clause
#include "startup/links.h"

#include <string_view>

#include "fs/layout.h"
#include "fs/operations.h"
#include "platform/warn.h"

namespace tz {

std::string read_latest_link() {
    return fs::read_symlink(layout::latest_link);
}

std::string read_current_dataset_path() {
    return dataset_path_from_zoneinfo_link(fs::read_symlink(layout::zoneinfo_link));
}

std::string dataset_path_from_zoneinfo_link(const std::string& target) {
    constexpr std::string_view prefix = layout::updates_directory;

    if (target.starts_with(prefix)) {
        const auto last_slash = target.rfind('/');
        if (last_slash > prefix.size()) {
            return target.substr(0, last_slash);
        }
    } else if (target == layout::system_zoneinfo) {
        return {};
    }
    warn("Bad zoneinfo link %s", target.c_str());
    throw -1;
}

} // namespace tz
