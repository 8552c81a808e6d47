#pragma once

#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <string>

#include "faults.h"

// A throw-away device in a temporary directory. The test process only changes it from outside. A
// forked child enters it, as root of its own, and sees nothing else.
//
// In all texts "~/" is short for the program's own directory. A line tells what stands at a path:
//   "PATH -> TARGET"   "PATH = TEXT"   "PATH (directory)"   "PATH (pipe)"   "PATH (absent)"
class device : public ::testing::Test {
 protected:
  device();
  ~device() override;

  // Puts on the device what the lines tell, with the parent directories. Files are dated 2040.
  void put(const std::string& entries) const;
  // Returns where a path of the device is for the test process.
  std::string outside(const std::string& path) const;

  // Calls `body` in a child. Returns the lines that were printed, then what `body` returned, then
  // how the child ended, if not well. A warning is shown without the program's name; the error text
  // behind it is "(NAME)", or left out if `expected` leaves it out.
  std::string run(const std::function<std::string()>& body, const std::string& expected) const;

  // Runs the program, after `before` in its process. It must print and change what the lines tell.
  void boot(const std::string& printed, const std::string& changes, const fault& planned,
            const std::function<void()>& before) const;

 private:
  std::map<std::string, std::string> look() const;

  std::string root;
};
