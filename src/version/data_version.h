// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace tz {

/// The version of a dataset: a release of the tz database, such as 2016a, and up to two numbers,
/// such as .1.0.
///
/// A default-constructed value is the unknown version, which is older than every other.
struct data_version {
    int year = -1;
    std::string letters;
    int minor = -1; // -1 when absent, so 2016a is older than 2016a.0
    int patch = -1;

    data_version() = default;

    /// Parses `text`; see parse().
    explicit data_version(const std::string& text) { parse(text); }

    /// Sets all fields from a text such as 2016a, 2016a.1 or 2016a.1.0. Numbers are decimal;
    /// leading zeros are ignored. A text of any other form gives two warning lines and the unknown
    /// version. A number greater than INT_MAX throws std::out_of_range.
    void parse(const std::string& text);

    /// Strictly newer: by year, then by letters as bytes, then by the two numbers.
    bool operator>(const data_version& other) const;
    bool operator==(const data_version& other) const = default;
};

/// The parts of a version text, unchanged; a missing number is empty.
struct version_pieces {
    std::string_view year;
    std::string_view letters;
    std::string_view minor;
    std::string_view patch;
};

/// Splits a version text, which must match as a whole:
/// [0-9]+ [a-z]+ ( "." [0-9]+ ( "." [0-9]+ )? )?
/// Returns nothing if it does not. Runs in linear time and constant space.
[[nodiscard]] std::optional<version_pieces> split_version(std::string_view text);

} // namespace tz
