// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

#include "fs/descriptor.h"

namespace tz {

/// Opens the regular file at `path`, relative to the open `directory`, for reading. Nothing else is
/// ever opened for its contents, as that alone can start a watchdog, rewind a tape or release the
/// writer of a FIFO. A symbolic link as the last element is not followed.
///
/// If no regular file is there, the result is not open and `errno` is ENOENT or ENOTDIR. Any other
/// `errno` is that of a failure.
[[nodiscard]] fs::descriptor open_regular_file(int directory, const std::string& path);

/// Makes open_regular_file independent of what happens at a path between looking and opening, by
/// means of /proc. Called before the root directory changes. Where there is no /proc, a file that
/// takes the place of another in that moment may be opened, but is never read.
void prepare_to_open_regular_files();

} // namespace tz
