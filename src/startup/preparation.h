// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz {

/// All that comes before the decision. No failure here stops a start.
///
/// Takes data protection off the state directory and the directory of updates, so that they can be
/// used before the machine is unlocked; one that is missing is skipped without a message.
///
/// Moves the ICU link from its legacy place to its present one, its text unchanged, unless there is
/// a link already; then deletes the legacy one, whatever came of that. A legacy link whose target
/// is missing is left alone. Failures give warning lines.
///
/// Removes, silently, the marker of the start before and the legacy ICU directory if it is empty.
void prepare();

} // namespace tz
