#pragma once

// The filesystem layout: every fixed path of a run. None of these directories is ever created.
namespace paths {

// The program's own directory. The entries of it that have a name here are links, but for the
// directory of the downloads and the record.
inline constexpr char storage[] = "/var/db/timezone/";

// What the path of every download begins with; the rest of the path is its version string.
inline constexpr char downloads[] = "/var/db/timezone/tz/";

// To the newest download's directory; absent when there is none. Only read.
inline constexpr char latest_link[] = "/var/db/timezone/tz_latest";

// To the active tz database tree.
inline constexpr char zoneinfo_link[] = "/var/db/timezone/zoneinfo";

// To the active download's ICU directory. A reset to the system data set removes it.
inline constexpr char icu_link[] = "/var/db/timezone/icutz";

// To the local zone's file, through the zoneinfo link.
inline constexpr char localtime_link[] = "/var/db/timezone/localtime";

// The record of the last update: the version before it, "_", the version that it installed.
inline constexpr char record[] = "/var/db/timezone/TZVersionDiffRecord";

// The system data set: its tz database tree and its ICU directory. Never written, and no link leads
// to the second.
inline constexpr char system_zoneinfo[] = "/usr/share/zoneinfo.default";
inline constexpr char system_icu[] = "/usr/share/icu";

// What older systems left: where the ICU link was; an ICU entry, which is removed; and what the
// text of a local time link began with, which is rewritten.
inline constexpr char legacy_icu_link[] = "/var/db/icutz";
inline constexpr char legacy_icu_entry[] = "/var/db/icu";
inline constexpr char legacy_zoneinfo_prefix[] = "/usr/share/zoneinfo";

}  // namespace paths
