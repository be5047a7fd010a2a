// SPDX-License-Identifier: BSD-2-Clause
#pragma once

/// What comes before the decision. No failure here stops a start.
namespace tz {

/// Takes data protection off the state directory and the directory of updates, so that they can be
/// used before the machine is unlocked. Silent, also where one is missing.
void prepare_state_directories();

/// Moves the ICU link from its legacy place to its present one, its text unchanged, unless there is
/// a link already; then deletes the legacy one, even if that failed. A legacy link whose target is
/// missing stays. Failures give warning lines.
void migrate_legacy_icu_link();

} // namespace tz
