// SPDX-License-Identifier: BSD-2-Clause
// Holds the scanners against std::regex, and the reading of the current link against plain string
// tests, on whatever text a fuzzer or replay.cc comes up with. Aborts where they differ.
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <iostream>
#include <regex>
#include <string>
#include <vector>

#include "dataset/kiv_icu.h"
#include "platform/warn.h"
#include "startup/links.h"
#include "version/data_version.h"

// Millions of refused texts need no line each.
void tz::warn(const char* /*format*/, ...) {}

namespace {

using groups = std::vector<std::string>; // of a text that matches; none if it does not

groups matched(const std::string& text, const std::regex& pattern) {
    std::smatch match;
    return std::regex_match(text, match, pattern) ? groups(++match.begin(), match.end()) : groups();
}

groups split(const std::string& text) {
    const auto pieces = tz::split_version(text);
    return pieces ? groups{std::string(pieces->year), std::string(pieces->letters),
                           std::string(pieces->minor), std::string(pieces->patch)}
                  : groups();
}

groups schema(const std::string& name) {
    const auto found = tz::icu_schema_in_name(name);
    return found.empty() ? groups() : groups{std::string(found)};
}

groups dataset_path(const std::string& target) {
    try {
        return {tz::dataset_path_from_zoneinfo_link(target)};
    } catch (int) {
        return {};
    }
}

groups dataset_path_by_hand(const std::string& target) {
    const std::string prefix = "/var/db/timezone/tz/";
    if (target == "/usr/share/zoneinfo.default") {
        return {""};
    }
    const auto path = target.substr(0, target.find_last_of('/'));
    const bool good = target.substr(0, 20) == prefix && path.length() >= 21 && path != target;
    return good ? groups{path} : groups();
}

void expect_same(const char* what, const std::string& text, const groups& found,
                 const groups& expected) {
    if (found != expected) {
        std::cout << what << " differs on \"" << text << "\"\n" << std::flush;
        std::abort();
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
    static const std::regex version(R"(([0-9]+)([a-z]+)(?:\.([0-9]+))?(?:\.([0-9]+))?)");
    static const std::regex icu_name(R"(icutz([0-9]+[lbe])\.dat)");

    const std::string text(data, data + size);
    expect_same("version", text, split(text), matched(text, version));
    for (const auto& name : {text, "icutz" + text + ".dat"}) {
        expect_same("ICU file name", name, schema(name), matched(name, icu_name));
    }
    for (const auto& target : {text, "/var/db/timezone/tz/" + text}) {
        expect_same("link target", target, dataset_path(target), dataset_path_by_hand(target));
    }
    return 0;
}
