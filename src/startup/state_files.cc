// SPDX-License-Identifier: BSD-2-Clause
#include "startup/state_files.h"

#include <string>

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include "fs/descriptor.h"
#include "fs/layout.h"
#include "platform/data_protection.h"
#include "platform/disk.h"
#include "platform/warn.h"

namespace tz {

void touch_needs_cleanup() {
    fs::descriptor marker(platform::open_dprotected_np(
        layout::cleanup_marker, O_RDWR | O_CREAT, platform::class_without_protection, 0, 0666));
    struct stat status {};
    if (!marker.is_open() || platform::fstat(marker.number(), &status) == -1 ||
        marker.close() == -1) {
        warn("Cannot touch file %s", layout::cleanup_marker);
    }
}

void write_version_diff_record(const kiv_dataset& effective, const kiv_dataset& latest) {
    const std::string text = effective.version_string() + "_" + latest.version_string();
    const fs::descriptor record(
        platform::open(layout::version_diff_record,
                       O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC | O_NONBLOCK | O_NOCTTY, 0666));
    if (record.is_open()) {
        [[maybe_unused]] const auto written = ::write(record.number(), text.data(), text.size());
    }
}

} // namespace tz
