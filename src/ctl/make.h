// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>
#include <vector>

namespace tz {

/// Becomes make-dataset, with these arguments. Throws std::system_error if that cannot be.
[[noreturn]] void make(const std::vector<std::string>& arguments);

} // namespace tz
