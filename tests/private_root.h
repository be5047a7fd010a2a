// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <functional>
#include <map>
#include <string>

#include <gtest/gtest.h>

/// The program's paths are absolute and fixed, so the tests run in a root directory of their own,
/// which main enters before the first test. It holds nothing but what a test lays out there.
namespace tz::test {

/// Paths, absolute or relative to /var/db/timezone, and what is there: "->" and a link's target,
/// "=" and a file's text, "|" for a FIFO, "/" for a directory, "!" for nothing. A target may begin
/// with "@" for the directory of updates.
using tree = std::map<std::string, std::string>;

/// A tree from a text such as "zoneinfo->@2016a/zoneinfo, needs_cleanup=, tz_latest!".
tree parsed(const std::string& text);

/// Makes the root hold just `entries`, and /var/db/timezone, which is then the working directory.
void lay_out(const tree& entries);

/// What is in /var/db, by relative paths, but not what is in the updates.
tree state();

/// The warning lines that `action` writes, without the program's name and the reason.
std::string warnings_of(const std::function<void()>& action);

} // namespace tz::test
