#include <gtest/gtest.h>
#include <sys/resource.h>
#include <sys/wait.h>

#include <cerrno>
#include <csignal>
#include <filesystem>
#include <ostream>
#include <sstream>
#include <string>
#include <utility>

#include "device.h"
#include "faults.h"

namespace {

using text = std::string;

// What stands on a device: constants. On this one a run changes and prints nothing; each case puts
// something else there.
const text at_rest =
    "/usr/share/zoneinfo.default/+VERSION = 2016b other\n"
    "/usr/share/zoneinfo.default/Asia/Tokyo = zone\n"
    "/usr/share/icu/icutzformat.txt = 44l\n"
    "/usr/share/icu/icutz90b.dat = of a name that says nothing\n"
    "~/zoneinfo -> /usr/share/zoneinfo.default\n"
    "~/localtime -> ~/zoneinfo2/None\n"
    "~/tz/2016a/icutz/icutz44l.dat = older than the system\n"
    "~/tz/2016c/icutz/icutz44l.dat = newer than the system\n"
    "~/tz/2016c/zoneinfo/+VERSION = 2015z says nothing\n"
    "~/tz/2016e/icutz/icutz90b.dat = of another format\n";
const text version = "/usr/share/zoneinfo.default/+VERSION = ";
const text long_word = "2016" + text(64 << 10, 'z');
const text on_system = "~/icutz (absent)\n~/zoneinfo -> /usr/share/zoneinfo.default\n";
const text on_2016a = "~/icutz -> ~/tz/2016a/icutz\n~/zoneinfo -> ~/tz/2016a/zoneinfo\n";
const text on_2016c = "~/icutz -> ~/tz/2016c/icutz\n~/zoneinfo -> ~/tz/2016c/zoneinfo\n";
const text on_2016e = "~/icutz -> ~/tz/2016e/icutz\n~/zoneinfo -> ~/tz/2016e/zoneinfo\n";
const text newest_2016c = "~/tz_latest -> ~/tz/2016c\n";
const text record = "~/TZVersionDiffRecord = ";
const text old_zone = "~/localtime -> /usr/share/zoneinfo/Asia/Tokyo\n";
const text default_zone = "~/localtime -> ~/zoneinfo/America/Los_Angeles\n";

// What a run prints: functions. Each gives whole lines.
text unread(const text& path) { return "read_symlink: " + path + "\n"; }
text not_made(const text& link, const text& target) {
  return "create_symlink: from " + link + " to " + target + "\n";
}
text zoneinfo_not_replaced() {
  return "remove: could not remove ~/zoneinfo\nUnlink of zoneinfo softlink failed\n" +
         not_made("~/zoneinfo", "/usr/share/zoneinfo.default");
}
text icutz_stays() { return "remove: could not remove ~/icutz\nunlink of ICU softlink failed\n"; }
text invalid() { return "Invalid current symlinks; resetting to system partition\n"; }
text incompatible() { return "Symlink points at data incompatible with installed system\n"; }
text refused(const text& update, const text& current) {
  return "New update not compatible or older version: " + update + " vs. " + current + "\n";
}
text unable() { return "Unable to locate data; resetting to system partition\n"; }
text unparsed(const text& word) {
  const text line = "Cannot parse version string " + word;
  return line + ", results.size() = 0\n" + line + "\n";
}
text correcting(const text& target) { return "Correcting localtime link to " + target + "\n"; }
text zone_reset() { return "localtime link invalid; resetting to America/Los_Angeles\n"; }

struct boot_case {
  text name, before, printed, changes = {};
  int status = 0;
  fault plan = {};
};
std::ostream& operator<<(std::ostream& stream, const boot_case& row) { return stream << row.name; }

const boot_case typical_cases[] = {
    {"new_device", "~/zoneinfo (absent)\n~/localtime (absent)\n",
     "Bad zoneinfo link \n" + invalid() + zone_reset(),
     default_zone + "~/zoneinfo -> /usr/share/zoneinfo.default\n"},
    {"update", newest_2016c, "", record + "2016b.1.0_2016c\n" + on_2016c},
    {"newer_download", version + "2015a\n" + on_2016a + newest_2016c + record + "a longer text\n",
     "", record + "2016a_2016c\n" + on_2016c},
    {"nothing_new", on_2016c + newest_2016c + record + "2016b.1.0_2016c\n",
     refused("2016c", "2016c")},
    {"system_upgrade", version + "2017a\n" + on_2016c, incompatible(), on_system},
    {"older_entries", old_zone + "/var/db/icu = file\n/var/db/icutz -> ../db/icu\n",
     correcting("~/zoneinfo/Asia/Tokyo"),
     "/var/db/icu (absent)\n/var/db/icutz (absent)\n"
     "~/icutz -> ../db/icu\n~/localtime -> ~/zoneinfo/Asia/Tokyo\n"},
};

const fault symlink_fails = {"symlink", EROFS};
const fault walk_fails = {"fts_open", ENOMEM};

// A second thing in a case is one that doesn't depend on the first.
const boot_case rare_cases[] = {
    {"system_upgrade_and_newer_download", version + "2017a\n" + on_2016a + newest_2016c,
     incompatible(), record + "2017a.1.0_2016c\n" + on_2016c},
    // The zone's link is replaced even if it works.
    {"no_format_file_and_relative_zone",
     "/usr/share/icu/icutzformat.txt (absent)\n~/localtime -> ..~/zoneinfo\n" + on_2016a +
         newest_2016c,
     incompatible() + refused("2016c", "2016a") + zone_reset(),
     "~/icutz (absent)\n" + default_zone + "~/zoneinfo -> /usr/share/zoneinfo.default\n"},
    // The name of the system's data file tells no format.
    {"no_format_file_and_alien_download",
     "/usr/share/icu/icutzformat.txt (absent)\n~/tz_latest -> ~/tz/2016e\n",
     refused("2016e", "2016b.1.0")},
    {"name_of_one_character_and_zone_elsewhere",
     "~/tz_latest -> ~/tz/x\n~/localtime -> /mnt/usr/share/zoneinfo/Asia/Tokyo\n",
     unparsed("x") + "No ICU schema found for ~/tz/x\n" + refused("x", "2016b.1.0") + zone_reset(),
     default_zone},
    {"slash_behind_the_name_and_absent_zone",
     "~/tz_latest -> ~/tz/2016c/\n~/localtime -> /usr/share/zoneinfo/None\n",
     unparsed("2016c/") + refused("2016c/", "2016b.1.0") + correcting("~/zoneinfo/None") +
         zone_reset(),
     default_zone},
    // No data set is made for an absent latest link.
    {"no_version_file_and_dangling_old_ICU_link",
     "/usr/share/zoneinfo.default/+VERSION (absent)\n/var/db/icutz -> /none\n",
     unparsed(".1.0") + unparsed(".1.0")},
    {"bad_zoneinfo_link_and_download",
     "~/zoneinfo -> /%s%n\n/var/db/icutz -> /none\n" + newest_2016c,
     "Bad zoneinfo link /%s%n\n" + invalid(),
     "/var/db/icutz (absent)\n" + record + "2016b.1.0_2016c\n" + on_2016c},
    // A dangling ICU link goes, too.
    {"bad_version_and_bad_latest_link",
     version + "%s%n\n" + on_2016e + "~/icutz -> /none\n~/tz_latest -> ~/%s%n\n",
     unparsed("%s%n.1.0") + incompatible() + unparsed("%s%n.1.0") +
         "olm_dataset::create_components: bad path ~/%s%n\n" + unable() + unparsed("%s%n.1.0"),
     on_system},
    // The zone is left alone.
    {"number_too_large", version + "2147483648a\n/var/db/icu = file\n" + old_zone, unable(),
     "/var/db/icu (absent)\n", 1},
    {"long_word", version + long_word + "\n" + newest_2016c, refused("2016c", long_word + ".1.0")},
    {"long_latest_link", "~/tz_latest -> " + long_word.substr(0, 1100) + "\n",
     "olm_dataset::create_components: bad path " + long_word.substr(0, 1024) + "\n" + unable()},
    // The latest link is read first.
    {"directory_at_the_latest_link", "~/tz_latest (directory)\n~/zoneinfo -> /none\n",
     unread("~/tz_latest") + unable(), "~/zoneinfo -> /usr/share/zoneinfo.default\n"},
    {"directory_at_the_zoneinfo_link", "~/zoneinfo (directory)\n~/icutz -> /none\n" + old_zone,
     unread("~/zoneinfo") + invalid() + zoneinfo_not_replaced() + unable() +
         zoneinfo_not_replaced(),
     "", 1},
    // The old link is not tried then, and the record not written.
    {"directory_at_the_ICU_link", newest_2016c + "~/icutz (directory)\n/var/db/icutz -> /none\n",
     icutz_stays() + not_made("~/icutz", "~/tz/2016c/icutz") + unable() + icutz_stays()},
    {"directories_at_the_old_ICU_entries", "/var/db/icutz (directory)\n/var/db/icu/file = text\n",
     unread("/var/db/icutz") + "Could not migrate /var/db/icutz to ~/icutz\n" +
         "remove: could not remove /var/db/icutz\nCould not remove /var/db/icutz\n"},
    {"directory_at_the_local_time_link", "~/localtime (absent)\n~/localtime/file = text\n",
     unread("~/localtime") + zone_reset() +
         not_made("~/localtime", "~/zoneinfo/America/Los_Angeles"),
     "", 1},
    {"pipe_at_the_record", newest_2016c + "~/TZVersionDiffRecord (pipe)\n", "", on_2016c},
    {"link_at_the_record", newest_2016c + "~/TZVersionDiffRecord -> f\n~/f = text\n", "", on_2016c},
    // The older form may name no zone.
    {"two_ICU_links_and_no_downloads",
     "/var/db/icutz -> /usr\n~/icutz -> /\n~/localtime -> /usr/share/zoneinfo\n~/tz (absent)\n",
     correcting("~/zoneinfo"), "/var/db/icutz (absent)\n~/localtime -> ~/zoneinfo\n"},
    {"reset_fails", on_2016e,
     incompatible() + not_made("~/zoneinfo", "/usr/share/zoneinfo.default") + unable(), on_system,
     0, symlink_fails},
    {"walk_fails", newest_2016c,
     "tz_icu::initialize: fts_open of ~/tz/2016c/icutz failed, Cannot allocate memory\n" + unable(),
     "", 0, walk_fails},
};

class driver_test : public device, public ::testing::WithParamInterface<boot_case> {};

TEST_P(driver_test, boot) {
  const boot_case& row = GetParam();
  put(at_rest + row.before);
  const state before = look();
  EXPECT_EXIT(enter(olmboot_main, row.plan), ::testing::ExitedWithCode(row.status),
              ::testing::Eq(full(row.printed)));
  EXPECT_EQ(changes_since(before), full(row.changes));
}

// After a boot with too little memory the next one may leave these, as CAVEATS in olmboot(8) says.
const text exceptions = default_zone + "~/icutz (absent)\n~/icutz -> ~/tz/2016a/icutz\n" +
                        "~/icutz -> ~/tz/2016c/icutz\n~/TZVersionDiffRecord (absent)\n" + record +
                        "a longer text\n" + record + "2015a.1.0_2016c\n";

class memory_test : public driver_test {};

TEST_P(memory_test, each_allocation_fails_alone_or_with_all_that_follow) {
#ifdef _LIBCPP_VERSION
  GTEST_SKIP() << "libc++ crashes when it has no memory to begin a regular expression";
#endif
  int status = 0;
  const auto ends = [&status](int result) {
    status = WEXITSTATUS(result);
    return WIFEXITED(result);
  };
  const auto boot = [&](const fault& plan) { EXPECT_EXIT(enter(olmboot_main, plan), ends, ""); };
  const auto start_again = [this] {
    put("/usr (absent)\n/var (absent)\n" + at_rest + GetParam().before);
  };
  start_again();
  boot({});
  boot({});
  const state undisturbed = look();
  for (const bool and_later : {false, true}) {
    for (int first = 1; status <= 1; ++first) {
      start_again();
      boot({"operator new", 0, first, and_later});
      EXPECT_TRUE(first > 1 || status != no_fault) << "the run allocates nothing";
      if (status == no_fault) break;
      boot({});
      std::istringstream changes(changes_since(undisturbed));
      for (text line; std::getline(changes, line);) {
        EXPECT_NE(full(exceptions).find(line + "\n"), text::npos) << first << ": " << line;
      }
    }
    EXPECT_EQ(std::exchange(status, 0), no_fault);
  }
}

const auto name_of = [](const auto& row) { return row.param.name; };
INSTANTIATE_TEST_SUITE_P(typical, driver_test, ::testing::ValuesIn(typical_cases), name_of);
INSTANTIATE_TEST_SUITE_P(rare, driver_test, ::testing::ValuesIn(rare_cases), name_of);
INSTANTIATE_TEST_SUITE_P(typical, memory_test, ::testing::ValuesIn(typical_cases), name_of);

TEST_F(device, a_signal_for_what_cannot_be_written_ends_nothing) {
  put(at_rest + newest_2016c);
  const state before = look();
  run([] {
    const rlimit none = {0, 0};
    setrlimit(RLIMIT_FSIZE, &none);
    return olmboot_main() + std::raise(SIGPIPE);
  });
  EXPECT_EQ(changes_since(before), full(record + "\n" + on_2016c));
  EXPECT_EQ(fs::status(outside("~/TZVersionDiffRecord")).permissions(), fs::perms{0644});
}

}  // namespace
