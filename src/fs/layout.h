// SPDX-License-Identifier: BSD-2-Clause
#pragma once

/// Every path that a start touches. All are fixed: there is no option, no environment variable and
/// no prefix. None of the directories is ever created here.
namespace tz::layout {

// The state directory, and in it one directory for each installed update, named by its version.
inline constexpr char state_directory[] = "/var/db/timezone/";
inline constexpr char updates_directory[] = "/var/db/timezone/tz/";

// Links that name the data in use: the compiled tz database, always; the ICU data, only while an
// update is current.
inline constexpr char zoneinfo_link[] = "/var/db/timezone/zoneinfo";
inline constexpr char icu_link[] = "/var/db/timezone/icutz";

// Link to the newest installed update; written by whoever installs updates, only read here.
inline constexpr char latest_link[] = "/var/db/timezone/tz_latest";

// Link to the file of the local zone, reached through zoneinfo_link.
inline constexpr char localtime_link[] = "/var/db/timezone/localtime";
inline constexpr char default_zone[] = "America/Los_Angeles";

// Empty file that says: an update has stopped being current, its directory may be deleted.
inline constexpr char cleanup_marker[] = "/var/db/timezone/needs_cleanup";

// Which version replaced which, at the last adoption of an update.
inline constexpr char version_diff_record[] = "/var/db/timezone/TZVersionDiffRecord";

// What older systems left behind.
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
