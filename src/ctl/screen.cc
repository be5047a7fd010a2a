// SPDX-License-Identifier: BSD-2-Clause
#include <algorithm>
#include <cstdlib>
#include <iostream>

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

void print_link(const std::string& name, const link& link) {
    std::cout << "  " << cell(name, 9);
    if (link.target) {
        std::cout << "-> " << printable(*link.target)
                  << (link.state == link_state::ok ? "" : coloured(" (dangling)", yellow)) << '\n';
    } else {
        std::cout << (link.state == link_state::missing ? "missing" : "not a link") << '\n';
    }
}

void print_reader(const reader& reader) {
    std::cout << "  " << cell(reader.path, 19);
    if (reader.target) {
        std::cout << "-> " << printable(*reader.target);
    } else {
        std::cout << "is not a link";
    }
    std::cout << '\n' << (reader.follows ? "" : "    (not through the current link)\n");
}

// A start that has nothing to do compares the latest update with itself, and prints that.
bool is_usual(const prediction& next, const candidates& linked) {
    return next.result.decided == decision::keep && next.warnings.size() == 1 && linked.latest &&
           linked.latest->path == next.result.dataset;
}

} // namespace

void print_for_people(const survey& found) {
    const prediction& next = found.next_start;
    print_title("The next start " + printable(headline(next.result)) + ".");
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
    print_link("zoneinfo", found.zoneinfo);
    print_link("icutz", found.icutz);
    print_link("tz_latest", found.tz_latest);
    print_link("localtime", found.localtime);
    std::cout << '\n';
    print_title("What programs read");
    print_reader(found.zoneinfo_reader);
    print_reader(found.etc_localtime);
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

} // namespace tz
