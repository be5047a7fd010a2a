// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <sys/types.h>

#include "fs/descriptor.h"

namespace tz {

/// What the kernel passes on the way to something: directories, and symbolic links with what they
/// lead to.
struct way {
    struct entry {
        std::pair<dev_t, ino_t> identity;
        mode_t mode = 0;
        std::string target; // of a link
    };

    std::vector<entry> passed; // the last is what it leads to
    bool leads_somewhere = false;
    fs::descriptor directory{-1}; // that contains the last entry
    std::string name;             // of the last entry there
    std::string shown;            // the path that was followed, in messages

    /// Whether every user can follow it to its end, and read what is there.
    [[nodiscard]] bool is_open_to_others() const;

    [[nodiscard]] bool passes(const std::pair<dev_t, ino_t>& identity) const;

    /// Whether it leads to a compiled zone file.
    [[nodiscard]] bool leads_to_zone() const;
};

/// Follows the absolute `path` as far as it leads. Throws std::system_error if something on the
/// way cannot be looked at.
[[nodiscard]] way follow(const std::string& path);

} // namespace tz
