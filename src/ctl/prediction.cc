// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/prediction.h"

#include <algorithm>
#include <array>
#include <climits>

#include "dataset/kiv_dataset.h"
#include "dataset/kiv_icu.h"
#include "fs/layout.h"
#include "platform/disk.h"
#include "platform/imagination.h"
#include "startup/decision.h"
#include "startup/links.h"
#include "startup/start_up.h"

namespace tz {
namespace {

using lines = std::vector<std::string>;

// A dataset, and what to say of it.
struct candidate {
    explicit candidate(const std::string& path)
        : data(path),
          name(data.version_string() + (path.empty() ? " (the system's own data)" : "")),
          schema(kiv_icu(path).schema()) {}

    kiv_dataset data;
    std::string name;
    std::string schema;
};

std::string incompatible(const candidate& one, const candidate& system) {
    const auto schema = [](const candidate& of) {
        return of.schema.empty() ? "no ICU schema" : "ICU schema " + of.schema;
    };
    return one.name + " has " + schema(one) + ", the system " + schema(system) + ".";
}

// Why a start in which nothing fails decides as it does.
std::string why(const std::string& current_path, const std::string& latest_path) try {
    const candidate system("");
    const candidate current(current_path);
    std::string reason = !current.data.compatible_with(system.data) ? incompatible(current, system)
                         : keep_current(current.data, system.data)
                             ? current.name + " is current."
                             : system.name + " is newer than " + current.name + ".";
    if (latest_path.empty()) {
        return reason + " No update is offered.";
    }
    const candidate latest(latest_path);
    if (adopt_latest(latest.data, current.data, system.data)) {
        return latest.name + " is compatible and newer than " + current.name + ".";
    }
    if (!latest.data.compatible_with(system.data)) {
        return reason + " " + incompatible(latest, system);
    }
    return reason + (latest.data == current.data
                         ? " The latest update is the same."
                         : " " + latest.name + " is not newer than " + current.name + ".");
} catch (...) {
    return "Somebody else changes what it looks at.";
}

// The line in which `message` was said.
lines::const_iterator find(const lines& said, const char* message) {
    return std::find_if(said.begin(), said.end(),
                        [&](const auto& line) { return line.starts_with(message); });
}

std::string line_before(const lines& said, lines::const_iterator line) {
    return line == said.begin() ? "a version holds a number beyond 2147483647" : *std::prev(line);
}

} // namespace

std::optional<std::string> target_of(const char* link) {
    std::array<char, PATH_MAX> target{};
    const ssize_t length = platform::readlink(link, target.data(), target.size());
    return length == -1
               ? std::nullopt
               : std::optional<std::string>({target.data(), static_cast<std::size_t>(length)});
}

std::optional<std::string> current_dataset_path() {
    try {
        return read_current_dataset_path();
    } catch (...) {
        return std::nullopt;
    }
}

std::optional<std::string> latest_dataset_path() {
    try {
        const std::string path = read_latest_link();
        return path.empty() ? std::nullopt : std::optional(path);
    } catch (...) {
        return std::nullopt;
    }
}

prediction predict_start() {
    const auto links = [] {
        return std::array{target_of(layout::zoneinfo_link), target_of(layout::icu_link),
                          target_of(layout::localtime_link)};
    };
    const auto before = links();
    const std::string current_path = current_dataset_path().value_or("");
    const std::string latest_path = latest_dataset_path().value_or("");
    (void)imagination::take_warnings();

    prediction result;
    bool failed = false;
    try {
        start_up();
    } catch (...) {
        failed = true;
    }
    const auto after = links();
    const lines said = imagination::take_warnings();
    const auto fell_back = find(said, messages::fell_back);
    const auto invalid = find(said, messages::invalid_links);
    result.dataset = current_dataset_path();
    if (failed) {
        const bool last = fell_back != said.end() && std::next(fell_back) == said.end();
        result.decided = decision::fail;
        result.reason =
            "Not all links can be set: " + line_before(said, last ? fell_back : said.end());
    } else if (fell_back != said.end()) {
        result.decided = decision::reset;
        result.reason = "Something fails on the way: " + line_before(said, fell_back);
    } else if (before[0] != after[0] && after[0] != layout::system_zoneinfo) {
        result.decided = decision::adopt;
        result.dataset = latest_path;
        result.reason = why(current_path, latest_path);
    } else if (invalid != said.end()) {
        result.decided = decision::reset;
        result.reason = "The current link cannot be used: " + line_before(said, invalid);
    } else {
        const bool dropped = find(said, messages::dropped) != said.end();
        result.decided = dropped ? decision::drop : decision::keep;
        result.reason = why(current_path, latest_path);
    }
    (void)imagination::take_warnings();
    result.icutz = after[1];
    result.localtime = after[2];
    result.changes = before != after;
    result.warnings = said;
    if (failed) {
        result.warnings.emplace_back(messages::gave_up);
    }
    return result;
}

} // namespace tz
