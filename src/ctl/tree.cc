// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/tree.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <climits>
#include <cstdio>
#include <filesystem>
#include <memory>
#include <random>
#include <sstream>
#include <string_view>

#include <dirent.h>
#include <fcntl.h>
#include <sys/sendfile.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ctl/failure.h"
#include "ctl/interruption.h"
#include "ctl/root.h"
#include "rehearsal/kernel.h"
#include "rehearsal/regular_file.h"

namespace tz::tree {
namespace {

constexpr int directory_flags = O_RDONLY | O_DIRECTORY | O_CLOEXEC;
constexpr int most_levels = 8; // of directories, each of which takes a descriptor

struct listing_closer {
    void operator()(DIR* listing) const { ::closedir(listing); }
};

// An entry somewhere below a directory.
struct item {
    int directory;           // in which it is
    const std::string& name; // there
    const std::string& path; // from where the walk began
    struct stat status;
    int levels; // of directories that may still follow
};

enum class next { descend, skip, stop };

bool is_same(const struct stat& one, const struct stat& other) {
    return one.st_dev == other.st_dev && one.st_ino == other.st_ino;
}

void for_each_name(fs::descriptor directory, const std::string& shown,
                   const std::function<void(int, const std::string&)>& act) {
    check(directory.number(), shown);
    const std::unique_ptr<DIR, listing_closer> listing(::fdopendir(directory.number()));
    check(listing ? 0 : -1, shown);
    const int number = directory.release(); // closed with the listing
    for (;;) {
        errno = 0;
        const dirent* const entry = ::readdir(listing.get());
        if (entry == nullptr) {
            return check(errno == 0 ? 0 : -1, shown);
        }
        const std::string name = entry->d_name;
        if (name != "." && name != "..") {
            act(number, name);
        }
    }
}

// Visits every entry, a directory before what is in it; returns whether a visit returned stop.
bool walk(fs::descriptor directory, const std::string& shown, const std::string& parent, int levels,
          const std::function<next(const item&)>& visit) {
    bool stopped = false;
    for_each_name(std::move(directory), shown + "/" + parent, [&](int in, const std::string& name) {
        const std::string path = parent + name;
        struct stat status {};
        if (stopped) {
            return;
        }
        check(::fstatat(in, name.c_str(), &status, AT_SYMLINK_NOFOLLOW), shown + "/" + path);
        const next wanted = visit({in, name, path, status, levels});
        stopped = wanted == next::stop;
        if (!S_ISDIR(status.st_mode) || wanted != next::descend || levels == 0) {
            return;
        }
        fs::descriptor child(::openat(in, name.c_str(), directory_flags | O_NOFOLLOW));
        struct stat opened {};
        check(child.number(), shown + "/" + path);
        check(::fstat(child.number(), &opened), shown + "/" + path);
        if (!is_same(status, opened)) {
            refuse(shown + "/" + path, "changed while it was read");
        }
        stopped = walk(std::move(child), shown, path + "/", levels - 1, visit);
    });
    return stopped;
}

bool walk(const fs::descriptor& directory, const std::string& shown,
          const std::function<next(const item&)>& visit) {
    return walk(fs::descriptor(::openat(directory.number(), ".", directory_flags)), shown, "",
                most_levels, visit);
}

std::string target_of(int directory, const std::string& link, const std::string& shown) {
    std::array<char, PATH_MAX> target{};
    const ssize_t length = ::readlinkat(directory, link.c_str(), target.data(), target.size());
    check(length, shown);
    return {target.data(), static_cast<std::size_t>(length)};
}

void copy_file(const item& file, int copy, const std::string& shown) {
    const fs::descriptor source = open_regular_file(file.directory, file.name);
    struct stat status {};
    check(source.number(), shown);
    check(::fstat(source.number(), &status), shown);
    if (!is_same(status, file.status)) {
        refuse(shown, "changed during the copy");
    }
    const fs::descriptor target(
        ::openat(copy, file.path.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0644));
    check(target.number(), shown);
    constexpr off_t most_at_once = 1 << 24; // so that an interruption does not wait long
    for (off_t rest = status.st_size; rest > 0;) {
        interruption::check();
        const ssize_t copied = ::sendfile(target.number(), source.number(), nullptr,
                                          static_cast<std::size_t>(std::min(rest, most_at_once)));
        check(copied, shown);
        if (copied == 0) {
            refuse(shown, "changed during the copy");
        }
        rest -= copied;
    }
}

void copy_item(const item& entry, int copy, const std::string& shown) {
    switch (entry.status.st_mode & S_IFMT) {
    case S_IFDIR:
        if (entry.levels == 0) {
            refuse(shown, "too many levels of directories");
        }
        return check(::mkdirat(copy, entry.path.c_str(), 0755), shown);
    case S_IFREG: return copy_file(entry, copy, shown);
    case S_IFLNK:
        return check(::symlinkat(target_of(entry.directory, entry.name, shown).c_str(), copy,
                                 entry.path.c_str()),
                     shown);
    default: refuse(shown, "neither a file, a directory nor a symbolic link");
    }
}

// For the complete copy, which nobody else can change.
void check_links(const fs::descriptor& copy, const std::string& shown) {
    (void)walk(copy, shown, [&](const item& entry) {
        if (S_ISLNK(entry.status.st_mode) &&
            !fs::descriptor(kernel::open_beneath(copy.number(), entry.path)).is_open()) {
            const bool out = errno == EXDEV || errno == ELOOP || errno == ENAMETOOLONG;
            check(out || is_missing() ? 0 : -1, shown + "/" + entry.path);
            refuse(shown + "/" + entry.path,
                   "a symbolic link that leads out of the dataset or nowhere");
        }
        return next::descend;
    });
}

bool have_same_contents(const fs::descriptor& one, const fs::descriptor& other,
                        const std::string& shown) {
    std::array<char, 1 << 16> mine;   // NOLINT(*-member-init): read fills them
    std::array<char, 1 << 16> theirs; // NOLINT(*-member-init)
    for (;;) {
        const ssize_t length = ::read(one.number(), mine.data(), mine.size());
        check(length, shown);
        const auto wanted = static_cast<std::size_t>(length);
        const ssize_t found = ::read(other.number(), theirs.data(), length == 0 ? 1 : wanted);
        check(found, shown);
        if (found != length || !std::equal(mine.begin(), mine.begin() + length, theirs.begin())) {
            return false;
        }
        if (length == 0) {
            return true;
        }
    }
}

bool is_equal(const item& entry, const fs::descriptor& own, const std::string& shown) {
    struct stat status {};
    if (::fstatat(own.number(), entry.path.c_str(), &status, AT_SYMLINK_NOFOLLOW) == -1) {
        check(is_missing() ? 0 : -1, shown);
        return false;
    }
    if ((status.st_mode & S_IFMT) != (entry.status.st_mode & S_IFMT)) {
        return false;
    }
    if (S_ISLNK(status.st_mode)) {
        return target_of(entry.directory, entry.name, shown) ==
               target_of(own.number(), entry.path, shown);
    }
    if (!S_ISREG(status.st_mode)) {
        return S_ISDIR(status.st_mode);
    }
    const fs::descriptor theirs = open_regular_file(entry.directory, entry.name);
    check(theirs.number(), shown);
    const fs::descriptor mine = open_regular_file(own.number(), entry.path);
    check(mine.number(), shown);
    return have_same_contents(theirs, mine, shown);
}

// Visits every entry but directories where programs look for zones, until a visit returns true.
bool walk_zones(const fs::descriptor& zoneinfo, const std::string& shown,
                const std::function<bool(const item&)>& visit) {
    return walk(zoneinfo, shown, [&](const item& entry) {
        return S_ISDIR(entry.status.st_mode)
                   ? (entry.path == "posix" || entry.path == "right" ? next::skip : next::descend)
               : visit(entry) ? next::stop
                              : next::descend;
    });
}

// Removes entries. Moves what lies too deep up to the top directory, and removes it from there.
class remover {
  public:
    remover(int top, const std::function<void(const std::string&)>& failed)
        : top_(top), failed_(failed) {}

