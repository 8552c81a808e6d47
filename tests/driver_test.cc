#include <sys/resource.h>

#include <functional>

#include "device.h"

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
    "~/tz/2016d/icutz/icutz44l.dat = newer than the system\n"
    "~/tz/2016e/icutz/icutz46l.dat = of another format\n"
    "~/tz/2016f/icutz/icutz46l.dat = of another format\n";
std::string version(const std::string& word) {
  return "/usr/share/zoneinfo.default/+VERSION = " + word + "\n";
}
std::string newest(const std::string& name) { return "~/tz_latest -> ~/tz/" + name + "\n"; }
std::string on(const std::string& name) {
  return "~/zoneinfo -> ~/tz/" + name + "/zoneinfo\n~/icutz -> ~/tz/" + name + "/icutz\n";
}
std::string record(const std::string& text) { return "~/TZVersionDiffRecord = " + text + "\n"; }
const std::string on_system = "~/zoneinfo -> /usr/share/zoneinfo.default\n~/icutz (absent)\n";
const std::string no_link = "~/zoneinfo (absent)\n";
const std::string old_zone = "~/localtime -> /usr/share/zoneinfo/Asia/Tokyo\n";
const std::string zone = "~/localtime -> ~/zoneinfo/Asia/Tokyo\n";
const std::string default_zone = "~/localtime -> ~/zoneinfo/America/Los_Angeles\n";

// What is printed more than once.
const std::string invalid = "Invalid current symlinks; resetting to system partition\n";
const std::string bad_link = "Bad zoneinfo link \n" + invalid;
const std::string incompatible = "Symlink points at data incompatible with installed system\n";
const std::string unable = "Unable to locate data; resetting to system partition\n";
const std::string not_migrated = "Could not migrate /var/db/icutz to ~/icutz\n";
const std::string corrected = "Correcting localtime link to ~/zoneinfo/Asia/Tokyo\n";
const std::string zone_reset = "localtime link invalid; resetting to America/Los_Angeles\n";
const std::string zoneinfo_stays = "Unlink of zoneinfo softlink failed\n";
const std::string no_link_made = "create_symlink: from ~/zoneinfo to /usr/share/zoneinfo.default\n";
const std::string icu_stays =
    "remove: could not remove ~/icutz\nunlink of ICU softlink failed (EISDIR)\n";
std::string refused(const std::string& update, const std::string& current) {
  return "New update not compatible or older version: " + update + " vs. " + current + "\n";
}
std::string unparsed(const std::string& text) {
  const std::string line = "Cannot parse version string " + text;
  return line + ", results.size() = 0\n" + line + "\n";
}

// What is done to the process of a run.
using trouble = std::function<void()>;
trouble fail(const std::string& name, int nth, int error) {
  return [=] { planned_fault = {name, nth, error}; };
}
trouble limit(decltype(RLIMIT_STACK) resource, rlim_t bytes) {
  return [=] {
    const rlimit both{bytes, bytes};
    setrlimit(resource, &both);
  };
}
void close_pipe() {
  int ends[2];
  if (pipe(ends) == 0) dup2(ends[1], STDERR_FILENO);
  for (const int end : ends) close(end);
}
const std::string letters = "2016" + std::string(64 << 10, 'z');

struct boot_case {
  std::string name, device, printed, changes;
  trouble before = [] {};
};
std::ostream& operator<<(std::ostream& stream, const boot_case& row) { return stream << row.name; }

