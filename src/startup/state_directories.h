// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz {

/// Takes data protection off the state directory and the directory of updates, so that they can be
/// used before the machine is unlocked. A directory that is missing is skipped without a message.
void prepare_state_directories();

/// Moves the ICU link from its legacy place to its present one, its text unchanged, unless there is
/// a link already; then deletes the legacy one, whatever came of that. A legacy link whose target
/// is missing is left alone. Failures give warning lines and are not thrown.
void migrate_legacy_icu_link();

} // namespace tz
