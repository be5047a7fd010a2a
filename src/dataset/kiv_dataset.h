// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "dataset/kiv_dataset_component.h"
#include "dataset/kiv_icu.h"
#include "version/data_version.h"

namespace tz {

/// One complete set of time-zone data: the system's own, or an installed update, which is a
/// directory named by its version, such as /var/db/timezone/tz/2016f.1.0. The constructor reads the
/// disk; only make_current() changes it.
class kiv_dataset {
  public:
    /// The system's own data. Its version is the word in "+VERSION" followed by ".1.0".
    kiv_dataset() : kiv_dataset(std::string()) {}

    /// The update at `path`; the system's own data if `path` is empty. A path that names no update
    /// gives a warning line and throws std::invalid_argument. Missing data or a malformed version
    /// is no error. Also throws what data_version and the components throw.
    explicit kiv_dataset(const std::string& path);

    /// The version as text, for messages and records. For an update: the part of its path below the
    /// directory of updates.
    [[nodiscard]] std::string version_string() const { return version_string_; }

    [[nodiscard]] const data_version& version() const { return version_; }

    /// The schema of the ICU data; empty if none was found.
    [[nodiscard]] const std::string& schema() const {
        return dynamic_cast<const kiv_icu&>(*components_.back()).schema();
    }

    /// Whether each component finds its counterpart in `other` compatible.
    [[nodiscard]] bool compatible_with(const kiv_dataset& other) const;

    /// Makes every component current, the tz database first. Throws the first failure at once; the
    /// links of later components then stay as they were.
    void make_current() const;

    /// Whether both have the same path, byte for byte.
    friend bool operator==(const kiv_dataset& left, const kiv_dataset& right);

    /// Strictly newer, by version.
    friend bool operator>(const kiv_dataset& left, const kiv_dataset& right);

  private:
    void create_components();

    data_version version_;
    std::string version_string_;
    std::string path_;
    std::vector<std::shared_ptr<kiv_dataset_component>> components_;
};

/// Makes the system's own data current. Throws what the constructor and make_current() throw.
void reset_to_system_partition();

} // namespace tz
