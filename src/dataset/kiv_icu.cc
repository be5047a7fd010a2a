// SPDX-License-Identifier: BSD-2-Clause
#include "dataset/kiv_icu.h"

#include <array>
#include <cerrno>
#include <cstring>
#include <memory>

#include <sys/stat.h>

#include "fs/layout.h"
#include "fs/operations.h"
#include "platform/disk.h"
#include "platform/warn.h"

namespace tz {
namespace {

struct walk_closer {
    void operator()(FTS* walk) const { ::fts_close(walk); }
};

bool is_world_readable_file(const FTSENT& entry) {
    return entry.fts_errno == 0 && entry.fts_info == FTS_F &&
           (entry.fts_statp->st_mode & S_IROTH) != 0;
}

// The schema of the first data file in `directory`, not below it; empty if there is none.
std::string first_schema_in(std::string directory) {
    // FTS_NOCHDIR: on 32-bit machines glibc's fts cannot enter a directory dated after 2038.
    constexpr int options = FTS_COMFOLLOW | FTS_PHYSICAL | FTS_XDEV | FTS_NOCHDIR;
    std::array<char*, 2> roots{directory.data(), nullptr};
    const std::unique_ptr<FTS, walk_closer> walk(platform::fts_open(roots.data(), options));
    if (!walk) {
        warn("tz_icu::initialize: fts_open of %s failed, %s", directory.c_str(),
             std::strerror(errno));
        throw int{errno};
    }
    while (FTSENT* entry = platform::fts_read(walk.get())) {
        if (entry->fts_level != 1) {
            continue;
        }
        if (entry->fts_info == FTS_D) {
            // Files below do not count, and there may be very many of them.
            ::fts_set(walk.get(), entry, FTS_SKIP);
        }
        if (is_world_readable_file(*entry)) {
            const auto schema = icu_schema_in_name({entry->fts_name, entry->fts_namelen});
            if (!schema.empty()) {
                return std::string(schema);
            }
        }
    }
    return {};
}

} // namespace

std::string_view icu_schema_in_name(std::string_view name) {
    constexpr std::string_view prefix = "icutz";
    constexpr std::string_view suffix = ".dat";

    if (!name.starts_with(prefix) || !name.ends_with(suffix)) {
        return {};
    }
    const auto schema = name.substr(prefix.size(), name.size() - prefix.size() - suffix.size());
    const auto letter = schema.find_first_not_of("0123456789");
    const bool well_formed = letter != 0 && letter != std::string_view::npos &&
                             letter + 1 == schema.size() &&
                             std::string_view("lbe").find(schema[letter]) != std::string_view::npos;
    return well_formed ? schema : std::string_view();
}

kiv_icu::kiv_icu(const std::string& dataset_path)
    : kiv_dataset_component(dataset_path),
      directory_(dataset_path.empty() ? layout::system_icu : dataset_path + layout::update_icu) {
    initialize();
}

void kiv_icu::initialize() {
    if (dataset_path().empty()) {
        schema_ = fs::read_word(directory_ + layout::icu_schema_file);
        return;
    }
    schema_ = first_schema_in(directory_);
    if (schema_.empty()) {
        warn("No ICU schema found for %s", dataset_path().c_str());
    }
}

bool kiv_icu::compatible_schema(const kiv_dataset_component& other) const {
    const auto* const icu = dynamic_cast<const kiv_icu*>(&other);
    if (icu == nullptr) {
        warn("kiv_icu::compatible_schema: could not dynamic_cast other component");
        return false;
    }
    return schema_ == icu->schema_;
}

void kiv_icu::make_current() const {
    try {
        fs::remove(layout::icu_link);
        fs::remove(layout::legacy_icu_link);
    } catch (...) {
        warn("unlink of ICU softlink failed");
    }
    if (!dataset_path().empty()) {
        fs::create_symlink(directory_, layout::icu_link);
    }
}

} // namespace tz
