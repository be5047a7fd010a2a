// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/root.h"

#include <fstream>

#include <sched.h>
#include <unistd.h>

#include "ctl/failure.h"

namespace tz {
namespace {

std::string image; // empty for the running system

void become_root_of_a_namespace() {
    const auto user = ::geteuid();
    const auto group = ::getegid();
    check(::unshare(CLONE_NEWUSER), "cannot enter a user namespace");
    std::ofstream("/proc/self/uid_map") << "0 " << user << " 1";
    std::ofstream("/proc/self/setgroups") << "deny";
    std::ofstream("/proc/self/gid_map") << "0 " << group << " 1";
}

} // namespace

void enter_root(const std::string& directory) {
    if (::geteuid() != 0) {
        become_root_of_a_namespace();
    }
    check(::chroot(directory.c_str()), directory);
    check(::chdir("/"), directory);
    image = directory.substr(0, directory.find_last_not_of('/') + 1);
}

std::string in_image(const std::string& path) {
    return image + path;
}

} // namespace tz
