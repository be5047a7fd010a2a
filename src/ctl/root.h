// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

namespace tz {

/// Makes `directory`, a mounted or unpacked image, the root directory of this process, so that
/// every path and every link leads to somewhere inside. An ordinary user, who may not do that, does
/// it in a user namespace. Throws std::system_error.
void enter_root(const std::string& directory);

/// Goes back to where the caller was, if another root directory was entered. Throws
/// std::system_error.
void leave_root();

/// `path`, which is absolute, as the caller types it: with the image in front.
[[nodiscard]] std::string in_image(const std::string& path);

} // namespace tz
