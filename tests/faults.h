#pragma once

#include <fts.h>
#include <unistd.h>

#include <cerrno>
#include <new>
#include <string>
#include <vector>

// Makes the `nth` call of the C library's function `name` fail, or each if that is 0: with the
// error number `error`, or by throwing std::bad_alloc if that is 0.
struct fault {
  std::string name;
  int nth, error;
};
inline fault planned_fault;
inline std::vector<int> recorded_arguments;  // of the last call that passes some here

inline bool fails(const char* name, const std::vector<int>& arguments = {}) {
  if (!arguments.empty()) recorded_arguments = arguments;
  if (planned_fault.name != name || planned_fault.nth-- > 1) return false;
  if (planned_fault.nth == 0) planned_fault.name.clear();
  if (planned_fault.error == 0) throw std::bad_alloc();
  errno = planned_fault.error;
  return true;
}

// For the files of the program that are compiled with this header ahead of them.
#ifdef OLMBOOT_FAULTS
#define access(path, mode) (fails("access", {mode}) ? -1 : access(path, mode))
#define fts_open(at, how, by) (fails("fts_open", {how, bool(by)}) ? nullptr : fts_open(at, how, by))
#define readlink(...) (fails("readlink") ? -1 : readlink(__VA_ARGS__))
#define symlink(...) (fails("symlink") ? -1 : symlink(__VA_ARGS__))
#define unlink(...) (fails("unlink") ? -1 : unlink(__VA_ARGS__))
#include <fcntl.h>
#define fcntl(...) fails("fcntl", {__VA_ARGS__})
#endif
