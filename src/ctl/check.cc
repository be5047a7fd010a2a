// SPDX-License-Identifier: BSD-2-Clause
#include <iostream>

#include "ctl/survey.h"
#include "ctl/text.h"
#include "ctl/verbs.h"

namespace tz {
namespace {

struct service_state {
    int status;
    std::string text;
};

service_state state_of(const survey& found) {
    const outcome& next = found.next_start.result;
    const std::string headline_of_next = "the next start " + headline(next);
    if (!found.current_has_zones) {
        return {2, "the current data cannot be read, so every time zone is UTC"};
    }
    if (next.decided == decision::fail) {
        return {2, headline_of_next};
    }
    if (!found.findings.empty()) {
        const auto more = found.findings.size() - 1;
        return {1, found.findings.front() +
                       (more == 0 ? "" : " (and " + std::to_string(more) + " more)")};
    }
    if (next.decided == decision::keep || next.decided == decision::adopt) {
        const auto& current = found.linked.current;
        const std::string name = current ? dataset_name(current->path) : "nothing";
        return {0, name + " is current" +
                       (next.decided == decision::adopt ? ", " + headline_of_next : "")};
    }
    return {1, headline_of_next};
}

int print(const service_state& state) {
    constexpr const char* names[] = {"OK", "WARNING", "CRITICAL", "UNKNOWN"};
    std::cout << "TZDATA " << names[state.status] << " - " << printable(state.text) << '\n';
    return state.status;
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
    return print({3, why});
}

} // namespace tz
