#include <unistd.h>

#include <cerrno>
#include <stdexcept>

#include "sandbox.h"
#include "util/first_word.h"
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
  for (std::size_t i = 0; i < ascending.size(); ++i) {
    for (std::size_t j = 0; j < ascending.size(); ++j) {
      EXPECT_EQ(ascending[i] > ascending[j], i > j) << i << ' ' << j;
      EXPECT_EQ(ascending[i] == ascending[j], i == j) << i << ' ' << j;
    }
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
    EXPECT_TRUE(ended(run(parse), 0, {line + ", results.size() = 0", line}));
  }
}

TEST_F(util_test, numbers_beyond_32_bits_raise_in_silence) {
  for (const auto* text : {"2147483648a", "2016a.4294967296", "2016a.1.99999999999999999999"}) {
    EXPECT_THROW(olm_version{text}, std::out_of_range) << text;
  }
}

// What whole runs don't come to.
TEST_F(util_test, primitives) {
  put({{"/var/file", ""}, {"/var/loop", "> /var/loop"}, {"/var/dangling", "> /nowhere"}});
  EXPECT_TRUE(ended(run([] { return primitive::remove("/var/file/%s%n"), 0; }), ENOTDIR,
                    {"remove: could not remove /var/file/%s%n: Not a directory"}));
  EXPECT_TRUE(ended(run([] { return primitive::read_symlink("/var/loop/x").empty(); }), ELOOP,
                    {"read_symlink: /var/loop/x: Too many levels of symbolic links"}));
  put({{"/var/long", "> " + std::string(1100, 'x')}});
  EXPECT_EQ(primitive::read_symlink("/var/long"), std::string(1024, 'x'));
  const auto raise_unheard = [] {
    close(STDERR_FILENO);
    try {
      primitive::create_symlink("/", "/var/dangling");
    } catch (int error) {
      return error == EEXIST && errno == EEXIST ? 0 : 1;
    }
    return 2;
  };
  EXPECT_TRUE(ended(run(raise_unheard), 0, {}));
}

TEST_F(util_test, first_word) {
  put({{"/var/other", "other"}});
  const std::string long_word(4 << 20, 'w');
  const std::pair<std::string, std::string> cases[] = {{" \t\n\v\f\r2016a 2016b", "2016a"},
                                                       {"2016a", "2016a"},
                                                       {"\n\n ", ""},
                                                       {"", ""},
                                                       {absent, ""},
                                                       {directory, ""},
                                                       {"> /var/other", "other"},
                                                       {long_word + " x", long_word}};
  for (const auto& [entry, word] : cases) {
    put({{"/var/file", entry}});
    EXPECT_TRUE(first_word("/var/file") == word) << entry.substr(0, 40);
  }
}

}  // namespace
