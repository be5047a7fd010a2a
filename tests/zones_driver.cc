// SPDX-License-Identifier: BSD-2-Clause
// Compares two directories of zones from now on, for ten years, and prints the differences as JSON.
#include <iostream>

#include <fcntl.h>
#include <nlohmann/json.hpp>

#include "ctl/zones.h"
#include "fs/descriptor.h"

int main(int argc, char** argv) try {
    if (argc != 3) {
        return 2;
    }
    const tz::fs::descriptor from(::open(argv[1], O_PATH | O_DIRECTORY));
    const tz::fs::descriptor to(::open(argv[2], O_PATH | O_DIRECTORY));
    const auto start = std::time(nullptr);
    const auto end = start + std::time_t{3652} * 24 * 60 * 60;
    const auto found = tz::compare_zones({from.number(), argv[1]}, {to.number(), argv[2]}, start,
                                         end, [](auto /*done*/, auto /*all*/) {});
    nlohmann::json changed = nlohmann::json::array();
    const auto in_json = [](const tz::local_type& type) -> nlohmann::json {
        return {{"offset", type.offset},
                {"dst", type.daylight_saving},
                {"abbreviation", type.abbreviation}};
    };
    for (const auto& one : found.changed) {
        changed.push_back({{"zone", one.zone},
                           {"at", one.at},
                           {"before", in_json(one.before)},
                           {"after", in_json(one.after)}});
    }
    std::cout << nlohmann::json{{"start", start},
                                {"end", end},
                                {"compared", found.compared},
                                {"changed", changed},
                                {"added", found.added},
                                {"removed", found.removed},
                                {"unreadable_before", found.unreadable_before},
                                {"unreadable_after", found.unreadable_after}};
} catch (const std::exception& failure) {
    std::cerr << failure.what() << '\n';
    return 1;
}
