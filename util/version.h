#pragma once

#include <cstdint>
#include <string>

// The parsed form of a data set's version string, such as 2016a.1.0: a release of the tz database
// and, optionally, one or two numbers. A default-constructed record is the unknown version; every
// known version is greater.
struct olm_version {
  // The value of a number that the string leaves out, and of each in the unknown version.
  static constexpr std::int32_t absent = -1;

  std::int32_t year = absent;
  std::string letters;  // lower-case; empty when unknown
  // Some C libraries' headers have function-like macros of these two names: never write a
  // parenthesis straight after one.
  std::int32_t major = absent;
  std::int32_t minor = absent;

  olm_version() = default;
  // The unknown version, then parse(text).
  explicit olm_version(const std::string& text);

  // Replaces the record by what the whole of `text` says. A text that is not a version string gives
  // the unknown version and prints
  //   "Cannot parse version string TEXT, results.size() = 0"
  //   "Cannot parse version string TEXT"
  // For a number above 2147483647, prints nothing and throws std::out_of_range; the record is then
  // of no use.
  void parse(const std::string& text);
};

// Returns whether `a` is the later version: by year, then letters as text, then major, then minor.
bool operator>(const olm_version& a, const olm_version& b);

bool operator==(const olm_version& a, const olm_version& b);
