// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/survey.h"

#include <algorithm>
#include <fstream>
#include <iterator>
#include <stdexcept>
#include <system_error>

#include "ctl/imagination.h"
#include "ctl/text.h"
#include "ctl/updates.h"
#include "dataset/kiv_dataset.h"
#include "dataset/kiv_icu.h"
#include "dataset/kiv_zoneinfo.h"
#include "fs/layout.h"
#include "fs/operations.h"
#include "platform/warn.h"

namespace tz {
namespace {

namespace files = std::filesystem;

std::optional<std::string> unless_empty(const std::string& text) {
    return text.empty() ? std::nullopt : std::optional(text);
}

// What can be told of a dataset, also of one whose version a start cannot read; nothing if the path
// names none.
std::optional<dataset_report> report_on(const std::string& path, const kiv_dataset* system) {
    dataset_report report;
    try {
        const kiv_dataset dataset(path);
        report.version = dataset.version_string();
        report.newer_than_system = system != nullptr && dataset > *system;
    } catch (const std::out_of_range&) {
        report.version = files::path(path).filename();
        warn("%s: its version holds a number beyond 2147483647", path.c_str());
    } catch (...) {
        return std::nullopt;
    }
    const kiv_icu icu(path);
    report.path = path;
    report.release = unless_empty(kiv_zoneinfo(path).version());
    report.schema = unless_empty(icu.schema());
    report.compatible = icu.compatible_schema(kiv_icu());
    return report;
}

link_report report_on_link(const char* path) {
    link_report report{path, target_of(path), "ok"};
    std::error_code none;
    if (!report.target) {
        const bool missing = !files::exists(files::symlink_status(path, none));
        report.state = missing ? "missing" : "not a link";
    } else if (!fs::exists(path)) {
        report.state = "dangling";
    }
    return report;
}

// Of no known form is as old as it gets, and so is what is too large.
data_version version_of(const dataset_report& report) {
    try {
        return data_version(report.version);
    } catch (const std::out_of_range&) {
        return {};
    }
}

bool is_newer(const dataset_report& left, const dataset_report& right) {
    const auto left_version = version_of(left);
    const auto right_version = version_of(right);
    return left_version == right_version ? left.version < right.version
                                         : left_version > right_version;
}

std::vector<dataset_report> report_on_installed(const kiv_dataset* system) {
    std::vector<dataset_report> reports;
    for (const auto& directory : updates::installed()) {
        reports.push_back(report_on(directory, system).value());
    }
    std::sort(reports.begin(), reports.end(), is_newer);
    return reports;
}

std::optional<std::string> text_in(const char* path) {
    std::error_code none;
    if (!files::is_regular_file(path, none)) {
        return std::nullopt;
    }
    std::ifstream file(path);
    return std::string(std::istreambuf_iterator(file), {});
}

// What no message of a start tells.
void add_findings(survey& found) {
    const auto add = [&](const std::string& finding) { found.findings.push_back(finding); };
    const std::string update_icu = found.current ? found.current->path + layout::update_icu : "";

    if (found.system && !updates::holds_zones(layout::system_zoneinfo)) {
        add("The system has no tz database of its own in " + std::string(layout::system_zoneinfo) +
            ".");
    }
    if (found.current && !found.current->path.empty()) {
        if (found.icutz.target != update_icu) {
            add("The ICU link does not lead to the data of the current update: \"tzctl use " +
                found.current->version + "\" mends that.");
        }
    } else if (found.current && found.icutz.state != "missing") {
        add("The ICU link has been left behind, though the system's own data is current: \"tzctl "
            "use system\" mends that.");
    }
    if (found.current && !found.current->path.empty() &&
        !updates::holds_zones(found.current->path + layout::update_zoneinfo)) {
        add("The current update holds no zone file: every time zone is UTC.");
    }
    if (found.tz_latest.state == "dangling") {
        add("The latest link leads nowhere.");
    }
    if (found.localtime.state == "dangling") {
        add("The local-time link leads to no zone file, so local time is UTC: " +
            *found.localtime.target + ".");
    }
}

} // namespace

survey take_survey() {
    imagination::forget();
    survey found;
    std::optional<kiv_dataset> system;
    try {
        system.emplace();
        found.system = report_on("", &*system);
    } catch (...) {
        warn("A start cannot use the system's own data");
    }
    const kiv_dataset* const reference = system ? &*system : nullptr;
    if (const auto path = current_dataset_path()) {
        found.current = report_on(*path, reference);
    }
    if (const auto path = target_of(layout::latest_link)) {
        found.latest = report_on(*path, reference);
    }
    found.installed = report_on_installed(reference);
    found.zoneinfo = report_on_link(layout::zoneinfo_link);
    found.icutz = report_on_link(layout::icu_link);
    found.tz_latest = report_on_link(layout::latest_link);
    found.localtime = report_on_link(layout::localtime_link);
    found.marker = fs::exists(layout::cleanup_marker);
    found.record = text_in(layout::version_diff_record);

    for (auto& line : imagination::take_warnings()) { // some were said twice
        if (std::find(found.findings.begin(), found.findings.end(), line) == found.findings.end()) {
            found.findings.push_back(std::move(line));
        }
    }
    add_findings(found);
    found.next_start = predict_start();
    if (found.localtime.state == "ok" && !fs::exists(layout::localtime_link)) {
        found.findings.push_back(
            "The data that the next start makes current lacks the local zone: " +
            found.next_start.localtime.value_or("") + ".");
    }
    return found;
}

} // namespace tz
