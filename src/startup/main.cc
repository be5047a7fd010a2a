// SPDX-License-Identifier: BSD-2-Clause
#include <csignal>

#include <fcntl.h>
#include <unistd.h>

#include "platform/warn.h"
#include "startup/start_up.h"

namespace {

// A descriptor that is closed now would be taken by the first file opened, and warnings would land
// in that file. "/" always exists, and nothing can be written to it.
void hold_standard_descriptors() {
    for (int descriptor = STDIN_FILENO; descriptor <= STDERR_FILENO; ++descriptor) {
        if (::fcntl(descriptor, F_GETFD) == -1) {
            (void)::open("/", O_RDONLY);
        }
    }
}

// A warning that nobody reads, or a record past a size limit, must not stop the start.
void ignore_write_signals() {
    (void)std::signal(SIGPIPE, SIG_IGN);
    (void)std::signal(SIGXFSZ, SIG_IGN);
}

} // namespace

int main() {
    hold_standard_descriptors();
    ignore_write_signals();
    try {
        tz::start_up();
        return 0;
    } catch (...) {
        tz::warn("Could not set all time-zone links");
        return 1;
    }
}
