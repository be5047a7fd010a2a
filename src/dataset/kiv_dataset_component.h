// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>

namespace tz {

/// One kind of time-zone data in a dataset, with a directory, a notion of compatibility, and a link
/// of its own through which the system finds it.
///
/// The destructor is protected and not virtual: components are owned through shared_ptr made from
/// the concrete type, which calls the concrete destructor.
class kiv_dataset_component {
  public:
    /// Whether a system whose own component is `other` can use this one.
    [[nodiscard]] virtual bool compatible_schema(const kiv_dataset_component& other) const = 0;

    /// Replaces the system's link for this kind of data by a link to this component. If the old
    /// link cannot be removed, warns and still tries to create the new one. If that fails, throws
    /// the `errno` value, an `int`.
    virtual void make_current() const = 0;

  protected:
    kiv_dataset_component() = default;
    explicit kiv_dataset_component(const std::string& dataset_path) : dataset_path_(dataset_path) {}
    ~kiv_dataset_component() = default;

    /// The dataset's directory, such as /var/db/timezone/tz/2016f.1.0; empty for the system's own.
    [[nodiscard]] const std::string& dataset_path() const { return dataset_path_; }

  private:
    std::string dataset_path_;
};

} // namespace tz
