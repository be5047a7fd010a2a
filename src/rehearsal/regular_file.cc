// SPDX-License-Identifier: BSD-2-Clause
#include "rehearsal/regular_file.h"

#include <cerrno>

#include <fcntl.h>
#include <sys/stat.h>

namespace tz {
namespace {

constexpr int reading = O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY;
int own_descriptors = -1; // the directory in which the kernel lists them

} // namespace

void prepare_to_open_regular_files() {
    own_descriptors = ::open("/proc/self/fd", O_PATH | O_DIRECTORY | O_CLOEXEC);
}

fs::descriptor open_regular_file(int directory, const std::string& path) {
    const fs::descriptor place(::openat(directory, path.c_str(), O_PATH | O_NOFOLLOW | O_CLOEXEC));
    struct stat seen {};
    if (!place.is_open() || ::fstat(place.number(), &seen) == -1) {
        return fs::descriptor(-1);
    }
    if (!S_ISREG(seen.st_mode)) {
        errno = ENOENT;
        return fs::descriptor(-1);
    }
    if (own_descriptors != -1) {
        return fs::descriptor(
            ::openat(own_descriptors, std::to_string(place.number()).c_str(), reading));
    }
    fs::descriptor file(::openat(directory, path.c_str(), reading | O_NOFOLLOW));
    struct stat opened {};
    if (file.is_open() && ::fstat(file.number(), &opened) == 0 &&
        (opened.st_dev != seen.st_dev || opened.st_ino != seen.st_ino)) {
        errno = ESTALE;
        return fs::descriptor(-1);
    }
    return file;
}

} // namespace tz
