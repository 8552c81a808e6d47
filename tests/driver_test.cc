#include <sys/resource.h>

#include "driver/link_state.h"
#include "sandbox.h"

namespace {

const std::string version_file = "/usr/share/zoneinfo.default/+VERSION";
const tree on_system = {{"~/zoneinfo", "> /usr/share/zoneinfo.default"}, {"~/icutz", absent}};
// A device on which a run changes and prints nothing.
const tree at_rest = on_system + tree{{version_file, "> /usr/share/version"},
                                      {"/usr/share/version", " \t\v\n\f\r2016b other"},
                                      {"/usr/share/zoneinfo.default/Asia/Tokyo", "zone"},
                                      {"/usr/share/icu/icutzformat.txt", "44l\n"},
                                      {"~/localtime", "> ~/zoneinfo/Asia/Tokyo"}};
tree on(const std::string& version) {
  const std::string link = "> ~/tz/" + version;
  return {{"~/zoneinfo", link + "/zoneinfo"}, {"~/icutz", link + "/icutz"}};
}
tree download(const std::string& version, const std::string& schema = "44l") {
  return {{"~/tz/" + version + "/icutz/icutz" + schema + ".dat", "data"}};
}
tree newest(const std::string& version) { return {{"~/tz_latest", "> ~/tz/" + version}}; }
tree active(const std::string& version, const std::string& schema = "44l") {
  return download(version, schema) + on(version);
}
tree offer(const std::string& version, const std::string& schema = "44l") {
  return download(version, schema) + newest(version);
}
tree recorded(const std::string& text) { return {{"~/TZVersionDiffRecord", text}}; }

const std::string unread = "read_symlink: ";
const std::string unremoved = "remove: could not remove ";
const std::string unmade = "create_symlink: from ";
const std::string bad_link = "Bad zoneinfo link ";
const std::string invalid = "Invalid current symlinks; resetting to system partition";
const std::string overtaken = "Symlink points at data incompatible with installed system";
const std::string unable = "Unable to locate data; resetting to system partition";
const std::string no_schema = "No ICU schema found for ~/tz/2016c";
std::string refused(const std::string& update, const std::string& current) {
  return "New update not compatible or older version: " + update + " vs. " + current;
}
lines unparsed(const std::string& text) {
  const std::string line = "Cannot parse version string " + text;
  return {line + ", results.size() = 0", line};
}

class driver_test : public sandbox {
 protected:
  // Runs the program on a device at rest changed by `device`. The run must print `expected` and
  // leave all but `changes` as it was.
  static void expect(
      const tree& device, const tree& changes, const lines& expected,
      const std::function<void()>& before = [] {}) {
    clear();
    put(at_rest + device);
    tree left = look();
    for (const auto& [path, entry] : changes) {
      left.erase(path);
      if (entry != absent) left[path] = entry;
    }
    EXPECT_EQ(boot(before), expected);
    EXPECT_EQ(look(), left);
  }
};

TEST_F(driver_test, decides_by_format_and_age) {
  expect({}, {}, {});
  expect(offer("2016c.1.0"), on("2016c.1.0") + recorded("2016b.1.0_2016c.1.0"), {});
  expect(active("2016c") + offer("2016d") + recorded("a_record_longer_than_the_next"),
         on("2016d") + recorded("2016c_2016d"), {});
  expect(active("2016c") + newest("2016c"), {}, {refused("2016c", "2016c")});
  expect(offer("2016b.1.0"), {}, {refused("2016b.1.0", "2016b.1.0")});
  expect(offer("2016c", "46l"), {}, {refused("2016c", "2016b.1.0")});
  expect(active("2016b"), on_system, {overtaken});
  expect(active("2016a.1") + offer("2016a.2"), on("2016a.2") + recorded("2016b.1.0_2016a.2"),
         {overtaken});
  expect(active("2016a") + newest("2016a"), on_system, {overtaken, refused("2016a", "2016a")});
  expect(active("2016c", "46l") + offer("2016d", "46l"), on_system,
         {overtaken, refused("2016d", "2016c")});
  expect(active("2016c", "46l") + offer("2016d"), on("2016d") + recorded("2016b.1.0_2016d"),
         {overtaken});
}

TEST_F(driver_test, goes_on_without_what_is_missing_or_bad) {
  expect({{"~/zoneinfo", absent}}, on_system, {bad_link, invalid});
  expect({{"~/zoneinfo", "file"}}, on_system, {unread + "~/zoneinfo", invalid});
  expect(offer("2016c") + tree{{"~/zoneinfo", "> /%s%n"}, {"~/icutz", "> /nowhere"}},
         on("2016c") + recorded("2016b.1.0_2016c"), {bad_link + "/%s%n", invalid});
  for (const auto* entry : {absent, pipe_file, directory, " \n"}) {
    expect(offer("2016c") + tree{{version_file, entry}}, on("2016c") + recorded(".1.0_2016c"),
           unparsed(".1.0") + unparsed(".1.0"));
  }
  for (const auto* entry : {directory, pipe_file, "> /dev/none"}) {
    expect(offer("2016c") + recorded(entry), on("2016c"), {});
  }
  expect(newest("2016c"), {}, {no_schema, refused("2016c", "2016b.1.0")});
  expect(newest("2016c") + tree{{"/usr/share/icu/icutzformat.txt", pipe_file}},
         on("2016c") + recorded("2016b.1.0_2016c"), {no_schema});
}

TEST_F(driver_test, every_error_ends_on_the_system_partition) {
  expect(active("2016c") + tree{{"~/tz_latest", "file"}}, on_system,
         {unread + "~/tz_latest", unable});
  expect(active("2016c") + tree{{"~/tz_latest", "> /%s%n"}}, on_system,
         {"olm_dataset::create_components: bad path /%s%n", unable});
  for (const auto* latest : {"2147483648a", "2016a.2147483648", "2016a.1.2147483648"}) {
    expect(active("2016c") + newest(latest), on_system, {unable});
  }
  expect(on("2147483648a"), on_system, {unable});
  expect({{version_file, absent}, {"~/tz_latest", "file"}}, {},
         unparsed(".1.0") + lines{unread + "~/tz_latest", unable} + unparsed(".1.0"));
  const lines blocked = lines{unremoved + "~/icutz", "unlink of ICU softlink failed"};
  expect(offer("2016c") + tree{{"~/icutz", directory}, {"/var/db/icutz", "> /nowhere"}}, {},
         blocked + lines{unmade + "~/icutz to ~/tz/2016c/icutz", unable} + blocked);
}

TEST_F(driver_test, an_error_of_the_last_reset_ends_the_run) {
  const tree unrepaired = {{"~/localtime", absent}};
  expect(tree{{version_file, "2147483648a"}} + unrepaired, {}, {unable, "status 1"});
  const lines blocked = lines{unremoved + "~/zoneinfo", "Unlink of zoneinfo softlink failed",
                              unmade + "~/zoneinfo to /usr/share/zoneinfo.default"};
  expect(tree{{"~/zoneinfo", directory}, {"~/icutz", "> /nowhere"}} + unrepaired, {},
         lines{unread + "~/zoneinfo", invalid} + blocked + lines{unable} + blocked +
             lines{"status 1"});
}

TEST_F(driver_test, a_word_of_any_length_ends_by_the_rules) {
  const auto small_stack = [] {
    const rlimit limit{256 << 10, 256 << 10};
    setrlimit(RLIMIT_STACK, &limit);
  };
  const std::string digits(4 << 20, '7');
  const std::string late = "2016" + std::string(4 << 20, 'z');
  expect(offer("2016c") + tree{{version_file, late}}, {}, {refused("2016c", late + ".1.0")},
         small_stack);
  expect(offer("2016c") + tree{{version_file, digits}},
         on("2016c") + recorded(digits + ".1.0_2016c"),
         unparsed(digits + ".1.0") + unparsed(digits + ".1.0"), small_stack);
  expect({{version_file, digits + "a"}}, {}, {unable, "status 1"}, small_stack);
}

TEST_F(driver_test, a_link_names_a_data_set_by_its_shape_alone) {
  for (const std::string path : {"~/tz/2024a.1.0", "~/tz/x", "~/tz/a/b"}) {
    EXPECT_EQ(parse_zoneinfo_link(spelled_out(path) + "/"), spelled_out(path));
    EXPECT_EQ(parse_zoneinfo_link(spelled_out(path) + "/zoneinfo"), spelled_out(path));
  }
  for (const std::string link : {"~/tz/2024a.1.0", "~/tz//zoneinfo", "~/tz/", "zoneinfo",
                                 "/usr/share/zoneinfo.default/", "/usr/share/zoneinfo"}) {
    const auto parse = [&link] { return parse_zoneinfo_link(spelled_out(link)).empty() ? 1 : 0; };
    EXPECT_EQ(run(parse), (lines{bad_link + link, "status 255"}));
  }
}

TEST_F(driver_test, moves_and_removes_legacy_entries) {
  const std::string legacy = "/var/db/icutz";
  const std::string not_migrated = "Could not migrate /var/db/icutz to ~/icutz";
  expect({{legacy, "> ../db"}}, {{legacy, absent}, {"~/icutz", "> ../db"}}, {});
  expect(tree{{legacy, "> /usr"}} + active("2016c"), {{legacy, absent}}, {});
  expect({{legacy, "> /nowhere"}}, {}, {});
  expect({{legacy, "> /nowhere"}, {"~/zoneinfo", absent}}, on_system + tree{{legacy, absent}},
         {bad_link, invalid});
  expect({{legacy, "> /usr"}, {"~/icutz", "> /nowhere"}}, {{legacy, absent}},
         {unmade + "~/icutz to /usr", not_migrated});
  expect({{legacy, directory}}, {},
         {unread + legacy, not_migrated, unremoved + legacy, "Could not remove /var/db/icutz"});
  expect({{"/var/db/icu", directory}}, {{"/var/db/icu", absent}}, {});
  expect({{"/var/db/icu/file", ""}}, {}, {});
}

TEST_F(driver_test, repairs_the_local_time_link) {
  const std::string fixed = "Correcting localtime link to ~/zoneinfo";
  const std::string reset = "localtime link invalid; resetting to America/Los_Angeles";
  const std::string default_link = "> ~/zoneinfo/America/Los_Angeles";
  const struct {
    std::string before, after;
    lines printed;
  } cases[] = {
      {"> ~/zoneinfo/No/Such", "> ~/zoneinfo/No/Such", {}},
      {"> ~/zoneinfo", "> ~/zoneinfo", {}},
      {"> /usr/share/zoneinfo/Asia/Tokyo", "> ~/zoneinfo/Asia/Tokyo", {fixed + "/Asia/Tokyo"}},
      {"> /usr/share/zoneinfo/No", default_link, {fixed + "/No", reset}},
      {"> /usr/share/zoneinfo.default", default_link, {fixed + ".default", reset}},
      {absent, default_link, {reset}},
      {"> Asia/Tokyo", default_link, {reset}},
      {directory, default_link, {unread + "~/localtime", reset}}};
  for (const auto& [before, after, printed] : cases) {
    expect({{"~/localtime", before}}, {{"~/localtime", after}}, printed);
  }
  expect({{"~/localtime", absent}, {"~/localtime/file", ""}}, {},
         {unread + "~/localtime", reset, unmade + "~/localtime to ~/zoneinfo/America/Los_Angeles",
          "status 1"});
}

}  // namespace
