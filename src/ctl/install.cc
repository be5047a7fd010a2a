// SPDX-License-Identifier: BSD-2-Clause
#include <climits>
#include <iostream>
#include <stdexcept>

#include <fcntl.h>
#include <sys/sendfile.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ctl/prediction.h"
#include "ctl/text.h"
#include "ctl/updates.h"
#include "ctl/verbs.h"
#include "fs/layout.h"
#include "platform/disk.h"
#include "platform/failure.h"
#include "platform/imagination.h"
#include "version/data_version.h"

namespace tz {
namespace {

namespace files = std::filesystem;

void check_name(const std::string& version, bool forced) {
    if (version.empty() || version[0] == '.' || !(forced || split_version(version))) {
        throw std::runtime_error("\"" + version + "\" is not a version such as 2016b.1.0");
    }
    if (files::exists(files::symlink_status(version))) {
        throw std::runtime_error(version + " is installed already: see tzctl use, or cleanup");
    }
}

void copy_file(const std::string& path, int directory) {
    const fs::descriptor source(::open(path.c_str(), O_RDONLY | O_NOFOLLOW | O_CLOEXEC));
    check(source.number(), path);
    const fs::descriptor copy(
        ::openat(directory, path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0644));
    check(copy.number(), path);
    ssize_t copied = 0;
    do {
        copied = ::sendfile(copy.number(), source.number(), nullptr, INT_MAX);
    } while (copied > 0);
    check(static_cast<int>(copied), path);
}

void copy(const files::directory_entry& entry, int directory) {
    const std::string path = entry.path();
    switch (entry.symlink_status().type()) {
    case files::file_type::directory:
        return check(::mkdirat(directory, path.c_str(), 0755), path);
    case files::file_type::regular:
        return copy_file(path, directory);
    case files::file_type::symlink:
        return check(::symlinkat(files::read_symlink(path).c_str(), directory, path.c_str()), path);
    default:
        throw std::runtime_error(path + " is neither a file, a directory nor a link");
    }
}

// Copies the working directory, for everybody to read, into a directory of this user's own, in
// which nobody else can put a link in the way.
void copy_into(const fs::descriptor& staged) {
    struct stat status {};
    check(::fstat(staged.number(), &status), updates::staging);
    if (status.st_uid != ::geteuid()) {
        throw std::runtime_error("somebody else makes updates, too");
    }
    for (const auto& entry : files::recursive_directory_iterator(".")) {
        updates::end_if_interrupted();
        copy(entry, staged.number());
    }
    check(::syncfs(staged.number()), updates::staging);
}

void stage(const fs::descriptor& source, const updates::work& work) {
    (void)::umask(022);
    check(::mkdir(updates::staging, 0755), updates::staging);
    const fs::descriptor staged(
        ::open(updates::staging, O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
    check(::fchdir(source.number()), "the dataset");
    copy_into(staged);
    work.return_to_updates();
}

// What a start would do if the staged dataset were in place and the latest.
prediction predict_with_staged(const std::string& place) {
    imagination::forget();
    (void)platform::unlink(layout::latest_link);
    check(platform::symlink(place.c_str(), layout::latest_link), layout::latest_link);
    check(platform::symlink(updates::path_of(updates::staging).c_str(), place.c_str()), place);
    return predict_start();
}

// Why the dataset should not be installed; empty if it may be.
std::string objection(const prediction& start, const std::string& place) {
    if (start.decided != decision::adopt || start.dataset != place) {
        return "the next start would not adopt it. " + start.reason;
    }
    return updates::holds_zones(updates::staging + std::string(layout::update_zoneinfo))
               ? ""
               : "it holds no tz database, and every time zone would be UTC";
}

void publish(const std::string& version, const std::string& place) {
    check(::rename(updates::staging, version.c_str()), place);
    ::sync(); // before a link names it
    try {
        updates::replace({{layout::latest_link, place}});
    } catch (...) {
        check(::rename(version.c_str(), updates::staging), place);
        throw;
    }
}

} // namespace

void install(const fs::descriptor& source, const std::string& version, bool forced) {
    const updates::work work;
    check_name(version, forced);
    stage(source, work);

    const std::string place = updates::path_of(version);
    const auto start = predict_with_staged(place);
    const std::string against = objection(start, place);
    if (!against.empty() && !forced) {
        throw std::runtime_error(against);
    }
    updates::end_if_interrupted();
    publish(version, place);
    std::cout << wrapped("Installed update " + version + ". The next start " + headline(start) +
                         ".")
              << wrapped(against.empty() ? start.reason : "Forced, though " + against);
}

} // namespace tz
