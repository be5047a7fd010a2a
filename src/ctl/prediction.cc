// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/prediction.h"

#include <algorithm>
#include <array>
#include <cctype>
#include <climits>

#include "ctl/imagination.h"
#include "dataset/kiv_dataset.h"
#include "dataset/kiv_icu.h"
#include "fs/layout.h"
#include "platform/disk.h"
#include "startup/decision.h"
#include "startup/links.h"
#include "startup/start_up.h"

namespace tz {
namespace {

using lines = std::vector<std::string>;

// A dataset, and what to call it.
struct candidate {
    explicit candidate(const std::string& path)
        : data(path), schema(kiv_icu(path).schema()),
          name((path.empty() ? "the system's own data, " : "update ") + data.version_string()) {}

    kiv_dataset data;
    std::string schema;
    std::string name;
};

std::string sentence(std::string words) {
    words[0] = static_cast<char>(std::toupper(static_cast<unsigned char>(words[0])));
    return words + ".";
}

std::string incompatible(const candidate& one, const candidate& system) {
    const auto schema = [](const candidate& of) {
        return of.schema.empty() ? "no ICU schema" : "the ICU schema " + of.schema;
    };
    return sentence(one.name + " has " + schema(one) + ", and the system's own data has " +
                    schema(system));
}

std::string why_kept_or_dropped(const candidate& current, const candidate& system) {
    if (!current.data.compatible_with(system.data)) {
        return incompatible(current, system);
    }
    if (!keep_current(current.data, system.data)) {
        return sentence(system.name + ", is newer than " + current.name);
    }
    return sentence(current.name + " is current");
}

std::string why_not_adopted(const candidate& latest, const candidate& current,
                            const candidate& system) {
    if (latest.data == current.data) {
        return "The latest update is the same.";
    }
    if (!latest.data.compatible_with(system.data)) {
        return incompatible(latest, system);
    }
    return sentence(latest.name + " is not newer than " + current.name);
}

// Why a start in which nothing fails decides as it does.
std::string why(const std::string& current_path, const std::string& latest_path) {
    const candidate system("");
    const candidate current(current_path);
    if (latest_path.empty()) {
        return why_kept_or_dropped(current, system) + " No update is offered.";
    }
    const candidate latest(latest_path);
    if (adopt_latest(latest.data, current.data, system.data)) {
        return sentence(latest.name + " is compatible and newer than " + current.name);
    }
    return why_kept_or_dropped(current, system) + " " + why_not_adopted(latest, current, system);
}

// The line in which `message` was said.
lines::const_iterator find(const lines& said, const char* message) {
    return std::find_if(said.begin(), said.end(),
                        [&](const auto& line) { return line.starts_with(message); });
}

std::string line_before(const lines& said, lines::const_iterator line) {
    return line == said.begin() ? "a version holds a number beyond 2147483647" : *std::prev(line);
}

struct links {
    std::optional<std::string> zoneinfo = target_of(layout::zoneinfo_link);
    std::optional<std::string> icutz = target_of(layout::icu_link);
    std::optional<std::string> localtime = target_of(layout::localtime_link);

    bool operator==(const links&) const = default;
};

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

prediction predict_start() {
    const links before;
    const std::string current_path = current_dataset_path().value_or("");
    const std::string latest_path = target_of(layout::latest_link).value_or("");
    (void)imagination::take_warnings();

    prediction result;
    bool failed = false;
    try {
        start_up();
    } catch (...) {
        failed = true;
    }
    const links after;
    result.warnings = imagination::take_warnings();
    result.dataset = current_dataset_path();
    result.icutz = after.icutz;
    result.localtime = after.localtime;
    result.changes = before != after;

    const lines& said = result.warnings;
    const auto fell_back = find(said, messages::fell_back);
    const auto invalid = find(said, messages::invalid_links);
    if (failed) {
        const bool silent = fell_back != said.end() && std::next(fell_back) == said.end();
        result.decided = decision::fail;
        result.reason =
            "Not all links can be set: " + line_before(said, silent ? fell_back : said.end()) + ".";
    } else if (fell_back != said.end()) {
        result.decided = decision::reset;
        result.reason = "Something fails on the way: " + line_before(said, fell_back) + ".";
    } else if (!result.dataset->empty() && before.zoneinfo != after.zoneinfo) {
        result.decided = decision::adopt;
    } else if (invalid != said.end()) {
        result.decided = decision::reset;
        result.reason = "The current link cannot be used: " + line_before(said, invalid) + ".";
    } else if (find(said, messages::dropped) != said.end()) {
        result.decided = decision::drop;
    }
    if (result.reason.empty()) {
        result.reason = why(current_path, latest_path);
        (void)imagination::take_warnings();
    }
    return result;
}

} // namespace tz
