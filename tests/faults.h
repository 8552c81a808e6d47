#pragma once

#include <err.h>
#include <fts.h>
#include <unistd.h>

#include <cerrno>
#include <cstdarg>
#include <new>
#include <string>
#include <vector>

// A call to the C library that is to fail: the `nth` of that name, or each if that is 0. It fails
// with the number `error`, or throws std::bad_alloc if that is 0.
struct fault {
  std::string call;
  int nth, error;
};
inline fault planned_fault;
inline std::vector<int> recorded_arguments;  // of the last call that passes some here

inline bool fails(const char* call, const std::vector<int>& arguments = {}) {
  if (!arguments.empty()) recorded_arguments = arguments;
  if (planned_fault.call != call) return false;
  if (planned_fault.nth > 1) {
    --planned_fault.nth;
    return false;
  }
  if (planned_fault.nth == 1) planned_fault.call.clear();
  if (planned_fault.error == 0) throw std::bad_alloc();
  errno = planned_fault.error;
  return true;
}

// The C library's warn, after which the error number is another, as it may be.
inline void warn_and_forget(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  vwarn(format, arguments);
  va_end(arguments);
  errno = EDOM;
}

// For the files of the program that are compiled with this header ahead of them.
#ifdef OLMBOOT_FAULTS
#define warn warn_and_forget
#define access(path, mode) (fails("access", {mode}) ? -1 : access(path, mode))
#define fts_open(path, flags, by) (fails("fts_open", {flags}) ? nullptr : fts_open(path, flags, by))
#define readlink(...) (fails("readlink") ? -1 : readlink(__VA_ARGS__))
#define symlink(...) (fails("symlink") ? -1 : symlink(__VA_ARGS__))
#define unlink(...) (fails("unlink") ? -1 : unlink(__VA_ARGS__))
#include <fcntl.h>
#define fcntl(...) fails("fcntl", {__VA_ARGS__})
#endif
