#include <sys/syscall.h>

#include <cstdarg>
#include <cstdio>
#include <new>

#include "device.h"

static bool fails(const char* call) {
  if (planned_fault.call == nullptr || std::strcmp(planned_fault.call, call) != 0) return false;
  errno = EIO;  // of no use if the call succeeds
  return --planned_fault.nth == 0;
}

// The file streams of libstdc++ call it, those of libc++ don't.
ssize_t read(int descriptor, void* buffer, std::size_t size) {
  return fails("read") ? -1 : syscall(SYS_read, descriptor, buffer, size);
}

// As if a larger file took the place of the one at the path at once.
int stat(const char* path, struct stat* status) noexcept {
  const int result = fstatat(AT_FDCWD, path, status, 0);
  if (fails("stat")) status->st_size = 2;
  return result;
}

int symlink(const char* target, const char* path) noexcept {
  return fails("symlink") ? -1 : symlinkat(target, AT_FDCWD, path);
}

ssize_t write(int descriptor, const void* buffer, std::size_t size) {
  return fails("write") ? -1 : syscall(SYS_write, descriptor, buffer, size);
}

void warn(const char* format, ...) {
  last_warned_error = errno;
  va_list arguments;
  va_start(arguments, format);
  char* const end = printed + std::strlen(printed);
  end[std::vsnprintf(end, printed_size - std::strlen(printed), format, arguments)] = '\n';
  va_end(arguments);
  std::raise(SIGPIPE);  // as if nobody read it
  errno = 0;            // as the C library's may change it
}

// All forms that can meet. The forms for arrays come to these or, under a sanitizer, stay among
// themselves; so do those for greater alignments.
void* operator new(std::size_t size, const std::nothrow_t& /*tag*/) noexcept {
  return fails("operator new") ? nullptr : std::malloc(size);
}
void* operator new(std::size_t size) {
  void* const memory = operator new(size, std::nothrow);
  return memory != nullptr ? memory : throw std::bad_alloc();
}
void operator delete(void* memory) noexcept { std::free(memory); }
void operator delete(void* memory, std::size_t /*size*/) noexcept { std::free(memory); }
void operator delete(void* memory, const std::nothrow_t& /*tag*/) noexcept { std::free(memory); }
