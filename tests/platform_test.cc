#include <sys/xattr.h>
#include <unistd.h>

#include <cstdlib>

#include "sandbox.h"

namespace {

using platform_test = sandbox;

void lose_the_reader() {
  int ends[2];
  if (pipe(ends) != 0) std::abort();
  dup2(ends[1], STDERR_FILENO);
  close(ends[0]);
}
void close_all() {
  for (const int standard : {0, 1, 2}) close(standard);
}

TEST_F(platform_test, a_run_that_nobody_hears_does_its_work) {
  for (const auto& before : {lose_the_reader, close_all}) {
    put({{"~/tz_latest", "> ~/tz/2016c"}, {"~/zoneinfo", absent}, {"~/localtime", absent}});
    const tree expected = look() + tree{{"~/zoneinfo", "> ~/tz/2016c/zoneinfo"},
                                        {"~/icutz", "> ~/tz/2016c/icutz"},
                                        {"~/TZVersionDiffRecord", ".1.0_2016c"},
                                        {"~/localtime", "> ~/zoneinfo/America/Los_Angeles"}};
    EXPECT_EQ(boot(before), lines{});
    EXPECT_EQ(look(), expected);
  }
}

TEST_F(platform_test, both_directories_are_put_into_class_d) {
  for (const auto* path : {"/var/db/timezone", "/var/db/timezone/tz"}) {
    if (setxattr(path, "user.protection_class", "?", 1, 0) != 0) GTEST_SKIP() << "no attributes";
    boot();
    char value[2] = {};
    EXPECT_EQ(getxattr(path, "user.protection_class", value, sizeof value), 1);
    EXPECT_EQ(value[0], '4') << path;
  }
}

}  // namespace
