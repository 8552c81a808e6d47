#include <sys/xattr.h>

#include "dataset/icu.h"
#include "device.h"
#include "driver/link_state.h"
#include "util/first_word.h"
#include "util/primitives.h"
#include "util/version.h"

using units_test = device;

const string downloads = "/var/db/timezone/tz/";

TEST_F(units_test, versions_are_strictly_ordered) {
  const string ascending[] = {
      "999a",        "2016a",  "2016a.0", "2016a.0.5", "2016a.1.0", "2016a.9.10", "2016a.9.32768",
      "2016a.010.2", "2016az", "2016aza", "2016b",     "02019a",    "2147483647a"};
  for (const auto& a : ascending) {
    for (const auto& b : ascending) {
      EXPECT_EQ(olm_version(a) > olm_version(b), &a > &b) << a << " and " << b;
      EXPECT_EQ(olm_version(a) == olm_version(b), &a == &b) << a << " and " << b;
    }
  }
}

TEST_F(units_test, near_misses_are_no_versions) {
  olm_version version("2016a.1.0");
  for (const auto* text : {"2016", "a", "2016A", "2016z.", "2016a.1.", "2016a..1", "2016a.1.2.3",
                           "2016a-1", "2016a.1.0/", " 2016a", "-2016a"}) {
    version.parse(text);
    EXPECT_EQ(version, olm_version()) << text;
  }
  for (const auto* text : {"2147483648a", "2016a.2147483648", "2016a.0.2147483648"})
    EXPECT_THROW(version.parse(text), std::out_of_range) << text;
}

TEST_F(units_test, only_the_text_of_a_zoneinfo_link_counts) {
  EXPECT_EQ(parse_zoneinfo_link(downloads + "x/zoneinfo"), downloads + "x");
  EXPECT_EQ(parse_zoneinfo_link(downloads + "repeated//slashes"), downloads + "repeated/");
  for (const auto* text : {"tz/x/zoneinfo", "/usr/share/zoneinfo", "/usr/share/zoneinfo.default/",
                           "/var/db/timezone/tz/x", "/var/db/timezone/tz//zoneinfo",
                           "/var/db/timezone/tz-x/zoneinfo", "/mnt/var/db/timezone/tz/x/zoneinfo"})
    EXPECT_THROW(parse_zoneinfo_link(text), filesystem_error) << text;
}

TEST_F(units_test, an_error_is_told_and_stays_the_error_number) {
  put("/file = text\n");
  EXPECT_THROW(primitive::remove("/file/child"), filesystem_error);
  EXPECT_TRUE(errno == ENOTDIR && last_warned_error == ENOTDIR);
  EXPECT_THROW(primitive::read_symlink("/file/child"), filesystem_error);
  EXPECT_THROW(primitive::read_symlink("/file"), filesystem_error);
  EXPECT_TRUE(errno == EINVAL && last_warned_error == EINVAL);
  EXPECT_THROW(primitive::create_symlink("/none", "/file"), filesystem_error);
  EXPECT_TRUE(errno == EEXIST && last_warned_error == EEXIST);
}

TEST_F(units_test, a_word_ends_at_white_space_and_its_file_somewhere) {
  put("/link -> file\n/pipe (pipe)\n/large = word other\n/long = " + string(9000, 'x') + "\n");
  EXPECT_EQ(read_first_word("/pipe"), "");
  for (const char blank : {' ', '\t', '\v', '\f', '\r'}) {
    put(string("/file = ") + blank + "\xEF\xBB\xBFword" + blank + "other\n");
    EXPECT_EQ(read_first_word("/link"), "\xEF\xBB\xBFword") << static_cast<int>(blank);
  }
  ASSERT_EQ(truncate("/large", 16 << 20), 0);
  EXPECT_EQ(read_first_word("/large"), "word");
  ASSERT_EQ(truncate("/large", (16 << 20) + 1), 0);
  EXPECT_EQ(read_first_word("/large"), "");
  ASSERT_EQ(fchdir(outside), 0);
  EXPECT_EQ(read_first_word("proc/version"), "");  // the kernel tells the size 0
  planned_fault = {"read", 2};
  const string cut = read_first_word("/long");
  EXPECT_EQ(cut.empty(), planned_fault.nth <= 0);
  planned_fault = {"stat"};
  EXPECT_EQ(read_first_word("/long"), "xx");
}

TEST_F(units_test, the_first_public_file_of_the_right_name_names_the_schema) {
  const auto schema_is = [](const string& schema) {
    put("/usr/share/icu/icutzformat.txt = " + schema + "\n");
    return olm_icu(downloads + "x").compatible_schema(olm_icu());
  };
  for (const string other :
       {"icutz44L.dat = ", "icutz44x.dat = ", "icutzl.dat = ", "icutz44le.dat = ",
        "xicutz44l.dat = ", "icutz44l.dat.bak = ", "icutz44lxdat = ", "sub/icutz44l.dat = ",
        "icutz44l.dat/file = ", "icutz44l.dat (pipe)",
        "icutz44l.dat -> /usr/share/icu/icutzformat.txt"}) {
    put("~/tz/x (absent)\n~/tz/x/icutz/" + other + "\n");
    EXPECT_TRUE(schema_is("")) << other;
  }
  put("~/tz/x/icutz -> ../../icu\n~/icu/icutz4e.dat = \n~/icu/icutz44l.dat = \n");
  const auto first_file = fs::directory_iterator(expand("~/icu"))->path();
  const string first = first_file.stem() == "icutz44l" ? "44l" : "4e";
  chmod(first_file.c_str(), S_IRUSR | S_IROTH);
  EXPECT_TRUE(schema_is(first));
  chmod(first_file.c_str(), S_IRUSR | S_IRGRP);
  EXPECT_TRUE(schema_is(first == "4e" ? "44l" : "4e"));
}

TEST_F(units_test, a_walk_that_cannot_start_is_an_error) {
  EXPECT_THROW(olm_icu(string(1, '\0')), filesystem_error);  // fts_open(3) takes no empty path
  EXPECT_EQ(errno, ENOENT);
  EXPECT_STREQ(printed, "tz_icu::initialize: fts_open of  failed, No such file or directory\n");
}

TEST_F(units_test, the_directories_get_class_d) {
  put("~/tz (directory)\n");
  if (setxattr("/var/db/timezone/tz", "user.protection_class", "BB", 2, 0) != 0) GTEST_SKIP();
  boot();
  for (const auto* path : {"/var/db/timezone", "/var/db/timezone/tz"}) {
    char value[] = "none";
    getxattr(path, "user.protection_class", value, sizeof value);
    EXPECT_STREQ(value, "4one") << path;
  }
}
