// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <filesystem>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <vector>

#include "fs/descriptor.h"

/// What the updater's verbs do to the disk, in earnest. Refusals and failures are thrown as
/// std::exception, whose text is for people.
namespace tz::updates {

/// The name that what is half-made or half-deleted has in the directory of updates.
inline constexpr char staging[] = ".tzctl";

/// The directory of the update of this version; the path of the system's own data is empty.
[[nodiscard]] std::string path_of(const std::string& version);

/// The directories of the installed updates in the order of their names; a link to one counts, too.
[[nodiscard]] std::vector<std::filesystem::path> installed();

/// The installed updates by which no link of the state directory leads, and that are directories
/// themselves. Throws while that cannot be told.
[[nodiscard]] std::vector<std::filesystem::path> removable();

/// The first bytes of the regular file at `path`, at most as many; nothing if there is none, or it
/// cannot be read.
[[nodiscard]] std::optional<std::string> first_bytes(const std::string& path, std::size_t most);

/// Whether there is a compiled zone file in `directory` or below.
[[nodiscard]] bool holds_zones(const std::string& directory);

/// Links by their paths, with their targets; without one there is to be no link. The order is that
/// in which they are replaced, with zoneinfo before icutz, as a start does.
using links = std::map<std::string, std::optional<std::string>, std::greater<>>;

/// Replaces each link in one step: nobody ever finds none where one was and will be. If that fails,
/// all are as before.
void replace(const links& wanted);

/// As long as this lives, no other tzctl changes anything, no interruption ends this one before it
/// has put things in order, and the working directory is that of the updates: it may belong to
/// somebody who puts a link in its place meanwhile. Nothing half-made is there before or after.
class work {
  public:
    work();
    work(const work&) = delete;
    work& operator=(const work&) = delete;
    ~work();

    /// Goes back to the directory of updates.
    void return_to_updates() const;

  private:
    fs::descriptor lock_;
    fs::descriptor updates_;
};

/// Throws if there was an interruption during the work.
void end_if_interrupted();

} // namespace tz::updates
