// SPDX-License-Identifier: BSD-2-Clause
#pragma once

/// Every path that a start uses. All are fixed: no option, environment variable or prefix changes
/// them. A start never creates a directory.
namespace tz::layout {

// The state directory, and the directory of updates, each of which is named by its version.
inline constexpr char state_directory[] = "/var/db/timezone/";
inline constexpr char updates_directory[] = "/var/db/timezone/tz/";

// Links to the current data: the compiled tz database, always; the ICU data, only while an update
// is current.
inline constexpr char zoneinfo_link[] = "/var/db/timezone/zoneinfo";
inline constexpr char icu_link[] = "/var/db/timezone/icutz";

// Link to the newest installed update; written by the updater, only read here.
inline constexpr char latest_link[] = "/var/db/timezone/tz_latest";

// Link to the local zone's file, through zoneinfo_link.
inline constexpr char localtime_link[] = "/var/db/timezone/localtime";
inline constexpr char default_zone[] = "America/Los_Angeles";

// Empty file: an update is no longer current, and its directory may be deleted.
inline constexpr char cleanup_marker[] = "/var/db/timezone/needs_cleanup";

// The record of the last adoption: which version replaced which.
inline constexpr char version_diff_record[] = "/var/db/timezone/TZVersionDiffRecord";

// Left behind by older systems.
inline constexpr char legacy_icu_link[] = "/var/db/icutz";
inline constexpr char legacy_icu_directory[] = "/var/db/icu";
inline constexpr char legacy_zoneinfo[] = "/usr/share/zoneinfo";

// The system's own data, read-only.
inline constexpr char system_zoneinfo[] = "/usr/share/zoneinfo.default";
inline constexpr char system_icu[] = "/usr/share/icu";

// Names inside an update, and inside the data directories.
inline constexpr char update_zoneinfo[] = "/zoneinfo";
inline constexpr char update_icu[] = "/icutz";
inline constexpr char zoneinfo_version_file[] = "/+VERSION";
inline constexpr char icu_schema_file[] = "/icutzformat.txt";

} // namespace tz::layout
