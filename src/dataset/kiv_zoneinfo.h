// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

#include "dataset/kiv_dataset_component.h"

namespace tz {

/// The compiled tz database of a dataset: a directory of zone files and a file "+VERSION", whose
/// first word is the release, such as 2016a.
class kiv_zoneinfo final : public kiv_dataset_component {
  public:
    /// The system's own tz database.
    kiv_zoneinfo() : kiv_zoneinfo(std::string()) {}

    /// The tz database of the update at `dataset_path`; of the system if that is empty. Missing
    /// data is no error.
    explicit kiv_zoneinfo(const std::string& dataset_path);

    /// The release; empty if "+VERSION" is missing, unreadable or contains no word.
    [[nodiscard]] std::string version() const { return version_; }

    /// Always true: the C library reads compiled zones of every release.
    [[nodiscard]] bool compatible_schema(const kiv_dataset_component& other) const override;

    /// Replaces the zoneinfo link as the base describes.
    void make_current() const override;

  private:
    void read_version();

    std::string directory_;
    std::string version_;
};

} // namespace tz
