#include "device.h"

namespace {

// A device on which a run changes and prints nothing. Each case puts something else on it.
const std::string at_rest =
    "/usr/share/zoneinfo.default/+VERSION = 2016b other\n"
    "/usr/share/zoneinfo.default/Asia/Tokyo = zone\n"
    "/usr/share/icu/icutzformat.txt = 44l\n"
    "~/zoneinfo -> /usr/share/zoneinfo.default\n"
    "~/localtime -> ~/zoneinfo2/None\n"
    "~/tz/2016a/icutz/icutz44l.dat = older than the system\n"
    "~/tz/2016c/icutz/icutz44l.dat = newer than the system\n"
    "~/tz/2016e/icutz/icutz90b.dat = of another format\n";
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
const std::string no_link_made = "create_symlink: from ~/zoneinfo to /usr/share/zoneinfo.default\n";
const std::string zoneinfo_stays =
    "remove: could not remove ~/zoneinfo\nUnlink of zoneinfo softlink failed\n" + no_link_made;
const std::string icu_stays = "remove: could not remove ~/icutz\nunlink of ICU softlink failed\n";
const std::string refused = "New update not compatible or older version: ";
const std::string not_migrated = "Could not migrate /var/db/icutz to ~/icutz\n";
const std::string old_link_stays = "Could not remove /var/db/icutz\n";
const std::string unparsed =
    "Cannot parse version string %s%n.1.0, results.size() = 0\n"
    "Cannot parse version string %s%n.1.0\n";

const std::string long_word = "2016" + std::string(64 << 10, 'z');

struct boot_case {
  std::string name, device, printed, changes = {};
  fault planned = {};
};
std::ostream& operator<<(std::ostream& stream, const boot_case& row) { return stream << row.name; }

const boot_case cases[] = {
    {"newer_download",
     version + "2015a\n" + on("2016a") + newest("2016c") + record("longer than the next one"), "",
     record("2016a_2016c") + on("2016c")},
    {"same_download", on("2016c") + newest("2016c"), refused + "2016c vs. 2016c\n"},
    {"no_format_file", "/usr/share/icu/icutzformat.txt (absent)\n" + on("2016a") + newest("2016c"),
     incompatible + refused + "2016c vs. 2016a\n", back_on_system},
    {"system_upgrade_and_newer_download", version + "2017a\n" + on("2016a") + newest("2016c"),
     incompatible, record("2017a.1.0_2016c") + on("2016c")},
    {"download_of_one_character", newest("x"),
     "Cannot parse version string x, results.size() = 0\nCannot parse version string x\n"
     "No ICU schema found for ~/tz/x\n"
     "New update not compatible or older version: x vs. 2016b.1.0\n"},
    {"bad_version_and_bad_zoneinfo_link", bad_version + "~/zoneinfo -> /%s%n\n" + newest("2016c"),
     unparsed + bad_link + "/%s%n\n" + invalid + unparsed + unparsed,
     record("%s%n.1.0_2016c") + on("2016c")},
    {"bad_version_and_bad_latest_link", bad_version + on("2016e") + "~/tz_latest -> ~/%s%n\n",
     unparsed + incompatible + unparsed + "olm_dataset::create_components: bad path ~/%s%n\n" +
         unable + unparsed,
     back_on_system},
    {"number_too_large", version + "2147483648a\n" + old_zone + "/var/db/icu = file\n",
     unable + "status 1\n", "/var/db/icu (absent)\n"},
    {"long_word", version + long_word + "\n" + newest("2016c"),
     refused + "2016c vs. " + long_word + ".1.0\n"},
    {"directory_at_the_zoneinfo_link", "~/zoneinfo (directory)\n~/icutz -> /none\n" + old_zone,
     "read_symlink: ~/zoneinfo\n" + invalid + zoneinfo_stays + unable + zoneinfo_stays +
         "status 1\n"},
    {"directory_at_the_ICU_link", newest("2016c") + "~/icutz (directory)\n/var/db/icutz -> /none\n",
     icu_stays + "create_symlink: from ~/icutz to ~/tz/2016c/icutz\n" + unable + icu_stays},
    {"directory_at_the_local_time_link", "~/localtime (absent)\n~/localtime/file = text\n",
     "read_symlink: ~/localtime\n" + zone_reset +
         "create_symlink: from ~/localtime to ~/zoneinfo/America/Los_Angeles\nstatus 1\n"},
    {"directory_at_the_old_ICU_link", "/var/db/icutz (directory)\n",
     "read_symlink: /var/db/icutz\n" + not_migrated + "remove: could not remove /var/db/icutz\n" +
         old_link_stays},
    {"pipe_for_the_record", newest("2016c") + "~/TZVersionDiffRecord (pipe)\n", "", on("2016c")},

    {"old_ICU_link_into_old_entry", "/var/db/icutz -> ../db/icu\n/var/db/icu (directory)\n", "",
     "/var/db/icu (absent)\n" + old_link_gone + "~/icutz -> ../db/icu\n"},
    {"old_and_new_ICU_link", old_link + "~/icutz -> /\n", "", old_link_gone},
    {"old_zone_and_no_zoneinfo_link", old_zone + no_link + "/var/db/icutz -> /none\n",
     bad_link + "\n" + invalid + correcting + "/Asia/Tokyo\n",
     old_link_gone + "~/localtime -> ~/zoneinfo/Asia/Tokyo\n" + on_system},
    {"old_form_without_a_zone", "~/localtime -> /usr/share/zoneinfo\n~/tz (absent)\n",
     correcting + "\n", "~/localtime -> ~/zoneinfo\n"},
    {"rewrite_of_the_zone_fails", "~/localtime -> /usr/share/zoneinfo\n",
     correcting + "\ncreate_symlink: from ~/localtime to ~/zoneinfo\n" + zone_reset, default_zone,
     fault{"symlink", 1, EROFS}},
    {"reset_fails", on("2016e"), incompatible + no_link_made + unable, back_on_system,
     fault{"symlink", 1, EROFS}},
    {"walk_fails", newest("2016c"),
     "tz_icu::initialize: fts_open of ~/tz/2016c/icutz failed, Cannot allocate memory\n" + unable,
     "", fault{"fts_open", 1, ENOMEM}},
    {"no_memory_to_remove_links", no_link + old_link,
     old_link_stays + bad_link + "\n" + invalid +
         "Unlink of zoneinfo softlink failed\nunlink of ICU softlink failed\n",
     "~/icutz -> /usr\n" + on_system, fault{"unlink", 0, 0}},
    {"no_memory_to_read_links", bad_version + old_link,
     not_migrated + unparsed + unable + unparsed + zone_reset, old_link_gone + default_zone,
     fault{"readlink", 0, 0}},
    {"no_memory_to_read_the_zoneinfo_link", "", invalid, "", fault{"readlink", 2, 0}},
    {"no_memory_for_a_warning", "~/localtime -> /usr/share/zoneinfo/None\n",
     correcting + "/None\n" + zone_reset + "status 1\n", "", fault{"warn", 2, 0}},
    {"no_reader_and_a_size_limit", "~/localtime -> ..~/zoneinfo\n", zone_reset, default_zone,
     fault{"warn", 1, EPIPE}},
};

class driver_test : public device, public ::testing::WithParamInterface<boot_case> {};

TEST_P(driver_test, boot) {
  const boot_case& row = GetParam();
  put(at_rest + row.device);
  EXPECT_EQ(run(olmboot_main, row.planned), row.printed + row.changes);
}

INSTANTIATE_TEST_SUITE_P(of, driver_test, ::testing::ValuesIn(cases),
                         [](const auto& row) { return row.param.name; });

}  // namespace
