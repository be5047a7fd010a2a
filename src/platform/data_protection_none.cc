// SPDX-License-Identifier: BSD-2-Clause
#include "platform/data_protection.h"

#include <fcntl.h>

namespace tz::platform {

int open_dprotected_np(const char* path, int flags, int /*protection_class*/,
                       int /*protection_flags*/, mode_t mode) {
    return ::open(path, flags, mode);
}

int set_protection_class(int /*descriptor*/, int /*protection_class*/) {
    return 0;
}

} // namespace tz::platform
