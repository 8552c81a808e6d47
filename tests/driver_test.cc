#include "device.h"

namespace {

// What stands on a device: constants. On this one a run changes and prints nothing; each case puts
// something else there.
const text at_rest =
    "/usr/share/zoneinfo.default/+VERSION = 2016b other\n"
    "/usr/share/zoneinfo.default/Asia/Tokyo = zone\n"
    "/usr/share/icu/icutzformat.txt = 44l\n/usr/share/icu/icutz90b.dat = not its format\n"
    "~/zoneinfo -> /usr/share/zoneinfo.default\n~/localtime -> ~/zoneinfo2/None\n"
    "~/tz/2016a/icutz/icutz44l.dat = older\n~/tz/2016e/icutz/icutz90b.dat = of another format\n"
    "~/tz/2016c/icutz/icutz44l.dat = newer\n~/tz/2016c/zoneinfo/+VERSION = 2015z not its version\n";
const text version = "/usr/share/zoneinfo.default/+VERSION = ";
const text no_format = "/usr/share/icu/icutzformat.txt (absent)\n";
const text on_system = "~/zoneinfo -> /usr/share/zoneinfo.default\n";
const text on_2016a = "~/icutz -> ~/tz/2016a/icutz\n~/zoneinfo -> ~/tz/2016a/zoneinfo\n";
const text on_2016c = "~/icutz -> ~/tz/2016c/icutz\n~/zoneinfo -> ~/tz/2016c/zoneinfo\n";
const text on_2016e = "~/zoneinfo -> ~/tz/2016e/\n";
const text no_icutz = "~/icutz (absent)\n";
const text newest_2016c = "~/tz_latest -> ~/tz/2016c\n";
const text long_word = "2016" + text(64 << 10, 'z');
const text record = "~/TZVersionDiffRecord = ";
const text updated = record + "2016b.1.0_2016c\n" + on_2016c;
const text old_zone = "~/localtime -> /usr/share/zoneinfo/Asia/Tokyo\n";
const text default_zone = "~/localtime -> ~/zoneinfo/America/Los_Angeles\n";

// What a run prints: functions. Each gives whole lines.
text unread(const text& path) { return "read_symlink: " + path + "\n"; }
text unremoved(const text& path) { return "remove: could not remove " + path + "\n"; }
text unmade(text link) { return "create_symlink: from " + link.replace(link.find("->"), 2, "to"); }
text zoneinfo_stays() {
  return unremoved("~/zoneinfo") + "Unlink of zoneinfo softlink failed\n" + unmade(on_system);
}
text icutz_stays() { return unremoved("~/icutz") + "unlink of ICU softlink failed\n"; }
text invalid() { return "Invalid current symlinks; resetting to system partition\n"; }
text incompatible() { return "Symlink points at data incompatible with installed system\n"; }
text refused(const text& update, const text& current) {
  return "New update not compatible or older version: " + update + " vs. " + current + "\n";
}
text bad_path(const text& to) { return "olm_dataset::create_components: bad path " + to + "\n"; }
text unable() { return "Unable to locate data; resetting to system partition\n"; }
text unparsed(const text& word) {
  const text line = "Cannot parse version string " + word;
  return line + ", results.size() = 0\n" + line + "\n";
}
text correcting(const text& target) { return "Correcting localtime link to " + target + "\n"; }
text zone_reset() { return "localtime link invalid; resetting to America/Los_Angeles\n"; }

struct boot_case {
  text name, before, after;  // the last: what is printed, then what has changed
  int status = 0;
  fault plan = {};
};
std::ostream& operator<<(std::ostream& stream, const boot_case& row) { return stream << row.name; }

const fault symlink_fails = {"symlink", EROFS};

// A second thing in a case is one that doesn't depend on the first. The first six are typical.
const boot_case cases[] = {
    {"new_device", "~/zoneinfo (absent)\n~/localtime (absent)\n",
     "Bad zoneinfo link \n" + invalid() + zone_reset() + default_zone + on_system},
    {"update", newest_2016c, updated},
    {"newer_download", version + "2015a\n" + on_2016a + newest_2016c + record + "a longer text\n",
     record + "2016a_2016c\n" + on_2016c},
    {"nothing_new", newest_2016c + updated, refused("2016c", "2016c")},
    {"system_upgrade", version + "2017a\n" + on_2016c, incompatible() + no_icutz + on_system},
    {"older_entries", old_zone + "/var/db/icu = file\n/var/db/icutz -> ../db/icu\n",
     correcting("~/zoneinfo/Asia/Tokyo") + "/var/db/icu (absent)\n/var/db/icutz (absent)\n" +
         "~/icutz -> ../db/icu\n~/localtime -> ~/zoneinfo/Asia/Tokyo\n"},
    {"upgrade_and_newer_download", version + "2017a\n" + on_2016a + newest_2016c,
     incompatible() + record + "2017a.1.0_2016c\n" + on_2016c},
    {"no_format", no_format + "~/localtime -> ..~/zoneinfo\n" + on_2016a + newest_2016c,
     incompatible() + refused("2016c", "2016a") + zone_reset() + no_icutz + default_zone +
         on_system},  // the zone's link goes even if it works; the update is named first
    {"no_format_and_alien_download", no_format + "~/tz_latest -> ~/tz/2016e\n",
     refused("2016e", "2016b.1.0")},  // the name of the system's data file tells no format
    {"bad_name", "~/tz_latest -> ~/tz/2016c.1.\n~/localtime -> /mnt/usr/share/zoneinfo/Asia\n",
     unparsed("2016c.1.") + "No ICU schema found for ~/tz/2016c.1.\n" +
         refused("2016c.1.", "2016b.1.0") + zone_reset() + default_zone},
    {"slash_and_no_zone", "~/tz_latest -> ~/tz/2016c/\n~/localtime -> /usr/share/zoneinfo/None\n",
     unparsed("2016c/") + refused("2016c/", "2016b.1.0") + correcting("~/zoneinfo/None") +
         zone_reset() + default_zone},
    {"no_version", "/usr/share/zoneinfo.default/+VERSION (absent)\n/var/db/icutz -> /none\n",
     unparsed(".1.0") + unparsed(".1.0")},  // no data set is made for an absent latest link
    {"bad_zoneinfo_link", "~/zoneinfo -> /%s%n\n/var/db/icutz -> /none\n" + newest_2016c,
     "Bad zoneinfo link /%s%n\n" + invalid() + "/var/db/icutz (absent)\n" + updated},
    {"bad_version_and_path", version + "%s%n\n~/icutz -> /none\n~/tz_latest -> ~/%s%n\n" + on_2016e,
     unparsed("%s%n.1.0") + incompatible() + unparsed("%s%n.1.0") + bad_path("~/%s%n") + unable() +
         unparsed("%s%n.1.0") + no_icutz + on_system},  // a dangling ICU link goes, too
    {"number_too_large", version + "2147483648a\n/var/db/icu = file\n" + old_zone,
     unable() + "/var/db/icu (absent)\n", 1},  // the zone is left alone
    {"long_word", version + long_word + "\n" + newest_2016c, refused("2016c", long_word + ".1.0")},
    {"long_latest_link", "~/tz_latest -> " + long_word.substr(0, 1100) + "\n",
     bad_path(long_word.substr(0, 1024)) + unable()},
    {"directory_at_latest_link", "~/tz_latest/file = text\n~/zoneinfo -> /none\n",
     unread("~/tz_latest") + unable() + on_system},  // the latest link is read first
    {"directory_at_zoneinfo_link",
     "~/zoneinfo (absent)\n~/zoneinfo/file = text\n~/icutz -> /none\n" + old_zone,
     unread("~/zoneinfo") + invalid() + zoneinfo_stays() + unable() + zoneinfo_stays(), 1},
    {"directory_at_ICU_link", newest_2016c + "~/icutz/file = text\n/var/db/icutz -> /none\n",
     icutz_stays() + unmade("~/icutz -> ~/tz/2016c/icutz\n") + unable() +
         icutz_stays()},  // the old link is not tried, the record not written
    {"directories_at_old_ICU_entries", "/var/db/icutz/file = text\n/var/db/icu/file = text\n",
     unread("/var/db/icutz") + "Could not migrate /var/db/icutz to ~/icutz\n" +
         unremoved("/var/db/icutz") + "Could not remove /var/db/icutz\n"},
    {"directory_at_local_time_link", "~/localtime (absent)\n~/localtime/file = text\n",
     unread("~/localtime") + zone_reset() + unmade(default_zone), 1},
    {"pipe_at_record", newest_2016c + "~/TZVersionDiffRecord (pipe)\n", on_2016c},
    {"link_at_record", newest_2016c + "~/TZVersionDiffRecord -> f\n~/f = text\n", on_2016c},
    {"two_ICU_links", "/var/db/icutz -> /usr\n~/icutz -> /\n~/localtime -> /usr/share/zoneinfo\n",
     correcting("~/zoneinfo") + "/var/db/icutz (absent)\n~/localtime -> ~/zoneinfo\n"},
    {"reset_fails", on_2016e, incompatible() + unmade(on_system) + unable() + on_system, 0,
     symlink_fails},
    {"write_fails", newest_2016c, record + "\n" + on_2016c, 0, {"write", EIO}},
};

class driver_test : public device, public ::testing::WithParamInterface<boot_case> {};

TEST_P(driver_test, boot) {
  put(at_rest + GetParam().before);
  const state before = look();
  EXPECT_EQ(boot(GetParam().plan), GetParam().status);
  EXPECT_EQ(printed + changes_since(before), full(GetParam().after));
}

// After a boot with too little memory the next one may leave these, as CAVEATS in olmboot(8) says.
const text exceptions = default_zone + no_icutz + "~/icutz -> ~/tz/2016a/icutz\n" +
                        "~/icutz -> ~/tz/2016c/icutz\n~/TZVersionDiffRecord (absent)\n" + record +
                        "a longer text\n" + record + "2015a.1.0_2016c\n";

class memory_test : public driver_test {};

TEST_P(memory_test, each_allocation_fails_alone_or_with_all_that_follow) {
  const text start = "/usr (absent)\n/var (absent)\n" + at_rest + GetParam().before;
  put(start);
  boot();
  boot();
  const state undisturbed = look();
  for (const bool and_later : {false, true}) {
    for (int first = 1, status = 0; status != no_fault; ++first) {
      put(start);
      status = boot({"operator new", 0, first, and_later});
      ASSERT_TRUE(status <= 1 || (status == no_fault && first > 1)) << status;
      boot();
      std::istringstream changes(changes_since(undisturbed));
      for (text line; std::getline(changes, line);)
        EXPECT_NE(full(exceptions).find(line + "\n"), text::npos) << first << ": " << line;
    }
  }
}

const auto name_of = [](const auto& row) { return row.param.name; };
INSTANTIATE_TEST_SUITE_P(all, driver_test, ::testing::ValuesIn(cases), name_of);
INSTANTIATE_TEST_SUITE_P(typical, memory_test, ::testing::ValuesIn(cases, cases + 6), name_of);

}  // namespace
