// A fortified C library defines some of these functions in its headers.
#undef _FORTIFY_SOURCE

#include "faults.h"

#include <dlfcn.h>
#include <err.h>
#include <fcntl.h>
#include <fts.h>
#include <sys/syscall.h>
#include <unistd.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstdlib>
#include <new>

static bool fails(std::string_view call) {
  fault& plan = planned_fault;
  if (plan.call != call) return false;
  ++plan.seen;
  if (plan.and_later ? plan.seen < plan.first : plan.seen != plan.first) return false;
  plan.struck = true;
  errno = plan.error;
  return true;
}

extern "C" {

FTS* fts_open(char* const* paths, int how, int (*order)(const FTSENT**, const FTSENT**)) {
  last_walk_options = how;
  // The second is what it is named where narrow offsets and times are the default.
  void* const hidden = dlsym(RTLD_NEXT, sizeof(long) >= 8 ? "fts_open" : "__fts64_open_time64");
  return fails("fts_open") ? nullptr
                           : reinterpret_cast<decltype(&fts_open)>(hidden)(paths, how, order);
}

// The file streams of libstdc++ call it, those of libc++ don't.
ssize_t read(int descriptor, void* buffer, std::size_t size) {
  return fails("read") ? -1 : syscall(SYS_read, descriptor, buffer, size);
}

ssize_t readlink(const char* path, char* buffer, std::size_t size) noexcept {
  return fails("readlink") ? -1 : readlinkat(AT_FDCWD, path, buffer, size);
}

int symlink(const char* target, const char* path) noexcept {
  return fails("symlink") ? -1 : symlinkat(target, AT_FDCWD, path);
}

int unlink(const char* path) noexcept { return fails("unlink") ? -1 : unlinkat(AT_FDCWD, path, 0); }

// Prints the message alone.
void warn(const char* format, ...) {
  last_warned_error = errno;
  va_list arguments;
  va_start(arguments, format);
  std::vfprintf(stderr, format, arguments);
  va_end(arguments);
  std::fputc('\n', stderr);
  errno = 0;  // as the C library's may change it
}

}  // extern "C"

void* operator new(std::size_t size) {
  void* const memory = fails("operator new") ? nullptr : std::malloc(size);
  return memory != nullptr ? memory : throw std::bad_alloc();
}
void operator delete(void* memory) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t /*size*/) noexcept { std::free(memory); }
