// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "rehearsal/imagination.h"
#include "startup/start_up.h"

namespace tz {

/// What one start would do.
struct prediction {
    outcome result;
    std::optional<std::string> icutz; // targets of the links afterwards, if there are such
    std::optional<std::string> localtime;
    bool changes = false; // whether one of these, or the current link, then differs from now
    std::vector<std::string> warnings;
};

/// Runs a start in `imagined`, after the changes noted there. Throws std::system_error if that
/// meets a failure that another start might not meet.
[[nodiscard]] prediction predict_start(imagination::session& imagined);

} // namespace tz
