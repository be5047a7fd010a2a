// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <filesystem>
#include <string>
#include <vector>

#include "fs/descriptor.h"

/// What the updater's verbs do to the disk, in earnest. Failures are thrown as std::exception,
/// whose text is for people.
namespace tz::updates {

/// Where a directory of updates keeps what is half-made or half-deleted.
[[nodiscard]] std::filesystem::path staging_directory();

/// The directory of the update of this version; the path of the system's own data is empty.
[[nodiscard]] std::string path_of(const std::string& version);

/// The directories of the installed updates in the order of their names; a link to one counts, too.
[[nodiscard]] std::vector<std::filesystem::path> installed();

/// The installed updates into which no link of the state directory leads, and that are directories
/// themselves. Throws while that cannot be told.
[[nodiscard]] std::vector<std::filesystem::path> removable();

/// Whether there is a compiled zone file in `directory` or below.
[[nodiscard]] bool holds_zones(const std::filesystem::path& directory);

/// Makes the link `path` say `target`, in one step: nobody ever finds no link there.
void replace_link(const std::string& target, const std::filesystem::path& path);

/// As long as this lives, no other tzctl changes anything, and no interruption ends this one before
/// it has put things in order. Nothing half-made is there before or after.
class work {
  public:
    work();
    work(const work&) = delete;
    work& operator=(const work&) = delete;
    ~work();

  private:
    fs::descriptor lock_;
};

/// Throws if there was an interruption during the work.
void end_if_interrupted();

} // namespace tz::updates
