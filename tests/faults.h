#pragma once

#include <sys/mman.h>

#include <cerrno>
#include <string_view>

// Faults on demand. faults.cc stands in for these functions of the whole program: read, readlink,
// symlink, unlink, write, operator new, and warn, which never fails.
struct fault {
  std::string_view call;   // whose calls fail; none's if empty
  int error = 0;           // the error number; operator new throws std::bad_alloc instead
  int first = 1;           // the first of its calls that fails, counted from 1
  bool and_later = false;  // whether each call after that fails too
  int seen = 0;            // how many of its calls there were
};
inline fault planned_fault;

// The messages of warn, a line each, in memory that a forked child shares.
inline constexpr std::size_t printed_size = 1 << 18;
inline char* const printed = static_cast<char*>(
    mmap(nullptr, printed_size, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0));
inline int last_warned_error;  // the error number that warn was to tell
