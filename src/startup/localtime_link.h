// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz {

/// Makes sure that the local-time link leads through the zoneinfo link, so that the local zone
/// follows the current data. A link that does is left alone, whether or not its zone exists; a link
/// into the legacy tz database is corrected if the current data has that zone; anything else is
/// replaced by a link to the default zone. All but the first give warning lines.
///
/// Throws the `errno` value, an `int`, if the link to the default zone could not be created.
void repair_localtime_link();

} // namespace tz
