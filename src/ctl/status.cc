// SPDX-License-Identifier: BSD-2-Clause
#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <iomanip>
#include <iostream>

#include <unistd.h>

#include "ctl/survey.h"
#include "ctl/text.h"
#include "ctl/updates.h"
#include "ctl/verbs.h"
#include "fs/layout.h"

namespace tz {
namespace {

using nlohmann::ordered_json;

// How a terminal is told to stress something; nothing where colour is not wanted.
struct style {
    std::string strong;
    std::string alarming;
    std::string plain;
};

style style_of_output() {
    const char* const refused = std::getenv("NO_COLOR"); // see no-color.org
    const bool wanted = refused == nullptr || *refused == '\0';
    return wanted && ::isatty(STDOUT_FILENO) == 1 ? style{"\x1b[1m", "\x1b[33m", "\x1b[0m"}
                                                  : style{};
}

std::string text_of(const ordered_json& text) {
    return text.is_null() ? "none" : printable(text);
}

void print_title(const style& in, const std::string& title) {
    std::cout << '\n' << in.strong << title << in.plain << '\n';
}

void print_lines(const std::vector<std::string>& lines, const std::string& title, const style& in,
                 const std::string& how) {
    if (!lines.empty()) {
        print_title(in, title);
    }
    for (const auto& line : lines) {
        std::cout << how << wrapped(line, 2) << in.plain;
    }
}

std::vector<std::string> removable_paths() {
    try {
        const auto directories = updates::removable();
        return {directories.begin(), directories.end()};
    } catch (const std::exception&) {
        return {}; // tzctl cleanup says why
    }
}

bool is_system(const ordered_json& dataset) {
    return dataset["path"].get_ref<const std::string&>().empty();
}

std::string role_of(const ordered_json& dataset, const ordered_json& survey) {
    static const auto removable = removable_paths();
    const auto& path = dataset["path"];
    const auto is_named = [&](const char* link) {
        return !survey[link].is_null() && survey[link]["path"] == path;
    };
    std::string role;
    const auto add = [&role](bool holds, const char* word) {
        role += holds ? (role.empty() ? "" : ", ") + std::string(word) : "";
    };
    add(is_system(dataset), "system's own");
    add(is_named("current"), "current");
    add(is_named("latest"), "latest");
    add(std::find(removable.begin(), removable.end(), path) != removable.end(), "may be removed");
    return role;
}

void print_dataset(const ordered_json& dataset, const ordered_json& survey) {
    const auto yes_or_no = [&](const char* key) {
        return is_system(dataset) ? "" : dataset[key] ? "yes" : "no";
    };
    std::cout << std::left << "  " << std::setw(15) << text_of(dataset["version"]) << ' '
              << std::setw(8) << text_of(dataset["release"]) << ' ' << std::setw(7)
              << text_of(dataset["schema"]) << ' ' << std::setw(11) << yes_or_no("compatible")
              << ' ' << std::setw(6) << yes_or_no("newer_than_system") << role_of(dataset, survey)
              << '\n';
}

void print_link(const std::string& name, const ordered_json& link, const style& in) {
    const std::string state = link["state"];
    std::cout << "  " << std::setw(10) << name;
    if (link["target"].is_null()) {
        std::cout << state << '\n';
    } else {
        std::cout << "-> " << text_of(link["target"])
                  << (state == "ok" ? "" : in.alarming + " (dangling)" + in.plain) << '\n';
    }
}

void print(const ordered_json& survey, const prediction& next, const style& in) {
    print_title(in, "The next start " + printable(headline(next)) + ".");
    std::cout << wrapped(next.reason, 2);
    print_lines(next.warnings, "It will say", in, "");

    print_title(in, "Datasets          release  schema  compatible  newer");
    for (const auto& dataset : survey["installed"]) {
        print_dataset(dataset, survey);
    }
    if (!survey["system"].is_null()) {
        print_dataset(survey["system"], survey);
    }

    print_title(in, std::string("Links in ") + layout::state_directory);
    for (const auto& [name, link] : survey["links"].items()) {
        print_link(name, link, in);
    }
    std::cout << "\nThe last adoption: " << text_of(survey["record"]) << '\n'
              << "An update may be removed (marker): " << (survey["marker"] ? "yes" : "no") << '\n';
    print_lines(survey["findings"], "What is not as it should be", in, in.alarming);
    std::cout << '\n';
}

} // namespace

void print_status(bool as_json) {
    prediction next;
    const auto found = survey(next);
    if (as_json) {
        std::cout << found.dump(2) << '\n';
    } else {
        print(found, next, style_of_output());
    }
}

} // namespace tz
