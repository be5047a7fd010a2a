// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include "dataset/kiv_dataset.h"

/// The two decisions of a start. They look at datasets only, never at the disk.
namespace tz {

/// What a start decides: to keep the current data; to adopt the latest update, also after a drop or
/// a reset; to drop the current update; to reset to the system's own data because something failed.
/// `fail`: the start could not set all links, and exits with status 1.
enum class decision { keep, adopt, drop, reset, fail };

/// What a start found out about the dataset that the current or the latest link names.
enum class verdict {
    unknown,      // something else failed first
    none,         // the link is missing; of the current: or it names no dataset
    failed,       // the dataset cannot be read; of the latest: or its link names none
    other_schema, // the ICU data does not have the system's schema
    not_newer,    // the system's data is newer; of the latest: it is not newer than the current
    fits,
};

/// Whether `current`, which the current link names, stays current: it is compatible with `system`,
/// and `system` is not strictly newer.
[[nodiscard]] verdict judge_current(const kiv_dataset& current, const kiv_dataset& system);

/// Whether `latest`, which the latest link names, becomes current: it is compatible with `system`,
/// and strictly newer than `current`, even if that has just been dropped.
[[nodiscard]] verdict judge_latest(const kiv_dataset& latest, const kiv_dataset& current,
                                   const kiv_dataset& system);

} // namespace tz
