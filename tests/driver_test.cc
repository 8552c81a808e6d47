#include "device.h"

// What stands on a device: constants. On this one a run changes and prints nothing; each case puts
// something else there.
const string at_rest =
    "/usr/share/zoneinfo.default/+VERSION = 2016b other\n"
    "/usr/share/zoneinfo.default/Asia/Tokyo = zone\n"
    "/usr/share/icu/icutzformat.txt = 44l\n/usr/share/icu/icutz90b.dat = not its format\n"
    "~/zoneinfo -> /usr/share/zoneinfo.default\n~/localtime -> ~/zoneinfo2/None\n"
    "~/tz/2016a/icutz/icutz44l.dat = older\n~/tz/2016e/icutz/icutz44b.dat = of another format\n"
    "~/tz/2016c/icutz/icutz44l.dat = newer\n~/tz/2016c/zoneinfo/+VERSION = 2015z not its version\n";
const string version = "/usr/share/zoneinfo.default/+VERSION = ";
const string on_system = "~/zoneinfo -> /usr/share/zoneinfo.default\n";
const string on_2016a = "~/icutz -> ~/tz/2016a/icutz\n~/zoneinfo -> ~/tz/2016a/zoneinfo\n";
const string on_2016c = "~/icutz -> ~/tz/2016c/icutz\n~/zoneinfo -> ~/tz/2016c/zoneinfo\n";
const string no_icutz = "~/icutz (absent)\n";
const string newest_2016c = "~/tz_latest -> ~/tz/2016c\n";
const string long_word = "2016" + string(64 << 10, 'z');
const string record = "~/TZVersionDiffRecord = ";
const string updated = record + "2016b.1.0_2016c\n" + on_2016c;
const string old_zone = "~/localtime -> /usr/share/zoneinfo/Asia/Tokyo\n";
const string default_zone = "~/localtime -> ~/zoneinfo/America/Los_Angeles\n";

// What a run prints, in whole lines.
const string invalid = "Invalid current symlinks; resetting to system partition\n";
const string incompatible = "Symlink points at data incompatible with installed system\n";
const string unable = "Unable to locate data; resetting to system partition\n";
const string zone_reset = "localtime link invalid; resetting to America/Los_Angeles\n";
const string not_migrated = "Could not migrate /var/db/icutz to ~/icutz\n";
string bad_link(const string& to) { return "Bad zoneinfo link " + to + "\n"; }
string bad_path(const string& s) { return "olm_dataset::create_components: bad path " + s + "\n"; }
string unread(const string& path) { return "read_symlink: " + path + "\n"; }
string unremoved(const string& path) { return "remove: could not remove " + path + "\n"; }
string unmade(const string& link, const string& target) {
  return "create_symlink: from " + link + " to " + target + "\n";
}
const string zoneinfo_unmade = unmade("~/zoneinfo", "/usr/share/zoneinfo.default");
const string zoneinfo_stays =
    unremoved("~/zoneinfo") + "Unlink of zoneinfo softlink failed\n" + zoneinfo_unmade;
const string icutz_stays = unremoved("~/icutz") + "unlink of ICU softlink failed\n";
string refused(const string& update, const string& current) {
  return "New update not compatible or older version: " + update + " vs. " + current + "\n";
}
string unparsed(const string& word) {
  const string line = "Cannot parse version string " + word;
  return line + ", results.size() = 0\n" + line + "\n";
}
string correcting(const string& target) { return "Correcting localtime link to " + target + "\n"; }

struct boot_case {
  string name, before, printed, changed = {};
  int status = 0;
  fault plan = {};
};
std::ostream& operator<<(std::ostream& stream, const boot_case& row) { return stream << row.name; }

