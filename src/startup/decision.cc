// SPDX-License-Identifier: BSD-2-Clause
#include "startup/decision.h"

namespace tz {

bool keep_current(const kiv_dataset& current, const kiv_dataset& system) {
    return current.compatible_with(system) && !(system > current);
}

bool adopt_latest(const kiv_dataset& latest, const kiv_dataset& current,
                  const kiv_dataset& system) {
    return latest.compatible_with(system) && latest > current;
}

} // namespace tz
