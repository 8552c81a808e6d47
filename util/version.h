#pragma once

#include <cstdint>
#include <string>

// The parsed form of a data set's version string, for instance 2016a.1.0: a release of the tz
// database and, optionally, one or two numbers. A default-constructed record is the unknown
// version, which every known one is greater than.
struct olm_version {
  // What a number is when its part of the string is absent or the version is unknown.
  static constexpr std::int32_t absent = -1;

  std::int32_t year = absent;
  std::string letters;  // lower-case; empty when unknown
  // Older C libraries have function-like macros of these two names: never write a parenthesis
  // straight after one.
  std::int32_t major = absent;
  std::int32_t minor = absent;

  olm_version() = default;
  // As parse(text) on an unknown version.
  explicit olm_version(const std::string& text);

  // Replaces the record by what `text`, the whole of it, says. A text that is no version string
  // makes the record the unknown version and prints
  //   "Cannot parse version string TEXT, results.size() = 0"
  //   "Cannot parse version string TEXT"
  // Raises std::out_of_range, with nothing printed, for a number above 2147483647; the record is
  // then of no use.
  void parse(const std::string& text);
};

// Whether `a` is the later version: by year, then letters as text, then major, then minor.
bool operator>(const olm_version& a, const olm_version& b);

bool operator==(const olm_version& a, const olm_version& b);
