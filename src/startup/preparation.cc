// SPDX-License-Identifier: BSD-2-Clause
#include "startup/preparation.h"

#include "fs/layout.h"
#include "fs/operations.h"
#include "platform/warn.h"

namespace tz {

void prepare_state_directories() {
    fs::set_protection_class(layout::state_directory);
    fs::set_protection_class(layout::updates_directory);
}

void migrate_legacy_icu_link() {
    if (fs::exists(layout::legacy_icu_link) && !fs::exists(layout::icu_link)) {
        try {
            fs::create_symlink(fs::read_symlink(layout::legacy_icu_link), layout::icu_link);
        } catch (...) {
            warn("Could not migrate %s to %s", layout::legacy_icu_link, layout::icu_link);
        }
    }
    if (fs::exists(layout::legacy_icu_link)) {
        try {
            fs::remove(layout::legacy_icu_link);
        } catch (...) {
            warn("Could not remove %s", layout::legacy_icu_link);
        }
    }
}

} // namespace tz
