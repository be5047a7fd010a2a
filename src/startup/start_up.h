// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

#include "startup/decision.h"

namespace tz {

/// What one start decided, and why.
struct outcome {
    decision decided = decision::keep;
    std::string dataset;                // path of the dataset now current; empty: the system's own
    verdict current = verdict::unknown; // on the dataset that the current link named
    verdict latest = verdict::unknown;  // on the dataset that the latest link names
};

/// The warning line with which main reports that start_up threw.
inline constexpr char gave_up[] = "Could not set all time-zone links";

/// One start: decides which time-zone data is current, and sets the links accordingly. A failure on
/// the way makes the system's own data current. Throws only if that fails, too, or if the link to
/// the default zone cannot be created; at least one warning line has then been written.
outcome start_up();

} // namespace tz
