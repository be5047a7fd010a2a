// SPDX-License-Identifier: BSD-2-Clause
#include "platform/process.h"

#include <csignal>

#include <fcntl.h>
#include <unistd.h>

namespace tz::platform {

void prepare_process() {
    for (int descriptor = STDIN_FILENO; descriptor <= STDERR_FILENO; ++descriptor) {
        if (::fcntl(descriptor, F_GETFD) == -1) {
            (void)::open("/", O_RDONLY); // always exists and cannot be written to
        }
    }
    (void)std::signal(SIGPIPE, SIG_IGN);
    (void)std::signal(SIGXFSZ, SIG_IGN);
}

} // namespace tz::platform
