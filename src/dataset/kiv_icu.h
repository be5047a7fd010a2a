// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <string>
#include <string_view>

#include "dataset/kiv_dataset_component.h"

namespace tz {

/// The ICU time-zone data of a dataset: a directory of data files that all follow one schema, such
/// as 44l: ICU's data format version and a letter for the byte order and character set of its
/// files. The system's ICU library reads the schema of its own data only.
///
/// The system states its schema in a text file; an update by the names of its data files.
class kiv_icu final : public kiv_dataset_component {
  public:
    /// The system's own ICU data.
    kiv_icu() : kiv_icu(std::string()) {}

    /// The ICU data of the update at `dataset_path`; of the system if that is empty. An update
    /// without a schema gives a warning line, the system without one does not. Throws the `errno`
    /// value, an `int`, after a warning line, if the update's directory cannot be walked at all.
    explicit kiv_icu(const std::string& dataset_path);

    /// The schema; empty if none was found.
    [[nodiscard]] const std::string& schema() const { return schema_; }

    /// Whether both schemas are the same, byte for byte. False, with a warning line, if `other` is
    /// of another kind.
    [[nodiscard]] bool compatible_schema(const kiv_dataset_component& other) const override;

    /// Replaces the ICU link, as the base says; and removes its legacy form. For the system's own
    /// data no link is created: the ICU library finds that without one.
    void make_current() const override;

  private:
    void initialize();

    std::string schema_;
    std::string directory_;
};

/// The schema in the name of an ICU data file: the whole of it must be
/// "icutz" [0-9]+ [lbe] ".dat"
/// and the text between "icutz" and ".dat" is returned; empty otherwise.
///
/// Example: icutz44l.dat gives 44l.
[[nodiscard]] std::string_view icu_schema_in_name(std::string_view name);

} // namespace tz
