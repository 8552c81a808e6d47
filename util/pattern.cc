#include "util/pattern.h"

olm_pattern compile_pattern(const char* pattern) {
  auto options = olm_pattern::ECMAScript;
#ifdef __GLIBCXX__
  // libstdc++'s default matcher recurses once per character and overflows the stack on long words;
  // __polynomial doesn't, and matches the same.
  options |= std::regex_constants::__polynomial;
#endif
  return olm_pattern(pattern, options);
}
