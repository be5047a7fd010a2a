// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/text.h"

#include <array>
#include <sstream>
#include <string_view>

#include <utf8.h>

#include "fs/layout.h"

namespace tz {
namespace {

// `text` with \x and hexadecimal digits for what is not UTF-8, or a code that is not `wanted`.
std::string escaped(const std::string& text, bool (*wanted)(utf8::uint32_t code)) {
    constexpr std::string_view digits = "0123456789abcdef";
    std::string result;
    for (auto at = text.begin(); at != text.end();) {
        auto end = at;
        bool shown = false;
        try {
            shown = wanted(utf8::next(end, text.end()));
        } catch (const utf8::exception&) {
            end = at + 1;
        }
        for (; at != end; ++at) {
            const auto byte = static_cast<unsigned char>(*at);
            result += shown ? std::string(1, *at)
                            : std::string{'\\', 'x', digits[byte / 16], digits[byte % 16]};
        }
    }
    return result;
}

} // namespace

std::string in_utf8(const std::string& text) {
    return escaped(text, [](auto) { return true; });
}

std::string printable(const std::string& text) {
    return escaped(text, [](auto code) { return code >= 0x20 && (code < 0x7f || code >= 0xa0); });
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

std::string dataset_name(const std::optional<std::string>& path) {
    constexpr std::string_view prefix = layout::updates_directory;
    return !path           ? "what the current link names"
           : path->empty() ? "the system's own data"
                           : "update " + path->substr(prefix.size());
}

std::string headline(const prediction& start) {
    constexpr std::array verbs{"keeps ", "adopts ", "drops the current update for ",
                               "goes back to "};
    return start.decided == decision::fail
               ? "fails"
               : verbs.at(static_cast<std::size_t>(start.decided)) + dataset_name(start.dataset);
}

} // namespace tz
