#pragma once

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sched.h>
#include <sys/stat.h>
#include <sys/wait.h>

#include <cstring>
#include <filesystem>
#include <fstream>
#include <functional>
#include <map>
#include <regex>
#include <sstream>

#include "faults.h"

namespace fs = std::filesystem;

// A throw-away device in a temporary directory. The test process only changes it from outside. A
// forked child enters it and sees nothing else.
//
// In all texts "~/" is short for the program's own directory. A line tells what stands at a path:
//   "PATH -> TARGET"   "PATH = TEXT"   "PATH (directory)"   "PATH (pipe)"   "PATH (absent)"
class device : public ::testing::Test {
 protected:
  using tree = std::map<std::string, std::string>;  // what stands at each path

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

  // Returns what stands on the device.
  tree look() const {
    tree found;
    for (const auto& entry : fs::recursive_directory_iterator(root)) {
      std::string& what = found[shortened(entry.path().string().substr(root.size()))];
      if (entry.is_symlink()) what = "-> " + shortened(fs::read_symlink(entry));
      if (!what.empty()) continue;
      what = entry.is_directory() ? "(directory)" : "(pipe)";
      if (!entry.is_regular_file()) continue;
      what = "= " + (std::ostringstream() << std::ifstream(entry.path()).rdbuf()).str();
    }
    return found;
  }

  // Returns lines that tell what has changed on the device, in the order of the paths.
  std::string changes_since(tree before) const {
    tree now = look();
    for (const auto& [path, what] : before) now.try_emplace(path, "(absent)");
    std::string lines;
    for (const auto& [path, what] : now) {
      if (before[path] != what) lines.append(path + " ").append(what + "\n");
    }
    return lines;
  }

  // Calls `body` in a child. Returns the lines that were printed, then what `body` returned, then
  // how the child ended, if not well. A warning is shown without the program's name; the error text
  // behind it is "(NAME)", or left out if `expected` leaves it out.
  std::string run(const std::function<std::string()>& body,
                  const std::string& expected = {}) const {
    ::testing::internal::CaptureStdout();
    ::testing::internal::CaptureStderr();
    const pid_t child = fork();
    if (child == 0) {
      alarm(120);
      const int machine = open("/", O_RDONLY);
      enter();
      const int next = dup(machine);
      std::fputs(body().c_str(), stdout);
      if (dup(machine) > next + 1) std::puts("a descriptor is left open");
      // A leak check at the exit needs the machine's /proc.
      std::exit(fchdir(machine) + chroot("."));
    }
    int status = 0;
    waitpid(child, &status, 0);
    std::string seen;
    std::istringstream errors(shortened(::testing::internal::GetCapturedStderr()));
    for (std::string line; std::getline(errors, line);) seen += shown(line, expected) + "\n";
    seen += ::testing::internal::GetCapturedStdout();
    if (WIFSIGNALED(status)) return seen + strsignal(WTERMSIG(status));
    return WEXITSTATUS(status) == 0 ? seen : seen + "status 1\n";
  }

 private:
  static std::string shortened(const std::string& text) {
    return std::regex_replace(text, std::regex("/var/db/timezone/"), "~/");
  }

  // Makes this process see the device alone; in a user namespace if it isn't root.
  void enter() const {
    if (geteuid() != 0) unshare(CLONE_NEWUSER);
    if (chroot(root.c_str()) == 0 && chdir("/") == 0) return;
    std::fputs("no right to chroot: be root, or allow user namespaces\n", stderr);
    std::exit(EXIT_FAILURE);
  }

  // Returns a line of standard error as run() shows it.
  static std::string shown(const std::string& line, const std::string& expected) {
    const std::string name = std::string(program_invocation_short_name) + ": ";
    const std::size_t end = std::max(line.rfind(": "), name.size());
    for (int number = 0; number < 134; ++number) {
      std::string message = line.substr(std::min(name.size(), line.size()), end - name.size());
      if (line != name + message + ": " + std::strerror(number)) continue;
      if (("\n" + expected).find("\n" + message + "\n") != std::string::npos) return message;
      return message + " (" + strerrorname_np(number) + ")";
    }
    return "not a warning: " + line;
  }

  std::string root;
};
