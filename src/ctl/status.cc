// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/status.h"

#include <algorithm>
#include <array>
#include <cstdlib>
#include <iomanip>
#include <iostream>

#include <nlohmann/json.hpp>
#include <unistd.h>

#include "ctl/survey.h"
#include "ctl/text.h"
#include "ctl/updates.h"

namespace tz {
namespace {

using nlohmann::ordered_json;

ordered_json text_or_null(const std::optional<std::string>& text) {
    return text ? ordered_json(in_utf8(*text)) : ordered_json();
}

ordered_json in_json(const std::optional<dataset_report>& dataset) {
    if (!dataset) {
        return nullptr;
    }
    return {{"path", in_utf8(dataset->path)},
            {"version", in_utf8(dataset->version)},
            {"release", text_or_null(dataset->release)},
            {"schema", text_or_null(dataset->schema)},
            {"compatible", dataset->compatible},
            {"newer_than_system", dataset->newer_than_system}};
}

ordered_json in_json(const link_report& link) {
    return {{"path", link.path}, {"target", text_or_null(link.target)}, {"state", link.state}};
}

ordered_json in_json(const prediction& start) {
    constexpr std::array decisions{"keep", "adopt", "drop", "reset", "fail"};
    const bool fails = start.decided == decision::fail;
    return {{"decision", decisions.at(static_cast<std::size_t>(start.decided))},
            {"dataset", text_or_null(fails ? std::nullopt : start.dataset)},
            {"icutz", text_or_null(start.icutz)},
            {"localtime", text_or_null(start.localtime)},
            {"changes", start.changes},
            {"reason", in_utf8(start.reason)}};
}

ordered_json in_json(const survey& found) {
    ordered_json installed = ordered_json::array();
    for (const auto& dataset : found.installed) {
        installed.push_back(in_json(dataset));
    }
    ordered_json findings = ordered_json::array();
    for (const auto& finding : found.findings) {
        findings.push_back(in_utf8(finding));
    }
    return {{"format", 1},
            {"system", in_json(found.system)},
            {"current", in_json(found.current)},
            {"latest", in_json(found.latest)},
            {"installed", installed},
            {"links",
             {{"zoneinfo", in_json(found.zoneinfo)},
              {"icutz", in_json(found.icutz)},
              {"tz_latest", in_json(found.tz_latest)},
              {"localtime", in_json(found.localtime)}}},
            {"marker", found.marker},
            {"record", text_or_null(found.record)},
            {"next_start", in_json(found.next_start)},
            {"findings", findings}};
}

bool wants_colour() {
    const char* const refused = std::getenv("NO_COLOR"); // see no-color.org
    return (refused == nullptr || *refused == '\0') && ::isatty(STDOUT_FILENO) == 1;
}

// Prints a survey for people.
class page {
  public:
    explicit page(const survey& found) : found_(found) {
        try {
            removable_ = updates::removable();
        } catch (const updates::refusal&) {
            // Nothing is shown as removable then.
        }
    }

    void print() const {
        std::cout << '\n'
                  << strong_ << "Next start " << headline(found_.next_start) << plain_ << ".\n"
                  << wrapped(printable(found_.next_start.reason), 2);
        print_lines("It will say", found_.next_start.warnings, plain_);
        print_datasets();
        print_links();
        print_lines("Findings", found_.findings, alarming_);
        std::cout << '\n';
    }

  private:
    void print_title(const char* title) const {
        std::cout << '\n' << strong_ << title << plain_ << '\n';
    }

    void print_lines(const char* title, const std::vector<std::string>& lines,
                     const std::string& how) const {
        if (lines.empty()) {
            return;
        }
        print_title(title);
        for (const auto& line : lines) {
            std::cout << how << wrapped(printable(line), 2) << plain_;
        }
    }

    void print_datasets() const {
        print_title("Datasets          release  schema  compatible  newer");
        for (const auto& dataset : found_.installed) {
            print_dataset(dataset, dataset.compatible ? "yes" : "no",
                          dataset.newer_than_system ? "yes" : "no");
        }
        if (found_.system) {
            print_dataset(*found_.system, "", "");
        }
    }

    void print_dataset(const dataset_report& dataset, const char* compatible,
                       const char* newer) const {
        const bool current = found_.current && found_.current->path == dataset.path;
        std::cout << (current ? strong_ : "") << std::left << "  " << std::setw(15)
                  << printable(dataset.version) << ' ' << std::setw(8)
                  << printable(dataset.release.value_or("none")) << ' ' << std::setw(7)
                  << printable(dataset.schema.value_or("none")) << ' ' << std::setw(11)
                  << compatible << ' ' << std::setw(5) << newer << ' ' << role_of(dataset, current)
                  << plain_ << '\n';
    }

    [[nodiscard]] std::string role_of(const dataset_report& dataset, bool current) const {
        std::string role = dataset.path.empty() ? ", system's own" : "";
        role += current ? ", current" : "";
        role += found_.latest && found_.latest->path == dataset.path ? ", latest" : "";
        const bool may_go =
            std::find(removable_.begin(), removable_.end(), dataset.path) != removable_.end();
        role += may_go ? ", may be removed" : "";
        return role.empty() ? role : role.substr(2);
    }

    void print_links() const {
        print_title("Links");
        for (const auto* link :
             {&found_.zoneinfo, &found_.icutz, &found_.tz_latest, &found_.localtime}) {
            std::cout << "  " << link->path << ' '
                      << (link->state == "ok" ? "" : alarming_ + link->state + plain_) << '\n';
            if (link->target) {
                std::cout << "    -> " << printable(*link->target) << '\n';
            }
        }
        std::cout << "  Marker: "
                  << (found_.marker ? "an update has stopped being current" : "none") << '\n'
                  << "  Record of the last adoption: " << printable(found_.record.value_or("none"))
                  << '\n';
    }

    const survey& found_;
    std::vector<std::filesystem::path> removable_;
    std::string strong_ = wants_colour() ? "\x1b[1m" : "";
    std::string alarming_ = wants_colour() ? "\x1b[33m" : "";
    std::string plain_ = wants_colour() ? "\x1b[0m" : "";
};

} // namespace

void print_status(bool as_json) {
    const survey found = take_survey();
    if (as_json) {
        std::cout << in_json(found).dump(2) << '\n';
    } else {
        page(found).print();
    }
}

} // namespace tz
