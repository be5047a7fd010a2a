// SPDX-License-Identifier: BSD-2-Clause
#pragma once

#include <map>
#include <string>
#include <vector>

/// Imagined hands. In tzctl the calls of platform/disk.h, data protection and warn are these: they
/// look at the real disk, but only note what they would change there, answer later looks from their
/// notes (also where a path leads through a link just imagined), and collect the warning lines. So
/// the shared code can be run to see what it would do.
///
/// A change is imagined to succeed unless what lies on the disk forbids it, as it would for root:
/// an entry in the way, a directory, a mount point, a file system mounted read-only, an attribute
/// set by chattr(1). Full disks are not foreseen.
namespace tz::imagination {

/// What is imagined at a place on the disk.
struct entry {
    enum class kind { nothing, link, directory, file } what = kind::nothing; // a file of any sort
    std::string target;                                                      // of a link

    bool operator==(const entry&) const = default;
};

/// Places by their paths, none of which leads through a link.
using changes = std::map<std::string, entry>;

/// Goes back to the disk as it is.
void forget();

/// All that has been changed since.
[[nodiscard]] const changes& noted();

/// The warning lines since the last call, without the program's name, and with a reason only where
/// the last call failed.
[[nodiscard]] std::vector<std::string> take_warnings();

/// Every place, as in `changes`, that is passed on the way to `path`: links, and what they lead to,
/// as far as that is there. Throws std::system_error if that cannot be told.
[[nodiscard]] std::vector<std::string> way_to(const std::string& path);

} // namespace tz::imagination
