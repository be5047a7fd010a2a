// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

namespace tz {

/// Makes the installed update `version`, or with "system" the system's own data, current at once,
/// and lets the latest link say so, too, so that the next start keeps it. Refuses what a start
/// would not keep, and what holds no tz database. Throws std::exception; the links are then as
/// before.
void use(const std::string& version);

} // namespace tz
