// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

namespace tz {

/// One kind of time-zone data in a dataset: it has a place on disk, an idea of which other data it
/// is compatible with, and a link of its own through which the system finds it.
///
/// Components are owned through shared handles made from the concrete type, which therefore destroy
/// it as what it is; the base cannot be destroyed from outside.
class kiv_dataset_component {
  public:
    /// Whether the system can use this component beside `other`, its counterpart in another
    /// dataset.
    [[nodiscard]] virtual bool compatible_schema(const kiv_dataset_component& other) const = 0;

    /// Makes the system's link for this kind of data name this component. The old link is removed
    /// first; one that cannot be removed is reported by a warning, and creation is tried all the
    /// same. Throws the `errno` value, an `int`, of a link that could not be created.
    virtual void make_current() const = 0;

  protected:
    kiv_dataset_component() = default;
    explicit kiv_dataset_component(const std::string& dataset_path) : dataset_path_(dataset_path) {}
    ~kiv_dataset_component() = default;

    /// Root of the dataset, such as /var/db/timezone/tz/2016f.1.0; empty for the system's own data.
    [[nodiscard]] const std::string& dataset_path() const { return dataset_path_; }

  private:
    std::string dataset_path_;
};

} // namespace tz
