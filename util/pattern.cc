#include "util/pattern.h"

olm_pattern compile_pattern(const char* pattern) {
  auto options = olm_pattern::ECMAScript;
#ifdef __GLIBCXX__
  // This library's usual matcher calls itself once for every character, so that a long word
  // overflows the stack. With this option of its own it walks the word once, in a loop; what
  // matches stays the same.
  options |= std::regex_constants::__polynomial;
#endif
  return olm_pattern(pattern, options);
}
