// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/text.h"

#include <algorithm>
#include <array>
#include <cstdio>
#include <sstream>

#include "dataset/kiv_dataset.h"
#include "fs/layout.h"

namespace tz {
namespace {

// How many bytes of `text`, at its front, are one character in UTF-8; 0 if none are.
std::size_t character_length(std::string_view text) {
    const auto byte = [&](std::size_t i) { return static_cast<unsigned char>(text[i]); };
    const std::size_t length = byte(0) < 0x80 ? 1 : byte(0) < 0xe0 ? 2 : byte(0) < 0xf0 ? 3 : 4;
    if (length == 1) {
        return 1;
    }
    if (byte(0) < 0xc2 || byte(0) > 0xf4 || text.size() < length) {
        return 0;
    }
    unsigned code = byte(0) & (0xffU >> (length + 1));
    for (std::size_t i = 1; i < length; ++i) {
        if ((byte(i) & 0xc0U) != 0x80) {
            return 0;
        }
        code = code << 6U | (byte(i) & 0x3fU);
    }
    constexpr std::array<unsigned, 5> smallest{0, 0, 0x80, 0x800, 0x10000};
    const bool surrogate = code >= 0xd800 && code <= 0xdfff;
    return code >= smallest.at(length) && code <= 0x10ffff && !surrogate ? length : 0;
}

// C0, DEL, and C1 as UTF-8 has them.
bool is_control(std::string_view character) {
    const auto first = static_cast<unsigned char>(character[0]);
    return first < 0x20 || first == 0x7f ||
           (first == 0xc2 && static_cast<unsigned char>(character[1]) < 0xa0);
}

std::string hexadecimal(std::string_view bytes) {
    std::string result;
    for (const char byte : bytes) {
        std::array<char, 5> text{};
        (void)std::snprintf(text.data(), text.size(), "\\x%02x",
                            static_cast<unsigned>(static_cast<unsigned char>(byte)));
        result += text.data();
    }
    return result;
}

std::string escaped(std::string_view text, bool controls_too) {
    std::string result;
    while (!text.empty()) {
        const auto length = character_length(text);
        const auto character = text.substr(0, std::max<std::size_t>(length, 1));
        const bool plain = length != 0 && !(controls_too && is_control(character));
        result += plain ? std::string(character) : hexadecimal(character);
        text.remove_prefix(character.size());
    }
    return result;
}

} // namespace

std::string in_utf8(std::string_view text) {
    return escaped(text, false);
}

std::string printable(std::string_view text) {
    return escaped(text, true);
}

std::string wrapped(const std::string& text, std::size_t indent) {
    constexpr std::size_t columns = 80;
    std::string result;
    std::string line;
    std::istringstream words(text);
    for (std::string word; words >> word;) {
        if (!line.empty() && indent + line.size() + 1 + word.size() > columns) {
            result += std::string(indent, ' ') + line + "\n";
            line.clear();
        }
        line += (line.empty() ? "" : " ") + word;
    }
    return result + std::string(indent, ' ') + line + "\n";
}

std::string dataset_name(const std::string& path) {
    return path.empty()
               ? "the system's own data"
               : "update " + path.substr(std::string_view(layout::updates_directory).size());
}

std::string headline(const prediction& start) {
    const std::string name = start.dataset ? dataset_name(*start.dataset) : "";
    switch (start.decided) {
    case decision::keep:
        return "keeps " + name;
    case decision::adopt:
        return "adopts " + name;
    case decision::drop:
        return "drops the current update for " + name;
    case decision::reset:
        return "goes back to " + name;
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
