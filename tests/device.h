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

int olmboot_main();

// A throw-away device in a temporary directory. The test process only changes it from outside. A
// forked child enters it, as root of its own, and sees nothing else.
//
// In all texts "~/" is short for the program's own directory. A line tells what stands at a path:
//   "PATH -> TARGET"   "PATH = TEXT"   "PATH (directory)"   "PATH (pipe)"   "PATH (absent)"
class device : public ::testing::Test {
 protected:
  device() : root(fs::canonical(fs::temp_directory_path()) / "olmboot_tests.XXXXXX") {
    if (mkdtemp(root.data()) == nullptr) throw std::runtime_error("can't make " + root);
    planned_fault = {};
    put("/usr/share (directory)\n~/tz (directory)\n");
  }
  ~device() override { fs::remove_all(root); }

  // Returns where a path of the device is for the test process.
  std::string outside(const std::string& path) const {
    return root + std::regex_replace(path, std::regex("~/"), "/var/db/timezone/");
  }

  // Puts on the device what the lines tell, with the parent directories. Files are dated 2040.
  void put(const std::string& lines) const {
    for (const auto& [short_path, what] : tree_of(lines)) {
      const fs::path path = outside(short_path);
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

  // Calls `body` in a child. Returns the lines that were printed, then what `body` returned, then
  // how the child ended, if not well. A warning is shown without the program's name; the error text
  // behind it is "(NAME)", or left out if `expected` leaves it out.
  std::string run(const std::function<std::string()>& body, const std::string& expected) const {
    ::testing::internal::CaptureStdout();
    ::testing::internal::CaptureStderr();
    const pid_t child = fork();
    if (child == 0) {
      alarm(120);
      const int machine = open("/", O_RDONLY);
      enter();
      const int free = dup(machine);
      close(free);
      std::fputs(body().c_str(), stdout);
      if (dup(machine) > free) std::puts("a descriptor is left open");
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

  // Runs the program, after `trouble` in its process. It must print and change what the lines tell.
  void boot(const std::string& printed, const std::string& changes,
            const std::function<void()>& trouble) const {
    const tree at_start = look();
    tree expected = at_start;
    for (const auto& [path, what] : tree_of(changes)) expected[path] = what;
    const auto body = [&trouble]() noexcept {
      trouble();
      return std::string(olmboot_main() == 0 ? "" : "main doesn't return 0\n");
    };
    const std::string seen = run(body, printed);
    EXPECT_EQ(printed + difference(at_start, expected), seen + difference(at_start, look()));
  }

 private:
  using tree = std::map<std::string, std::string>;  // what stands at each path

  static std::string shortened(const std::string& text) {
    return std::regex_replace(text, std::regex("/var/db/timezone/"), "~/");
  }

  // Makes this process see the device alone; in a user namespace if it isn't root.
  void enter() const {
    const std::string user = "0 " + std::to_string(geteuid()) + " 1";
    const std::string group = "0 " + std::to_string(getegid()) + " 1";
    if (geteuid() != 0 && unshare(CLONE_NEWUSER) == 0) {
      std::ofstream("/proc/self/uid_map") << user;
      std::ofstream("/proc/self/setgroups") << "deny";
      std::ofstream("/proc/self/gid_map") << group;
    }
    if (chroot(root.c_str()) == 0 && chdir("/") == 0) return;
    std::fputs("no right to chroot: be root, or allow user namespaces\n", stderr);
    std::exit(EXIT_FAILURE);
  }

  // Returns a line of standard error as run() shows it.
  static std::string shown(const std::string& line, const std::string& expected) {
    const std::string name = std::string(program_invocation_short_name) + ": ";
    const std::size_t end = std::max(line.rfind(": "), name.size());
    const std::string message = line.substr(name.size(), end - name.size());
    for (int number = 0; number < 134; ++number) {
      if (line != name + message + ": " + std::strerror(number)) continue;
      if (("\n" + expected).find("\n" + message + "\n") != std::string::npos) return message;
      return message + " (" + strerrorname_np(number) + ")";
    }
    return "not a warning: " + line;
  }

  static tree tree_of(const std::string& lines) {
    tree all;
    std::istringstream stream(lines);
    for (std::string path, what; stream >> path;) {
      std::getline(stream >> std::ws, what);
      all[path] = what;
    }
    return all;
  }

  tree look() const {
    tree found;
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

  // Returns lines that tell how `after` differs from `before`.
  static std::string difference(tree before, tree after) {
    for (const auto& [path, what] : after) before.try_emplace(path, "(absent)");
    std::string lines;
    for (const auto& [path, what] : before) {
      const std::string now = after.try_emplace(path, "(absent)").first->second;
      if (now != what) lines.append(path + " ").append(now + "\n");
    }
    return lines;
  }

  std::string root;
};
