#pragma once

#include <err.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sched.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <map>
#include <regex>
#include <sstream>
#include <string>

int olmboot_main();

namespace fs = std::filesystem;
using std::string;

// Faults on demand. faults.cc stands in for these functions of the whole program: read, stat,
// symlink, write, operator new, and warn, which never fails.
struct fault {
  const char* call = nullptr;  // whose calls are counted, if any
  int nth = 1;                 // which of its calls fails; counted down
};
inline fault planned_fault;

// The messages of warn, a line each, in memory that a forked child shares.
inline constexpr std::size_t printed_size = 1 << 18;
inline char* const printed = static_cast<char*>(
    mmap(nullptr, printed_size, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0));
inline int last_warned_error;  // the error number that warn was to tell

// A throw-away device: a temporary directory that is the root while a test runs. A line tells what
// stands at a path; "~/" is short for the program's own directory there and in what is printed:
//   "PATH -> TARGET"   "PATH = TEXT"   "PATH & OTHER_NAME"   "PATH (pipe, directory or absent)"
class device : public ::testing::Test {
 protected:
  using state = std::map<string, string>;  // what stands at each path
  // What boot() returns besides the program's statuses. no_fault: the planned one didn't happen.
  enum { no_fault = 77, standard_output_used, wrong_signals, descriptor_left_open };

  device() {
    std::signal(SIGPIPE, SIG_IGN);
    umask(S_IWOTH);
    if ((chroot("/") != 0 && unshare(CLONE_NEWUSER) != 0) || mkdtemp(root.data()) == nullptr ||
        chdir(root.c_str()) != 0 || chroot(".") != 0) {
      err(EXIT_FAILURE, "be root, or allow user namespaces: chroot to %s", root.c_str());
    }
    planned_fault = {};
    std::memset(printed, 0, printed_size);
  }
  ~device() override {
    if (fchdir(outside) != 0 || chroot(".") != 0) std::abort();
    fs::remove_all(root);
  }

  static string expand(const string& lines) {
    return std::regex_replace(lines, std::regex("~/"), "/var/db/timezone/");
  }

  static void put(const string& lines) {
    std::istringstream stream(expand(lines));
    for (string path, what; stream >> path && std::getline(stream >> std::ws, what);) {
      fs::remove_all(path);
      fs::create_directories(fs::path(path).parent_path());
      if (what == "(pipe)") mkfifo(path.c_str(), 0664);
      if (what == "(directory)") fs::create_directory(path);
      if (what[0] == '&') fs::create_hard_link(what.substr(2), path);
      if (what[0] == '-') fs::create_symlink(what.substr(3), path);
      if (what[0] == '=') std::ofstream(path) << what.substr(2);
    }
  }

  static state look() {
    state found;
    for (const auto& entry : fs::recursive_directory_iterator("/")) {
      struct stat status = {};
      lstat(entry.path().c_str(), &status);
      string& what = found[entry.path()] = "(directory or pipe)";
      if (entry.is_symlink()) what = "-> " + fs::read_symlink(entry).string();
      if (S_ISREG(status.st_mode))
        what = "= " + (std::ostringstream() << std::ifstream(entry.path()).rdbuf()).str();
      const mode_t mode = entry.is_symlink() ? 0777 : S_ISDIR(status.st_mode) ? 0775 : 0664;
      if ((status.st_mode & 0777) != mode || status.st_uid != geteuid())
        what += " (not the mode or the owner of a new one)";
    }
    return found;
  }

  // Returns the lines of what differs from `before`, in the order of the paths.
  static string changes_since(state before) {
    state now = look();
    for (const auto& [path, what] : before) now.try_emplace(path, "(absent)");
    string changes;
    for (const auto& [path, what] : now)
      if (before[path] != what) changes.append(path + " ").append(what + "\n");
    return changes;
  }

  // Runs the program in a child. Returns its status, 128 and the signal that ended it, or one of
  // the above. noexcept: an exception that escapes the program ends the child, too. GoogleTest
  // would take it for the test's, and go on with the other tests there.
  static int boot(const fault& plan = {}) noexcept {
    std::memset(printed, 0, printed_size);
    std::fflush(stdout);
    if (fork() == 0) {
      alarm(150);  // for a run that hangs
      std::signal(SIGPIPE, SIG_DFL);
      dup2(outside, STDOUT_FILENO);  // where nothing can be written
      close(STDIN_FILENO);           // so that it is the next to be opened
      planned_fault = plan;
      const int status = olmboot_main();
      if (plan.call != nullptr && planned_fault.nth > 0) _exit(no_fault);
      if (std::fflush(stdout) != 0) _exit(standard_output_used);
      if (std::signal(SIGXFSZ, SIG_DFL) != SIG_IGN || std::signal(SIGTERM, SIG_DFL) != SIG_DFL ||
          alarm(0) < 100)
        _exit(wrong_signals);
      if (dup(STDERR_FILENO) != STDIN_FILENO) _exit(descriptor_left_open);
      _exit(status);
    }
    int status = 0;
    wait(&status);
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
  }

  static inline const int outside = open("/", O_RDONLY | O_CLOEXEC);  // outside the device

 private:
  string root = fs::canonical(fs::temp_directory_path()) / "olmboot_tests.XXXXXX";
};
