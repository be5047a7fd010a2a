// SPDX-License-Identifier: BSD-2-Clause
#include <iostream>
#include <optional>

#include "ctl/failure.h"
#include "ctl/root.h"
#include "ctl/survey.h"
#include "ctl/text.h"
#include "ctl/tree.h"
#include "ctl/updates.h"
#include "ctl/verbs.h"
#include "ctl/work.h"
#include "fs/layout.h"

namespace tz {
namespace {

// The path of a dataset that is there, and has zones.
std::string checked_path(const std::string& version, const work& work) {
    const bool system = version == "system";
    std::string path = system ? "" : updates::path_of(version);
    if (!system &&
        (version.empty() || version[0] == '.' || version.find('/') != std::string::npos ||
         !tree::open_directory(work.updates().number(), version, in_image(path)))) {
        refuse(version, "not installed");
    }
    const std::string zoneinfo = system ? layout::system_zoneinfo : path + layout::update_zoneinfo;
    if (!tree::holds_zones(zoneinfo)) {
        refuse(in_image(zoneinfo), "holds no zone file, so every time zone would be UTC");
    }
    return path;
}

// The links that make the dataset at `path` current and the latest, in the order of a start.
std::vector<wanted_link> links_to(const std::string& path) {
    if (path.empty()) {
        return {{layout::zoneinfo_link, layout::system_zoneinfo},
                {layout::icu_link, std::nullopt},
                {layout::legacy_icu_link, std::nullopt},
                {layout::latest_link, std::nullopt}};
    }
    return {{layout::zoneinfo_link, path + layout::update_zoneinfo},
            {layout::icu_link, path + layout::update_icu},
            {layout::legacy_icu_link, std::nullopt},
            {layout::latest_link, path}};
}

foresight make_current(const std::string& version, const work& work) {
    const std::string path = checked_path(version, work);
    const auto wanted = links_to(path);
    auto next = foresee(wanted);
    const outcome& result = next.start.result;
    const bool way_out = path.empty(); // the system's data is allowed even if every start fails
    if (result.dataset != path || (result.decided != decision::keep && !way_out)) {
        refuse(version, "the next start would not keep it: " + reason(result, next.considered));
    }
    work.replace(wanted, version);
    return next;
}

} // namespace

void finish_interrupted_use(const work& work) {
    const auto version = unfinished_use();
    if (!version) {
        return;
    }
    try {
        (void)make_current(*version, work);
    } catch (const std::system_error&) {
        throw; // the next one tries again
    } catch (const std::runtime_error& error) {
        std::cerr << "tzctl: cannot complete \"use " << printable(*version)
                  << "\": " << printable(error.what()) << '\n';
    }
    work.forget_unfinished_use();
}

void use(const std::string& version) {
    const work work;
    try {
        finish_interrupted_use(work);
    } catch (const std::system_error&) {
        // This sets the same links.
    }
    const auto next = make_current(version, work);
    const outcome& result = next.start.result;
    std::cout << wrapped("Current now: " + dataset_name(result.dataset) + ".")
              << wrapped("The next start " + headline(result) + ". " +
                         reason(result, next.considered))
              << "Running programs keep what they have read.\n";
}

} // namespace tz
