// SPDX-License-Identifier: BSD-2-Clause
#include "dataset/kiv_dataset.h"

#include <algorithm>
#include <stdexcept>
#include <string_view>

#include "dataset/kiv_icu.h"
#include "dataset/kiv_zoneinfo.h"
#include "fs/layout.h"
#include "platform/warn.h"

namespace tz {

kiv_dataset::kiv_dataset(const std::string& path) : path_(path) {
    create_components();
}

void kiv_dataset::create_components() {
    const auto zoneinfo = std::make_shared<kiv_zoneinfo>(path_);
    if (path_.empty()) {
        version_string_ = zoneinfo->version() + ".1.0";
    } else {
        constexpr std::string_view prefix = layout::updates_directory;
        if (!path_.starts_with(prefix) || path_.size() == prefix.size()) {
            warn("kiv_dataset::create_components: bad path %s", path_.c_str());
            throw std::invalid_argument("badpath");
        }
        version_string_ = path_.substr(prefix.size());
    }
    version_.parse(version_string_);
    components_.push_back(zoneinfo);
    components_.push_back(std::make_shared<kiv_icu>(path_));
}

bool kiv_dataset::compatible_with(const kiv_dataset& other) const {
    return std::equal(
        components_.begin(), components_.end(), other.components_.begin(), other.components_.end(),
        [](const auto& mine, const auto& theirs) { return mine->compatible_schema(*theirs); });
}

void kiv_dataset::make_current() const {
    for (const auto& component : components_) {
        component->make_current();
    }
}

bool operator==(const kiv_dataset& left, const kiv_dataset& right) {
    return left.path_ == right.path_;
}

bool operator>(const kiv_dataset& left, const kiv_dataset& right) {
    return left.version_ > right.version_;
}

void reset_to_system_partition() {
    kiv_dataset().make_current();
}

} // namespace tz
