// SPDX-License-Identifier: BSD-2-Clause
#include "version/data_version.h"

#include <algorithm>
#include <tuple>

#include "platform/warn.h"

namespace tz {
namespace {

bool is_digit(char c) {
    return '0' <= c && c <= '9';
}

bool is_letter(char c) {
    return 'a' <= c && c <= 'z';
}

// Removes the leading bytes of one kind from `text` and returns them.
std::string_view take(std::string_view& text, bool (*is_of_kind)(char)) {
    const std::string_view run(text.begin(),
                               std::find_if_not(text.begin(), text.end(), is_of_kind));
    text.remove_prefix(run.size());
    return run;
}

// The same for a dot and the digits after it; returns the digits. A dot without digits stays.
std::string_view take_dotted_number(std::string_view& text) {
    if (!text.starts_with('.')) {
        return {};
    }
    std::string_view rest = text.substr(1);
    const std::string_view digits = take(rest, is_digit);
    if (!digits.empty()) {
        text = rest;
    }
    return digits;
}

int number(std::string_view digits) {
    return digits.empty() ? -1 : std::stoi(std::string(digits));
}

} // namespace

std::optional<version_pieces> split_version(std::string_view text) {
    version_pieces pieces;
    pieces.year = take(text, is_digit);
    pieces.letters = take(text, is_letter);
    pieces.minor = take_dotted_number(text);
    pieces.patch = take_dotted_number(text);
    if (pieces.year.empty() || pieces.letters.empty() || !text.empty()) {
        return std::nullopt;
    }
    return pieces;
}

void data_version::parse(const std::string& text) {
    const auto pieces = split_version(text);
    if (!pieces) {
        warn("Cannot parse version string %s, results.size() = 0", text.c_str());
        warn("Cannot parse version string %s", text.c_str());
        *this = data_version();
        return;
    }
    year = number(pieces->year);
    letters = pieces->letters;
    minor = number(pieces->minor);
    patch = number(pieces->patch);
}

bool data_version::operator>(const data_version& other) const {
    return std::tie(year, letters, minor, patch) >
           std::tie(other.year, other.letters, other.minor, other.patch);
}

} // namespace tz
