// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

#include "ctl/survey.h"

namespace tz {

/// `text` in UTF-8, reversibly: a backslash and every byte that is not UTF-8 become \x and two
/// hexadecimal digits. Ends after 4,096 bytes, with "..." then.
[[nodiscard]] std::string in_utf8(const std::string& text);

/// The same, with control and bidirectional characters escaped, too: no name on the disk and no
/// argument may control a terminal.
[[nodiscard]] std::string printable(const std::string& text);

/// The columns that a printable text takes.
[[nodiscard]] std::size_t columns(const std::string& text);

/// `text`, printable, broken at blanks into lines as wide as the terminal, but at most 100 columns,
/// and 80 where there is no terminal; each after `indent` blanks.
[[nodiscard]] std::string wrapped(const std::string& text, std::size_t indent = 0);

/// What messages call the dataset at `path`, such as "update 2016d.1.0".
[[nodiscard]] std::string dataset_name(const std::string& path);

/// What a start does, such as "adopts update 2016d.1.0".
[[nodiscard]] std::string headline(const outcome& start);

/// Why a start that looks at these datasets does that: a sentence or two.
[[nodiscard]] std::string reason(const outcome& start, const candidates& considered);

} // namespace tz
