// SPDX-License-Identifier: BSD-2-Clause
#include <iostream>

#include <nlohmann/json.hpp>

#include "ctl/printers.h"
#include "ctl/text.h"

namespace tz {
namespace {

using nlohmann::ordered_json;

const char* name_of(decision decided) {
    switch (decided) {
    case decision::keep: return "keep";
    case decision::adopt: return "adopt";
    case decision::drop: return "drop";
    case decision::reset: return "reset";
    case decision::fail: break;
    }
    return "fail";
}

const char* name_of(verdict found) {
    switch (found) {
    case verdict::none: return "none";
    case verdict::failed: return "failed";
    case verdict::other_schema: return "other schema";
    case verdict::not_newer: return "not newer";
    case verdict::fits: return "fits";
    case verdict::unknown: break;
    }
    return "unknown";
}

const char* name_of(link_state state) {
    switch (state) {
    case link_state::ok: return "ok";
    case link_state::dangling: return "dangling";
    case link_state::missing: return "missing";
    case link_state::not_a_link: break;
    }
    return "not a link";
}

ordered_json text_or_null(const std::optional<std::string>& text) {
    return text ? ordered_json(in_utf8(*text)) : ordered_json();
}

ordered_json word_or_null(const std::string& word) {
    return word.empty() ? ordered_json() : ordered_json(in_utf8(word));
}

ordered_json texts(const std::vector<std::string>& all) {
    ordered_json array = ordered_json::array();
    for (const auto& text : all) {
        array.push_back(in_utf8(text));
    }
    return array;
}

ordered_json described(const dataset& data) {
    return {{"path", in_utf8(data.path)},
            {"version", in_utf8(data.version)},
            {"release", word_or_null(data.release)},
            {"schema", word_or_null(data.schema)},
            {"icu_release", word_or_null(data.icu_release)},
            {"compatible", data.compatible},
            {"newer_than_system", data.newer_than_system}};
}

ordered_json described(const std::optional<dataset>& data) {
    return data ? described(*data) : ordered_json();
}

ordered_json described(const std::vector<dataset>& all) {
    ordered_json array = ordered_json::array();
    for (const auto& data : all) {
        array.push_back(described(data));
    }
    return array;
}

ordered_json described(const link& link) {
    return {
        {"path", link.path}, {"target", text_or_null(link.target)}, {"state", name_of(link.state)}};
}

ordered_json described(const reader& reader) {
    auto object = described(reader.place);
    object["follows"] = reader.follows;
    return object;
}

ordered_json described(const prediction& next, const candidates& linked) {
    const outcome& result = next.result;
    const bool fails = result.decided == decision::fail;
    return {{"decision", name_of(result.decided)},
            {"dataset", fails ? ordered_json() : ordered_json(in_utf8(result.dataset))},
            {"icutz", text_or_null(next.icutz)},
            {"localtime", text_or_null(next.localtime)},
            {"changes", next.changes},
            {"reason", in_utf8(reason(result, linked))},
            {"current", name_of(result.current)},
            {"latest", name_of(result.latest)},
            {"warnings", texts(next.warnings)}};
}

ordered_json described(const local_type& type) {
    return {{"offset", type.offset},
            {"dst", type.daylight_saving},
            {"abbreviation", in_utf8(type.abbreviation)}};
}

ordered_json described(const std::vector<zone_change>& all) {
    ordered_json array = ordered_json::array();
    for (const auto& [zone, at, before, after] : all) {
        array.push_back({{"zone", in_utf8(zone)},
                         {"at", at},
                         {"before", described(before)},
                         {"after", described(after)}});
    }
    return array;
}

} // namespace

void print_as_json(const survey& found) {
    const ordered_json object{{"format", 1},
                              {"system", described(found.linked.system)},
                              {"current", described(found.linked.current)},
                              {"latest", described(found.linked.latest)},
                              {"installed", described(found.installed)},
                              {"links",
                               {{"zoneinfo", described(found.zoneinfo)},
                                {"icutz", described(found.icutz)},
                                {"tz_latest", described(found.tz_latest)},
                                {"localtime", described(found.localtime)}}},
                              {"readers",
                               {{"zoneinfo", described(found.zoneinfo_reader)},
                                {"localtime", described(found.etc_localtime)}}},
                              {"local_zone", text_or_null(found.local_zone)},
                              {"marker", found.marker},
                              {"record", text_or_null(found.record)},
                              {"next_start", described(found.next_start, found.linked)},
                              {"findings", texts(found.findings)}};
    std::cout << object.dump(2, ' ', true) << '\n';
}

void print_as_json(const comparison& done) {
    const ordered_json object{{"format", 1},
                              {"from", in_utf8(done.from)},
                              {"to", in_utf8(done.to)},
                              {"start", done.start},
                              {"end", done.end},
                              {"compared", done.found.compared.size()},
                              {"local_zone", text_or_null(done.local_zone)},
                              {"changed", described(done.found.changed)},
                              {"added", texts(done.found.added)},
                              {"removed", texts(done.found.removed)},
                              {"unreadable_from", texts(done.found.unreadable_before)},
                              {"unreadable_to", texts(done.found.unreadable_after)}};
    std::cout << object.dump(2, ' ', true) << '\n';
}

} // namespace tz
