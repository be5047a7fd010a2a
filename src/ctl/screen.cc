// SPDX-License-Identifier: BSD-2-Clause
#include <algorithm>
#include <array>
#include <cstdio>
#include <cstdlib>
#include <ctime>
#include <iostream>
#include <map>
#include <utility>

#include <unistd.h>

#include "ctl/printers.h"
#include "ctl/text.h"
#include "fs/layout.h"

namespace tz {
namespace {

constexpr char bold[] = "\x1b[1m";
constexpr char yellow[] = "\x1b[33m";

// Where colour is wanted, `text` with it. See no-color.org.
std::string coloured(const std::string& text, const char* colour) {
    const char* const refused = std::getenv("NO_COLOR");
    const bool wanted = (refused == nullptr || *refused == '\0') && ::isatty(STDOUT_FILENO) == 1;
    return wanted ? colour + text + "\x1b[0m" : text;
}

void print_title(const std::string& title) {
    std::cout << coloured(title, bold) << '\n';
}

// A table's cell, at least `width` columns wide, and a blank.
std::string cell(const std::string& text, std::size_t width) {
    const std::string shown = text.empty() ? "none" : printable(text);
    return shown + std::string(std::max(width, columns(shown)) - columns(shown) + 1, ' ');
}

std::string role_of(const dataset& data, const candidates& linked) {
    std::string role = data.path.empty() ? ", system's own" : "";
    role += linked.current && linked.current->path == data.path ? ", current" : "";
    role += linked.latest && linked.latest->path == data.path ? ", latest" : "";
    role += data.removable ? ", may be removed" : "";
    return role.substr(std::min<std::size_t>(role.size(), 2));
}

void print_dataset(const dataset& data, const candidates& linked) {
    const auto yes_or_no = [&](bool holds) {
        return data.path.empty() ? " " : holds ? "yes" : "no";
    };
    std::cout << "  " << cell(data.version, 15) << cell(data.release, 8)
              << cell(data.icu_release, 6) << cell(data.schema, 6)
              << cell(yes_or_no(data.compatible), 10) << cell(yes_or_no(data.newer_than_system), 5)
              << role_of(data, linked) << '\n';
}

void print_link(const std::string& name, std::size_t width, const link& link) {
    std::cout << "  " << cell(name, width);
    if (link.target) {
        std::cout << "-> " << printable(*link.target)
                  << (link.state == link_state::ok ? "" : coloured(" (dangling)", yellow)) << '\n';
    } else {
        std::cout << (link.state == link_state::missing ? "missing" : "not a link") << '\n';
    }
}

void print_reader(const reader& reader) {
    print_link(reader.place.path, 19, reader.place);
    std::cout << (reader.follows ? "" : "    (not through the current link)\n");
}

// A start that has nothing to do compares the latest update with itself, and prints that.
bool is_usual(const prediction& next, const candidates& linked) {
    return next.result.decided == decision::keep && next.warnings.size() == 1 && linked.latest &&
           linked.latest->path == next.result.dataset;
}

std::string in_words(const local_type& type) {
    std::array<char, 32> offset{};
    const long size = std::labs(type.offset);
    const int length =
        std::snprintf(offset.data(), offset.size(), "%c%02ld:%02ld:%02ld",
                      type.offset < 0 ? '-' : '+', size / 3600, size / 60 % 60, size % 60);
    const std::string shown(offset.data(), static_cast<std::size_t>(length));
    return type.abbreviation + " (UTC" + shown.substr(0, size % 60 == 0 ? 6 : 9) +
           (type.daylight_saving ? ", DST)" : ")");
}

std::string in_words(const zone_change& change, const comparison& done) {
    std::array<char, 32> text{"now"};
    std::tm moment{};
    if (change.at != done.start) {
        (void)std::strftime(text.data(), text.size(),
                            change.at % 60 == 0 ? "%Y-%m-%d %H:%M UTC" : "%Y-%m-%d %H:%M:%S UTC",
                            ::gmtime_r(&change.at, &moment));
    }
    return text.data() + (": " + in_words(change.after)) + " instead of " + in_words(change.before);
}

std::string list(const std::vector<std::string>& zones) {
    std::string text;
    for (const auto& zone : zones) {
        text += (text.empty() ? "" : ", ") + zone;
    }
    return text.empty() ? "none" : text;
}

bool contains(const std::vector<std::string>& sorted, const std::string& zone) {
    return std::binary_search(sorted.begin(), sorted.end(), zone);
}

// The zones that only the data before has valid files of.
std::size_t count_lost(const zone_differences& found) {
    const auto is_new = [&](const std::string& zone) {
        return !contains(found.unreadable_before, zone);
    };
    return found.removed.size() +
           static_cast<std::size_t>(
               std::count_if(found.unreadable_after.begin(), found.unreadable_after.end(), is_new));
}

// One sentence.
std::string effect_on_local_time(const comparison& done) {
    if (done.next_local_zone) {
        return "The next start sets the local-time link to the zone " + *done.next_local_zone + ".";
    }
    if (!done.local_zone) {
        return "Local time: no link names the local zone.";
    }
    const std::string subject = "Local time, " + *done.local_zone + ", ";
    if (!done.local_time_follows) {
        return subject + "does not change: it is not read through the current link.";
    }
    if (!contains(done.found.compared, *done.local_zone)) {
        const bool lost = contains(done.found.removed, *done.local_zone) ||
                          contains(done.found.unreadable_after, *done.local_zone);
        return subject + (lost ? "will be UTC: " + done.to : "cannot be compared: " + done.from) +
               " lacks a valid file of it.";
    }
    for (const auto& change : done.found.changed) {
        if (change.zone == *done.local_zone) {
            return subject + (change.at == done.start ? "changes " : "changes at ") +
                   in_words(change, done) + ".";
        }
    }
    return subject + "does not change.";
}

} // namespace

void print_for_people(const survey& found) {
    const prediction& next = found.next_start;
    std::string title = wrapped("The next start " + headline(next.result) + ".");
    title.pop_back();
    print_title(title);
    std::cout << wrapped(reason(next.result, found.linked), 2);
    if (!next.warnings.empty()) {
        std::cout << '\n';
        print_title("It will print");
    }
    for (const auto& line : next.warnings) {
        std::cout << wrapped(line, 2);
    }
    if (is_usual(next, found.linked)) {
        std::cout << "  (This is usual while the latest update is current.)\n";
    }
    std::cout << '\n';
    print_title("Datasets          release  ICU    schema compatible newer");
    for (const auto& data : found.installed) {
        print_dataset(data, found.linked);
    }
    if (found.linked.system) {
        print_dataset(*found.linked.system, found.linked);
    }
    std::cout << '\n';
    print_title(std::string("Links in ") + layout::state_directory);
    print_link("zoneinfo", 9, found.zoneinfo);
    print_link("icutz", 9, found.icutz);
    print_link("tz_latest", 9, found.tz_latest);
    print_link("localtime", 9, found.localtime);
    std::cout << '\n';
    print_title("What programs read");
    print_reader(found.zoneinfo_reader);
    print_reader(found.etc_localtime);
    std::cout << "  local zone: " << printable(found.local_zone.value_or("unknown")) << '\n';
    std::cout << "\nLast adoption: " << printable(found.record.value_or("none")) << '\n'
              << "Clean-up pending: " << (found.marker ? "yes" : "no") << '\n';
    if (!found.findings.empty()) {
        std::cout << '\n';
        print_title("Problems");
    }
    for (const auto& line : found.findings) {
        std::cout << coloured(wrapped(line, 2), yellow);
    }
}

void print_for_people(const comparison& done) {
    const auto& found = done.found;
    std::map<std::pair<std::time_t, std::string>, std::vector<std::string>> changes;
    for (const auto& change : found.changed) {
        changes[{change.at, in_words(change, done)}].push_back(change.zone);
    }
    std::cout << wrapped("From " + done.from + " to " + done.to + ", clocks differ in " +
                         std::to_string(found.changed.size()) + " of " +
                         std::to_string(found.compared.size()) + " zones within ten years.")
              << '\n';
    for (const auto& [change, zones] : changes) {
        std::cout << wrapped(change.second, 2) << wrapped(list(zones), 4);
    }
    std::cout << (changes.empty() ? "" : "\n")
              << wrapped("New zones: " + list(found.added) +
                         ". Removed zones: " + list(found.removed) + ".");
    for (const auto& [name, zones] : {std::pair(done.from, found.unreadable_before),
                                      std::pair(done.to, found.unreadable_after)}) {
        if (!zones.empty()) {
            std::cout << wrapped("Broken zone files in " + name + ": " + list(zones) + ".");
        }
    }
    std::cout << wrapped(effect_on_local_time(done));
}

void print_effect(const comparison& done) {
    if (!done.obstacle.empty()) {
        std::cout << wrapped("Local time cannot be compared: " + done.obstacle + ".");
        return;
    }
    const bool covers_zone = done.local_time_follows && !done.next_local_zone;
    const auto others = std::count_if(
        done.found.changed.begin(), done.found.changed.end(),
        [&](const zone_change& change) { return !covers_zone || change.zone != done.local_zone; });
    const std::size_t lost = count_lost(done.found);
    std::cout << wrapped(
        effect_on_local_time(done) +
        " Other zones that change: " + (others == 0 ? "none" : std::to_string(others)) + "." +
        (lost == 0 ? "" : " Zones that become UTC: " + std::to_string(lost) + "."));
}

} // namespace tz
