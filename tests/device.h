#pragma once

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sched.h>
#include <sys/stat.h>
#include <sys/wait.h>

#include <cstring>
#include <filesystem>
#include <fstream>
#include <map>
#include <regex>
#include <sstream>

#include "faults.h"

int olmboot_main();

namespace fs = std::filesystem;

// A throw-away device in a temporary directory. The test process only changes it from outside. A
// forked child enters it and sees nothing else. In all texts "~/" is short for the program's own
// directory. A line tells what stands at a path:
//   "PATH -> TARGET"   "PATH = TEXT"   "PATH (directory)"   "PATH (pipe)"   "PATH (absent)"
class device : public ::testing::Test {
 protected:
  device() : root(fs::canonical(fs::temp_directory_path()) / "olmboot_tests.XXXXXX") {
    if (mkdtemp(root.data()) == nullptr) throw std::runtime_error("can't make " + root);
  }
  ~device() override { fs::remove_all(root); }

  // Returns where a path of the device is for the test process.
  std::string outside(const std::string& path) const {
    return root + std::regex_replace(path, std::regex("~/"), "/var/db/timezone/");
  }

  // Puts on the device what the lines tell, with the parent directories. Files are dated 2040.
  void put(const std::string& lines) const {
    std::istringstream stream(lines);
    for (std::string word, what; stream >> word;) {
      std::getline(stream >> std::ws, what);
      const fs::path path = outside(word);
      // A link on the device must not lead out of it.
      if (fs::weakly_canonical(path.parent_path()) != path.parent_path()) std::abort();
      fs::remove_all(path);
      if (what == "(absent)") continue;
      fs::create_directories(what == "(directory)" ? path : path.parent_path());
      if (what == "(pipe)") mkfifo(path.c_str(), 0644);
      const std::string text = what.substr(what.find(' ') + 1);
      if (what[0] == '-') fs::create_symlink(outside(text).substr(root.size()), path);
      if (what[0] != '=') continue;
      std::ofstream(path) << text;
      const timespec dates[] = {{2208988800, 0}, {2208988800, 0}};
      utimensat(AT_FDCWD, path.c_str(), dates, 0);
    }
  }

  // Calls `body` in a child that sees the device alone, with `planned` as its fault. Returns the
  // lines that were printed, how the child ended if not with status 0, and what has changed, in the
  // order of the paths. A line that warn, in parts_test.cc, didn't print is marked.
  std::string run(int body(), const fault& planned = {}) const {
    auto before = look();
    ::testing::internal::CaptureStdout();
    ::testing::internal::CaptureStderr();
    const pid_t child = fork();
    if (child == 0) enter(body, planned);
    int status = 0;
    waitpid(child, &status, 0);
    std::string seen = ::testing::internal::GetCapturedStderr();
    seen = std::regex_replace(seen, std::regex("([^\r])\n"), "$1 (not a warning)\n");
    seen = shortened(std::regex_replace(seen, std::regex("\r"), ""));
    seen += ::testing::internal::GetCapturedStdout();
    if (WIFSIGNALED(status)) seen.append(strsignal(WTERMSIG(status))).append("\n");
    if (WEXITSTATUS(status) != 0) seen += "status " + std::to_string(WEXITSTATUS(status)) + "\n";
    auto now = look();
    for (const auto& [path, what] : before) now.try_emplace(path, "(absent)");
    for (const auto& [path, what] : now) {
      if (before[path] != what) seen.append(path + " ").append(what + "\n");
    }
    return seen;
  }

 private:
  static std::string shortened(const std::string& text) {
    return std::regex_replace(text, std::regex("/var/db/timezone/"), "~/");
  }

  // Returns what stands at each path of the device.
  std::map<std::string, std::string> look() const {
    std::map<std::string, std::string> found;
    for (const auto& entry : fs::recursive_directory_iterator(root)) {
      std::string& what = found[shortened(entry.path().string().substr(root.size()))];
      what = entry.is_directory() ? "(directory)" : "(pipe)";
      if (entry.is_symlink()) {
        what = "-> " + shortened(fs::read_symlink(entry));
      } else if (entry.is_regular_file()) {
        what = "= " + (std::ostringstream() << std::ifstream(entry.path()).rdbuf()).str();
      }
    }
    return found;
  }

  // Makes the device this process's root, in a user namespace if it isn't run by root. Ends with
  // what `body` returns. Like main, lets nothing that `body` throws pass.
  [[noreturn]] void enter(int body(), const fault& planned) const noexcept {
    const int machine = open("/", O_RDONLY);
    if (geteuid() != 0) unshare(CLONE_NEWUSER);
    if (chroot(root.c_str()) != 0 || chdir("/") != 0) {
      std::fputs("no right to chroot: be root, or allow user namespaces\n", stderr);
      std::exit(EXIT_FAILURE);
    }
    const int next = dup(machine);
    planned_fault = planned;
    const int status = body();
    if (dup(machine) > next + 1) std::puts("a descriptor is left open");
    // A leak check at the exit needs the machine's /proc.
    std::exit(fchdir(machine) + chroot(".") + status);
  }

  std::string root;
};