    bool remove_with_all_levels(const std::string& name, const std::string& shown) {
        bool all = remove(top_, name, shown, most_levels);
        while (!moved_up_.empty()) {
            const std::string next = moved_up_.back();
            moved_up_.pop_back();
            all = remove(top_, next, shown, most_levels) && all;
        }
        return all;
    }

  private:
    bool remove(int directory, const std::string& name, const std::string& shown, int levels) {
        if (::unlinkat(directory, name.c_str(), 0) == 0 || is_missing()) {
            return true;
        }
        if (errno != EISDIR) {
            return stays(shown);
        }
        if (levels == 0) {
            moved_up_.push_back(temporary_name());
            return ::renameat(directory, name.c_str(), top_, moved_up_.back().c_str()) == 0 ||
                   stays(shown);
        }
        fs::descriptor child(kernel::open_directory_on_same_mount(directory, name));
        return (child.is_open() || stays(shown)) &&
               remove_all_in(std::move(child), shown, levels - 1) &&
               (::unlinkat(directory, name.c_str(), AT_REMOVEDIR) == 0 || stays(shown));
    }

    bool remove_all_in(fs::descriptor directory, const std::string& shown, int levels) try {
        bool all = true;
        for_each_name(std::move(directory), shown, [&](int in, const std::string& name) {
            all = remove(in, name, shown + "/" + name, levels) && all;
        });
        return all;
    } catch (const std::system_error& error) {
        errno = error.code().value();
        return stays(shown);
    }

