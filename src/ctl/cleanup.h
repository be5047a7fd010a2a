// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz {

/// Deletes the installed updates that are not in use, and says which; or, as a `rehearsal`, only
/// says so. Throws std::exception.
void clean_up(bool rehearsal);

} // namespace tz
