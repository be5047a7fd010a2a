// SPDX-License-Identifier: BSD-2-Clause
#include <array>
#include <iostream>

#include "ctl/survey.h"
#include "ctl/text.h"
#include "ctl/verbs.h"

namespace tz {
namespace {

constexpr int unknown = 3;

struct service_state {
    int status;
    std::string text;
};

std::string first_of(const std::vector<std::string>& findings) {
    const auto more = findings.size() - 1;
    const std::string& first = findings.front();
    return first.substr(0, first.size() - (first.ends_with('.') ? 1 : 0)) +
           (more == 0 ? "" : " (and " + std::to_string(more) + " more)");
}

service_state state_of(const survey& found) {
    const outcome& next = found.next_start.result;
    const bool stays = next.decided == decision::keep || next.decided == decision::adopt;
    const bool fails = next.decided == decision::fail || !found.current_has_zones;
    if (!found.findings.empty()) {
        return {fails ? 2 : 1, first_of(found.findings)};
    }
    if (!stays) {
        return {1, "the next start " + headline(next)};
    }
    const std::string current = found.linked.current ? found.linked.current->path : "";
    return {0, dataset_name(current) + " is current" +
                   (next.decided == decision::adopt ? ", the next start " + headline(next) : "")};
}

int print(const service_state& state) {
    constexpr std::array names{"OK", "WARNING", "CRITICAL", "UNKNOWN"};
    std::cout << "TZDATA " << names.at(static_cast<std::size_t>(state.status)) << " - "
              << printable(state.text) << '\n';
    return std::cout.flush() ? state.status : unknown;
}

} // namespace

int print_check() {
    try {
        return print(state_of(look()));
    } catch (const std::exception& error) {
        return print_unknown(error.what());
    }
}

int print_unknown(const std::string& why) {
    return print({unknown, why});
}

} // namespace tz
