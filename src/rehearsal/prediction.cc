// SPDX-License-Identifier: BSD-2-Clause
#include "rehearsal/prediction.h"

#include <array>

#include "fs/layout.h"

namespace tz {
namespace {

std::array<std::optional<std::string>, 3> links(const imagination::session& imagined) {
    return {imagined.target_of(layout::zoneinfo_link), imagined.target_of(layout::icu_link),
            imagined.target_of(layout::localtime_link)};
}

} // namespace

prediction predict_start(imagination::session& imagined) {
    const auto before = links(imagined);
    (void)imagined.take_warnings();

    prediction start;
    try {
        start.result = start_up();
    } catch (...) {
        start.result.decided = decision::fail;
    }
    imagined.check();
    const auto after = links(imagined);
    start.icutz = after[1];
    start.localtime = after[2];
    start.changes = before != after;
    start.warnings = imagined.take_warnings();
    if (start.result.decided == decision::fail) {
        start.warnings.emplace_back(gave_up);
    }
    imagined.check();
    return start;
}

} // namespace tz
