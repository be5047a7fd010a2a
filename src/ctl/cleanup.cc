// SPDX-License-Identifier: BSD-2-Clause
#include <filesystem>
#include <iomanip>
#include <iostream>
#include <optional>
#include <set>
#include <utility>

#include <sys/stat.h>

#include "ctl/text.h"
#include "ctl/updates.h"
#include "ctl/verbs.h"

namespace tz {
namespace {

namespace files = std::filesystem;

// In MB: what the files in `directory` and below take, each of which may have several names.
double size_of(const files::path& directory) {
    double bytes = 0;
    std::set<std::pair<dev_t, ino_t>> counted;
    for (const auto& entry : files::recursive_directory_iterator(directory)) {
        struct stat status {};
        if (::lstat(entry.path().c_str(), &status) == 0 &&
            counted.emplace(status.st_dev, status.st_ino).second) {
            bytes += static_cast<double>(status.st_blocks) * 512;
        }
    }
    return bytes / 1e6;
}

// Whoever looks finds all of it or nothing.
void remove_update(const files::path& name) {
    files::rename(name, updates::staging);
    files::remove_all(updates::staging);
}

} // namespace

void clean_up(bool rehearsed) {
    std::optional<updates::work> work;
    if (!rehearsed) {
        work.emplace();
    }
    std::cout << std::fixed << std::setprecision(1);
    double freed = 0;
    for (const auto& directory : updates::removable()) {
        updates::end_if_interrupted();
        const double size = size_of(directory);
        if (!rehearsed) {
            remove_update(directory.filename());
        }
        std::cout << (rehearsed ? "Would delete update " : "Deleted update ")
                  << printable(directory.filename()) << ": " << size << " MB\n";
        freed += size;
    }
    std::cout << (rehearsed ? "That would give back " : "That gives back ") << freed << " MB.\n";
}

} // namespace tz
