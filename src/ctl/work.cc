// SPDX-License-Identifier: BSD-2-Clause
#include "ctl/work.h"

#include <algorithm>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <unistd.h>

#include "ctl/failure.h"
#include "ctl/interruption.h"
#include "ctl/root.h"
#include "ctl/tree.h"
#include "ctl/updates.h"
#include "fs/layout.h"
#include "platform/disk.h"
#include "rehearsal/kernel.h"
#include "rehearsal/regular_file.h"

namespace tz {
namespace {

constexpr char lock_name[] = ".tzctl.lock";
constexpr char unfinished[] = ".tzctl.use.";

constexpr int directory_flags = O_RDONLY | O_DIRECTORY | O_CLOEXEC;

std::string parent_of(const std::string& path) {
    return path.substr(0, path.find_last_of('/') + 1);
}

std::string name_of(const std::string& path) {
    return path.substr(path.find_last_of('/') + 1);
}

// Nobody but root and the owner of the state directory can open the lock, and so hold it.
fs::descriptor lock(const fs::descriptor& state) {
    const std::string shown = in_image(std::string(layout::state_directory) + lock_name);
    fs::descriptor file(
        ::openat(state.number(), lock_name, O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0600));
    struct stat status {};
    if (file.is_open()) {
        check(::fstat(state.number(), &status), shown);
        [[maybe_unused]] const int result = // fails where not even root may do that
            ::fchown(file.number(), status.st_uid, status.st_gid);
    } else {
        check(errno == EEXIST ? 0 : -1, shown);
        file = open_regular_file(state.number(), lock_name);
        if (!file.is_open() && is_missing()) {
            refuse(shown, "not a regular file");
        }
        check(file.number(), shown);
    }
    if (::flock(file.number(), LOCK_EX | LOCK_NB) == -1) {
        check(errno == EWOULDBLOCK ? 0 : -1, shown);
        refuse(shown, "another tzctl is running");
    }
    return file;
}

// Whether `name` is a link that notes an unfinished use, or may be one that cannot be read.
bool may_be_note(int directory, const std::string& name) {
    char none = 0;
    return name.starts_with(unfinished) &&
           (::readlinkat(directory, name.c_str(), &none, 1) != -1 || errno != EINVAL);
}

// For file systems that cannot do it in one step. Readers find an entry `name` at every moment.
int exchange_in_steps(int directory, const std::string& name, const std::string& other) {
    const auto rename = [&](const std::string& from, const std::string& to) {
        return ::renameat(directory, from.c_str(), directory, to.c_str());
    };
    const std::string former = tree::temporary_name();
    if (::linkat(directory, name.c_str(), directory, former.c_str(), 0) == -1 ||
        rename(other, name) == -1) {
        return -1;
    }
    if (rename(former, other) == 0) {
        return 0;
    }
    const int reason = errno;
    (void)rename(former, name);
    errno = reason;
    return -1;
}

// Both entries change places, or the one that exists takes the place of the other. So the same call
// again undoes it.
int exchange(int directory, const std::string& name, const std::string& other) {
    int result = kernel::exchange(directory, name, other);
    if (result == -1 && kernel::is_unsupported()) {
        result = exchange_in_steps(directory, name, other);
    }
    if (result == -1 && errno == ENOENT) {
        result = kernel::rename_to_free_name(directory, other, name);
    }
    if (result == -1 && errno == ENOENT) {
        result = kernel::rename_to_free_name(directory, name, other);
    }
    return result;
}

// A link to replace. Its successor lies beside it under the name `beside`; after the exchange, its
// predecessor does.
struct replacement {
    explicit replacement(const wanted_link& link)
        : path(link.path), directory(tree::open(parent_of(path))) {
        if (link.target) {
            check(::symlinkat(link.target->c_str(), directory.number(), beside.c_str()),
                  in_image(path));
        }
    }

    [[nodiscard]] int exchange() const {
        return tz::exchange(directory.number(), name_of(path), beside);
    }

    [[nodiscard]] bool is_undone() const { return updates::target_of(path) == former; }

