// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <optional>
#include <string>
#include <vector>

/// The calls of platform/disk.h, data protection and warn as tzctl has them: they look at the real
/// disk, but only note what they would change there, and collect the warning lines. Later looks
/// take the notes into account, also where a path leads through a link that was only noted. So the
/// code of a start can run without consequences.
///
/// A change succeeds unless the state of the disk forbids it even to root: an entry in the way, a
/// directory, a mount point, a file system mounted read-only, an attribute set by chattr(1). A full
/// disk is not foreseen. Of a file only the first MiB is read, so that nothing on the disk decides
/// how much memory this takes.
namespace tz::imagination {

/// Begins with the disk as it is, and forgets all changes and warnings at its end. Only one exists
/// at a time.
class session {
  public:
    /// Error messages have `image` in front of their paths.
    explicit session(std::string image);
    session(const session&) = delete;
    session& operator=(const session&) = delete;
    ~session();

    /// The whole target of a link; nothing if there is none.
    [[nodiscard]] std::optional<std::string> target_of(const char* link) const;

    /// Whether the path leads to a compiled zone file.
    [[nodiscard]] bool leads_to_zone(const char* path) const;

    /// The warning lines since the last call, without the program's name, each cut off after 4,096
    /// bytes, and with an error only where the last call failed.
    [[nodiscard]] std::vector<std::string> take_warnings();

    /// Throws std::system_error if a look at the disk failed because memory or descriptors ran out,
    /// or because of a disk error or a missing permission. The code of a start may take that for a
    /// missing entry, so its result is then invalid.
    void check() const;

  private:
    std::string image_;
};

} // namespace tz::imagination
