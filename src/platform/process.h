// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz::platform {

/// Called first by every main. Makes the standard descriptors valid, so that no file opened later
/// takes the place of one that is closed, and warnings land in that file. Lets writes that nobody
/// reads, or past a size limit, fail rather than kill: they must not stop the work.
void prepare_process();

} // namespace tz::platform
