// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/survey.h"

#include <algorithm>
#include <array>
#include <set>
#include <stdexcept>

#include <fcntl.h>
#include <unistd.h>

#include "ctl/failure.h"
#include "ctl/readers.h"
#include "ctl/root.h"
#include "ctl/tree.h"
#include "ctl/updates.h"
#include "ctl/way.h"
#include "dataset/kiv_dataset.h"
#include "fs/layout.h"
#include "rehearsal/regular_file.h"
#include "startup/links.h"

namespace tz {
namespace {

const std::string version_file = layout::zoneinfo_version_file; // in ICU's data, too

// The beginning of a regular file; nothing if there is none.
std::optional<std::string> beginning_of(int directory, const std::string& path) {
    std::array<char, 4096> text{};
    const fs::descriptor file = open_regular_file(directory, path);
    if (!file.is_open() && is_missing()) {
        return std::nullopt;
    }
    check(file.number(), in_image(path));
    const ssize_t length = ::read(file.number(), text.data(), text.size());
    check(length, in_image(path));
    return std::string(text.data(), static_cast<std::size_t>(length));
}

// The first word of a regular file, or nothing.
std::string word_in(int directory, const std::string& path) {
    constexpr char white_space[] = " \t\n\v\f\r";
    const std::string text = beginning_of(directory, path).value_or("");
    const auto begin = std::min(text.find_first_not_of(white_space), text.size());
    return text.substr(begin, text.find_first_of(white_space, begin) - begin);
}

std::optional<kiv_dataset> system_data() {
    try {
        return kiv_dataset();
    } catch (const std::out_of_range&) {
        return std::nullopt;
    }
}

// Nothing if the path names no dataset.
std::optional<dataset> describe(const std::string& path, const std::optional<kiv_dataset>& system) {
    dataset found;
    found.path = path;
    try {
        const kiv_dataset data(path);
        found.version = data.version_string();
        found.order = data.version();
        found.schema = data.schema();
        found.compatible = system && data.compatible_with(*system);
        found.newer_than_system = system && data > *system;
    } catch (const std::out_of_range&) {
        found.version = path.substr(std::min(path.size(), updates::path_of("").size()));
        found.readable = false;
    } catch (...) {
        return std::nullopt;
    }
    if (path.empty()) {
        found.release = found.version.substr(0, found.version.rfind(".1.0"));
        found.icu_release = word_in(AT_FDCWD, layout::system_icu + version_file);
    } else if (const auto updates = tree::open_if_any(layout::updates_directory)) {
        if (const auto update = tree::open_directory(updates->number(), found.version, path)) {
            found.release = release_in(*update, layout::update_zoneinfo);
            found.icu_release = release_in(*update, layout::update_icu);
        }
    }
    return found;
}

std::vector<dataset> describe_installed() {
    std::vector<dataset> all;
    const auto directory = tree::open_if_any(layout::updates_directory);
    if (!directory) {
        return all;
    }
    std::vector<std::string> unused;
    try {
        unused = updates::removable(*directory);
    } catch (const std::system_error&) {
        throw;
    } catch (const std::runtime_error&) {
        // None can be called unused then; the links are among the findings.
    }
    const auto system = system_data();
    for (const auto& version : updates::installed(*directory)) {
        auto data = describe(updates::path_of(version), system);
        if (data) {
            data->removable = std::binary_search(unused.begin(), unused.end(), version);
            all.push_back(*std::move(data));
        }
    }
    std::sort(all.begin(), all.end(), [](const dataset& left, const dataset& right) {
        return left.order == right.order ? left.version < right.version : left.order > right.order;
    });
    return all;
}

link describe_link(const char* path) {
    const auto target = updates::target_of(path);
    if (target) {
        return {path, target, follow(path).leads_somewhere ? link_state::ok : link_state::dangling};
    }
    return {path, target, updates::exists(path) ? link_state::not_a_link : link_state::missing};
}

reader describe_reader(const char* path) {
    return {describe_link(path), leads_through(path, layout::zoneinfo_link)};
}

// What is wrong with the data, the worst first.
void add_problems_of_data(const survey& found, std::vector<std::string>& all) {
    const auto add = [&](bool holds, const std::string& problem) {
        all.insert(all.end(), holds ? 1 : 0, problem);
    };
    const outcome& next = found.next_start.result;
    add(!updates::exists(layout::state_directory),
        std::string(layout::state_directory) +
            " is missing: systemd-tmpfiles or the builder of the system creates it.");
    add(!found.current_has_zones,
        "The current link leads to no zone file: programs that follow it show UTC for every zone.");
    add(!found.linked.system, "No start can use the system's own data.");
    add(next.decided == decision::fail, "The next start fails.");
    add(!tree::holds_zones(layout::system_zoneinfo),
        std::string("There is no zone file in ") + layout::system_zoneinfo + ".");
    add(next.current == verdict::not_newer,
        "The current update is older than the system's own data: \"tzctl use system\" makes that "
        "current at once.");
    for (const auto& data : found.installed) {
        add(!data.readable, why_unreadable(data));
    }
}

// What is wrong with the links, and with what they lead to.
void add_problems_of_links(const survey& found, std::vector<std::string>& all) {
    const auto add = [&](bool holds, const std::string& problem) {
        all.insert(all.end(), holds ? 1 : 0, problem);
    };
    const auto& current = found.linked.current;
    const bool update = current && !current->path.empty();
    std::string updates = layout::updates_directory;
    updates.pop_back(); // or a link would be followed
    const prediction& next = found.next_start;
    add(updates::target_of(updates).has_value(),
        updates + " is a symbolic link: tzctl changes nothing then.");
    add(update && found.icutz.target != current->path + layout::update_icu,
        "The ICU link does not lead into the current update: \"tzctl use\" corrects that.");
    add(current && !update && found.icutz.state != link_state::missing,
        "The ICU link is left over, as the system's own data is current: \"tzctl use system\" "
        "corrects that.");
    add(found.tz_latest.state == link_state::dangling, "The latest link leads nowhere.");
    for (const auto& link : {found.zoneinfo, found.icutz, found.localtime}) {
        add(link.state == link_state::ok && !follow(link.path).is_open_to_others(),
            "Only root can read what " + link.path + " leads to.");
    }
    const bool has_etc = found.etc_localtime.place.state != link_state::missing;
    const bool etc_is_zone = follow(etc_localtime).leads_to_zone();
    const bool link_is_zone = follow(layout::localtime_link).leads_to_zone();
    add(found.localtime.state != link_state::missing && !link_is_zone,
        std::string("The local-time link leads to no compiled zone file") +
            (etc_is_zone ? "." : ": local time is UTC."));
    add(has_etc && !etc_is_zone && link_is_zone,
        std::string(etc_localtime) + " leads to no compiled zone file: local time is UTC.");
    add(next.localtime && next.localtime != found.localtime.target,
        "The local-time link is " +
            std::string(found.localtime.state == link_state::missing ? "missing" : "invalid") +
            ": the next start makes it lead to " + next.localtime.value_or("") + ".");
    if (next.result.decided == decision::adopt) {
        const std::string zoneinfo = next.result.dataset + layout::update_zoneinfo;
        const way there = follow(zoneinfo);
        add(!tree::holds_zones(zoneinfo),
            "The next start makes data current that contains no zone file: programs that follow "
            "the current link will show UTC for every zone.");
        add(there.leads_somewhere && !there.is_open_to_others(),
            "Only root can read the data that the next start makes current.");
    }
    add((has_etc ? etc_is_zone : link_is_zone) && !found.has_local_time_next,
        "The next start makes data current that lacks the local zone.");
    if (const auto version = unfinished_use()) {
        add(true, "\"tzctl use " + *version +
                      "\" was interrupted: the next tzctl that changes "
                      "something completes it.");
    }
}

// What the current and the latest link name now, in the simulation.
candidates look_at_candidates() {
    const auto path_or_none = [](std::string (*read)()) -> std::optional<std::string> {
        try {
            return read();
        } catch (int) {
            return std::nullopt;
        }
    };
    const auto system = system_data();
    const auto current = path_or_none(read_current_dataset_path);
    const auto latest = path_or_none(read_latest_link);
    return {system ? describe("", system) : std::nullopt,
            current ? describe(*current, system) : std::nullopt,
            latest && !latest->empty() ? describe(*latest, system) : std::nullopt};
}

// Drops a finding that is there twice. One of the two may end with the error of an unrelated call.
void drop_repetitions(std::vector<std::string>& findings) {
    const std::set<std::string> all(findings.begin(), findings.end());
    std::set<std::string> known;
    std::erase_if(findings, [&](const std::string& finding) {
        const auto error = finding.rfind(": ");
        return !known.insert(finding).second ||
               (error != std::string::npos && all.contains(finding.substr(0, error)));
    });
}

} // namespace

// Unlike a start, this follows no link: the word is printed, and must not come from another file.
std::string release_in(const fs::descriptor& dataset, const std::string& component) {
    const auto directory = tree::open_directory(dataset.number(), component.substr(1), component);
    return directory ? word_in(directory->number(), version_file.substr(1)) : "";
}

foresight foresee(const std::vector<wanted_link>& wanted) {
    imagination::session imagined(in_image(""));
    for (const auto& link : wanted) {
        imagine(link);
    }
    candidates considered = look_at_candidates();
    return {std::move(considered), predict_start(imagined)};
}

survey look() {
    survey found;
    std::vector<std::string> warnings;
    {
        imagination::session as_it_is(in_image(""));
        found.linked = look_at_candidates();
        found.installed = describe_installed();
        warnings = as_it_is.take_warnings();
        as_it_is.check();
    }
    found.zoneinfo = describe_link(layout::zoneinfo_link);
    found.icutz = describe_link(layout::icu_link);
    found.tz_latest = describe_link(layout::latest_link);
    found.localtime = describe_link(layout::localtime_link);
    found.marker = follow(layout::cleanup_marker).leads_somewhere;
    found.record = beginning_of(AT_FDCWD, layout::version_diff_record);
    {
        imagination::session imagined(in_image(""));
        found.next_start = predict_start(imagined);
        found.has_local_time_next = imagined.leads_to_zone(local_time_path());
        imagined.check();
    }
    found.zoneinfo_reader = describe_reader(layout::legacy_zoneinfo);
    found.etc_localtime = describe_reader(etc_localtime);
    found.local_zone = local_zone();
    found.current_has_zones = tree::holds_zones(layout::zoneinfo_link);
    add_problems_of_data(found, found.findings);
    add_problems_of_links(found, found.findings);
    found.findings.insert(found.findings.end(), warnings.begin(), warnings.end());
    drop_repetitions(found.findings);
    return found;
}

} // namespace tz
