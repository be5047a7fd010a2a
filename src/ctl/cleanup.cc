// SPDX-License-Identifier: BSD-2-Clause
#include <cstring>
#include <iomanip>
#include <iostream>

#include "ctl/failure.h"
#include "ctl/interruption.h"
#include "ctl/root.h"
#include "ctl/text.h"
#include "ctl/tree.h"
#include "ctl/updates.h"
#include "ctl/verbs.h"
#include "ctl/work.h"
#include "fs/layout.h"
#include "rehearsal/kernel.h"

namespace tz {
namespace {

void report(const std::string& path) {
    std::cerr << "tzctl: " << printable(path) << ": "
              << (errno == EXDEV ? "a mount point" : std::strerror(errno)) << '\n';
}

double size_of(const fs::descriptor& updates, const std::string& version) {
    const std::string shown = in_image(updates::path_of(version));
    const auto update = tree::open_directory(updates.number(), version, shown);
    return update ? tree::size(*update, shown) : 0;
}

// A reader finds all of the update or nothing.
bool delete_update(const fs::descriptor& updates, const std::string& version) {
    const std::string name = tree::temporary_name();
    if (kernel::rename_to_free_name(updates.number(), version, name) == -1) {
        report(in_image(updates::path_of(version)));
        return false;
    }
    if (!tree::remove(updates.number(), name, in_image(updates::path_of(name)), report)) {
        std::cerr << "tzctl: " << printable(in_image(updates::path_of(version)))
                  << ": partly deleted, the rest is now in " << name << '\n';
        return false;
    }
    return true;
}

// Deletes what can be deleted, and returns whether that is everything.
bool delete_unused(const fs::descriptor& updates, bool rehearsed) {
    constexpr double mega = 1e6;
    double freed = 0;
    bool complete = true;
    const auto unused = updates::removable(updates);
    std::cout << std::fixed << std::setprecision(1);
    for (const auto& version : unused) {
        interruption::check();
        try {
            const double size = size_of(updates, version);
            if (!rehearsed && !delete_update(updates, version)) {
                complete = false;
                continue;
            }
            freed += size;
            std::cout << (rehearsed ? "Would delete update " : "Deleted update ") << version << ": "
                      << size / mega << " MB\n";
        } catch (const std::exception& error) {
            std::cerr << "tzctl: " << printable(error.what()) << '\n';
            complete = false;
        }
    }
    if (unused.empty()) {
        std::cout << "There is no update to delete.\n";
    } else {
        std::cout << (rehearsed ? "That would free " : "That frees ") << freed / mega << " MB.\n";
    }
    return complete;
}

} // namespace

bool clean_up(bool rehearsed) {
    if (rehearsed) {
        if (const auto version = unfinished_use()) {
            refuse("\"use " + *version + "\"", "was interrupted: a clean-up completes that first");
        }
        return delete_unused(open_updates(tree::open(layout::state_directory)), rehearsed);
    }
    const work work;
    finish_interrupted_use(work);
    return delete_unused(work.updates(), rehearsed);
}

} // namespace tz
