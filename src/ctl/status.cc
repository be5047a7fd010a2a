// SPDX-License-Identifier: BSD-2-Clause
#include <algorithm>
#include <array>
#include <cerrno>
#include <cstdlib>
#include <iomanip>
#include <iostream>

#include <nlohmann/json.hpp>
#include <unistd.h>

#include "ctl/prediction.h"
#include "ctl/text.h"
#include "ctl/updates.h"
#include "ctl/verbs.h"
#include "dataset/kiv_dataset.h"
#include "dataset/kiv_icu.h"
#include "dataset/kiv_zoneinfo.h"
#include "fs/layout.h"
#include "fs/operations.h"
#include "platform/imagination.h"
#include "platform/warn.h"

namespace tz {
namespace {

namespace files = std::filesystem;
using nlohmann::ordered_json;

ordered_json text_or_null(const std::optional<std::string>& text) {
    return text ? ordered_json(in_utf8(*text)) : ordered_json();
}

ordered_json word_or_null(const std::string& word) {
    return word.empty() ? ordered_json() : ordered_json(in_utf8(word));
}

// A warning like those of the shared code, but for no call that has failed.
void note(const std::string& finding) {
    errno = 0;
    warn("%s", finding.c_str());
}

// A dataset, also one whose version a start cannot read; null if the path names none.
ordered_json describe(const std::string& path, const kiv_dataset* system) {
    std::string version = files::path(path).filename();
    bool newer = false;
    try {
        const kiv_dataset dataset(path);
        version = dataset.version_string();
        newer = system != nullptr && dataset > *system;
    } catch (const std::out_of_range&) {
        if (path.empty()) {
            return nullptr;
        }
        note(version + ": the version holds a number beyond 2147483647");
    } catch (...) {
        return nullptr;
    }
    const kiv_icu icu(path);
    return {{"path", in_utf8(path)},
            {"version", in_utf8(version)},
            {"release", word_or_null(kiv_zoneinfo(path).version())},
            {"schema", word_or_null(icu.schema())},
            {"compatible", icu.compatible_schema(kiv_icu())},
            {"newer_than_system", newer}};
}

data_version version_of(const ordered_json& dataset) {
    try {
        return data_version(dataset["version"]);
    } catch (const std::out_of_range&) {
        return {}; // as old as those of no known form
    }
}

bool is_newer(const ordered_json& left, const ordered_json& right) {
    const auto mine = version_of(left);
    const auto theirs = version_of(right);
    return mine == theirs ? left["version"] < right["version"] : mine > theirs;
}

ordered_json describe_installed(const kiv_dataset* system) {
    ordered_json datasets = ordered_json::array();
    for (const auto& directory : updates::installed()) {
        datasets.push_back(describe(directory, system));
    }
    std::sort(datasets.begin(), datasets.end(), is_newer);
    return datasets;
}

ordered_json describe_link(const char* path) {
    const auto target = target_of(path);
    std::error_code none;
    const bool missing = !files::exists(files::symlink_status(path, none));
    const char* const state = missing             ? "missing"
                              : !target           ? "not a link"
                              : !fs::exists(path) ? "dangling"
                                                  : "ok";
    return {{"path", path}, {"target", text_or_null(target)}, {"state", state}};
}

ordered_json describe_start(const prediction& start) {
    constexpr std::array decisions{"keep", "adopt", "drop", "reset", "fail"};
    const bool fails = start.decided == decision::fail;
    return {{"decision", decisions.at(static_cast<std::size_t>(start.decided))},
            {"dataset", text_or_null(fails ? std::nullopt : start.dataset)},
            {"icutz", text_or_null(start.icutz)},
            {"localtime", text_or_null(start.localtime)},
            {"changes", start.changes},
            {"reason", in_utf8(start.reason)}};
}

// The lines said while datasets were looked at, some of them twice; and what no start says.
ordered_json findings(const ordered_json& found, const std::optional<std::string>& current) {
    ordered_json all = ordered_json::array();
    const auto add = [&all](bool holds, const std::string& finding) {
        if (holds && std::find(all.begin(), all.end(), in_utf8(finding)) == all.end()) {
            all.push_back(in_utf8(finding));
        }
    };
    for (const auto& line : imagination::take_warnings()) {
        add(true, line);
    }
    const auto& links = found["links"];
    const bool update = current && !current->empty();
    add(!updates::holds_zones(layout::system_zoneinfo),
        std::string("There is no zone file in ") + layout::system_zoneinfo + ".");
    add(update && !updates::holds_zones(*current + layout::update_zoneinfo),
        "The current update holds no zone file: every time zone is UTC.");
    add(update && target_of(layout::icu_link) != *current + layout::update_icu,
        "The ICU link does not lead into the current update: tzctl use mends that.");
    add(current && !update && links["icutz"]["state"] != "missing",
        "The ICU link has been left behind, for the system's own data is current: tzctl use system "
        "mends that.");
    add(links["tz_latest"]["state"] == "dangling", "The latest link leads nowhere.");
    std::error_code none;
    add(links["localtime"]["state"] != "missing" &&
            !files::is_regular_file(layout::localtime_link, none),
        "The local-time link leads to no zone file: local time is UTC.");
    return all;
}

// All that is told, as the object that tzctl(8) describes, with every text in UTF-8.
ordered_json survey(prediction& next_start) {
    imagination::forget();
    std::optional<kiv_dataset> system;
    try {
        system.emplace();
    } catch (...) {
        note("No start can use the system's own data");
    }
    const kiv_dataset* const reference = system ? &*system : nullptr;
    const auto current = current_dataset_path();
    const auto latest = latest_dataset_path();
    ordered_json found{
        {"format", 1},
        {"system", system ? describe("", reference) : nullptr},
        {"current", current ? describe(*current, reference) : nullptr},
        {"latest", latest ? describe(*latest, reference) : nullptr},
        {"installed", describe_installed(reference)},
        {"links",
         {{"zoneinfo", describe_link(layout::zoneinfo_link)},
          {"icutz", describe_link(layout::icu_link)},
          {"tz_latest", describe_link(layout::latest_link)},
          {"localtime", describe_link(layout::localtime_link)}}},
        {"marker", fs::exists(layout::cleanup_marker)},
        {"record", text_or_null(updates::first_bytes(layout::version_diff_record, 4096))},
        {"next_start", nullptr},
        {"findings", nullptr}};
    found["findings"] = findings(found, current);
    next_start = predict_start();
    found["next_start"] = describe_start(next_start);
    if (found["links"]["localtime"]["state"] == "ok" && !fs::exists(layout::localtime_link)) {
        found["findings"].push_back("The next start makes data current that lacks the local zone.");
    }
    return found;
}

// Where colour is wanted, `text` as a terminal is told to stress it. See no-color.org.
std::string stressed(const std::string& text, const char* how = "\x1b[1m") {
    static const char* const refused = std::getenv("NO_COLOR");
    static const bool wanted =
        (refused == nullptr || *refused == '\0') && ::isatty(STDOUT_FILENO) == 1;
    return wanted ? how + text + "\x1b[0m" : text;
}

std::string alarming(const std::string& text) {
    return stressed(text, "\x1b[33m");
}

std::string text_of(const ordered_json& text) {
    return text.is_null() ? "none" : printable(text);
}

void print_title(const std::string& title) {
    std::cout << '\n' << stressed(title) << '\n';
}

std::vector<std::string> removable_paths() {
    try {
        std::vector<std::string> paths;
        for (const auto& directory : updates::removable()) {
            paths.push_back(in_utf8(directory));
        }
        return paths;
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
    std::string role = is_system(dataset) ? ", system's own" : "";
    for (const std::string link : {"current", "latest"}) {
        role += survey[link].is_object() && survey[link]["path"] == path ? ", " + link : "";
    }
    const bool kept = std::find(removable.begin(), removable.end(), path) == removable.end();
    role += kept ? "" : ", may be removed";
    return role.substr(std::min<std::size_t>(role.size(), 2));
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

void print_link(const std::string& name, const ordered_json& link) {
    const std::string state = link["state"];
    std::cout << std::left << "  " << std::setw(10) << name;
    if (link["target"].is_null()) {
        std::cout << state << '\n';
    } else {
        std::cout << "-> " << text_of(link["target"])
                  << (state == "ok" ? "" : alarming(" (dangling)")) << '\n';
    }
}

void print(const ordered_json& survey, const prediction& next) {
    print_title("The next start " + printable(headline(next)) + ".");
    std::cout << wrapped(next.reason, 2);
    if (!next.warnings.empty()) {
        print_title("It will say");
    }
    for (const auto& line : next.warnings) {
        std::cout << wrapped(line, 2);
    }
    print_title("Datasets          release  schema  compatible  newer");
    for (const auto& dataset : survey["installed"]) {
        print_dataset(dataset, survey);
    }
    if (!survey["system"].is_null()) {
        print_dataset(survey["system"], survey);
    }
    print_title(std::string("Links in ") + layout::state_directory);
    for (const auto& [name, link] : survey["links"].items()) {
        print_link(name, link);
    }
    std::cout << "\nThe last adoption: " << text_of(survey["record"]) << '\n'
              << "An update may be removed (marker): " << (survey["marker"] ? "yes" : "no") << '\n';
    if (!survey["findings"].empty()) {
        print_title("What is not as it should be");
    }
    for (const auto& line : survey["findings"]) {
        std::cout << alarming(wrapped(line, 2));
    }
    std::cout << '\n';
}

} // namespace

void print_status(bool as_json) {
    prediction next;
    const auto found = survey(next);
    if (as_json) {
        std::cout << found.dump(2) << '\n';
    } else {
        print(found, next);
    }
}

} // namespace tz
