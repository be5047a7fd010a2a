// SPDX-License-Identifier: BSD-2-Clause
#include "dataset/kiv_zoneinfo.h"

#include "fs/layout.h"
#include "fs/operations.h"
#include "platform/warn.h"

namespace tz {

kiv_zoneinfo::kiv_zoneinfo(const std::string& dataset_path)
    : kiv_dataset_component(dataset_path),
      directory_(dataset_path.empty() ? layout::system_zoneinfo
                                      : dataset_path + layout::update_zoneinfo) {
    read_version();
}

void kiv_zoneinfo::read_version() {
    version_ = fs::read_word(directory_ + layout::zoneinfo_version_file);
}

bool kiv_zoneinfo::compatible_schema(const kiv_dataset_component& /*other*/) const {
    return true;
}

void kiv_zoneinfo::make_current() const {
    try {
        fs::remove(layout::zoneinfo_link);
    } catch (...) {
        warn("Unlink of zoneinfo softlink failed");
    }
    fs::create_symlink(directory_, layout::zoneinfo_link);
}

} // namespace tz
