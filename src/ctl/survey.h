// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "ctl/prediction.h"

namespace tz {

struct dataset_report {
    std::string path; // empty for the system's own data
    std::string version;
    std::optional<std::string> release; // of the tz database; nothing where none was found
    std::optional<std::string> schema;  // of the ICU data; likewise
    bool compatible = false;
    bool newer_than_system = false;
};

struct link_report {
    std::string path;
    std::optional<std::string> target; // nothing where there is no link
    std::string state;                 // "ok", "dangling", "missing" or "not a link"
};

/// All that tzctl status tells.
struct survey {
    std::optional<dataset_report> system;  // nothing where a start could not use it at all
    std::optional<dataset_report> current; // that the current link names
    std::optional<dataset_report> latest;  // that the latest link names
    std::vector<dataset_report> installed; // newest first
    link_report zoneinfo;
    link_report icutz;
    link_report tz_latest;
    link_report localtime;
    bool marker = false;
    std::optional<std::string> record;
    prediction next_start;
    std::vector<std::string> findings; // what is not as it should be
};

/// Looks at everything, and changes nothing.
[[nodiscard]] survey take_survey();

} // namespace tz
