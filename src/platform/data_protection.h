// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <sys/types.h>

namespace tz::platform {

/// The class without protection: its data is readable before anybody has unlocked the machine,
/// which is when a start runs.
inline constexpr int class_without_protection = 4;

/// open(2) that creates a missing file in `protection_class`. `flags` and `mode` are those of
/// open(2); `protection_flags` are 0. Returns the descriptor, or -1 with `errno` set. On platforms
/// without protection classes this is open(2).
int open_dprotected_np(const char* path, int flags, int protection_class, int protection_flags,
                       mode_t mode);

/// Moves the open file or directory to `protection_class`. Returns -1 with `errno` set on failure.
/// Does nothing on platforms without protection classes.
int set_protection_class(int descriptor, int protection_class);

} // namespace tz::platform
