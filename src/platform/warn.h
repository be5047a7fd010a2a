// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz {

/// Writes one warning line to standard error: the program's name, ": ", the message, ": ", the
/// description of the current `errno` and a newline. `format` and its values are those of printf.
///
/// Example: with ENOENT in `errno`, warn("read_symlink: %s", "/x") writes
/// "tzreconcile: read_symlink: /x: No such file or directory".
///
/// The line is a single write, unlike those of the C library's warn(3). So lines of several writers
/// to a pipe do not mix as long as each fits into PIPE_BUF (4096 bytes on Linux). `errno` keeps its
/// value, so a second line about one failure gives the same error. A line that cannot be written is
/// lost silently.
[[gnu::format(printf, 1, 2)]] void warn(const char* format, ...);

} // namespace tz
