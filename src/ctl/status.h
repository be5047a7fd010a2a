// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz {

/// Prints what is there and what the next start would do: for people, at 80 columns; or as a JSON
/// object, whose format tzctl(8) describes.
void print_status(bool as_json);

} // namespace tz
