// SPDX-License-Identifier: BSD-2-Clause
#include "platform/process.h"
#include "platform/warn.h"
#include "startup/start_up.h"

int main() {
    tz::platform::prepare_process();
    try {
        (void)tz::start_up();
        return 0;
    } catch (...) {
        tz::warn(tz::gave_up);
        return 1;
    }
}
