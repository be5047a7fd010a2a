// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz {

/// The warning lines that tell why a start goes back to the system's own data, or fails even so.
namespace messages {
inline constexpr char invalid_links[] = "Invalid current symlinks; resetting to system partition";
inline constexpr char dropped[] = "Symlink points at data incompatible with installed system";
inline constexpr char fell_back[] = "Unable to locate data; resetting to system partition";
inline constexpr char gave_up[] = "Could not set all time-zone links"; // said by main
} // namespace messages

/// One start: decides which time-zone data is current and makes the links say so. Every failure on
/// the way ends with the system's own data being current. Throws only if that, or the link to the
/// default zone after it, could not be done either; a warning line has then said why.
void start_up();

} // namespace tz
