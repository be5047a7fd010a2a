// SPDX-License-Identifier: BSD-2-Clause
#include <filesystem>
#include <iostream>
#include <optional>
#include <stdexcept>

#include "ctl/prediction.h"
#include "ctl/text.h"
#include "ctl/updates.h"
#include "ctl/verbs.h"
#include "dataset/kiv_dataset.h"
#include "fs/layout.h"
#include "fs/operations.h"
#include "platform/imagination.h"

namespace tz {
namespace {

namespace files = std::filesystem;

// The path of a dataset that is there.
std::string checked_path(const std::string& version) {
    const bool system = version == "system";
    std::string path = system ? "" : updates::path_of(version);
    if (!system && (version.empty() || version[0] == '.' ||
                    files::path(version).filename() != version || !files::is_directory(path))) {
        throw std::runtime_error("\"" + version + "\" is not installed");
    }
    if (!updates::holds_zones(system ? layout::system_zoneinfo : path + layout::update_zoneinfo)) {
        throw std::runtime_error(dataset_name(path) + " holds no tz database that can be read");
    }
    return path;
}

// The links that are to be changed for the dataset at `path` to be current and the latest.
updates::links imagine_use(const std::string& path) {
    imagination::forget();
    try {
        kiv_dataset(path).make_current();
        fs::remove(layout::latest_link);
        if (!path.empty()) {
            fs::create_symlink(path, layout::latest_link);
        }
    } catch (...) {
        const auto said = imagination::take_warnings();
        throw std::runtime_error(said.empty() ? "its version cannot be read" : said.back());
    }
    updates::links wanted;
    for (const auto& [link, change] : imagination::noted()) {
        const bool gone = change.what == imagination::entry::kind::nothing;
        wanted[link] = gone ? std::nullopt : std::optional(change.target);
    }
    return wanted;
}

} // namespace

void use(const std::string& version) {
    const updates::work work;
    const std::string path = checked_path(version);
    const auto wanted = imagine_use(path);
    const auto start = predict_start();
    const bool way_out = path.empty(); // also where no start goes well any more
    if (start.dataset != path || (start.decided != decision::keep && !way_out)) {
        throw std::runtime_error("the next start would not keep it. " + start.reason);
    }
    updates::replace(wanted);
    std::cout << "Current now: " << printable(dataset_name(path)) << ".\n"
              << wrapped("The next start " + headline(start) + ". " + start.reason)
              << "Programs that run already keep what they have read.\n";
}

} // namespace tz