    bool stays(const std::string& shown) {
        failed_(shown);
        return false;
    }

    int top_;
    std::vector<std::string> moved_up_;
    const std::function<void(const std::string&)>& failed_;
};

} // namespace

fs::descriptor open(const std::string& path) {
    fs::descriptor directory(::open(path.c_str(), directory_flags));
    check(directory.number(), in_image(path));
    return directory;
}

std::optional<fs::descriptor> open_if_any(const std::string& path) {
    fs::descriptor directory(::open(path.c_str(), directory_flags));
    if (!directory.is_open() && is_missing()) {
        return std::nullopt;
    }
    check(directory.number(), in_image(path));
    return directory;
}

std::optional<fs::descriptor> open_directory(int directory, const std::string& path,
                                             const std::string& shown) {
    std::optional<fs::descriptor> at;
    std::istringstream elements(path);
    for (std::string name; std::getline(elements, name, '/');) {
        if (name == "..") {
            return std::nullopt;
        }
        at = fs::descriptor(
            ::openat(at ? at->number() : directory, name.c_str(), directory_flags | O_NOFOLLOW));
        if (!at->is_open()) {
            check(is_missing() || errno == ELOOP || errno == ENAMETOOLONG ? 0 : -1, shown);
            return std::nullopt;
        }
    }
    return at;
}

std::string own_name(const fs::descriptor& directory, const std::string& path) {
    std::error_code failure;
    const auto whole = std::filesystem::canonical(path, failure);
    if (failure) {
        throw std::system_error(failure, path);
    }
    struct stat opened {};
    struct stat named {};
    check(::fstat(directory.number(), &opened), path);
    check(::lstat(whole.c_str(), &named), path);
    if (!is_same(opened, named)) {
        refuse(path, "changed while it was read");
    }
    return whole.filename();
}

void for_each_name(const fs::descriptor& directory, const std::string& shown,
                   const std::function<void(const std::string&)>& act) {
    for_each_name(fs::descriptor(::openat(directory.number(), ".", directory_flags)), shown,
                  [&](int, const std::string& name) { act(name); });
}

void copy(const fs::descriptor& source, const fs::descriptor& copy, const std::string& shown) {
    struct stat top {};
    check(::fstat(source.number(), &top), shown);
    (void)walk(source, shown, [&](const item& entry) {
        interruption::check();
        const std::string path = shown + "/" + entry.path;
        const mode_t needed = S_IROTH | (S_ISDIR(entry.status.st_mode) ? S_IXOTH : 0);
        if (entry.status.st_uid != top.st_uid && (entry.status.st_mode & needed) != needed) {
            refuse(path, "readable only by another user than the dataset's owner");
        }
        copy_item(entry, copy.number(), path);
        return next::descend;
    });
    check_links(copy, shown);
    if (!equal(source, copy, shown)) {
        refuse(shown, "changed during the copy");
    }
}

bool equal(const fs::descriptor& theirs, const fs::descriptor& own, const std::string& shown) {
    std::size_t in_theirs = 0;
    std::size_t in_own = 0;
    const bool differs = walk(theirs, shown, [&](const item& entry) {
        interruption::check();
        ++in_theirs;
        return is_equal(entry, own, shown + "/" + entry.path) ? next::descend : next::stop;
    });
    (void)walk(own, shown, [&](const item& /*entry*/) {
        ++in_own;
        return next::descend;
    });
    return !differs && in_theirs == in_own;
}

bool is_zone(int directory, const std::string& name, const std::string& shown) {
    struct stat status {};
    check(::fstatat(directory, name.c_str(), &status, AT_SYMLINK_NOFOLLOW), shown);
    if (status.st_size == 0) { // like most files in /proc; opening one may have effects
        return false;
    }
    const fs::descriptor file = open_regular_file(directory, name);
    std::array<char, 4> magic{};
    check(file.number(), shown);
    const ssize_t length = ::read(file.number(), magic.data(), magic.size());
    check(length, shown);
    return std::string_view(magic.data(), static_cast<std::size_t>(length)) == "TZif";
}

bool holds_zones(const fs::descriptor& zoneinfo, const std::string& shown) {
    return walk_zones(zoneinfo, shown, [&](const item& entry) {
        return S_ISREG(entry.status.st_mode) &&
               is_zone(entry.directory, entry.name, shown + "/" + entry.path);
    });
}

bool holds_zones(const std::string& zoneinfo) {
    const fs::descriptor directory(::open(zoneinfo.c_str(), directory_flags));
    const bool nowhere = is_missing() || errno == ELOOP || errno == ENAMETOOLONG;
    check(directory.is_open() || nowhere ? 0 : -1, in_image(zoneinfo));
    return directory.is_open() && holds_zones(directory, in_image(zoneinfo));
}

void for_each_zone_name(const fs::descriptor& zoneinfo, const std::string& shown,
                        const std::function<void(const std::string&)>& act) {
    (void)walk_zones(zoneinfo, shown, [&](const item& entry) {
        act(entry.path);
        return false;
    });
}

double size(const fs::descriptor& directory, const std::string& shown) {
    double bytes = 0;
    (void)walk(directory, shown, [&](const item& entry) {
        const auto names = S_ISDIR(entry.status.st_mode) ? 1 : entry.status.st_nlink;
        bytes += static_cast<double>(entry.status.st_blocks) * 512 / static_cast<double>(names);
        return next::descend;
    });
    return bytes;
}

bool remove(int directory, const std::string& name, const std::string& shown,
            const std::function<void(const std::string&)>& failed) {
    return remover(directory, failed).remove_with_all_levels(name, shown);
}

std::string temporary_name(const std::string& prefix) {
    std::array<char, 9> digits{};
    (void)std::snprintf(digits.data(), digits.size(), "%08x", std::random_device()());
    return prefix + digits.data();
}

} // namespace tz::tree
