// SPDX-License-Identifier: BSD-2-Clause
#pragma once

namespace tz::platform {

/// Every main calls this first. Opens standard descriptors that are closed: otherwise a file opened
/// later could become standard error and receive the warnings. Ignores SIGPIPE and SIGXFSZ, so that
/// a write that nobody reads, or past a size limit, fails but does not end the program.
void prepare_process();

} // namespace tz::platform
