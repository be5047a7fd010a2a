// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

#include "fs/descriptor.h"

/// What tzctl can be asked to do. All print what came of it on standard output, and throw
/// std::exception, whose text is for people, if it was refused or failed.
namespace tz {

/// Prints what is there and what the next start would do: for people, at 80 columns; or as the JSON
/// object that tzctl(8) describes. Changes nothing.
void print_status(bool as_json);

/// Installs the dataset in the directory `source` as the update `version`, and makes it the latest.
/// A crash at any moment leaves the old state or the new, and a failure the old. Refuses what the
/// next start would not adopt, and what holds no tz database, unless `forced`.
void install(const fs::descriptor& source, const std::string& version, bool forced);

/// Makes the installed update `version`, or for "system" the system's own data, current at once,
/// and has the latest link say so, too, so that the next start keeps it. Refuses what a start would
/// not keep, and what holds no tz database. After a failure the links are as before.
void use(const std::string& version);

/// Deletes the installed updates that are not in use; with `rehearsed`, only says which these are.
void clean_up(bool rehearsed);

} // namespace tz
