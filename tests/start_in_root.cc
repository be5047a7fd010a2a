// SPDX-License-Identifier: BSD-2-Clause
// usage: tzreconcile DIRECTORY
// A start in that root directory. It stands in for a program that is not linked statically, which
// needs a C library in its root.
#include <cstdio>

#include <unistd.h>

int program_main(); // main of the program, renamed

int main(int /*count*/, char** arguments) {
    if (::chroot(arguments[1]) != 0 || ::chdir("/") != 0) {
        std::perror(arguments[1]);
        return 2;
    }
    return program_main();
}
