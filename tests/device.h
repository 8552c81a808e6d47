#pragma once

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sched.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <map>
#include <regex>
#include <sstream>
#include <string>

#include "faults.h"

int olmboot_main();

namespace fs = std::filesystem;

// A throw-away device in a temporary directory. The test process only changes it from outside. A
// child enters it and sees nothing else. A line tells what stands at a path:
//   "PATH -> TARGET"   "PATH = TEXT"   "PATH (directory)"   "PATH (pipe)"   "PATH (absent)"
// In all texts given "~/" is short for the program's own directory.
class device : public ::testing::Test {
 protected:
  using state = std::map<std::string, std::string>;  // what stands at each path
  static constexpr int no_fault = 77;                // a child's status: no call failed as planned
  static constexpr unsigned time_limit = 300;        // seconds

  // An alarm ends a test that hangs, and before that a child that does.
  device() : root(fs::canonical(fs::temp_directory_path()) / "olmboot_tests.XXXXXX") {
    alarm(time_limit);
    umask(S_IWGRP | S_IWOTH);
    if (mkdtemp(root.data()) == nullptr) std::abort();
  }
  ~device() override { fs::remove_all(root); }

  // Returns the text with each "~/" written out.
  static std::string full(const std::string& text) {
    return std::regex_replace(text, std::regex("~/"), "/var/db/timezone/");
  }

  // Returns where a path of the device is for the test process.
  std::string outside(const std::string& path) const { return root + full(path); }

  // Puts on the device what the lines tell, with the parent directories. Files are dated 2040,
  // which 32 bits don't hold.
  void put(const std::string& lines) const {
    std::istringstream stream(full(lines));
    for (std::string word, what; stream >> word;) {
      std::getline(stream >> std::ws, what);
      const fs::path path = root + word;
      // A link on the device must not lead out of it.
      if (fs::weakly_canonical(path.parent_path()) != path.parent_path()) std::abort();
      fs::remove_all(path);
      if (what == "(absent)") continue;
      fs::create_directories(what == "(directory)" ? path : path.parent_path());
      if (what == "(pipe)") mkfifo(path.c_str(), S_IRUSR | S_IWUSR | S_IRGRP | S_IROTH);
      const std::string text = what.substr(what.find(' ') + 1);
      if (what[0] == '-') fs::create_symlink(text, path);
      if (what[0] != '=') continue;
      std::ofstream(path) << text;
      const timespec dates[] = {{2208988800, 0}, {2208988800, 0}};
      utimensat(AT_FDCWD, path.c_str(), dates, 0);
    }
  }

  state look() const {
    state found;
    for (const auto& entry : fs::recursive_directory_iterator(root)) {
      std::string& what = found[entry.path().string().substr(root.size())];
      if (entry.is_symlink()) {
        what = "-> " + fs::read_symlink(entry).string();
      } else if (entry.is_regular_file()) {
        what = "= " + (std::ostringstream() << std::ifstream(entry.path()).rdbuf()).str();
      } else {
        what = entry.is_directory() ? "(directory)" : "(pipe)";
      }
    }
    return found;
  }

  // Returns the lines of what differs from `before`, in the order of the paths.
  std::string changes_since(state before) const {
    state now = look();
    for (const auto& [path, what] : before) now.try_emplace(path, "(absent)");
    std::string changes;
    for (const auto& [path, what] : now) {
      if (before[path] != what) changes.append(path + " ").append(what + "\n");
    }
    return changes;
  }

  // Calls `body` in a child that sees the device alone. Expects its checks to hold, 0 as its
  // result, and `last_line` as the end of what it prints.
  void run(int body(), const std::string& last_line = "") const {
    EXPECT_EXIT(enter(body, {}), ::testing::ExitedWithCode(0), last_line + "$");
  }

  // Makes the device this process's root, in a user namespace if it isn't run by root. Ends with
  // what `body` returns, or no_fault. Like main, lets nothing that `body` throws pass.
  [[noreturn]] void enter(int body(), const fault& plan) const noexcept {
    alarm(time_limit / 2);
    const int machine = open("/", O_RDONLY);
    if (geteuid() != 0) unshare(CLONE_NEWUSER);
    if (chroot(root.c_str()) != 0 || chdir("/") != 0) {
      ADD_FAILURE() << "no right to chroot: be root, or allow user namespaces";
      std::exit(EXIT_FAILURE);
    }
    const int next = dup(machine);
    planned_fault = plan;
    const int status = body();
    const bool as_planned = plan.call.empty() || planned_fault.struck;
    planned_fault = {};
    EXPECT_LE(dup(machine), next + 1) << "a descriptor is left open";
    // A leak check at the exit needs the machine's /proc.
    if (fchdir(machine) != 0 || chroot(".") != 0 || HasFailure()) std::abort();
    std::exit(as_planned ? status : no_fault);
  }

 private:
  std::string root;
};
