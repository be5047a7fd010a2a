// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz {

/// Writes one warning line on standard error: the program's name, ": ", the message, ": ", the
/// description of the current `errno` and a newline. `format` and its values are printf's.
///
/// Example: with ENOENT in `errno`, warn("read_symlink: %s", "/x") writes
/// "tzreconcile: read_symlink: /x: No such file or directory".
///
/// The line leaves in a single write, whatever its length and the bytes of the names in it; warn(3)
/// of the C library promises less. So the lines of several writers to a pipe do not mix, as long as
/// each fits the pipe's buffer (PIPE_BUF, 4096 bytes on Linux). `errno` is left as it was, so a
/// second line about one failure gives the same reason. A line that cannot be written is lost
/// without notice.
[[gnu::format(printf, 1, 2)]] void warn(const char* format, ...);

} // namespace tz
