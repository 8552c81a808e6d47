#include <sys/xattr.h>

#include <stdexcept>

#include "dataset/dataset.h"
#include "dataset/icu.h"
#include "dataset/zoneinfo.h"
#include "device.h"
#include "driver/link_state.h"
#include "util/first_word.h"
#include "util/primitives.h"
#include "util/version.h"

using units_test = device;

const text downloads = "/var/db/timezone/tz/";

TEST_F(units_test, versions_are_strictly_ordered) {
  const text ascending[] = {"0a",      "999a",      "2016a",     "2016a.0",    "2016a.0.5",
                            "2016a.1", "2016a.1.0", "2016a.9.9", "2016a.9.10", "2016a.010.2",
                            "2016az",  "2016b",     "02019a",    "2147483647a"};
  for (const auto& a : ascending) {
    for (const auto& b : ascending) {
      EXPECT_EQ(olm_version(a) > olm_version(b), &a > &b) << a << " and " << b;
      EXPECT_EQ(olm_version(a) == olm_version(b), &a == &b) << a << " and " << b;
    }
  }
  EXPECT_THROW(olm_version("2016a.1.2147483648"), std::out_of_range);
}

TEST_F(units_test, other_texts_are_no_version_no_zoneinfo_link_and_no_download) {
  for (const text other :
       {"", ".1.0", "2016", "a", "2016A", "2016a.", "2016a.1.", " 2016a", "2016a.1.2.3", "2016a-1",
        "2016a.1.0/", "-2016a", "var/db/timezone/tz/", "/var/db/timezone/tz//",
        "/mnt/var/db/timezone/tz/x/", "/var/db/timezone/tzz/x/z", "/usr/share/zoneinfo.default/"}) {
    olm_version version("2016a.1.0");
    version.parse(other);
    EXPECT_EQ(version, olm_version()) << other;
    EXPECT_THROW(parse_zoneinfo_link(other), filesystem_error) << other;
    EXPECT_THROW(olm_dataset("/" + other), std::invalid_argument) << other;
  }
  EXPECT_EQ(parse_zoneinfo_link(downloads + "x/zoneinfo"), downloads + "x");
  EXPECT_EQ(parse_zoneinfo_link(downloads + "a/b/"), downloads + "a/b");
}

TEST_F(units_test, an_error_is_told_and_thrown_and_stays_the_error_number) {
  for (const int error : {EROFS, EACCES, EPERM, ELOOP, ENOTDIR}) {
    for (const auto* call : {"unlink", "readlink", "symlink"}) {
      planned_fault = {call, error};
      try {
        primitive::remove("/none");
        primitive::read_symlink("/none");
        primitive::create_symlink("/none", "/made");
        ADD_FAILURE() << call;
      } catch (const filesystem_error thrown) {
        EXPECT_TRUE(thrown == error && errno == error && last_warned_error == error) << call;
      }
    }
  }
}

TEST_F(units_test, only_a_word_that_ends_is_read_and_an_unreadable_file_exists) {
  put("/link -> file\n/blank = \t\n/loop -> loop\n/pipe (pipe)\n/long = " + text(9000, 'x') + "\n");
  for (const auto* path : {"/blank", "/none", "/loop", "/pipe", "/"})
    EXPECT_EQ(read_first_word(path), "") << path;
  for (const char blank : {' ', '\t', '\v', '\f', '\r'}) {
    put(text("/file = ") + blank + "word" + blank + "other\n");
    EXPECT_EQ(read_first_word("/link"), "word") << static_cast<int>(blank);
  }
  planned_fault = {"read", EIO, 2};
  const text cut = read_first_word("/long");
  EXPECT_EQ(cut.empty(), planned_fault.seen >= 2);
  chmod("/", S_IRWXU | S_IXGRP);
  chmod("/file", 0);
  EXPECT_LE(setreuid(1, geteuid()), 0);  // the user of whom access(2) asks
  EXPECT_TRUE(primitive::exists("/file"));
  EXPECT_LE(setreuid(geteuid(), geteuid()), 0);
}

TEST_F(units_test, the_first_public_file_of_the_right_name_names_the_schema) {
  const auto schema_is = [](const text& schema) {
    put("/usr/share/icu/icutzformat.txt = " + schema + "\n");
    return olm_icu(downloads + "x").compatible_schema(olm_icu());
  };
  for (const text other : {"icutz44l.dat = ", "icutz90B.dat = ", "icutz90x.dat = ", "icutzb.dat = ",
                           "icutz90be.dat = ", "xicutz90b.dat = ", "icutz90b.dat.bak = ",
                           "icutz90bxdat = ", "sub/icutz90b.dat = ", "icutz1b.dat/file = ",
                           "icutz2b.dat (pipe)", "icutz3b.dat -> icutz44l.dat"})
    put("~/tz/x/icutz/" + other + "\n");
  EXPECT_TRUE(schema_is("44l"));
  put("~/tz/x/icutz -> ../../icu\n~/icu/icutz44l.dat = data\n~/icu/icutz109e.dat = data\n");
  const fs::path first = fs::directory_iterator(full("~/icu"))->path();
  EXPECT_TRUE(schema_is(first.stem() == "icutz44l" ? "44l" : "109e"));
  chmod(first.c_str(), S_IRUSR | S_IWUSR | S_IRGRP);
  EXPECT_TRUE(schema_is(first.stem() == "icutz44l" ? "109e" : "44l"));
}

TEST_F(units_test, data_sets) {
  put("/usr/share/icu/icutzformat.txt = 44l\n/usr/share/zoneinfo.default/+VERSION = 2016b\n");
  const olm_dataset system;
  const olm_dataset same(downloads + "2016b.1.0");
  EXPECT_TRUE(system == olm_dataset("") && !(system == same || same == system));
  EXPECT_FALSE(olm_dataset(downloads + "999a").newer_than(system));
  EXPECT_FALSE(olm_dataset(downloads + "x").newer_than(system));
  std::memset(printed, 0, printed_size);
  EXPECT_FALSE(olm_icu().compatible_schema(olm_zoneinfo()));
  EXPECT_THROW(olm_icu(text(1, '\0')), filesystem_error);  // fts_open(3) takes no empty path
  EXPECT_EQ(errno, ENOENT);
  EXPECT_STREQ(printed,
               "olm_icu::compatible_schema: could not dynamic_cast other component\n"
               "tz_icu::initialize: fts_open of  failed, No such file or directory\n");
}

TEST_F(units_test, the_directories_have_class_d_and_the_record_is_public) {
  put("~/tz/2016a/file = text\n~/tz_latest -> ~/tz/2016a\n");
  for (const auto& path : {full("~/"), full("~/tz")}) {
    if (setxattr(path.c_str(), "user.protection_class", "B", 1, 0) != 0) GTEST_SKIP();
    boot();
    char value[] = "none";
    getxattr(path.c_str(), "user.protection_class", value, sizeof value);
    EXPECT_STREQ(value, "4one") << path;
  }
  EXPECT_EQ(fs::status(full("~/TZVersionDiffRecord")).permissions(), fs::perms{0644});
}
