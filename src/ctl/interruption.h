// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz::interruption {

/// From now on SIGHUP, SIGINT and SIGTERM, unless they are ignored, no longer end the process at
/// once, so that it can restore a consistent state. They still interrupt a call that waits.
void defer();

/// Throws if one of them has arrived.
void check();

/// If one of them has arrived, lets it end the process.
void end_process_if_any();

} // namespace tz::interruption
