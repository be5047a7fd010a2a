// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

#include "ctl/work.h"
#include "fs/descriptor.h"

/// The verbs of tzctl. Every verb prints what it has done on standard output, and throws
/// std::exception, whose text is for people, if it refuses or fails.
namespace tz {

/// Installs the dataset in the directory `source`, which the caller calls `shown`, as the update
/// `version`, and makes it the latest. A crash at any moment leaves the old state or the new, and a
/// failure the old. Changes nothing if the same dataset is installed and the latest already. Unless
/// `forced`, refuses the datasets that tzctl(8) lists, such as one that no start would adopt.
void install(const fs::descriptor& source, const std::string& shown, const std::string& version,
             bool forced);

/// Makes the installed update `version`, or for "system" the system's own data, current at once,
/// and the latest, too, so that the next start keeps it. Refuses what a start would not keep, and
/// what has no zone file. After a failure the links are as before.
void use(const std::string& version);

/// Completes a `use` that was killed. If that is refused by now, prints why and forgets it. After
/// any other failure it stays unfinished, and the std::system_error is thrown.
void finish_interrupted_use(const work& work);

/// Prints one line for a monitoring system, in the form of its plugins, and returns the exit status
/// of a plugin: 0 if everything is fine, 1 for a warning, 2 if it is critical, 3 if the state is
/// unknown.
[[nodiscard]] int print_check();

/// The line and the status for what cannot be checked.
[[nodiscard]] int print_unknown(const std::string& why);

/// Deletes the installed updates that are not in use; with `rehearsed`, only lists them. Reports on
/// standard error what cannot be deleted, and returns false then.
[[nodiscard]] bool clean_up(bool rehearsed);

} // namespace tz
