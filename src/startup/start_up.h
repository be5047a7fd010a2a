// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz {

/// One start: decides which time-zone data is current and makes the links say so. Every failure on
/// the way ends with the system's own data being current. Throws only if that, or the link to the
/// default zone after it, could not be done either; a warning line has then said why.
void start_up();

} // namespace tz
