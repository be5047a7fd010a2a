// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

/// The few path operations on which everything else rests. Paths and link targets are byte strings,
/// handed to the system call as they are: nothing is normalised or resolved.
///
/// A failure that an operation does not tolerate is reported by one warning line and then thrown as
/// the bare `errno` value, an `int`. Callers need no more than the fact of it.
namespace tz::fs {

/// Removes the entry at `path`; of a link the link itself. An absent entry counts as removed. A
/// directory is never removed: that is a failure.
void remove(const std::string& path);

/// Whether `path` can be reached. Links are followed: a dangling link does not exist.
[[nodiscard]] bool exists(const std::string& path);

/// The target of the link at `path` as stored, at most its first 1024 bytes; empty if there is no
/// entry at `path`. Anything there but a link is a failure.
[[nodiscard]] std::string read_symlink(const std::string& path);

/// Makes a link at `link_path` whose text is `target`, which need not exist. An entry that is
/// already at `link_path` is a failure; it is never replaced.
void create_symlink(const std::string& target, const std::string& link_path);

/// Takes data protection off the file or directory at `path`, so that it can be read before the
/// machine is unlocked. Silent where that fails or the platform knows no such protection.
void set_protection_class(const std::string& path);

/// The first word of the text file at `path`: the bytes up to the next white space of the "C"
/// locale, after any that comes first. Empty, without a message, if there is no word or `path` is
/// not a readable regular file. FIFOs and devices are not waited for.
///
/// Example: "\n  2016a extra\n" gives "2016a".
[[nodiscard]] std::string read_word(const std::string& path);

} // namespace tz::fs
