// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <cerrno>
#include <string>
#include <system_error>

namespace tz {

/// Throws std::system_error with what `errno` says of `what`, if `result`, as of a system call, is
/// -1.
inline void check(int result, const std::string& what) {
    if (result == -1) {
        throw std::system_error(errno, std::generic_category(), what);
    }
}

} // namespace tz
