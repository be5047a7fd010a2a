// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/text.h"

#include <algorithm>
#include <sstream>
#include <string_view>

#include <sys/ioctl.h>
#include <unistd.h>
#include <utf8.h>

#include "fs/layout.h"

namespace tz {
namespace {

using code_point = utf8::uint32_t;

// `text` with \x and hexadecimal digits for what is not UTF-8, a backslash, or not `wanted`.
std::string escaped(const std::string& text, bool (*wanted)(code_point)) {
    constexpr std::size_t most = 4096;
    constexpr std::string_view digits = "0123456789abcdef";
    std::string result;
    for (auto at = text.begin(); at != text.end();) {
        auto end = at;
        bool shown = false;
        try {
            const code_point code = utf8::next(end, text.end());
            shown = code != '\\' && wanted(code);
        } catch (const utf8::exception&) {
            end = at + 1;
        }
        if (static_cast<std::size_t>(end - text.begin()) > most) {
            return result + "...";
        }
        for (; at != end; ++at) {
            const auto byte = static_cast<unsigned char>(*at);
            result += shown ? std::string(1, *at)
                            : std::string{'\\', 'x', digits[byte / 16], digits[byte % 16]};
        }
    }
    return result;
}

// Neither a control character nor one that changes the direction of a text or takes no column.
bool is_harmless(code_point code) {
    constexpr struct {
        code_point first, last;
    } steering[] = {{0, 0x1f},        {0x7f, 0x9f},     {0x61c, 0x61c},   {0x200b, 0x200f},
                    {0x2028, 0x202e}, {0x2060, 0x206f}, {0xfeff, 0xfeff}, {0xe0000, 0xe0fff}};
    return std::none_of(std::begin(steering), std::end(steering), [&](const auto& range) {
        return range.first <= code && code <= range.last;
    });
}

std::size_t width() {
    constexpr std::size_t usual = 80;
    constexpr std::size_t most = 100;
    winsize size{};
    return ::ioctl(STDOUT_FILENO, TIOCGWINSZ, &size) == -1 || size.ws_col == 0
               ? usual
               : std::min<std::size_t>(size.ws_col, most);
}

std::string name_of(const dataset& data) {
    return data.version + (data.path.empty() ? " (the system's own data)" : "");
}

std::string schema_of(const dataset& data) {
    return data.schema.empty() ? "no ICU schema" : "ICU schema " + data.schema;
}

std::string other_schema(const dataset& data, const dataset& system) {
    return name_of(data) + " has " + schema_of(data) + ", the system has " + schema_of(system) +
           ".";
}

std::string not_newer(const dataset& data, const dataset& than) {
    return name_of(data) + " is not newer than " + name_of(than) + ".";
}

// One sentence for each verdict.

std::string on_current(verdict found, const dataset& current, const dataset& system) {
    switch (found) {
    case verdict::fits: return name_of(current) + " is current.";
    case verdict::other_schema: return other_schema(current, system);
    case verdict::not_newer: return name_of(system) + " is newer than " + name_of(current) + ".";
    case verdict::none: return "The current link is missing or names no dataset.";
    case verdict::failed:
        return current.readable ? "The current update cannot be read." : why_unreadable(current);
    case verdict::unknown: break;
    }
    return "";
}

std::string on_latest(verdict found, const dataset& latest, const dataset& current,
                      const dataset& system) {
    switch (found) {
    case verdict::fits:
        return name_of(latest) + " is compatible and newer than " + name_of(current) + ".";
    case verdict::other_schema: return other_schema(latest, system);
    case verdict::not_newer:
        return latest.path == current.path ? "The latest update is the same."
                                           : not_newer(latest, current);
    case verdict::none: return "There is no latest update.";
    case verdict::failed:
        return latest.readable ? "The latest link names no update that can be read."
                               : why_unreadable(latest);
    case verdict::unknown: break;
    }
    return "";
}

} // namespace

std::string in_utf8(const std::string& text) {
    return escaped(text, [](code_point) { return true; });
}

std::string printable(const std::string& text) {
    return escaped(text, is_harmless);
}

std::size_t columns(const std::string& text) {
    return static_cast<std::size_t>(utf8::distance(text.begin(), text.end()));
}

std::string wrapped(const std::string& text, std::size_t indent) {
    const std::size_t most = width();
    const std::string margin(indent, ' ');
    std::string lines;
    std::string line = margin;
    std::istringstream words(printable(text));
    for (std::string word; words >> word;) {
        if (line.size() > indent && columns(line) + 1 + columns(word) > most) {
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

std::string headline(const outcome& start) {
    const std::string name = dataset_name(start.dataset);
    switch (start.decided) {
    case decision::keep: return "keeps " + name;
    case decision::adopt: return "adopts " + name;
    case decision::drop: return "drops the current update for " + name;
    case decision::reset: return "returns to " + name;
    case decision::fail: break;
    }
    return "fails";
}

std::string reason(const outcome& start, const candidates& considered) {
    const dataset system = considered.system.value_or(dataset());
    const dataset current =
        start.current == verdict::none ? system : considered.current.value_or(dataset());
    const dataset latest = considered.latest.value_or(dataset());
    const std::string about_current = on_current(start.current, current, system);
    std::string about_latest = on_latest(start.latest, latest, current, system);
    switch (start.decided) {
    case decision::keep:
    case decision::drop: return about_current + " " + about_latest;
    case decision::adopt: return about_latest;
    case decision::reset:
        return start.current == verdict::none     ? about_current + " " + about_latest
               : start.current == verdict::failed ? about_current
               : start.latest == verdict::failed  ? about_latest
               : about_current.empty()            ? "The system's own data cannot be read."
                                                  : "A link cannot be replaced.";
    case decision::fail: break;
    }
    return "It cannot set all links.";
}

} // namespace tz
