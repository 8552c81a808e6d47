#include "device.h"

#include <fcntl.h>
#include <sched.h>
#include <sys/stat.h>
#include <sys/wait.h>

#include <cstring>
#include <filesystem>
#include <fstream>
#include <regex>
#include <sstream>

namespace fs = std::filesystem;
using tree = std::map<std::string, std::string>;

int olmboot_main();

namespace {

constexpr int no_right = 77;  // the status of a child that can't enter the device

std::string shortened(const std::string& text) {
  return std::regex_replace(text, std::regex("/var/db/timezone/"), "~/");
}
std::string spelled_out(const std::string& text) {
  return std::regex_replace(text, std::regex("~/"), "/var/db/timezone/");
}

void write_file(const std::string& path, const std::string& text) { std::ofstream(path) << text; }

// Makes the process see `root` alone; in a user namespace if it isn't root.
bool enter(const std::string& root) {
  const std::string user = std::to_string(geteuid());
  const std::string group = std::to_string(getegid());
  if (user != "0" && unshare(CLONE_NEWUSER) == 0) {
    write_file("/proc/self/uid_map", "0 " + user + " 1");
    write_file("/proc/self/setgroups", "deny");
    write_file("/proc/self/gid_map", "0 " + group + " 1");
  }
  return chroot(root.c_str()) == 0 && chdir("/") == 0;
}

// Returns a line of standard error as device::run shows it.
std::string shown(const std::string& line, const std::string& expected) {
  const std::string name = std::string(program_invocation_short_name) + ": ";
  const std::size_t end = std::max(line.rfind(": "), name.size());
  const std::string message = line.substr(name.size(), end - name.size());
  for (int number = 0; number < 134; ++number) {
    if (line != name + message + ": " + std::strerror(number)) continue;
    if (("\n" + expected).find("\n" + message + "\n") != std::string::npos) return message + "\n";
    return message + " (" + strerrorname_np(number) + ")\n";
  }
  return "not a warning: " + line + "\n";
}

tree tree_of(const std::string& entries) {
  tree all;
  std::istringstream stream(entries);
  for (std::string line; std::getline(stream, line);) {
    const std::size_t blank = line.find(' ');
    all[line.substr(0, blank)] = line.substr(blank + 1);
  }
  return all;
}

std::string difference(tree before, tree after) {
  for (const auto& [path, what] : after) before.try_emplace(path, "(absent)");
  for (const auto& [path, what] : before) after.try_emplace(path, "(absent)");
  std::string lines;
  for (const auto& [path, what] : after) {
    if (what != before[path]) lines.append(path + " ").append(what + "\n");
  }
  return lines;
}

}  // namespace

device::device() : root(fs::canonical(fs::temp_directory_path()) / "olmboot_tests.XXXXXX") {
  if (mkdtemp(root.data()) == nullptr) throw fs::filesystem_error(root, std::error_code());
  planned_fault = {};
  put("/usr/share (directory)\n~/tz (directory)\n");
}

device::~device() { fs::remove_all(root); }

std::string device::outside(const std::string& path) const { return root + spelled_out(path); }

void device::put(const std::string& entries) const {
  for (const auto& [short_path, what] : tree_of(entries)) {
    const fs::path path = outside(short_path);
    // A link on the device must not lead out of it.
    if (fs::weakly_canonical(path.parent_path()) != path.parent_path()) std::abort();
    fs::remove_all(path);
    if (what == "(absent)") continue;
    fs::create_directories(what == "(directory)" ? path : path.parent_path());
    if (what == "(pipe)") mkfifo(path.c_str(), 0644);
    if (what[0] == '-') fs::create_symlink(spelled_out(what.substr(3)), path);
    if (what[0] != '=') continue;
    write_file(path, what.substr(2));
    const timespec dates[] = {{2208988800, 0}, {2208988800, 0}};
    utimensat(AT_FDCWD, path.c_str(), dates, 0);
  }
}

tree device::look() const {
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

std::string device::run(const std::function<std::string()>& body,
                        const std::string& expected) const {
  ::testing::internal::CaptureStdout();
  ::testing::internal::CaptureStderr();
  const pid_t child = fork();
  if (child == 0) {
    alarm(120);
    const int machine = open("/", O_RDONLY);
    if (!enter(root)) std::exit(no_right);
    const int free = dup(machine);
    close(free);
    std::fputs(body().c_str(), stdout);
    if (dup(machine) > free) std::puts("a descriptor is left open");
    // A leak check at the exit needs the machine's /proc.
    std::exit(fchdir(machine) == 0 && chroot(".") == 0 ? 0 : no_right);
  }
  int status = 0;
  waitpid(child, &status, 0);
  std::string seen;
  std::istringstream errors(shortened(::testing::internal::GetCapturedStderr()));
  for (std::string line; std::getline(errors, line);) seen += shown(line, expected);
  seen += ::testing::internal::GetCapturedStdout();
  if (WIFSIGNALED(status)) return seen + strsignal(WTERMSIG(status));
  if (WEXITSTATUS(status) == no_right)
    return "no right to chroot: be root, or allow user namespaces";
  return WEXITSTATUS(status) == 0 ? seen : seen + "status 1\n";
}

void device::boot(const std::string& printed, const std::string& changes, const fault& planned,
                  const std::function<void()>& before) const {
  const tree at_start = look();
  tree expected = at_start;
  for (const auto& [path, what] : tree_of(changes)) expected[path] = what;
  const auto body = [&]() noexcept {
    before();
    planned_fault = planned;
    return std::string(olmboot_main() == 0 ? "" : "main doesn't return 0\n");
  };
  const std::string seen = run(body, printed);
  EXPECT_EQ(printed + difference(at_start, expected), seen + difference(at_start, look()));
}
