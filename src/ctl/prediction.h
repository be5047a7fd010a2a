// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>
#include <vector>

namespace tz {

/// What a start decides: to stay with what is current; to adopt the latest update, whatever came
/// before that; to drop the current update; to go back to the system's own data because something
/// fails; or that not even this can be done, and it exits with status 1.
enum class decision { keep, adopt, drop, reset, fail };

/// What one start would do, and how the links would be afterwards.
struct prediction {
    decision decided = decision::keep;
    std::optional<std::string>
        dataset;                      // path that the current link then names; empty: the system's
    std::optional<std::string> icutz; // targets; nothing where there is no link
    std::optional<std::string> localtime;
    bool changes = false; // whether any of these three links differs from now
    std::string reason;   // a sentence, or two
    std::vector<std::string> warnings;
};

/// Lets a start run in the imagination, on the disk as it is imagined now.
[[nodiscard]] prediction predict_start();

/// The whole target of a link as it is imagined now; nothing if there is no link.
[[nodiscard]] std::optional<std::string> target_of(const char* link);

/// The dataset that the current link names, as a start reads it and as it is imagined now: its
/// path, empty for the system's own data; nothing if the link is missing or names none, for which
/// there is a warning.
[[nodiscard]] std::optional<std::string> current_dataset_path();

/// The dataset that the latest link names, in the same way; nothing if there is no such link.
[[nodiscard]] std::optional<std::string> latest_dataset_path();

} // namespace tz