// A second thing in a case doesn't depend on the first. The first six are the typical devices.
const boot_case cases[] = {
    {"new_device", "~/zoneinfo (absent)\n~/localtime (absent)\n",
     bad_link("") + invalid + zone_reset, default_zone + on_system},
    {"update", newest_2016c, "", updated},
    {"newer_download", version + "999a\n" + on_2016a + newest_2016c + record + "a longer text\n",
     "", record + "2016a_2016c\n" + on_2016c},
    {"nothing_new", newest_2016c + updated, refused("2016c", "2016c")},
    {"system_upgrade", version + "2017a\n" + on_2016c, incompatible, no_icutz + on_system},
    {"older_entries", old_zone + "/var/db/icu = file\n/var/db/icutz -> ../db/icu\n",
     correcting("~/zoneinfo/Asia/Tokyo"),
     "/var/db/icu (absent)\n/var/db/icutz (absent)\n~/icutz -> ../db/icu\n"
     "~/localtime -> ~/zoneinfo/Asia/Tokyo\n"},
    {"no_storage", "/var (absent)\n",
     bad_link("") + invalid + zoneinfo_unmade + unable + zoneinfo_unmade, "", 1},
    {"no_downloads_and_empty_directories_in_the_way",
     "~/tz (absent)\n/var/db/icu (directory)\n~/localtime (directory)\n",
     unread("~/localtime") + zone_reset, "/var/db/icu (absent)\n" + default_zone},
    {"two_ICU_links_and_old_zone_link_without_a_zone",
     "/var/db/icutz -> /usr\n~/icutz -> /\n~/localtime -> /usr/share/zoneinfo\n",
     correcting("~/zoneinfo"), "/var/db/icutz (absent)\n~/localtime -> ~/zoneinfo\n"},
    {"dangling_ICU_link_in_the_way", "/var/db/icutz -> /usr\n~/icutz -> /none\n",
     unmade("~/icutz", "/usr") + not_migrated, "/var/db/icutz (absent)\n"},
    {"full_directories_at_old_ICU_entries", "/var/db/icutz/f = text\n/var/db/icu/f = text\n",
     unread("/var/db/icutz") + not_migrated + unremoved("/var/db/icutz") +
         "Could not remove /var/db/icutz\n"},
    {"full_directory_at_zone_link", "~/localtime (absent)\n~/localtime/f = text\n",
     unread("~/localtime") + zone_reset + unmade("~/localtime", "~/zoneinfo/America/Los_Angeles"),
     "", 1},
    {"upgrade_and_newer_download", version + "2017a\n" + on_2016a + newest_2016c, incompatible,
     record + "2017a.1.0_2016c\n" + on_2016c},
    {"no_format_and_relative_zone_link",
     "/usr/share/icu/icutzformat.txt (absent)\n~/localtime -> ../var/db/timezone/zoneinfo\n" +
         on_2016a + newest_2016c,
     incompatible + refused("2016c", "2016a") + zone_reset, no_icutz + default_zone + on_system},
    {"download_that_is_gone_and_zone_link_elsewhere",
     "~/tz_latest -> ~/tz/2016f\n~/localtime -> /mnt/usr/share/zoneinfo/Asia\n",
     "No ICU schema found for ~/tz/2016f\n" + refused("2016f", "2016b.1.0") + zone_reset,
     default_zone},
    {"download_of_no_version_that_is_gone_and_old_zone_link_to_no_zone",
     "~/tz_latest -> ~/tz/x/2016f\n~/localtime -> /usr/share/zoneinfo/Asia/Tokyo/None\n",
     unparsed("x/2016f") + "No ICU schema found for ~/tz/x/2016f\n" +
         refused("x/2016f", "2016b.1.0") + correcting("~/zoneinfo/Asia/Tokyo/None") + zone_reset,
     default_zone},
    {"no_version_and_old_ICU_link_to_itself", version + "\n/var/db/icutz -> icutz\n",
     unparsed(".1.0") + unparsed(".1.0")},  // no data set is made for an absent latest link
    {"zone_link_to_the_system_tree", "~/localtime -> /usr/share/zoneinfo.default/Asia/Tokyo\n",
     correcting("~/zoneinfo.default/Asia/Tokyo") + zone_reset, default_zone},
    {"bad_zoneinfo_link_and_dangling_old_ICU_link",
     "~/zoneinfo -> tz/2016c/%s%n\n/var/db/icutz -> /none\n" + newest_2016c,
     bad_link("tz/2016c/%s%n") + invalid, "/var/db/icutz (absent)\n" + updated},
    {"bad_version_and_dangling_ICU_link_of_another_format",
     version + "%s%n\n~/icutz -> /none\n~/zoneinfo -> ~/tz/2016e/\n",
     unparsed("%s%n.1.0") + incompatible + unparsed("%s%n.1.0"), no_icutz + on_system},
    {"number_too_large_ends_the_run", version + "2147483648a\n/var/db/icu -> /none\n" + old_zone,
     unable, "/var/db/icu (absent)\n", 1},
    {"long_word", version + long_word + "\n" + newest_2016c, refused("2016c", long_word + ".1.0")},
    {"long_latest_link", "~/tz_latest -> " + long_word.substr(0, 1100) + "\n",
     bad_path(long_word.substr(0, 1024)) + unable},
    {"latest_link_to_all_downloads", "~/tz_latest -> ~/tz/\n", bad_path("~/tz/") + unable},
    {"latest_link_elsewhere", "~/tz_latest -> ~/tz-%s%n\n", bad_path("~/tz-%s%n") + unable},
    {"directory_at_latest_link_and_bad_zoneinfo_link",
     "~/tz_latest/file = text\n~/zoneinfo -> /none\n", unread("~/tz_latest") + unable,
     on_system},  // the latest link is read first
    {"directory_at_zoneinfo_link", "~/zoneinfo (directory)\n~/icutz -> /none\n" + old_zone,
     unread("~/zoneinfo") + invalid + zoneinfo_stays + unable + zoneinfo_stays, "", 1},
    {"directory_at_ICU_link", newest_2016c + "~/icutz/file = text\n/var/db/icutz -> /none\n",
     icutz_stays + unmade("~/icutz", "~/tz/2016c/icutz") + unable + icutz_stays},
    {"pipe_at_record", newest_2016c + "~/TZVersionDiffRecord (pipe)\n", "", on_2016c},
    {"link_at_record", newest_2016c + "~/TZVersionDiffRecord -> f\n~/f = text\n", "", on_2016c},
    {"record_with_two_names", newest_2016c + "~/f = text\n~/TZVersionDiffRecord & ~/f\n", "",
     on_2016c},
    {"writing_the_record_fails", newest_2016c + record + "older\n", "", record + "\n" + on_2016c, 0,
     fault{"write"}},
    {"correction_fails", old_zone,
     correcting("~/zoneinfo/Asia/Tokyo") + unmade("~/localtime", "~/zoneinfo/Asia/Tokyo") +
         zone_reset,
     default_zone, 0, fault{"symlink"}},
};

