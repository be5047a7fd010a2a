// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

/// The path operations on which all other code rests. Paths and link targets are byte strings and
/// reach the system call unchanged: nothing is normalised or resolved.
///
/// An operation reports a failure that it does not tolerate by one warning line and then throws the
/// `errno` value, an `int`. Callers only need to know that it failed.
namespace tz::fs {

/// Removes the file or link at `path`; it does not follow a link. A missing entry counts as
/// removed. A directory is a failure.
void remove(const std::string& path);

/// Whether `path` can be reached. Links are followed: a dangling link does not exist.
[[nodiscard]] bool exists(const std::string& path);

/// The stored target of the link at `path`, at most its first 1024 bytes; empty if there is no
/// entry at `path`. Anything other than a link is a failure.
[[nodiscard]] std::string read_symlink(const std::string& path);

/// Creates a link at `link_path` with the target `target`, which need not exist. An existing entry
/// at `link_path` is a failure and is not replaced.
void create_symlink(const std::string& target, const std::string& link_path);

/// Removes data protection from the file or directory at `path`, so that it is readable before the
/// machine is unlocked. Silent if that fails or the platform has no such protection.
void set_protection_class(const std::string& path);

/// The first word of the file at `path`, delimited by the white space of the "C" locale. Empty,
/// without a message, if there is no word or `path` is not a readable regular file. Does not wait
/// for FIFOs or devices.
///
/// Example: "\n  2016a extra\n" gives "2016a".
[[nodiscard]] std::string read_word(const std::string& path);

} // namespace tz::fs
