#pragma once

#include <string_view>

// Faults on demand. faults.cc stands in for these functions of the whole program: fts_open, read,
// readlink, symlink, unlink, warn, which never fails, and operator new.
struct fault {
  std::string_view call;   // whose calls fail; none's if empty
  int error = 0;           // the error number; operator new throws std::bad_alloc instead
  int first = 1;           // the first of its calls that fails, counted from 1
  bool and_later = false;  // whether each call after that fails too
  int seen = 0;            // how many of its calls there were, and
  bool struck = false;     // whether one has failed
};
inline fault planned_fault;

inline int last_walk_options;  // of fts_open
inline int last_warned_error;  // the error number that warn was to tell
