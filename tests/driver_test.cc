#include <sys/resource.h>

#include "device.h"

int olmboot_main();

namespace {

// A device on which a run changes and prints nothing. Each case puts something else on it.
const char at_rest[] =
    "/usr/share/zoneinfo.default/+VERSION = 2016b other\n"
    "/usr/share/zoneinfo.default/Asia/Tokyo = zone\n"
    "/usr/share/icu/icutzformat.txt = 44l\n"
    "~/zoneinfo -> /usr/share/zoneinfo.default\n"
    "~/localtime -> ~/zoneinfo2/None\n"
    "~/tz/2016a/icutz/icutz44l.dat = older than the system\n"
    "~/tz/2016a.1/icutz/icutz44l.dat = older than the system\n"
    "~/tz/2016c/icutz/icutz44l.dat = newer than the system\n"
    "~/tz/2016e/icutz/icutz46l.dat = of another format\n"
    "~/tz/2016f/icutz/icutz46l.dat = of another format\n";
const std::string version = "/usr/share/zoneinfo.default/+VERSION = ";
std::string newest(const std::string& name) { return "~/tz_latest -> ~/tz/" + name + "\n"; }
std::string record(const std::string& text) { return "~/TZVersionDiffRecord = " + text + "\n"; }
std::string on(const std::string& name) {
  return "~/icutz -> ~/tz/" + name + "/icutz\n~/zoneinfo -> ~/tz/" + name + "/zoneinfo\n";
}
const std::string bad_version = version + "%s%n\n";
const std::string on_system = "~/zoneinfo -> /usr/share/zoneinfo.default\n";
const std::string back_on_system = "~/icutz (absent)\n" + on_system;
const std::string no_link = "~/zoneinfo (absent)\n";
const std::string old_link = "/var/db/icutz -> /usr\n";
const std::string old_link_gone = "/var/db/icutz (absent)\n";
const std::string old_zone = "~/localtime -> /usr/share/zoneinfo/Asia/Tokyo\n";
const std::string default_zone = "~/localtime -> ~/zoneinfo/America/Los_Angeles\n";

// What is printed more than once.
const std::string bad_link = "Bad zoneinfo link ";
const std::string invalid = "Invalid current symlinks; resetting to system partition\n";
const std::string incompatible = "Symlink points at data incompatible with installed system\n";
const std::string unable = "Unable to locate data; resetting to system partition\n";
const std::string correcting = "Correcting localtime link to ~/zoneinfo";
const std::string zone_reset = "localtime link invalid; resetting to America/Los_Angeles\n";
const std::string unlinked = "remove: could not remove ";
const std::string zoneinfo_stays = "Unlink of zoneinfo softlink failed\n";
const std::string icu_stays = "unlink of ICU softlink failed\n";
const std::string no_link_made = "create_symlink: from ~/zoneinfo to /usr/share/zoneinfo.default\n";
const std::string refused = "New update not compatible or older version: ";
const std::string not_migrated = "Could not migrate /var/db/icutz to ~/icutz\n";
const std::string old_link_stays = "Could not remove /var/db/icutz\n";
const std::string unparsed =
    "Cannot parse version string %s%n.1.0, results.size() = 0\n"
    "Cannot parse version string %s%n.1.0\n";

// What is done to the process of a run.
std::function<void()> fail(const std::string& name, int nth, int error) {
  return [=] { planned_fault = {name, nth, error}; };
}
void lose_output() {
  int ends[2];
  if (pipe(ends) == 0) dup2(ends[1], STDERR_FILENO);
  for (const int end : ends) close(end);
  const rlimit none{};
  setrlimit(RLIMIT_FSIZE, &none);
}
const std::string long_word = "2016" + std::string(64 << 10, 'z');

struct boot_case {
  std::string name, device, printed, changes = {};
  std::function<void()> trouble = [] {};
};
std::ostream& operator<<(std::ostream& stream, const boot_case& row) { return stream << row.name; }

const boot_case cases[] = {
    {"newer_download", newest("2016c") + record("longer than the next one"), "",
     record("2016b.1.0_2016c") + on("2016c")},
    {"same_download", on("2016c") + newest("2016c"), refused + "2016c vs. 2016c\n"},
    {"other_format", on("2016e") + newest("2016f"), incompatible + refused + "2016f vs. 2016e\n",
     back_on_system},
    {"system_upgrade_and_newer_download", on("2016a") + newest("2016a.1"), incompatible,
     record("2016b.1.0_2016a.1") + on("2016a.1")},
    {"download_of_one_character", newest("x"),
     "Cannot parse version string x, results.size() = 0\nCannot parse version string x\n"
     "No ICU schema found for ~/tz/x\n" +
         refused + "x vs. 2016b.1.0\n"},
    {"first_boot", no_link + "~/localtime (absent)\n~/tz (absent)\n",
     bad_link + "\n" + invalid + zone_reset, default_zone + on_system},

    {"bad_version_and_bad_zoneinfo_link", bad_version + "~/zoneinfo -> /%s%n\n" + newest("2016c"),
     unparsed + bad_link + "/%s%n\n" + invalid + unparsed + unparsed,
     record("%s%n.1.0_2016c") + on("2016c")},
    {"bad_version_and_bad_latest_link",
     bad_version + on("2016e") + "~/tz_latest -> /var/db/timezones/%s%n\n",
     unparsed + incompatible + unparsed +
         "olm_dataset::create_components: bad path /var/db/timezones/%s%n\n" + unable + unparsed,
     back_on_system},
    {"number_too_large", version + "2147483648a\n" + old_zone + "/var/db/icu = file\n",
     unable + "status 1\n", "/var/db/icu (absent)\n"},
    {"long_word", version + long_word + "\n" + newest("2016c"),
     refused + "2016c vs. " + long_word + ".1.0\n"},
    {"file_for_the_latest_link", no_link + "~/tz_latest = file\n~/localtime (directory)\n",
     "read_symlink: ~/tz_latest\n" + unable + "read_symlink: ~/localtime\n" + zone_reset,
     default_zone + on_system},
    {"directory_for_the_zoneinfo_link", "~/zoneinfo (directory)\n~/icutz -> /none\n" + old_zone,
     "read_symlink: ~/zoneinfo\n" + invalid + unlinked + "~/zoneinfo\n" + zoneinfo_stays +
         no_link_made + unable + unlinked + "~/zoneinfo\n" + zoneinfo_stays + no_link_made +
         "status 1\n"},
    {"directory_for_the_ICU_link",
     newest("2016c") + "~/icutz (directory)\n/var/db/icutz -> /none\n",
     unlinked + "~/icutz\n" + icu_stays + "create_symlink: from ~/icutz to ~/tz/2016c/icutz\n" +
         unable + unlinked + "~/icutz\n" + icu_stays},
    {"directory_for_the_local_time_link", "~/localtime (absent)\n~/localtime/file = text\n",
     "read_symlink: ~/localtime\nlocaltime link invalid; resetting to America/Los_Angeles "
     "(EINVAL)\n"
     "create_symlink: from ~/localtime to ~/zoneinfo/America/Los_Angeles\nstatus 1\n"},
    {"directory_for_the_old_ICU_link", "/var/db/icutz (directory)\n",
     "read_symlink: /var/db/icutz\n" + not_migrated + unlinked + "/var/db/icutz\n" +
         old_link_stays},
    {"pipe_for_the_record", newest("2016c") + "~/TZVersionDiffRecord (pipe)\n", "", on("2016c")},

    {"old_ICU_link_into_old_entry", "/var/db/icutz -> ../db/icu\n/var/db/icu (directory)\n", "",
     "/var/db/icu (absent)\n" + old_link_gone + "~/icutz -> ../db/icu\n"},
    {"old_and_new_ICU_link", old_link + "~/icutz -> /\n", "", old_link_gone},
    {"old_ICU_link_dangles", "/var/db/icutz -> /none\n/var/db/icu/file = text\n", ""},
    {"old_zone_and_no_zoneinfo_link", old_zone + no_link + "/var/db/icutz -> /none\n",
     bad_link + "\n" + invalid + correcting + "/Asia/Tokyo\n",
     old_link_gone + "~/localtime -> ~/zoneinfo/Asia/Tokyo\n" + on_system},
    {"old_form_without_a_zone", "~/localtime -> /usr/share/zoneinfo\n", correcting + "\n",
     "~/localtime -> ~/zoneinfo\n"},
    {"old_zone_is_missing", "~/localtime -> /usr/share/zoneinfo/None\n",
     correcting + "/None\n" + zone_reset, default_zone},

    {"rewrite_of_the_zone_fails", old_zone,
     correcting + "/Asia/Tokyo\ncreate_symlink: from ~/localtime to ~/zoneinfo/Asia/Tokyo\n" +
         zone_reset,
     default_zone, fail("symlink", 1, EROFS)},
    {"reset_fails", on("2016e"), incompatible + no_link_made + unable, back_on_system,
     fail("symlink", 1, EROFS)},
    {"walk_fails", newest("2016c"),
     "tz_icu::initialize: fts_open of ~/tz/2016c/icutz failed, Cannot allocate memory\n" + unable,
     "", fail("fts_open", 1, ENOMEM)},
    {"no_memory_to_remove_links", no_link + old_link,
     old_link_stays + bad_link + "\n" + invalid + zoneinfo_stays + icu_stays,
     "~/icutz -> /usr\n" + on_system, fail("unlink", 0, 0)},
    {"no_memory_to_read_links", old_link, not_migrated + unable + zone_reset,
     old_link_gone + default_zone, fail("readlink", 0, 0)},
    {"no_memory_to_read_the_zoneinfo_link", "", invalid, "", fail("readlink", 2, 0)},
    {"output_is_lost", newest("2016c") + no_link, "", record("") + on("2016c"), lose_output},
};

class driver_test : public device, public ::testing::WithParamInterface<boot_case> {};

TEST_P(driver_test, boot) {
  const boot_case& row = GetParam();
  put(at_rest);
  put(row.device);
  const tree before = look();
  const auto body = [&row]() noexcept -> std::string {
    row.trouble();
    return olmboot_main() == 0 ? "" : "main doesn't return 0\n";
  };
  const std::string seen = run(body, row.printed);
  EXPECT_EQ(seen + changes_since(before), row.printed + row.changes);
}

INSTANTIATE_TEST_SUITE_P(of, driver_test, ::testing::ValuesIn(cases),
                         [](const auto& row) { return row.param.name; });

}  // namespace
