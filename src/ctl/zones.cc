// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/zones.h"

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <map>
#include <set>

#include <endian.h>
#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ctl/failure.h"
#include "ctl/tree.h"
#include "fs/descriptor.h"
#include "rehearsal/kernel.h"

namespace tz {
namespace {

constexpr std::time_t half_a_week = 302400;
constexpr off_t largest_file =
    65536; // ten times the largest zone; the C library is slow with large files
constexpr std::size_t most_files = 65536;

using timeline = std::map<std::time_t, local_type>; // what a clock shows from each moment on

struct zone_file {
    bool exists = false;
    bool readable = false;
    std::string contents = {}; // empty unless they begin as a zone's
    timeline types = {};
};

std::string own_path(int descriptor) {
    return "/proc/self/fd/" + std::to_string(descriptor);
}

void add_names(const zone_directory& top, std::set<std::string>& names) {
    tree::for_each_zone_name(top.descriptor, top.path, [&](const std::string& name) {
        if (name != "posixrules") {
            names.insert(name);
        }
        if (names.size() > most_files) {
            refuse(top.path, "too many files");
        }
    });
}

// Whether the file holds all that its headers count, and the last line. Of a truncated file, glibc
// may silently use the rest; musl trusts the counts and crashes.
bool is_whole(const std::string& file) {
    std::size_t at = 0;
    const auto count = [&](std::size_t index) {
        std::uint32_t number = 0;
        std::memcpy(&number, &file[at + 20 + index * 4], 4);
        return std::min<std::size_t>(be32toh(number), file.size());
    };
    for (const std::size_t time : {4U, 8U}) { // its size in the first block, and in the second
        if (file.size() < at + 44) {
            return false;
        }
        at += 44 + count(0) + count(1) + count(2) * (time + 4) + count(3) * (time + 1) +
              count(4) * 6 + count(5);
        if (file[4] == '\0') { // the first version has one block only
            return at <= file.size();
        }
    }
    return at < file.size() && file[at] == '\n' && file.find('\n', at + 1) == file.size() - 1;
}

zone_file look_at(const zone_directory& top, const std::string& name) {
    const std::string path = top.path + "/" + name;
    const fs::descriptor place(kernel::open_beneath(top.descriptor.number(), name));
    const int failure = place.is_open() ? 0 : errno;
    zone_file found{failure != ENOENT && failure != ENOTDIR};
    if (!found.exists || failure == EXDEV || failure == ELOOP) {
        return found; // a link that leads out, or in circles
    }
    check(place.number(), path);
    struct stat status {};
    check(::fstat(place.number(), &status), path);
    if (S_ISREG(status.st_mode) && status.st_size <= largest_file) {
        const fs::descriptor file(
            ::open(own_path(place.number()).c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK));
        check(file.number(), path);
        std::string contents(static_cast<std::size_t>(status.st_size), '\0');
        const auto size = ::read(file.number(), contents.data(), contents.size());
        check(static_cast<int>(size), path);
        contents.resize(static_cast<std::size_t>(size));
        if (contents.starts_with("TZif")) {
            found.readable = is_whole(contents);
            found.contents = contents;
        }
    }
    return found;
}

local_type local_type_at(std::time_t moment) {
    std::tm shown{};
    shown.tm_zone = "";
    ::localtime_r(&moment, &shown);
    return {shown.tm_gmtoff, shown.tm_isdst > 0, {shown.tm_zone, ::strnlen(shown.tm_zone, 32)}};
}

timeline types_between(std::time_t start, std::time_t end) {
    timeline found{{start, local_type_at(start)}};
    auto now = found.begin();
    for (auto low = start, high = start; low < end - 1; low = high) {
        high = std::min(low + half_a_week, end - 1);
        for (const auto type = local_type_at(high); now->second != type;) {
            auto changed = high;
            while (changed - low > 1) {
                const auto middle = low + (changed - low) / 2;
                (local_type_at(middle) == now->second ? low : changed) = middle;
            }
            now = found.emplace(changed, local_type_at(changed)).first;
            low = changed;
        }
    }
    return found;
}

// Makes the C library read zone files, from a copy in memory: it uses the bytes that were checked.
class zone_reader {
  public:
    zone_reader() : copy_(::memfd_create("zone", MFD_CLOEXEC)), path_(own_path(copy_.number())) {
        check(copy_.number(), "cannot copy a file to memory");
        check(::access(path_.c_str(), R_OK), path_); // or every zone would be UTC
    }

    // Sets the types. If the C library refuses the file, or its last line, clocks show UTC with an
    // empty abbreviation, and the file counts as unreadable.
    void read(zone_file& file, std::time_t start, std::time_t end) const {
        use(":"); // otherwise the same name is not read again
        check(::ftruncate(copy_.number(), 0), path_);
        const auto size = file.contents.size();
        check(static_cast<int>(::pwrite(copy_.number(), file.contents.data(), size, 0)), path_);
        use(":" + path_);
        file.types = types_between(start, end);
        file.readable = std::none_of(file.types.begin(), file.types.end(), [](const auto& period) {
            return period.second.abbreviation.empty();
        });
    }

  private:
    static void use(const std::string& zone) {
        check(::setenv("TZ", zone.c_str(), 1), "TZ");
        ::tzset();
    }

    fs::descriptor copy_;
    std::string path_;
};

void compare(const std::string& zone, const timeline& before, const timeline& after,
             std::vector<zone_change>& changed) {
    const auto at = [](const timeline& types, std::time_t moment) {
        return std::prev(types.upper_bound(moment))->second;
    };
    auto either = before;
    either.insert(after.begin(), after.end());
    for (const auto& [moment, type] : either) {
        if (at(before, moment) != at(after, moment)) {
            changed.push_back({zone, moment, at(before, moment), at(after, moment)});
            return;
        }
    }
}

} // namespace

zone_differences compare_zones(const zone_directory& from, const zone_directory& to,
                               std::time_t start, std::time_t end, const zone_progress& progress) {
    std::set<std::string> names;
    add_names(from, names);
    add_names(to, names);
    const zone_reader reader;
    zone_differences found;
    for (std::size_t done = 0; const auto& zone : names) {
        progress(done++, names.size());
        auto before = look_at(from, zone);
        auto after = look_at(to, zone);
        if (before.contents.empty() && after.contents.empty()) {
            continue;
        }
        for (auto* file : {&before, &after}) {
            if (file->readable && before.contents != after.contents) {
                reader.read(*file, start, end);
            }
        }
        if (before.readable && after.readable) {
            found.compared.push_back(zone);
            compare(zone, before.types, after.types, found.changed);
        }
        const auto note = [&zone](auto& list, bool applies) {
            list.insert(list.end(), applies ? 1 : 0, zone);
        };
        note(found.removed, before.readable && !after.exists);
        note(found.added, after.readable && !before.exists);
        note(found.unreadable_before, before.exists && !before.readable);
        note(found.unreadable_after, after.exists && !after.readable);
    }
    return found;
}

} // namespace tz
