// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "ctl/work.h"
#include "fs/descriptor.h"
#include "rehearsal/prediction.h"
#include "version/data_version.h"

/// What tzctl knows of a system, as values: texts have the bytes that are on the disk.
namespace tz {

struct dataset {
    std::string path;        // empty for the system's own data
    std::string version;     // such as 2016b.1.0
    std::string release;     // the word in "+VERSION", or empty
    std::string schema;      // of the ICU data, or empty
    std::string icu_release; // the word in its "+VERSION", or empty
    data_version order;      // of the version
    bool readable = true;    // by a start, which cannot read a number beyond INT_MAX
    bool compatible = false; // with the system's ICU library
    bool newer_than_system = false;
    bool removable = false; // an update that is not in use
};

/// The finding on a dataset that is not readable.
[[nodiscard]] inline std::string why_unreadable(const dataset& data) {
    return data.version + " is a version with a number beyond 2147483647.";
}

/// The datasets between which a start decides; nothing for one that does not exist.
struct candidates {
    std::optional<dataset> system;
    std::optional<dataset> current;
    std::optional<dataset> latest;
};

enum class link_state { ok, dangling, missing, not_a_link };

struct link {
    std::string path;
    std::optional<std::string> target;
    link_state state = link_state::missing;
};

/// Where programs look for zones, or for local time.
struct reader {
    link place;
    bool follows = false; // whether the way from there passes the current link
};

struct survey {
    candidates linked;
    std::vector<dataset> installed; // newest first
    link zoneinfo;
    link icutz;
    link tz_latest;
    link localtime;
    reader zoneinfo_reader;
    reader etc_localtime;
    std::optional<std::string> local_zone;
    bool current_has_zones = false;
    bool marker = false; // whether the clean-up marker exists
    std::optional<std::string> record;
    prediction next_start;
    bool has_local_time_next = false;  // whether local time is then read from a compiled zone file
    std::vector<std::string> findings; // problems, then warning lines of the look itself
};

/// Looks at everything, and changes nothing. Throws std::exception if something cannot be looked
/// at: what it reports as missing is missing, not unreadable.
[[nodiscard]] survey look();

/// The release of a component, such as "/zoneinfo", of a dataset: the word in its "+VERSION", or
/// empty.
[[nodiscard]] std::string release_in(const fs::descriptor& dataset, const std::string& component);

/// What the next start does, and the datasets that it considers.
struct foresight {
    candidates considered;
    prediction start;
};

/// Predicts the next start after the `wanted` links are in place. Throws std::system_error if a
/// link cannot be replaced, or if a look at the disk fails.
[[nodiscard]] foresight foresee(const std::vector<wanted_link>& wanted);

} // namespace tz
