#pragma once

#include "dataset/dataset.h"
#include "dataset/icu.h"
#include "dataset/zoneinfo.h"

// The whole filesystem layout: every fixed path of the program and what it is for. A path that
// belongs to a kind of data is defined with that kind and only named here. No directory is ever
// created.
namespace paths {

// The built-in copy, on the system partition. Never written.
inline constexpr auto& system_zoneinfo = olm_zoneinfo::system_directory;  // tz database tree
inline constexpr auto& system_icu = olm_icu::system_directory;            // ICU's time zone files

// The program's own directory, and in it the directory of the downloads, one directory each, named
// by its version string. Both are put into protection class D; nothing is written into the second.
inline constexpr char storage[] = "/var/db/timezone/";
inline constexpr auto& downloads = olm_dataset::downloads_directory;

// The directories in that of a download, by name.
inline constexpr auto& download_zoneinfo = olm_zoneinfo::download_directory;  // tz database tree
inline constexpr auto& download_icu = olm_icu::download_directory;            // ICU's files

// The files that are read, by name.
inline constexpr auto& version_file = olm_zoneinfo::version_file;  // in a tree: its release
inline constexpr auto& schema_file = olm_icu::schema_file;         // in the built-in ICU directory

// Link to the newest download's directory; absent when there is none. Only read.
inline constexpr char latest_link[] = "/var/db/timezone/tz_latest";

// The links that the program sets: to the active copy's tz database tree; to the active download's
// ICU directory, absent while the built-in copy is active; to the local zone's file, through the
// first.
inline constexpr auto& zoneinfo_link = olm_zoneinfo::link_path;
inline constexpr auto& icu_link = olm_icu::link_path;
inline constexpr char localtime_link[] = "/var/db/timezone/localtime";

// The record of the last update that was installed: the version before, "_", the version after.
inline constexpr char record[] = "/var/db/timezone/TZVersionDiffRecord";

// What older systems left. The link is moved to its present place, the entry is removed, and a
// local time link whose text begins with the prefix is rewritten.
inline constexpr auto& legacy_icu_link = olm_icu::legacy_link_path;
inline constexpr char legacy_icu_entry[] = "/var/db/icu";
inline constexpr char legacy_zoneinfo_prefix[] = "/usr/share/zoneinfo";

}  // namespace paths
