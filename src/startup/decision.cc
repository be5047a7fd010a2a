// SPDX-License-Identifier: BSD-2-Clause
#include "startup/decision.h"

namespace tz {

verdict judge_current(const kiv_dataset& current, const kiv_dataset& system) {
    if (!current.compatible_with(system)) {
        return verdict::other_schema;
    }
    return system > current ? verdict::not_newer : verdict::fits;
}

verdict judge_latest(const kiv_dataset& latest, const kiv_dataset& current,
                     const kiv_dataset& system) {
    if (!latest.compatible_with(system)) {
        return verdict::other_schema;
    }
    return latest > current ? verdict::fits : verdict::not_newer;
}

} // namespace tz
