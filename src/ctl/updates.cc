// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/updates.h"

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <stdexcept>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ctl/prediction.h"
#include "fs/layout.h"
#include "platform/failure.h"
#include "platform/imagination.h"

namespace tz::updates {
namespace {

namespace files = std::filesystem;

volatile std::sig_atomic_t asked_to_end = 0;

// Beside a link: what it will be, and what it was.
constexpr char wanted_suffix[] = ".tzctl-new";
constexpr char former_suffix[] = ".tzctl-old";

const files::path directory_of_updates = files::path(layout::updates_directory).parent_path();

// All by which the links of the state directory lead. Throws if that cannot be told.
std::vector<std::string> places_in_use() {
    std::vector<std::string> places;
    for (const char* link :
         {layout::zoneinfo_link, layout::icu_link, layout::latest_link, layout::localtime_link}) {
        if (target_of(link)) {
            const auto way = imagination::way_to(link);
            places.insert(places.end(), way.begin(), way.end());
        } else if (errno == EINVAL ? link == layout::latest_link : errno != ENOENT) {
            throw std::runtime_error(std::string(link) +
                                     " cannot be read, so nothing is known to be unused");
        }
    }
    return places;
}

int open_directory(const std::string& path) {
    const int directory = ::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
    if (directory == -1 && errno == ENOTDIR) {
        throw std::runtime_error(path + " is not a directory, but a link perhaps, through which "
                                        "nothing is changed");
    }
    check(directory, path);
    return directory;
}

void make_beside(const std::string& path, const char* suffix,
                 const std::optional<std::string>& target) {
    if (target) {
        check(::symlink(target->c_str(), (path + suffix).c_str()), path);
    }
}

// What lies beside takes the place of the link; if nothing does, the link goes. The result is as of
// rename(2).
int take_from_beside(const std::string& path, const char* suffix) {
    const int result = ::rename((path + suffix).c_str(), path.c_str());
    return result == -1 && errno == ENOENT ? ::unlink(path.c_str()) : result;
}

void delete_what_is_half_made() {
    std::error_code none;
    files::remove_all(staging, none);
    for (const char* link : {layout::zoneinfo_link, layout::icu_link, layout::latest_link}) {
        for (const char* suffix : {wanted_suffix, former_suffix}) {
            files::remove(std::string(link) + suffix, none);
        }
    }
}

} // namespace

std::string path_of(const std::string& version) {
    return layout::updates_directory + version;
}

std::vector<files::path> installed() {
    std::vector<files::path> found;
    std::error_code none;
    for (const auto& entry : files::directory_iterator(layout::updates_directory, none)) {
        if (entry.is_directory(none) && entry.path().filename() != staging) {
            found.push_back(entry.path());
        }
    }
    std::sort(found.begin(), found.end());
    return found;
}

std::vector<files::path> removable() {
    imagination::forget();
    if (!current_dataset_path()) {
        throw std::runtime_error(
            "the current link cannot be read, so nothing is known to be unused");
    }
    const fs::descriptor updates(open_directory(directory_of_updates)); // is one
    auto found = installed();
    const auto in_use = places_in_use();
    std::erase_if(found, [&](const auto& directory) {
        return files::is_symlink(directory) ||
               std::any_of(in_use.begin(), in_use.end(), [&](const auto& place) {
                   return (place + "/").starts_with(files::canonical(directory).string() + "/");
               });
    });
    return found;
}

std::optional<std::string> first_bytes(const std::string& path, std::size_t most) {
    const fs::descriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK | O_NOCTTY));
    struct stat status {};
    if (!file.is_open() || ::fstat(file.number(), &status) == -1 || !S_ISREG(status.st_mode)) {
        return std::nullopt;
    }
    std::string text(most, '\0');
    const auto length = ::read(file.number(), text.data(), text.size());
    return length == -1 ? std::nullopt
                        : std::optional(text.substr(0, static_cast<std::size_t>(length)));
}

bool holds_zones(const std::string& directory) {
    std::error_code failure;
    for (files::recursive_directory_iterator at(directory, failure), end; !failure && at != end;
         at.increment(failure)) {
        if (first_bytes(at->path(), 4) == "TZif") {
            return true;
        }
    }
    return false;
}

void replace(const links& wanted) {
    imagination::forget();
    for (const auto& [path, target] : wanted) { // all that needs room
        make_beside(path, wanted_suffix, target);
        make_beside(path, former_suffix, target_of(path.c_str()));
    }
    try {
        for (const auto& [path, target] : wanted) {
            check(take_from_beside(path, wanted_suffix), path);
        }
    } catch (...) {
        for (const auto& [path, target] : wanted) {
            (void)take_from_beside(path, former_suffix);
        }
        throw;
    }
    ::sync();
}

work::work()
    : lock_(open_directory(layout::state_directory)),
      updates_(open_directory(directory_of_updates)) {
    for (const int signal : {SIGHUP, SIGINT, SIGTERM}) {
        if (std::signal(signal, [](int) { asked_to_end = 1; }) == SIG_IGN) {
            (void)std::signal(signal, SIG_IGN);
        }
    }
    if (::flock(lock_.number(), LOCK_EX | LOCK_NB) == -1) {
        check(-1, errno == EWOULDBLOCK ? "another tzctl is at work" : layout::state_directory);
    }
    return_to_updates();
    delete_what_is_half_made();
}

work::~work() {
    if (::fchdir(updates_.number()) == 0) {
        delete_what_is_half_made();
    }
}

void work::return_to_updates() const {
    check(::fchdir(updates_.number()), directory_of_updates);
}

void end_if_interrupted() {
    if (asked_to_end != 0) {
        throw std::runtime_error("interrupted");
    }
}

} // namespace tz::updates
