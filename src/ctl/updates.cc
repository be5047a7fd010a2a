// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/updates.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <csignal>
#include <fstream>
#include <string_view>
#include <system_error>

#include <fcntl.h>
#include <sys/file.h>
#include <unistd.h>

#include "ctl/prediction.h"
#include "fs/layout.h"

namespace tz::updates {
namespace {

namespace files = std::filesystem;

volatile std::sig_atomic_t asked_to_end = 0;

// Whether `path` is `directory` or lies below it.
bool is_within(const files::path& path, const files::path& directory) {
    return std::mismatch(directory.begin(), directory.end(), path.begin(), path.end()).first ==
           directory.end();
}

// Where a link that says `target` leads in the end, as far as that exists.
files::path final_place(const files::path& target) {
    std::error_code failure;
    auto place = files::weakly_canonical(target, failure);
    if (failure && failure != std::errc::too_many_symbolic_link_levels) {
        throw files::filesystem_error("cannot follow a link", target, failure);
    }
    return place;
}

// All that the links of the state directory say, and where they lead in the end. Throws a refusal
// if that cannot be told.
std::vector<files::path> places_in_use() {
    std::vector<files::path> places;
    for (const char* link :
         {layout::zoneinfo_link, layout::icu_link, layout::latest_link, layout::localtime_link}) {
        if (const auto text = target_of(link)) {
            const auto target = layout::state_directory / files::path(*text);
            places.push_back(target.lexically_normal());
            places.push_back(final_place(target));
        } else if (errno == EINVAL ? link == layout::latest_link : errno != ENOENT) {
            throw std::runtime_error(std::string(link) +
                                     " cannot be read, so nothing is known to be unused");
        }
    }
    return places;
}

bool is_zone_file(const files::directory_entry& entry) {
    constexpr std::string_view magic = "TZif";
    std::array<char, magic.size()> start{};
    std::error_code none;
    return entry.is_regular_file(none) &&
           std::ifstream(entry.path()).read(start.data(), start.size()) &&
           std::string_view(start.data(), start.size()) == magic;
}

} // namespace

files::path staging_directory() {
    return files::path(layout::updates_directory) / ".tzctl";
}

std::string path_of(const std::string& version) {
    return layout::updates_directory + version;
}

std::vector<files::path> installed() {
    std::vector<files::path> found;
    std::error_code none;
    for (const auto& entry : files::directory_iterator(layout::updates_directory, none)) {
        if (entry.is_directory(none) && entry.path() != staging_directory()) {
            found.push_back(entry.path());
        }
    }
    std::sort(found.begin(), found.end());
    return found;
}

std::vector<files::path> removable() {
    if (!current_dataset_path()) {
        throw std::runtime_error(
            "the current link cannot be read, so nothing is known to be unused");
    }
    if (files::is_symlink(files::path(layout::updates_directory).parent_path())) {
        throw std::runtime_error(
            "the directory of updates is a link, through which nothing is deleted");
    }
    auto found = installed();
    const auto in_use = places_in_use();
    std::erase_if(found, [&](const auto& directory) {
        return files::is_symlink(directory) ||
               std::any_of(in_use.begin(), in_use.end(), [&](const auto& place) {
                   return is_within(place, directory) ||
                          is_within(place, files::canonical(directory));
               });
    });
    return found;
}

bool holds_zones(const files::path& directory) {
    std::error_code none;
    const files::recursive_directory_iterator entries(
        directory, files::directory_options::skip_permission_denied, none);
    return std::any_of(begin(entries), end(entries), is_zone_file);
}

void replace_link(const std::string& target, const files::path& path) {
    const auto beside = files::path(path) += ".tzctl";
    files::remove(beside);
    files::create_symlink(target, beside);
    try {
        files::rename(beside, path);
    } catch (...) {
        files::remove(beside);
        throw;
    }
}

work::work() : lock_(::open(layout::state_directory, O_RDONLY | O_DIRECTORY | O_CLOEXEC)) {
    for (const int signal : {SIGHUP, SIGINT, SIGTERM}) {
        (void)std::signal(signal, [](int) { asked_to_end = 1; });
    }
    if (!lock_.is_open() || ::flock(lock_.number(), LOCK_EX | LOCK_NB) == -1) {
        throw std::system_error(errno, std::generic_category(),
                                errno == EWOULDBLOCK ? "another tzctl is at work"
                                                     : layout::state_directory);
    }
    files::remove_all(staging_directory());
}

work::~work() {
    std::error_code none;
    files::remove_all(staging_directory(), none);
}

void end_if_interrupted() {
    if (asked_to_end != 0) {
        throw std::runtime_error("interrupted");
    }
}

} // namespace tz::updates