class driver_test : public device, public ::testing::WithParamInterface<boot_case> {};

TEST_P(driver_test, boot) {
  put(at_rest + GetParam().before);
  const state before = look();
  EXPECT_EQ(boot(GetParam().plan), GetParam().status);
  EXPECT_EQ(printed, expand(GetParam().printed));
  EXPECT_EQ(changes_since(before), expand(GetParam().changed));
}

class memory_test : public driver_test {};

TEST_P(memory_test, each_allocation_fails) {
  const string start = "/usr (absent)\n/var (absent)\n" + at_rest + GetParam().before;
  put(start);
  boot();
  state undisturbed = look();
  // The text of the default zone's link, and the paths of the migration, are in no handler's care.
  int unguarded = GetParam().name == "new_device" ? 3 : GetParam().name == "older_entries" ? 1 : 0;
  for (int nth = 1, status = 0; status != no_fault; ++nth) {
    put(start);
    status = boot({"operator new", nth});
    ASSERT_TRUE(status == 0 || (status == 1 && --unguarded >= 0) || (status == no_fault && nth > 1))
        << status << " at " << nth;
    boot();
    // The rest may need an operator, as olmboot(8) tells under CAVEATS.
    EXPECT_EQ(look()[expand("~/zoneinfo")], undisturbed[expand("~/zoneinfo")]) << nth;
  }
}

const auto name_of = [](const auto& row) { return row.param.name; };
INSTANTIATE_TEST_SUITE_P(all, driver_test, ::testing::ValuesIn(cases), name_of);
INSTANTIATE_TEST_SUITE_P(typical, memory_test, ::testing::ValuesIn(cases, cases + 6), name_of);
