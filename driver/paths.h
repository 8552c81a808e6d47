#pragma once

// The filesystem layout: the fixed paths that the driver owns. Those of a data set stand with it:
//   dataset/zoneinfo.h  the system's tz database tree, and the link to the active one
//   dataset/icu.h       the link to the active download's ICU files, and its place on older systems
//   dataset/icu.cc      the system's ICU directory
//   dataset/dataset.h   the directory that holds the downloads
// No directory is ever created.
namespace paths {

// The program's own directory; it holds all but the last two paths here.
inline constexpr char storage[] = "/var/db/timezone/";

// Link to the newest download's directory; absent when there is none. Only read.
inline constexpr char latest_link[] = "/var/db/timezone/tz_latest";

// Link to the local zone's file, through the zoneinfo link.
inline constexpr char localtime_link[] = "/var/db/timezone/localtime";

// The record of the last update: the version before it, "_", the version that it installed.
inline constexpr char record[] = "/var/db/timezone/TZVersionDiffRecord";

// What older systems left: an ICU entry, which is removed, and what the text of a local time link
// began with, which is rewritten.
inline constexpr char legacy_icu_entry[] = "/var/db/icu";
inline constexpr char legacy_zoneinfo_prefix[] = "/usr/share/zoneinfo";

}  // namespace paths