    std::string path;
    std::optional<std::string> former = updates::target_of(path);
    fs::descriptor directory;
    std::string beside = tree::temporary_name();
};

bool is_as(const wanted_link& wanted) {
    return wanted.target ? updates::target_of(wanted.path) == wanted.target
                         : !updates::exists(wanted.path);
}

} // namespace

fs::descriptor open_updates(const fs::descriptor& state) {
    std::string path = layout::updates_directory;
    path.pop_back(); // or a link would be followed
    fs::descriptor updates(
        ::openat(state.number(), name_of(path).c_str(), directory_flags | O_NOFOLLOW));
    if (!updates.is_open() && (errno == ENOTDIR || errno == ELOOP)) {
        refuse(in_image(path), "not a directory (a symbolic link is not followed)");
    }
    check(updates.number(), in_image(path));
    return updates;
}

void imagine(const wanted_link& wanted) {
    const char* const path = wanted.path.c_str();
    check(platform::unlink(path) == 0 || errno == ENOENT ? 0 : -1, in_image(wanted.path));
    check(wanted.target ? platform::symlink(wanted.target->c_str(), path) : 0,
          in_image(wanted.path));
}

std::optional<std::string> unfinished_use() {
    std::optional<std::string> version;
    if (const auto state = tree::open_if_any(layout::state_directory)) {
        tree::for_each_name(*state, in_image(layout::state_directory), [&](const auto& name) {
            if (name.starts_with(unfinished)) {
                const auto target = updates::target_of(layout::state_directory + name);
                version = target ? target : version;
            }
        });
    }
    return version;
}

work::work()
    : state_(tree::open(layout::state_directory)), updates_(open_updates(state_)),
      lock_(lock(state_)) {
    interruption::defer();
    remove_half_made();
}

work::~work() {
    try {
        remove_half_made();
    } catch (const std::exception&) {
        // The next one tries again.
    }
}

void work::replace(const std::vector<wanted_link>& wanted, const std::string& version) const {
    std::vector<replacement> all;
    for (const auto& link : wanted) { // first all that needs space on the disk
        if (!is_as(link)) {
            all.emplace_back(link);
        }
    }
    const std::string note = tree::temporary_name(unfinished);
    auto next = all.begin();
    try {
        if (!version.empty()) {
            note_unfinished_use(version, note);
        }
        for (; next != all.end(); ++next) {
            check(next->exchange(), in_image(next->path));
        }
        for (const auto& link : all) {
            check(::fsync(link.directory.number()), in_image(parent_of(link.path)));
        }
    } catch (...) {
        while (next != all.begin()) {
            (void)(--next)->exchange();
        }
        if (std::all_of(all.begin(), all.end(), [](const auto& one) { return one.is_undone(); })) {
            (void)::unlinkat(state_.number(), note.c_str(), 0);
        }
        throw;
    }
    forget_unfinished_use();
}

void work::note_unfinished_use(const std::string& version, const std::string& note) const {
    check(::symlinkat(version.c_str(), state_.number(), note.c_str()),
          in_image(layout::state_directory));
    check(::fsync(state_.number()), in_image(layout::state_directory));
}

void work::forget_unfinished_use() const try {
    tree::for_each_name(state_, in_image(layout::state_directory), [&](const auto& name) {
        if (name.starts_with(unfinished)) {
            (void)::unlinkat(state_.number(), name.c_str(), 0);
        }
    });
} catch (const std::exception&) {
    // So it is completed once more.
}

void work::remove_half_made() const {
    const auto above = tree::open(parent_of(layout::legacy_icu_link));
    for (const auto* directory : {&state_, &updates_, &above}) {
        const int in = directory->number();
        tree::for_each_name(*directory, in_image(layout::state_directory), [&](const auto& name) {
            const bool stays = directory == &state_ && (name == lock_name || may_be_note(in, name));
            if ((name + ".").starts_with(tree::half_made) && !stays) {
                (void)tree::remove(in, name, name, [](const std::string&) {});
            }
        });
    }
}

} // namespace tz
