// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <nlohmann/json.hpp>

#include "ctl/prediction.h"

namespace tz {

/// All that tzctl status tells, as the object that tzctl(8) describes, with every text in UTF-8.
/// Looks only. `next_start` becomes what the object tells of the next start.
[[nodiscard]] nlohmann::ordered_json survey(prediction& next_start);

} // namespace tz
