// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <cerrno>
#include <stdexcept>
#include <string>
#include <system_error>

/// Every failure is thrown as std::exception, whose text has the form "what: why". `what` is
/// usually a path, as the caller of tzctl would type it.
namespace tz {

/// If `result`, that of a system call, is -1: throws the error in `errno`, about `what`.
inline void check(ssize_t result, const std::string& what) {
    if (result == -1) {
        throw std::system_error(errno, std::generic_category(), what);
    }
}

[[noreturn]] inline void refuse(const std::string& what, const std::string& why) {
    throw std::runtime_error(what + ": " + why);
}

/// Whether `errno`, after a failed call, says that there is no such entry.
[[nodiscard]] inline bool is_missing() {
    return errno == ENOENT || errno == ENOTDIR;
}

} // namespace tz
