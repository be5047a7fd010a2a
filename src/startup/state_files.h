// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include "dataset/kiv_dataset.h"

namespace tz {

/// Creates the clean-up marker, an empty file without data protection. A failure gives a warning
/// line.
void touch_needs_cleanup();

/// Rewrites the record of the last adoption: the version of the dataset that was replaced, "_", and
/// the version of the update that replaced it, without a newline. Silent on failure, for example if
/// the path is a FIFO without a reader.
///
/// Example: 2016a.1.0_2016b.1.0
void write_version_diff_record(const kiv_dataset& effective, const kiv_dataset& latest);

} // namespace tz
