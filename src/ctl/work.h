// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>
#include <vector>

#include "fs/descriptor.h"

namespace tz {

/// A link to replace: its path and its new target. Without a target, it is removed.
struct wanted_link {
    std::string path;
    std::optional<std::string> target;
};

/// Replaces the link in the simulation. Throws the error that would prevent that on the disk.
void imagine(const wanted_link& wanted);

/// The version that a killed tzctl was about to make current.
[[nodiscard]] std::optional<std::string> unfinished_use();

/// Opens the directory of updates in the state directory. Throws also if it is a symbolic link,
/// which could lead root to somewhere else.
[[nodiscard]] fs::descriptor open_updates(const fs::descriptor& state);

/// While this exists, no other tzctl changes anything, and an interruption ends this one only in
/// interruption::check(). Everything half-made has a temporary name. The constructor and the
/// destructor remove it, also what a killed tzctl left. What they cannot remove does no harm.
class work {
  public:
    /// Throws std::exception if another tzctl is running, or as open_updates.
    work();
    work(const work&) = delete;
    work& operator=(const work&) = delete;
    ~work();

    [[nodiscard]] const fs::descriptor& updates() const { return updates_; }

    /// Replaces the links in their order, each in one step: a reader always finds what was there or
    /// what will be. What was there may be of any type but a directory. After a failure everything
    /// is as before. With a `version`, that is noted meanwhile as the unfinished use.
    void replace(const std::vector<wanted_link>& wanted, const std::string& version = "") const;

    void forget_unfinished_use() const;

  private:
    void note_unfinished_use(const std::string& version, const std::string& note) const;
    void remove_half_made() const;

    fs::descriptor state_;
    fs::descriptor updates_;
    fs::descriptor lock_;
};

} // namespace tz
