// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/cleanup.h"

#include <filesystem>
#include <iostream>

#include "ctl/text.h"
#include "ctl/updates.h"

namespace tz {

void clean_up(bool rehearsal) {
    const updates::work work;
    std::uintmax_t freed = 0;
    for (const auto& directory : updates::removable()) {
        work.go_on();
        const auto bytes =
            rehearsal ? updates::size_of(directory) : updates::remove_update(directory);
        std::cout << (rehearsal ? "Would delete update " : "Deleted update ")
                  << printable(directory.filename().string()) << ": " << amount(bytes) << std::endl;
        freed += bytes;
    }
    std::cout << (rehearsal ? "That would give back " : "That gives back ") << amount(freed)
              << ".\n";
}

} // namespace tz
