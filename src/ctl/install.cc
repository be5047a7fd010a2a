// SPDX-License-Identifier: BSD-2-Clause
#include <iostream>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ctl/failure.h"
#include "ctl/interruption.h"
#include "ctl/root.h"
#include "ctl/survey.h"
#include "ctl/text.h"
#include "ctl/tree.h"
#include "ctl/updates.h"
#include "ctl/verbs.h"
#include "ctl/work.h"
#include "fs/layout.h"
#include "rehearsal/kernel.h"

namespace tz {
namespace {

constexpr char no_version[] = "its name is not a version such as 2016b.1.0";

// A copy of the dataset, in which nobody else can change or read anything.
fs::descriptor stage(const fs::descriptor& source, const std::string& shown, const work& work,
                     const std::string& name) {
    (void)::umask(022);
    const std::string path = in_image(updates::path_of(name));
    check(::mkdirat(work.updates().number(), name.c_str(), 0700), path);
    auto staged = tree::open_directory(work.updates().number(), name, path);
    struct stat status {};
    if (!staged || ::fstat(staged->number(), &status) == -1 || status.st_uid != ::geteuid()) {
        refuse(path, "something else is in its place");
    }
    tree::copy(source, *staged, shown);
    check(::syncfs(staged->number()), path);
    return *std::move(staged);
}

bool is_installed(const std::string& version, const fs::descriptor& staged, const work& work) {
    const std::string path = in_image(updates::path_of(version));
    if (::faccessat(work.updates().number(), version.c_str(), F_OK, AT_SYMLINK_NOFOLLOW) == -1) {
        check(is_missing() ? 0 : -1, path);
        return false;
    }
    const auto installed = tree::open_directory(work.updates().number(), version, path);
    if (!installed || !tree::equal(*installed, staged, path)) {
        refuse(path, "installed already, with other contents");
    }
    return true;
}

bool has_zones(const fs::descriptor& dataset, const std::string& shown) {
    const std::string zoneinfo = layout::update_zoneinfo + 1;
    const auto directory = tree::open_directory(dataset.number(), zoneinfo, shown);
    return directory && tree::holds_zones(*directory, shown + "/" + zoneinfo);
}

bool is_older(const std::string& release, const std::string& than) {
    return split_version(release) && split_version(than) &&
           data_version(than) > data_version(release);
}

// Why the dataset should not be installed.
std::vector<std::string> objections(const foresight& next, const std::string& version,
                                    const fs::descriptor& staged, const std::string& shown) {
    std::vector<std::string> all;
    const auto add = [&](bool holds, const std::string& why) {
        all.insert(all.end(), holds ? 1 : 0, why);
    };
    const outcome& result = next.start.result;
    const bool stays = result.decided == decision::adopt || result.decided == decision::keep;
    const std::string release = release_in(staged, layout::update_zoneinfo);
    const std::string icu_release = release_in(staged, layout::update_icu);
    const std::string current =
        next.considered.current ? next.considered.current->icu_release : std::string();
    add(!split_version(version), no_version);
    add(!stays || result.dataset != updates::path_of(version),
        "the next start would not adopt it: " + reason(result, next.considered));
    add(!has_zones(staged, shown), "it holds no zone file, so every time zone would be UTC");
    add(!release.empty() && version != release && !version.starts_with(release + "."),
        "its data is of release " + release);
    add(is_older(icu_release, current), "its ICU data is of release " + icu_release +
                                            ", which is older than the current " + current);
    return all;
}

void publish(const std::string& version, const fs::descriptor& staged,
             const std::string& staged_name, const work& work) {
    const std::string place = updates::path_of(version);
    const int updates = work.updates().number();
    check(::fchmod(staged.number(), 0755), in_image(place));
    check(::fsync(staged.number()), in_image(place));
    check(kernel::rename_to_free_name(updates, staged_name, version), in_image(place));
    try {
        check(::fsync(updates), in_image(layout::updates_directory));
        work.replace({{layout::latest_link, place}});
    } catch (...) {
        if (updates::target_of(layout::latest_link) != place) { // or the link would lead nowhere
            (void)kernel::rename_to_free_name(updates, version, staged_name);
        }
        throw;
    }
}

} // namespace

void install(const fs::descriptor& source, const std::string& shown, const std::string& version,
             bool forced) {
    if (version.empty() || version[0] == '.' || !(forced || split_version(version))) {
        refuse(shown, no_version);
    }
    const work work;
    finish_interrupted_use(work);
    const std::string staged_name = tree::temporary_name();
    const fs::descriptor staged = stage(source, shown, work, staged_name);
    const bool installed = is_installed(version, staged, work);

    const std::string place = updates::path_of(version);
    std::vector<wanted_link> wanted{{layout::latest_link, place}};
    if (!installed) {
        wanted.push_back({place, updates::path_of(staged_name)});
    }
    const auto next = foresee(wanted);
    const auto against = objections(next, version, staged, shown);
    if (!against.empty() && !forced) {
        refuse(shown, against.front());
    }
    interruption::check();
    if (installed) {
        work.replace({{layout::latest_link, place}});
    } else {
        publish(version, staged, staged_name, work);
    }
    std::cout << wrapped(installed ? "Update " + version + " is installed already."
                                   : "Installed update " + version + ".")
              << wrapped("The next start " + headline(next.start.result) + ".")
              << (against.empty() ? wrapped(reason(next.start.result, next.considered)) : "");
    for (const auto& why : against) {
        std::cout << wrapped("Forced, although " + why + (why.ends_with('.') ? "" : "."));
    }
}

} // namespace tz
