// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/updates.h"

#include <algorithm>
#include <array>
#include <climits>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ctl/failure.h"
#include "ctl/root.h"
#include "ctl/tree.h"
#include "ctl/way.h"
#include "fs/layout.h"
#include "startup/links.h"
#include "version/data_version.h"

namespace tz::updates {
namespace {

constexpr char unknown_use[] = "names no dataset, so it is unknown which updates are in use";

std::vector<way> ways_in_use() {
    const auto current = target_of(layout::zoneinfo_link);
    try {
        (void)dataset_path_from_zoneinfo_link(current.value_or(""));
    } catch (int) {
        refuse(in_image(layout::zoneinfo_link), unknown_use);
    }
    if (exists(layout::latest_link) && !target_of(layout::latest_link)) {
        refuse(in_image(layout::latest_link), unknown_use);
    }
    std::vector<way> ways;
    for (const char* link :
         {layout::zoneinfo_link, layout::icu_link, layout::latest_link, layout::localtime_link}) {
        ways.push_back(follow(link));
    }
    return ways;
}

} // namespace

std::string path_of(const std::string& version) {
    return layout::updates_directory + version;
}

std::vector<std::string> installed(const fs::descriptor& directory) {
    std::vector<std::string> versions;
    const std::string shown = in_image(layout::updates_directory);
    tree::for_each_name(directory, shown, [&](const std::string& name) {
        struct stat status {};
        if (!split_version(name)) {
            return;
        }
        if (::fstatat(directory.number(), name.c_str(), &status, AT_SYMLINK_NOFOLLOW) == -1) {
            return check(is_missing() ? 0 : -1, shown + name);
        }
        if (S_ISDIR(status.st_mode)) {
            versions.push_back(name);
        }
    });
    std::sort(versions.begin(), versions.end());
    return versions;
}

std::vector<std::string> removable(const fs::descriptor& directory) {
    const auto in_use = ways_in_use();
    auto versions = installed(directory);
    std::erase_if(versions, [&](const std::string& version) {
        struct stat status {};
        if (::fstatat(directory.number(), version.c_str(), &status, AT_SYMLINK_NOFOLLOW) == -1) {
            check(is_missing() ? 0 : -1, in_image(path_of(version)));
            return true; // deleted meanwhile
        }
        return std::any_of(in_use.begin(), in_use.end(), [&](const way& one) {
            return one.passes({status.st_dev, status.st_ino});
        });
    });
    return versions;
}

bool exists(const std::string& path) {
    struct stat status {};
    const int result = ::lstat(path.c_str(), &status);
    check(result == -1 && is_missing() ? 0 : result, in_image(path));
    return result == 0;
}

std::optional<std::string> target_of(const std::string& link) {
    std::array<char, PATH_MAX> target{};
    const ssize_t length = ::readlink(link.c_str(), target.data(), target.size());
    if (length == -1 && (is_missing() || errno == EINVAL)) {
        return std::nullopt;
    }
    check(length, in_image(link));
    return std::string(target.data(), static_cast<std::size_t>(length));
}

} // namespace tz::updates
