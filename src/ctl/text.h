// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>

#include "ctl/prediction.h"

namespace tz {

/// `text` with every byte that is not UTF-8 written as \x and two hexadecimal digits.
[[nodiscard]] std::string in_utf8(const std::string& text);

/// The same, with control characters written so, too: no name on the disk may steer a terminal.
[[nodiscard]] std::string printable(const std::string& text);

/// `text`, printable, broken at blanks into lines of at most 80 columns, each after `indent`
/// blanks.
[[nodiscard]] std::string wrapped(const std::string& text, std::size_t indent = 0);

/// What people call the dataset at `path`, if that is known.
[[nodiscard]] std::string dataset_name(const std::optional<std::string>& path);

/// What a start does, in a few words, such as "adopts update 2016d.1.0".
[[nodiscard]] std::string headline(const prediction& start);

} // namespace tz
