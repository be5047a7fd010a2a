// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/use.h"

#include <filesystem>
#include <iostream>

#include <unistd.h>

#include "ctl/imagination.h"
#include "ctl/prediction.h"
#include "ctl/text.h"
#include "ctl/updates.h"
#include "dataset/kiv_dataset.h"
#include "fs/layout.h"
#include "fs/operations.h"

namespace tz {
namespace {

namespace files = std::filesystem;
using updates::refusal;

std::string checked_path(const std::string& version) {
    if (version == "system") {
        return {};
    }
    const std::string path = updates::path_of(version);
    if (files::path(version).filename() != version || !files::is_directory(path)) {
        throw refusal(version + " is not installed");
    }
    return path;
}

void check_zones(const std::string& path) {
    if (!updates::holds_zones(path.empty() ? layout::system_zoneinfo
                                           : path + layout::update_zoneinfo)) {
        throw refusal(dataset_name(path) + " holds no tz database that can be read");
    }
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
        throw refusal(said.empty() ? "its version cannot be read" : said.back());
    }
    return imagination::noted();
}

void check_kept(const std::string& path) {
    const auto start = predict_start();
    if (start.dataset != path) {
        throw refusal("the next start would not keep it. " + start.reason);
    }
}

imagination::entry on_disk(const files::path& path) {
    const auto status = files::symlink_status(path);
    if (files::is_symlink(status)) {
        return {imagination::entry::kind::link, files::read_symlink(path)};
    }
    return {files::exists(status) ? imagination::entry::kind::file
                                  : imagination::entry::kind::nothing,
            {}};
}

void carry_out(const files::path& path, const imagination::entry& change) {
    if (change.what == imagination::entry::kind::link) {
        updates::replace_link(change.target, path);
    } else if (change.what == imagination::entry::kind::nothing) {
        files::remove(path);
    }
}

// All of the changes, or none.
void carry_out(const imagination::changes& changes) {
    imagination::changes before;
    try {
        for (const auto& [path, change] : changes) {
            if (auto was = on_disk(path); was != change) {
                before[path] = std::move(was);
                carry_out(path, change);
            }
        }
    } catch (...) {
        for (const auto& [path, was] : before) {
            carry_out(path, was);
        }
        throw;
    }
    ::sync();
}

} // namespace

void use(const std::string& version) {
    const updates::work work;
    const std::string path = checked_path(version);
    check_zones(path);
    const auto changes = imagine_use(path);
    check_kept(path);
    carry_out(changes);
    std::cout << "Current now: " << printable(dataset_name(path)) << ".\n"
              << "Programs that run already keep what they have read.\n";
}

} // namespace tz
