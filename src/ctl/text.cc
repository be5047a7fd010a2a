// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/text.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <sstream>
#include <string_view>

#include <utf8.h>

#include "fs/layout.h"

namespace tz {
namespace {

std::string hexadecimal(char byte) {
    std::array<char, 5> text{};
    (void)std::snprintf(text.data(), text.size(), "\\x%02x",
                        static_cast<unsigned>(static_cast<unsigned char>(byte)));
    return text.data();
}

} // namespace

std::string in_utf8(const std::string& text) {
    std::string result;
    for (auto at = text.begin(); at != text.end();) {
        const auto invalid = utf8::find_invalid(at, text.end());
        result.append(at, invalid);
        at = invalid;
        if (at != text.end()) {
            result += hexadecimal(*at++);
        }
    }
    return result;
}

std::string printable(const std::string& text) {
    std::string result;
    const std::string valid = in_utf8(text);
    for (auto at = valid.begin(); at != valid.end();) {
        const auto begin = at;
        const auto code = utf8::unchecked::next(at);
        if (code < 0x20 || (0x7f <= code && code < 0xa0)) {
            std::for_each(begin, at, [&](char byte) { result += hexadecimal(byte); });
        } else {
            result.append(begin, at);
        }
    }
    return result;
}

std::string wrapped(const std::string& text, std::size_t indent) {
    constexpr std::size_t columns = 80;
    const std::string margin(indent, ' ');
    std::string lines;
    std::string line = margin;
    std::istringstream words(printable(text));
    for (std::string word; words >> word;) {
        if (line.size() > indent && line.size() + 1 + word.size() > columns) {
            lines += line + "\n";
            line = margin;
        }
        line += (line.size() > indent ? " " : "") + word;
    }
    return lines + line + "\n";
}

std::string dataset_name(const std::string& path) {
    constexpr std::string_view prefix = layout::updates_directory;
    return path.empty() ? "the system's own data" : "update " + path.substr(prefix.size());
}

std::string headline(const prediction& start) {
    switch (start.decided) {
    case decision::keep:
        return "keeps " + dataset_name(*start.dataset);
    case decision::adopt:
        return "adopts " + dataset_name(*start.dataset);
    case decision::drop:
        return "drops the current update for " + dataset_name(*start.dataset);
    case decision::reset:
        return "goes back to " + dataset_name(*start.dataset);
    case decision::fail:
        break;
    }
    return "fails";
}

std::string amount(std::uintmax_t bytes) {
    std::array<char, 32> text{};
    (void)std::snprintf(text.data(), text.size(), "%.1f MB", static_cast<double>(bytes) / 1e6);
    return text.data();
}

} // namespace tz
