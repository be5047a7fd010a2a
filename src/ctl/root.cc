// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/root.h"

#include <fstream>
#include <optional>

#include <fcntl.h>
#include <sched.h>
#include <unistd.h>

#include "ctl/failure.h"
#include "fs/descriptor.h"

namespace tz {
namespace {

struct place {
    fs::descriptor root{::open("/", O_PATH | O_CLOEXEC)};
    fs::descriptor directory{::open(".", O_PATH | O_CLOEXEC)};
};

std::string image; // empty for the running system
std::optional<place> outside;

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
    outside.emplace();
    check(::chroot(directory.c_str()), directory);
    check(::chdir("/"), directory);
    image = directory.substr(0, directory.find_last_not_of('/') + 1);
}

void leave_root() {
    if (outside) {
        check(::fchdir(outside->root.number()), "/");
        check(::chroot("."), "/");
        check(::fchdir(outside->directory.number()), ".");
    }
}

std::string in_image(const std::string& path) {
    return image + path;
}

} // namespace tz
