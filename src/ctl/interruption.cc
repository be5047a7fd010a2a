// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/interruption.h"

#include <csignal>
#include <initializer_list>
#include <stdexcept>

namespace tz {
namespace {

volatile std::sig_atomic_t arrived = 0; // the number of the signal

} // namespace

void interruption::defer() {
    struct sigaction deferring {};
    deferring.sa_handler = [](int signal) { arrived = signal; };
    for (const int signal : {SIGHUP, SIGINT, SIGTERM}) {
        struct sigaction former {};
        if (::sigaction(signal, nullptr, &former) == 0 && former.sa_handler != SIG_IGN) {
            (void)::sigaction(signal, &deferring, nullptr);
        }
    }
}

void interruption::check() {
    if (arrived != 0) {
        throw std::runtime_error("interrupted");
    }
}

void interruption::end_process_if_any() {
    if (arrived != 0) {
        (void)std::signal(arrived, SIG_DFL);
        (void)std::raise(arrived);
    }
}

} // namespace tz
