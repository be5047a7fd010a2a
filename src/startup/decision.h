// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include "dataset/kiv_dataset.h"

/// The two decisions of a start. They look at datasets only, never at the disk.
namespace tz {

/// Whether `current`, which the current link names, stays current: it is compatible with `system`,
/// and `system` is not strictly newer.
[[nodiscard]] bool keep_current(const kiv_dataset& current, const kiv_dataset& system);

/// Whether `latest`, which the latest link names, becomes current: it is compatible with `system`,
/// and strictly newer than `current`, even if that has just been dropped.
[[nodiscard]] bool adopt_latest(const kiv_dataset& latest, const kiv_dataset& current,
                                const kiv_dataset& system);

} // namespace tz
