// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/diff.h"

#include <algorithm>
#include <array>
#include <chrono>
#include <filesystem>
#include <iostream>

#include <unistd.h>

#include "ctl/failure.h"
#include "ctl/interruption.h"
#include "ctl/readers.h"
#include "ctl/root.h"
#include "ctl/survey.h"
#include "ctl/tree.h"
#include "ctl/updates.h"
#include "ctl/way.h"
#include "fs/layout.h"

namespace tz {
namespace {

constexpr std::time_t ten_years = std::time_t{3652} * 24 * 60 * 60;

// Compares, and shows the progress on a terminal once that takes longer than a second.
zone_differences compare_visibly(const zone_directory& from, const zone_directory& to,
                                 std::time_t start, std::time_t end) {
    using clock = std::chrono::steady_clock;
    const auto begin = clock::now();
    const bool terminal = ::isatty(STDERR_FILENO) == 1;
    bool printed = false;
    auto found = compare_zones(from, to, start, end, [&](auto done, auto all) {
        interruption::check();
        if (terminal && done % 16 == 0 && clock::now() - begin > std::chrono::seconds(1)) {
            printed = true;
            // The next line overwrites this one.
            std::cerr << "Compared " << done << " of " << all << " zones\r";
        }
    });
    std::cerr << (printed ? "\x1b[K" : "");
    return found;
}

zone_directory open_zones(const std::string& name, const std::string& path) {
    auto directory = tree::open(path);
    if (!tree::holds_zones(directory, in_image(path))) {
        refuse(in_image(path), "holds no zone file");
    }
    return {name, in_image(path), std::move(directory)};
}

zone_directory open_zones_in(const std::string& directory) {
    const std::string base = tree::own_name(tree::open(directory), directory);
    const std::string& name = base.empty() ? directory : base;
    for (const char* inside : {"zoneinfo.default", "zoneinfo"}) {
        const std::string zones = std::filesystem::path(directory) / inside;
        if (updates::exists(zones)) {
            return open_zones(name, zones);
        }
    }
    return open_zones(name, directory);
}

zone_directory open_zones_of(const std::string& path, const candidates& linked) {
    return path.empty() ? open_zones(linked.system ? linked.system->version : "system",
                                     layout::system_zoneinfo)
                        : open_zones(path.substr(updates::path_of("").size()),
                                     path + layout::update_zoneinfo);
}

zone_directory open_linked(const std::optional<dataset>& named, const char* link,
                           const candidates& linked) {
    if (!named) {
        refuse(in_image(link), "missing, or names no dataset");
    }
    return open_zones_of(named->path, linked);
}

zone_directory open_operand(operand& wanted, const candidates& linked) {
    if (wanted.opened) {
        return *std::move(wanted.opened);
    }
    if (wanted.text == "current") {
        return open_linked(linked.current, layout::zoneinfo_link, linked);
    }
    if (wanted.text == "latest") {
        return open_linked(linked.latest, layout::latest_link, linked);
    }
    const std::string path = wanted.text == "system" ? "" : updates::path_of(wanted.text);
    if (!path.empty() && !(split_version(wanted.text) && updates::exists(path))) {
        refuse(wanted.text, "not an installed version (a directory must contain a slash)");
    }
    return open_zones_of(path, linked);
}

comparison compare(const zone_directory& from, const zone_directory& to) {
    const std::time_t now = std::time(nullptr);
    comparison done{from.name, to.name, now, now + ten_years, local_zone(), {}, true, {}, {}};
    done.local_time_follows = leads_through(local_time_path(), layout::zoneinfo_link);
    leave_root();
    done.found = compare_visibly(from, to, done.start, done.end);
    return done;
}

// The zone of the local-time link, if the start replaces that, and with it local time.
std::optional<std::string> next_local_zone(const prediction& start) {
    const auto now = updates::target_of(layout::localtime_link);
    const std::string path = local_time_path();
    const bool reads_it =
        path == layout::localtime_link ||
        (now ? leads_through(path, layout::localtime_link) : !follow(path).leads_somewhere);
    const auto zone = zone_in(start.localtime.value_or(""));
    const bool same =
        zone == zone_in(now.value_or("")) && leads_through(path, layout::zoneinfo_link);
    return start.localtime == now || !reads_it || same ? std::nullopt : zone;
}

comparison compare_with_next(const foresight& next) {
    const auto& [linked, start] = next;
    if (start.result.decided == decision::fail) {
        refuse("the next start", "fails");
    }
    const auto zone = next_local_zone(start);
    auto done = compare(open_linked(linked.current, layout::zoneinfo_link, linked),
                        open_zones_of(start.result.dataset, linked));
    done.next_local_zone = zone;
    return done;
}

} // namespace

operand::operand(const std::string& word) : text(word) {
    if (word.find('/') != std::string::npos) {
        opened = open_zones_in(word);
    }
}

comparison compare(std::vector<operand> operands) {
    const auto next = foresee({});
    if (operands.empty()) {
        return compare_with_next(next);
    }
    const auto& linked = next.considered;
    const auto from = operands.size() == 1
                          ? open_linked(linked.current, layout::zoneinfo_link, linked)
                          : open_operand(operands.front(), linked);
    return compare(from, open_operand(operands.back(), linked));
}

comparison effect_of_next_start() {
    const auto next = foresee({});
    comparison none;
    try {
        return compare_with_next(next);
    } catch (const std::system_error& error) {
        constexpr std::array of_the_data{ENOENT, ENOTDIR, ELOOP, ENAMETOOLONG, EACCES};
        const int why = error.code().value();
        const bool obstacle = std::count(of_the_data.begin(), of_the_data.end(), why) != 0;
        if (!obstacle && why != ENOSYS) { // as of Linux before 5.6
            throw;
        }
        none.obstacle = error.what();
    } catch (const std::runtime_error& error) {
        none.obstacle = error.what();
    }
    return none;
}

} // namespace tz
