// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/way.h"

#include <algorithm>
#include <array>
#include <climits>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ctl/failure.h"
#include "ctl/root.h"
#include "ctl/tree.h"

namespace tz {

bool way::is_open_to_others() const {
    return leads_somewhere && std::all_of(passed.begin(), passed.end(), [&](const entry& one) {
               const mode_t to_pass = S_ISDIR(one.mode) ? S_IXOTH : 0;
               const mode_t needed = to_pass | (&one == &passed.back() ? S_IROTH : 0);
               return S_ISLNK(one.mode) || (one.mode & needed) == needed;
           });
}

bool way::passes(const std::pair<dev_t, ino_t>& identity) const {
    return std::any_of(passed.begin(), passed.end(),
                       [&](const entry& one) { return one.identity == identity; });
}

bool way::leads_to_zone() const {
    return leads_somewhere && S_ISREG(passed.back().mode) &&
           tree::is_zone(directory.number(), name, shown);
}

way follow(const std::string& path) {
    constexpr int most_links = 40; // the limit of Linux
    const std::string shown = in_image(path);
    const auto open_root = [] { return fs::descriptor(::open("/", O_PATH | O_CLOEXEC)); };
    way gone;
    gone.shown = shown;
    std::string rest = path;
    int links = 0;
    for (fs::descriptor at = open_root(); !rest.empty();) {
        const auto slash = std::min(rest.find('/'), rest.size());
        std::string name = slash == 0 ? "." : rest.substr(0, slash);
        const bool before_slash = slash != rest.size();
        rest.erase(0, slash + 1);
        fs::descriptor next(::openat(at.number(), name.c_str(), O_PATH | O_NOFOLLOW | O_CLOEXEC));
        if (!next.is_open() && (is_missing() || errno == ENAMETOOLONG)) {
            return gone;
        }
        struct stat status {};
        check(next.number(), shown);
        check(::fstat(next.number(), &status), shown);
        gone.passed.push_back({{status.st_dev, status.st_ino}, status.st_mode, ""});
        if (!S_ISLNK(status.st_mode)) {
            if (before_slash && !S_ISDIR(status.st_mode)) {
                return gone;
            }
            gone.directory = std::exchange(at, std::move(next));
            gone.name = std::move(name);
            continue;
        }
        std::array<char, PATH_MAX> text{};
        const ssize_t length = ::readlinkat(next.number(), "", text.data(), text.size());
        check(length, shown);
        if (++links > most_links) {
            return gone;
        }
        const std::string target(text.data(), static_cast<std::size_t>(length));
        gone.passed.back().target = target;
        rest.insert(0, target + (rest.empty() ? "" : "/"));
        if (target.starts_with('/')) {
            at = open_root();
        }
    }
    gone.leads_somewhere = true;
    return gone;
}

} // namespace tz
