// SPDX-License-Identifier: BSD-2-Clause
#include "startup/start_up.h"

#include <string>

#include "dataset/kiv_dataset.h"
#include "platform/warn.h"
#include "startup/decision.h"
#include "startup/links.h"
#include "startup/localtime_link.h"
#include "startup/preparation.h"
#include "startup/state_files.h"

namespace tz {
namespace {

std::string current_dataset_path_or_reset() {
    try {
        return read_current_dataset_path();
    } catch (...) {
        warn(messages::invalid_links);
        reset_to_system_partition();
        return {};
    }
}

void drop_current() {
    warn(messages::dropped);
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

void reconcile() {
    const kiv_dataset system;
    const std::string latest_path = read_latest_link();
    const kiv_dataset current(current_dataset_path_or_reset());

    const bool kept = keep_current(current, system);
    if (!kept) {
        drop_current();
    }
    const kiv_dataset& effective = kept ? current : system;
    if (latest_path.empty()) {
        return;
    }

    const kiv_dataset latest(latest_path);
    if (adopt_latest(latest, current, system)) {
        adopt(latest, effective, system);
    } else {
        warn("New update not compatible or older version: %s vs. %s",
             latest.version_string().c_str(), current.version_string().c_str());
    }
}

} // namespace

void start_up() {
    prepare();
    try {
        reconcile();
    } catch (...) {
        warn(messages::fell_back);
        reset_to_system_partition();
    }
    repair_localtime_link();
}

} // namespace tz
