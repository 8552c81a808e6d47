#pragma once

#include <regex>

// The standard library's traits without two questions to the locale, which compiling asks for every
// character there is: whether it is in a class such as [:alpha:], and what it is equivalent to. The
// patterns here name neither, and the answers would take longer than all else that a run computes.
struct olm_pattern_traits : std::regex_traits<char> {
  bool isctype(char /*character*/, char_class_type /*mask*/) const { return false; }
  template <typename iterator>
  string_type transform_primary(iterator /*first*/, iterator /*last*/) const {
    return {};
  }
};

using olm_pattern = std::basic_regex<char, olm_pattern_traits>;

// Returns `pattern` compiled, by the ECMAScript grammar. To be done when a run first needs it, and
// once.
// Prints nothing; raises std::regex_error for a malformed pattern.
olm_pattern compile_pattern(const char* pattern);
