// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "ctl/prediction.h"

namespace tz {

/// `text` with every byte that is not UTF-8 written as \x and two hexadecimal digits.
[[nodiscard]] std::string in_utf8(std::string_view text);

/// The same, with control characters written so, too: a name on the disk must not steer a terminal.
[[nodiscard]] std::string printable(std::string_view text);

/// `text` broken at blanks into lines of at most 80 columns, each after `indent` blanks.
[[nodiscard]] std::string wrapped(const std::string& text, std::size_t indent = 0);

/// How people call a dataset, by its path.
[[nodiscard]] std::string dataset_name(const std::string& path);

/// What a start will do, in a few words, such as "adopts update 2016d.1.0".
[[nodiscard]] std::string headline(const prediction& start);

/// An amount of bytes for people, such as "3.4 MB".
[[nodiscard]] std::string amount(std::uintmax_t bytes);

} // namespace tz
