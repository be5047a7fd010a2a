// SPDX-License-Identifier: BSD-2-Clause
#include <cerrno>
#include <iostream>
#include <system_error>

#include <fcntl.h>
#include <unistd.h>

#include "ctl/prediction.h"
#include "ctl/text.h"
#include "ctl/updates.h"
#include "ctl/verbs.h"
#include "fs/descriptor.h"
#include "fs/layout.h"
#include "platform/disk.h"
#include "platform/imagination.h"
#include "version/data_version.h"

namespace tz {
namespace {

namespace files = std::filesystem;

void check_name(const std::string& version, bool forced) {
    if (version.empty() || version[0] == '.' || !(forced || split_version(version))) {
        throw std::runtime_error("\"" + version + "\" is not a version such as 2016b.1.0");
    }
    if (files::exists(files::symlink_status(updates::path_of(version)))) {
        throw std::runtime_error(version + " is installed already: see tzctl use");
    }
}

void flush(const files::path& path) {
    const fs::descriptor file(::open(path.c_str(), O_RDONLY | O_CLOEXEC));
    if (!file.is_open() || ::fsync(file.number()) == -1) {
        throw std::system_error(errno, std::generic_category(), path);
    }
}

// Readable by everybody, and on the disk.
void settle(const files::directory_entry& entry) {
    if (!entry.is_symlink()) {
        files::permissions(entry, files::perms(entry.is_directory() ? 0755 : 0644));
        flush(entry);
    }
}

void stage(const files::path& source) {
    const auto staged = updates::staging_directory();
    files::copy(source, staged,
                files::copy_options::recursive | files::copy_options::copy_symlinks);
    for (const auto& entry : files::recursive_directory_iterator(staged)) {
        updates::end_if_interrupted();
        settle(entry);
    }
    settle(files::directory_entry(staged));
}

// What a start would do if the staged dataset were in place and the latest.
prediction predict_with_staged(const std::string& place) {
    imagination::forget();
    (void)platform::unlink(layout::latest_link);
    if (platform::symlink(place.c_str(), layout::latest_link) == -1 ||
        platform::symlink(updates::staging_directory().c_str(), place.c_str()) == -1) {
        throw std::system_error(errno, std::generic_category(), layout::latest_link);
    }
    return predict_start();
}

void check_adoption(const prediction& start, const std::string& place) {
    if (start.decided != decision::adopt || start.dataset != place) {
        throw std::runtime_error("the next start would not adopt it. " + start.reason);
    }
    if (!updates::holds_zones(updates::staging_directory() /
                              files::path(layout::update_zoneinfo).relative_path())) {
        throw std::runtime_error("it holds no tz database, and every time zone would be UTC");
    }
}

void publish(const std::string& place) {
    const auto staged = updates::staging_directory();
    files::rename(staged, place);
    try {
        flush(layout::updates_directory);
        updates::replace_link(place, layout::latest_link);
    } catch (...) {
        files::rename(place, staged);
        throw;
    }
    ::sync();
}

} // namespace

void install(const files::path& source, const std::string& version, bool forced) {
    const updates::work work;
    check_name(version, forced);
    stage(source);

    const std::string place = updates::path_of(version);
    const auto start = predict_with_staged(place);
    if (!forced) {
        check_adoption(start, place);
    }
    updates::end_if_interrupted();
    publish(place);
    std::cout << wrapped("Installed update " + version + ". The next start " + headline(start) +
                         ".")
              << wrapped(start.reason);
}

} // namespace tz
