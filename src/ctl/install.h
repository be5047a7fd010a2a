// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <filesystem>
#include <string>

namespace tz {

/// Installs the dataset in the directory `source` as the update `version`, and makes it the latest.
/// A crash at any moment leaves the old state or the new; any failure the old. Refuses what the
/// next start would not adopt, or what holds no tz database, unless `forced`. Throws
/// std::exception.
void install(const std::filesystem::path& source, const std::string& version, bool forced);

} // namespace tz
