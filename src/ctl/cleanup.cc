// SPDX-License-Identifier: BSD-2-Clause
#include <filesystem>
#include <iostream>

#include "ctl/text.h"
#include "ctl/updates.h"
#include "ctl/verbs.h"

namespace tz {

void clean_up(bool rehearsed) {
    const updates::work work;
    const auto removable = updates::removable();
    if (!rehearsed) {
        std::filesystem::remove_all(updates::staging_directory());
    }
    std::uintmax_t freed = 0;
    for (const auto& directory : removable) {
        updates::end_if_interrupted();
        const auto bytes =
            rehearsed ? updates::size_of(directory) : updates::remove_update(directory);
        std::cout << (rehearsed ? "Would delete update " : "Deleted update ")
                  << printable(directory.filename().string()) << ": " << amount(bytes) << std::endl;
        freed += bytes;
    }
    std::cout << (rehearsed ? "That would give back " : "That gives back ") << amount(freed)
              << ".\n";
}

} // namespace tz
