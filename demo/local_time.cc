// SPDX-License-Identifier: BSD-2-Clause
// Prints what the C library makes of a moment (seconds since 1970) in the system's local time zone.
// Linked statically for the demo's root directory, which holds no date(1).
#include <cstdlib>
#include <ctime>
#include <iostream>

int main(int count, char** arguments) {
    if (count != 2) {
        std::cerr << "usage: local_time SECONDS\n";
        return 2;
    }
    ::setenv("TZ", ":/var/db/timezone/localtime", 1);
    const std::time_t moment = std::strtoll(arguments[1], nullptr, 10);
    char text[64] = "";
    std::strftime(text, sizeof text, "%a %d %b %Y %H:%M:%S, UTC %z (%Z)", std::localtime(&moment));
    std::cout << text << '\n';
}
