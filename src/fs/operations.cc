// SPDX-License-Identifier: BSD-2-Clause
#include "fs/operations.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <string_view>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "fs/descriptor.h"
#include "platform/data_protection.h"
#include "platform/disk.h"
#include "platform/warn.h"

namespace tz::fs {
namespace {

bool is_white_space(char c) {
    return c == ' ' || ('\t' <= c && c <= '\r');
}

} // namespace

void remove(const std::string& path) {
    if (platform::unlink(path.c_str()) == 0 || errno == ENOENT) {
        return;
    }
    warn("remove: could not remove %s", path.c_str());
    throw int{errno};
}

bool exists(const std::string& path) {
    return platform::access(path.c_str(), F_OK) == 0;
}

std::string read_symlink(const std::string& path) {
    std::array<char, 1024> target; // NOLINT(*-member-init): readlink fills it
    const ssize_t length = platform::readlink(path.c_str(), target.data(), target.size());
    if (length >= 0) {
        return {target.data(), static_cast<std::size_t>(length)};
    }
    if (errno == ENOENT) {
        return {};
    }
    warn("read_symlink: %s", path.c_str());
    throw int{errno};
}

void create_symlink(const std::string& target, const std::string& link_path) {
    if (platform::symlink(target.c_str(), link_path.c_str()) == 0) {
        return;
    }
    warn("create_symlink: from %s to %s", link_path.c_str(), target.c_str());
    throw int{errno};
}

void set_protection_class(const std::string& path) {
    const descriptor file(platform::open(path.c_str(), O_RDONLY | O_CLOEXEC));
    if (file.is_open()) {
        platform::set_protection_class(file.number(), platform::class_without_protection);
    }
}

std::string read_word(const std::string& path) {
    // Non-blocking: opening a FIFO without a writer would block the boot.
    const descriptor file(
        platform::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
    struct stat status {};
    if (!file.is_open() || platform::fstat(file.number(), &status) == -1 ||
        !S_ISREG(status.st_mode)) {
        return {};
    }

    std::string word;
    std::array<char, 4096> buffer; // NOLINT(*-member-init): read fills it
    for (;;) {
        const ssize_t length = platform::read(file.number(), buffer.data(), buffer.size());
        if (length == -1) {
            return {};
        }
        const std::string_view text(buffer.data(), static_cast<std::size_t>(length));
        const auto* const begin = word.empty()
                                      ? std::find_if_not(text.begin(), text.end(), is_white_space)
                                      : text.begin();
        const auto* const end = std::find_if(begin, text.end(), is_white_space);
        word.append(begin, end);
        if (text.empty() || end != text.end()) {
            return word;
        }
    }
}

} // namespace tz::fs
