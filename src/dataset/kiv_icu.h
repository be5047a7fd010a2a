// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>
#include <string_view>

#include "dataset/kiv_dataset_component.h"

namespace tz {

/// The ICU time-zone data of a dataset: a directory of data files with one schema, such as 44l. The
/// schema is the version of ICU's data format and a letter for byte order and character set. The
/// system's ICU library reads only data with the schema of its own.
///
/// The system states its schema in a text file, an update in the names of its data files.
class kiv_icu final : public kiv_dataset_component {
  public:
    /// The system's own ICU data.
    kiv_icu() : kiv_icu(std::string()) {}

    /// The ICU data of the update at `dataset_path`; of the system if that is empty. An update
    /// without a schema gives a warning line; a system without one does not. If the walk of the
    /// update's directory cannot begin, warns and throws the `errno` value, an `int`.
    explicit kiv_icu(const std::string& dataset_path);

    /// The schema; empty if none was found.
    [[nodiscard]] const std::string& schema() const { return schema_; }

    /// Whether both schemas are the same, byte for byte. False, with a warning line, if `other` is
    /// not ICU data.
    [[nodiscard]] bool compatible_schema(const kiv_dataset_component& other) const override;

    /// Replaces the ICU link as the base describes, and removes the legacy one. For the system's
    /// own data it creates no link: the ICU library finds that without one.
    void make_current() const override;

  private:
    void initialize();

    std::string schema_;
    std::string directory_;
};

/// The schema in the name of an ICU data file, which must match as a whole:
/// "icutz" [0-9]+ [lbe] ".dat"
/// Returns the text between "icutz" and ".dat", or an empty text if the name does not match.
///
/// Example: icutz44l.dat gives 44l.
[[nodiscard]] std::string_view icu_schema_in_name(std::string_view name);

} // namespace tz
