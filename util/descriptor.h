#pragma once

#include <unistd.h>

// Owns an open file descriptor and closes it at the end of its scope.
class olm_descriptor {
 public:
  // Takes what open(2) returned; -1, a failed open, owns nothing.
  explicit olm_descriptor(int opened) noexcept : number(opened) {}
  ~olm_descriptor() {
    if (is_open()) close(number);
  }
  olm_descriptor(const olm_descriptor&) = delete;
  olm_descriptor& operator=(const olm_descriptor&) = delete;

  bool is_open() const noexcept { return number != -1; }
  int get() const noexcept { return number; }

 private:
  const int number;
};
