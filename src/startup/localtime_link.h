// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz {

/// Makes the local-time link lead through the zoneinfo link, so that local time follows the current
/// data. Such a link stays, whether or not its zone exists. A link into the legacy tz database
/// is corrected if the current data has that zone. Anything else is replaced by a link to the
/// default zone. Both changes give warning lines.
///
/// If the link to the default zone cannot be created, throws the `errno` value, an `int`.
void repair_localtime_link();

} // namespace tz
