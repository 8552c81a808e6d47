#include <unistd.h>

#include <cerrno>
#include <tuple>

#include "sandbox.h"
#include "util/primitives.h"
#include "util/version.h"

namespace {

using util_test = sandbox;

TEST_F(util_test, versions_are_strictly_ordered) {
  std::vector<olm_version> ascending(1);
  for (const auto* text : {"0a", "2016a", "2016a.0.5", "2016a.1", "2016a.1.0", "2016a.1.1",
                           "2016a.9.9", "2016a.10.02", "2016az", "2016b", "2016z", "2016za.2",
                           "2017a", "2147483647a", "2147483647a.0.2147483647"}) {
    ascending.emplace_back(text);
  }
  for (std::size_t i = 1; i < ascending.size(); ++i) {
    const auto& [a, b] = std::tie(ascending[i - 1], ascending[i]);
    EXPECT_TRUE(b > a && !(a > b) && !(b > b) && !(a == b) && b == b) << i;
  }
  EXPECT_TRUE(olm_version("02016a.01") == olm_version("2016a.1"));
}

TEST_F(util_test, other_texts_give_the_unknown_version_and_two_lines) {
  for (const std::string text : {"", ".1.0", "2016", "a", "2016A", "2016a.", "2016a.1.", " 2016a",
                                 "2016a.1.2.3", "2016a-1", "2016a.1.0/", "-2016a", "%s%n"}) {
    const auto parse = [&text] {
      olm_version version("2016a.1.0");
      version.parse(text);
      return version == olm_version() ? 0 : 1;
    };
    const std::string line = "Cannot parse version string " + text;
    EXPECT_EQ(run(parse), (lines{line + ", results.size() = 0", line}));
  }
}

TEST_F(util_test, primitives_report_and_raise_the_failed_call_s_error) {
  put({{"/var/file", ""}, {"/var/loop", "> /var/loop"}, {"/var/x", "> " + std::string(1100, 'x')}});
  EXPECT_EQ(primitive::read_symlink("/var/x"), std::string(1024, 'x'));
  EXPECT_EQ(run([] { return primitive::remove("/var/file/%s%n"), 0; }),
            (lines{"remove: could not remove /var/file/%s%n", "status 20"}));
  EXPECT_EQ(run([] { return primitive::read_symlink("/var/loop/x").empty(); }),
            (lines{"read_symlink: /var/loop/x", "status 40"}));
  const auto raise_unheard = [] {
    close(STDERR_FILENO);
    try {
      primitive::create_symlink("/", "/var/file");
    } catch (int error) {
      return error == EEXIST && errno == EEXIST ? 0 : 1;
    }
    return 2;
  };
  EXPECT_EQ(run(raise_unheard), lines{});
}

}  // namespace
