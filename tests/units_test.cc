#include <fts.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/xattr.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <regex>
#include <stdexcept>
#include <string>

#include "dataset/dataset.h"
#include "dataset/icu.h"
#include "dataset/zoneinfo.h"
#include "device.h"
#include "driver/link_state.h"
#include "faults.h"
#include "util/first_word.h"
#include "util/pattern.h"
#include "util/primitives.h"
#include "util/version.h"

namespace {

using units_test = device;

const std::string downloads = "/var/db/timezone/tz/";

TEST_F(units_test, versions_are_strictly_ordered) {
  const std::string ascending[] = {"0a",      "999a",      "2016a",     "2016a.0",    "2016a.0.5",
                                   "2016a.1", "2016a.1.0", "2016a.9.9", "2016a.9.10", "2016a.10.02",
                                   "2016az",  "2016b",     "2019a",     "2147483647a"};
  for (const auto& a : ascending) {
    for (const auto& b : ascending) {
      EXPECT_EQ(olm_version(a) > olm_version(b), &a > &b) << a << " and " << b;
      EXPECT_EQ(olm_version(a) == olm_version(b), &a == &b) << a << " and " << b;
    }
  }
  EXPECT_EQ(olm_version("02016a.010"), olm_version("2016a.10"));
  EXPECT_THROW(olm_version("2016a.1.2147483648"), std::out_of_range);
  EXPECT_THROW(compile_pattern("[[:alpha:]]"), std::regex_error);
}

TEST_F(units_test, other_texts_are_no_version_no_zoneinfo_link_and_no_download) {
  run([] {
    for (const std::string text :
         {"", ".1.0", "2016", "a", "2016A", "2016a.", "2016a.1.", " 2016a", "2016a.1.2.3",
          "2016a-1", "2016a.1.0/", "-2016a", "/var/db/timezone/tz//", "/mnt/var/db/timezone/tz/x/",
          "/var/db/timezone/tzz/x/z", "/usr/share/zoneinfo.default/"}) {
      olm_version version("2016a.1.0");
      version.parse(text);
      EXPECT_EQ(version, olm_version()) << text;
      EXPECT_THROW(parse_zoneinfo_link(text), filesystem_error) << text;
      EXPECT_THROW(olm_dataset("/" + text), std::invalid_argument) << text;
    }
    EXPECT_EQ(parse_zoneinfo_link(downloads + "x/zoneinfo"), downloads + "x");
    EXPECT_EQ(parse_zoneinfo_link(downloads + "a/b/"), downloads + "a/b");
    return olm_version().year + 1;
  });
}

TEST_F(units_test, an_error_is_told_and_thrown_and_stays_the_error_number) {
  run([] {
    for (const int error : {EROFS, EACCES, EPERM, ELOOP, ENOTDIR}) {
      for (const auto* call : {"unlink", "readlink", "fts_open", "symlink"}) {
        planned_fault = {call, error};
        try {
          primitive::remove("/none");
          primitive::read_symlink("/none");
          const olm_icu walked("/none");
          primitive::create_symlink("/none", "/made");
          ADD_FAILURE() << call;
        } catch (const filesystem_error thrown) {
          EXPECT_TRUE(thrown == error && errno == error && last_warned_error == error) << call;
        }
      }
    }
    return last_walk_options ^ (FTS_COMFOLLOW | FTS_PHYSICAL | FTS_XDEV);
  });
}

TEST_F(units_test, a_file_exists_that_may_not_be_read) {
  put("/file = text\n");
  chmod(outside("/").c_str(), S_IRWXU | S_IXGRP);
  chmod(outside("/file").c_str(), 0);
  run([] {
    EXPECT_LE(setreuid(1, geteuid()), 0);  // access(2) asks for the real user
    return primitive::exists("/file") ? EXIT_SUCCESS : EXIT_FAILURE;
  });
}

TEST_F(units_test, only_a_word_that_ends_is_read) {
  put("/file = \t\v\f\r word other\n/link -> file\n/blank = \t\n/loop -> loop\n/pipe (pipe)\n");
  put("/t = word\tother\n/v = word\vother\n/f = word\fother\n/r = word\rother\n");
  put("/long = " + std::string(9000, 'x') + "\n");
  run([] {
    for (const auto* path : {"/link", "/t", "/v", "/f", "/r"}) {
      EXPECT_EQ(read_first_word(path), "word") << path;
    }
    for (const auto* path : {"/blank", "/none", "/loop", "/pipe", "/"}) {
      EXPECT_EQ(read_first_word(path), "") << path;
    }
    planned_fault = {"read", EIO, 2};
    EXPECT_EQ(read_first_word("/long").empty(), planned_fault.struck);
    return 0;
  });
}

TEST_F(units_test, the_first_public_file_of_the_right_name_names_the_schema) {
  const auto has_schema = [this](const std::string& schema) {
    put("/usr/share/icu/icutzformat.txt = " + schema + "\n");
    run([] { return olm_icu(downloads + "x").compatible_schema(olm_icu()) ? 0 : 1; });
  };
  put("~/tz/x/icutz/icutz44l.dat = data\n");
  for (const std::string other :
       {"icutz90B.dat = ", "icutz90x.dat = ", "icutzb.dat = ", "icutz90be.dat = ",
        "xicutz90b.dat = ", "icutz90b.dat.bak = ", "icutz90bxdat = ", "sub/icutz90b.dat = ",
        "icutz1b.dat (directory)", "icutz2b.dat (pipe)", "icutz3b.dat -> icutz44l.dat"}) {
    put("~/tz/x/icutz/" + other + "\n");
  }
  has_schema("44l");
  put("~/tz/x/icutz -> ../../icu\n~/icu/icutz44l.dat = data\n~/icu/icutz109e.dat = data\n");
  const fs::path first = fs::directory_iterator(outside("~/icu"))->path();
  has_schema(first.stem().string().substr(std::strlen("icutz")));
  chmod(first.c_str(), S_IRUSR | S_IWUSR | S_IRGRP);
  has_schema(first.stem() == "icutz44l" ? "109e" : "44l");
}

TEST_F(units_test, data_sets) {
  put("/usr/share/icu/icutzformat.txt = 44l\n/usr/share/zoneinfo.default/+VERSION = 2016b\n");
  run(
      [] {
        const olm_dataset system;
        const olm_dataset same(downloads + "2016b.1.0");
        EXPECT_TRUE(system == olm_dataset(""));
        EXPECT_FALSE(system == same || same == system);
        EXPECT_FALSE(olm_dataset(downloads + "999a").newer_than(system));
        EXPECT_THROW(olm_dataset{downloads}, std::invalid_argument);
        EXPECT_FALSE(olm_icu().compatible_schema(olm_zoneinfo()));
        return 0;
      },
      "olm_icu::compatible_schema: could not dynamic_cast other component\n");
}

TEST_F(units_test, the_directories_have_class_d) {
#ifdef OLMBOOT_DATA_PROTECTION
  GTEST_SKIP() << "the kernel keeps the class";
#endif
  put("~/tz (directory)\n");
  if (setxattr(outside("~/").c_str(), "user.protection_class", "B", 1, 0) != 0) GTEST_SKIP();
  run([] {
    close(STDIN_FILENO);  // so that a directory is opened as descriptor 0
    return olmboot_main();
  });
  for (const auto* path : {"~/", "~/tz"}) {
    char value[] = "none";
    getxattr(outside(path).c_str(), "user.protection_class", value, sizeof value);
    EXPECT_STREQ(value, "4one") << path;
  }
}

}  // namespace