const boot_case cases[] = {
    {"nothing_new", "", "", ""},
    {"newer_download", newest("2016c"), "", on("2016c") + record("2016b.1.0_2016c")},
    {"second_download", on("2016c") + newest("2016d") + record("longer than the next"), "",
     on("2016d") + record("2016c_2016d")},
    {"same_download", on("2016c") + newest("2016c"), refused("2016c", "2016c"), ""},
    {"other_format", on("2016e") + newest("2016f"), incompatible + refused("2016f", "2016e"),
     on_system},
    {"system_upgrade", on("2016a") + newest("2016a"), incompatible + refused("2016a", "2016a"),
     on_system},
    {"system_upgrade_and_newer_download", on("2016a") + newest("2016a.1"), incompatible,
     on("2016a.1") + record("2016b.1.0_2016a.1")},
    {"download_of_one_character", newest("x"),
     unparsed("x") + "No ICU schema found for ~/tz/x\n" + refused("x", "2016b.1.0"), ""},

    {"bad_version_and_bad_zoneinfo_link",
     version("%s%n") + "~/zoneinfo -> /%s%n\n" + newest("2016c"),
     unparsed("%s%n.1.0") + "Bad zoneinfo link /%s%n\n" + invalid + unparsed("%s%n.1.0") +
         unparsed("%s%n.1.0"),
     on("2016c") + record("%s%n.1.0_2016c")},
    {"bad_version_and_bad_latest_link",
     version("") + on("2016e") + "~/tz_latest -> /var/db/timezones/%s%n\n",
     unparsed(".1.0") + incompatible + unparsed(".1.0") +
         "olm_dataset::create_components: bad path /var/db/timezones/%s%n\n" + unable +
         unparsed(".1.0"),
     on_system},
    {"no_links_but_a_file_and_a_directory",
     version("") + no_link + "~/tz_latest = file\n~/localtime (directory)\n",
     unparsed(".1.0") + "read_symlink: ~/tz_latest\n" + unable + unparsed(".1.0") +
         "read_symlink: ~/localtime\n" + zone_reset,
     on_system + default_zone},
    {"number_too_large", version("2147483648a") + old_zone + "/var/db/icu = file\n",
     unable + "status 1\n", "/var/db/icu (absent)\n"},
    {"pipe_for_the_record", newest("2016c") + "~/TZVersionDiffRecord (pipe)\n", "", on("2016c")},
    {"directory_for_the_ICU_link",
     newest("2016c") + "~/icutz (directory)\n/var/db/icutz -> /none\n",
     icu_stays +
         "create_symlink: from ~/icutz to ~/tz/2016c/icutz\nUnable to locate data; "
         "resetting to system partition (EEXIST)\n" +
         icu_stays,
     ""},
    {"directory_for_the_zoneinfo_link", "~/zoneinfo (directory)\n~/icutz -> /none\n" + old_zone,
     "read_symlink: ~/zoneinfo (EINVAL)\nInvalid current symlinks; resetting to system partition "
     "(EINVAL)\nremove: could not remove ~/zoneinfo\n" +
         zoneinfo_stays + no_link_made + unable + "remove: could not remove ~/zoneinfo\n" +
         zoneinfo_stays + no_link_made + "status 1\n",
     ""},
    {"directory_for_the_local_time_link", "~/localtime (absent)\n~/localtime/file = text\n",
     "read_symlink: ~/localtime\nlocaltime link invalid; resetting to America/Los_Angeles "
     "(EINVAL)\n"
     "create_symlink: from ~/localtime to ~/zoneinfo/America/Los_Angeles\nstatus 1\n",
     ""},

    {"old_ICU_link_into_old_entry", "/var/db/icutz -> ../db/icu\n/var/db/icu (directory)\n", "",
     "/var/db/icutz (absent)\n/var/db/icu (absent)\n~/icutz -> ../db/icu\n"},
    {"old_and_new_ICU_link", "/var/db/icutz -> /usr\n~/icutz -> /\n", "",
     "/var/db/icutz (absent)\n"},
    {"old_ICU_link_dangles", "/var/db/icutz -> /none\n/var/db/icu/file = text\n", "", ""},
    {"directory_for_the_old_ICU_link", "/var/db/icutz (directory)\n",
     "read_symlink: /var/db/icutz\n" + not_migrated +
         "remove: could not remove /var/db/icutz\nCould not remove /var/db/icutz\n",
     ""},
    {"old_zone_and_no_zoneinfo_link", old_zone + no_link + "/var/db/icutz -> /none\n",
     bad_link + corrected, on_system + zone + "/var/db/icutz (absent)\n"},
    {"old_form_without_a_zone", "~/localtime -> /usr/share/zoneinfo\n",
     "Correcting localtime link to ~/zoneinfo\n", "~/localtime -> ~/zoneinfo\n"},
    {"old_zone_is_missing", "~/localtime -> /usr/share/zoneinfo/None\n",
     "Correcting localtime link to ~/zoneinfo/None\n" + zone_reset, default_zone},
    {"no_local_time_and_no_downloads", "~/localtime (absent)\n~/tz (absent)\n", zone_reset,
     default_zone},

    {"reset_fails", on("2016e"), incompatible + no_link_made + unable, on_system,
     fail("symlink", 1, EROFS)},
    {"rewrite_of_the_zone_fails", old_zone,
     corrected + "create_symlink: from ~/localtime to ~/zoneinfo/Asia/Tokyo\n" + zone_reset,
     default_zone, fail("symlink", 1, EROFS)},
    {"walk_fails", newest("2016c"),
     "tz_icu::initialize: fts_open of ~/tz/2016c/icutz failed, Cannot allocate memory (ENOMEM)\n"
     "Unable to locate data; resetting to system partition (ENOMEM)\n",
     "", fail("fts_open", 1, ENOMEM)},
    {"no_memory_to_remove_links", no_link + "/var/db/icutz -> /usr\n",
     "Could not remove /var/db/icutz\n" + bad_link + zoneinfo_stays +
         "unlink of ICU softlink failed\n",
     on_system + "~/icutz -> /usr\n", fail("unlink", 0, 0)},
    {"no_memory_to_read_links", "/var/db/icutz -> /usr\n", not_migrated + unable + zone_reset,
     "/var/db/icutz (absent)\n" + default_zone, fail("readlink", 0, 0)},
    {"no_memory_to_read_the_zoneinfo_link", "", invalid, "", fail("readlink", 2, 0)},
    {"nobody_reads", newest("2016c") + no_link, "", on("2016c") + record("2016b.1.0_2016c"),
     close_pipe},
    {"no_file_may_grow", newest("2016c") + old_zone, "", on("2016c") + record("") + default_zone,
     limit(RLIMIT_FSIZE, 0)},
    {"long_letters", version(letters) + newest("2016c"), refused("2016c", letters + ".1.0"), "",
     limit(RLIMIT_STACK, 256 << 10)},
};

class driver_test : public device, public ::testing::WithParamInterface<boot_case> {};

TEST_P(driver_test, boot) {
  put(at_rest);
  put(GetParam().device);
  boot(GetParam().printed, GetParam().changes, GetParam().before);
}

INSTANTIATE_TEST_SUITE_P(of, driver_test, ::testing::ValuesIn(cases),
                         [](const auto& row) { return row.param.name; });

}  // namespace
