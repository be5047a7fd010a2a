// SPDX-License-Identifier: BSD-2-Clause
#include "startup/start_up.h"

#include <string>

#include "dataset/kiv_dataset.h"
#include "fs/layout.h"
#include "platform/disk.h"
#include "platform/warn.h"
#include "startup/links.h"
#include "startup/localtime_link.h"
#include "startup/preparation.h"
#include "startup/state_files.h"

namespace tz {
namespace {

std::string current_dataset_path_or_reset(outcome& so_far) {
    try {
        return read_current_dataset_path();
    } catch (...) {
        so_far.decided = decision::reset;
        so_far.current = verdict::none;
        warn("Invalid current symlinks; resetting to system partition");
        reset_to_system_partition();
        return {};
    }
}

void drop_current() {
    warn("Symlink points at data incompatible with installed system");
    reset_to_system_partition();
    touch_needs_cleanup();
}

void adopt(const kiv_dataset& latest, const kiv_dataset& effective, const kiv_dataset& system) {
    latest.make_current();
    if (effective != system) {
        touch_needs_cleanup();
    }
    write_version_diff_record(effective, latest);
}

// An exception ends the sequence and leaves `so_far` as it is then. So each verdict is `failed`
// while the steps that determine it run.
void reconcile(outcome& so_far) {
    const kiv_dataset system;
    so_far.latest = verdict::failed;
    std::string latest_path = read_latest_link();
    so_far.latest = latest_path.empty() ? verdict::none : verdict::unknown;
    so_far.current = verdict::failed;
    std::string current_path = current_dataset_path_or_reset(so_far);
    const kiv_dataset current(current_path);

    const verdict found = judge_current(current, system);
    const bool kept = found == verdict::fits;
    if (so_far.current != verdict::none) {
        so_far.current = found;
    }
    if (kept) {
        so_far.dataset.swap(current_path);
    } else {
        so_far.decided = decision::drop;
        drop_current();
    }
    const kiv_dataset& effective = kept ? current : system;
    if (latest_path.empty()) {
        return;
    }

    so_far.latest = verdict::failed;
    const kiv_dataset latest(latest_path);
    so_far.latest = judge_latest(latest, current, system);
    if (so_far.latest == verdict::fits) {
        so_far.decided = decision::adopt;
        so_far.dataset.swap(latest_path);
        adopt(latest, effective, system);
    } else {
        warn("New update not compatible or older version: %s vs. %s",
             latest.version_string().c_str(), current.version_string().c_str());
    }
}

} // namespace

outcome start_up() {
    outcome result;
    prepare_state_directories();
    migrate_legacy_icu_link();
    (void)platform::remove(layout::cleanup_marker);
    (void)platform::remove(layout::legacy_icu_directory);
    try {
        reconcile(result);
    } catch (...) {
        warn("Unable to locate data; resetting to system partition");
        reset_to_system_partition();
        result.decided = decision::reset;
        result.dataset.clear();
    }
    repair_localtime_link();
    return result;
}

} // namespace tz
