// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <functional>
#include <map>
#include <string>

#include <gtest/gtest.h>
#include <sys/types.h>

/// The program's paths are absolute and fixed, so the tests run in a root directory of their own,
/// which main enters before the first test. It holds nothing but what a test lays out there.
namespace tz::test {

/// Paths, absolute or counted from /var/db/timezone, and what is there: "->" and a link's target,
/// "=" and a file's text, "|" for a FIFO, "/" for a directory, "!" for nothing. A target may begin
/// with "@" for the directory of updates.
using tree = std::map<std::string, std::string>;

/// The system at 2016c, and updates that are older, newer and newest, each with its tz database.
inline const std::string three_updates =
    "/usr/share/zoneinfo.default/+VERSION=2016c, /usr/share/icu/icutzformat.txt=44l, "
    "localtime->/var/db/timezone/zoneinfo/Europe/Paris, "
    "tz/2016a/zoneinfo/+VERSION=2016a, tz/2016a/icutz/icutz44l.dat=, "
    "tz/2016d/zoneinfo/+VERSION=2016d, tz/2016d/icutz/icutz44l.dat=, "
    "tz/2016e/zoneinfo/+VERSION=2016e, tz/2016e/icutz/icutz44l.dat=, ";

/// A tree from a text such as "zoneinfo->@2016a/zoneinfo, needs_cleanup=, tz_latest!".
tree parsed(const std::string& text);

/// Adds `entries`, and the directories above, to what the root holds.
void add(const tree& entries);

/// Makes the root hold just `entries`, and /var/db/timezone, which is then the working directory.
void lay_out(const tree& entries);

/// What is in /var/db, except for the updates.
tree state();

/// The warning lines that `action` writes, without the program's name and (unless wanted) reason.
std::string warnings_of(const std::function<void()>& action, bool with_reasons = false);

/// /dev/full, which the root does not have.
inline int dev_full = -1;

/// Starts the built program in a process of its own, which does something `beforehand`.
pid_t start_program(const std::function<void()>& beforehand);

/// The wait(2) status with which the built program ends.
int run_program(const std::function<void()>& beforehand = [] {});

} // namespace tz::test
