// SPDX-License-Identifier: BSD-2-Clause
#include <filesystem>
#include <iostream>
#include <map>
#include <optional>

#include <unistd.h>

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

// The path of a dataset that is there, and that others can read.
std::string checked_path(const std::string& version) {
    const bool system = version == "system";
    std::string path = system ? "" : updates::path_of(version);
    if (!system && (files::path(version).filename() != version || !files::is_directory(path))) {
        throw std::runtime_error(version + " is not installed");
    }
    if (!updates::holds_zones(system ? layout::system_zoneinfo : path + layout::update_zoneinfo)) {
        throw std::runtime_error(dataset_name(path) + " holds no tz database that can be read");
    }
    return path;
}

// The changes that make the dataset at `path` current and the latest.
imagination::changes imagine_use(const std::string& path) {
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
    return imagination::noted();
}

void set_link(const std::string& path, const std::optional<std::string>& target) {
    if (target) {
        updates::replace_link(*target, path);
    } else {
        files::remove(path);
    }
}

// All of the changes, or none.
void carry_out(const imagination::changes& changes) {
    imagination::forget();
    std::map<std::string, std::optional<std::string>> before;
    try {
        for (const auto& [path, change] : changes) {
            before[path] = target_of(path.c_str());
            const bool link = change.what == imagination::entry::kind::link;
            set_link(path, link ? std::optional(change.target) : std::nullopt);
        }
    } catch (...) {
        for (const auto& [path, target] : before) {
            set_link(path, target);
        }
        throw;
    }
    ::sync();
}

} // namespace

void use(const std::string& version) {
    const updates::work work;
    const std::string path = checked_path(version);
    const auto changes = imagine_use(path);
    if (const auto start = predict_start(); start.dataset != path) {
        throw std::runtime_error("the next start would not keep it. " + start.reason);
    }
    carry_out(changes);
    std::cout << "Current now: " << printable(dataset_name(path)) << ".\n"
              << "Programs that run already keep what they have read.\n";
}

} // namespace tz
