#include "sandbox.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace fs = std::filesystem;

int olmboot_main();

namespace {

std::string replaced(std::string text, const std::string& from, const std::string& to) {
  for (std::size_t at = 0; (at = text.find(from, at)) != std::string::npos; at += to.size()) {
    text.replace(at, from.size(), to);
  }
  return text;
}
std::string shortened(std::string text) { return replaced(text, "/var/db/timezone/", "~/"); }

}  // namespace

std::string spelled_out(std::string text) { return replaced(text, "~/", "/var/db/timezone/"); }

tree operator+(tree base, const tree& changes) {
  for (const auto& [path, entry] : changes) base[path] = entry;
  return base;
}

lines operator+(lines first, const lines& second) {
  first.insert(first.end(), second.begin(), second.end());
  return first;
}

sandbox::sandbox() {
  static const int outside = open("/", O_RDONLY | O_DIRECTORY);
  static const bool entered = [] {
    const char* const root = std::getenv("OLMBOOT_ROOT");
    // The leak check at the end needs /proc.
    std::atexit([] { fchdir(outside) == 0 && chroot(".") == 0; });
    return root != nullptr && chdir(root) == 0 && chroot(".") == 0 && fs::exists("/throw-away");
  }();
  if (!entered) std::exit((std::fputs("not in a throw-away root; use tools/in_root\n", stderr), 1));
  clear();
}

void sandbox::clear() {
  for (const auto* top : {"/usr", "/var"}) fs::remove_all(top);
  for (const auto* made : {"/usr/share", "/var/db/timezone/tz"}) fs::create_directories(made);
}

void sandbox::put(const tree& entries) {
  for (const auto& [short_path, entry] : entries) {
    const fs::path path = spelled_out(short_path);
    fs::remove_all(path);
    if (entry == absent) continue;
    fs::create_directories(entry == directory ? path : path.parent_path());
    if (entry == pipe_file) {
      mkfifo(path.c_str(), 0644);
    } else if (entry.rfind("> ", 0) == 0) {
      fs::create_symlink(spelled_out(entry.substr(2)), path);
    } else if (entry != directory) {
      std::ofstream(path) << entry;
    }
  }
}

tree sandbox::look() {
  tree found;
  for (const auto* top : {"/usr", "/var"}) {
    for (const auto& entry : fs::recursive_directory_iterator(top)) {
      std::string& seen = found[shortened(entry.path())];
      seen = entry.is_directory() ? directory : pipe_file;
      if (entry.is_symlink()) {
        seen = "> " + shortened(fs::read_symlink(entry));
      } else if (entry.is_regular_file()) {
        seen = (std::ostringstream() << std::ifstream(entry.path()).rdbuf()).str();
      }
    }
  }
  return found;
}

lines sandbox::run(const std::function<int()>& body) {
  constexpr char output[] = "/tmp/output";
  std::fflush(stdout);
  const pid_t child = fork();
  if (child == 0) {
    alarm(120);
    const int file = open(output, O_WRONLY | O_CREAT | O_TRUNC, 0644);
    for (const int standard : {STDOUT_FILENO, STDERR_FILENO}) dup2(file, standard);
    close(file);
    int status = EXIT_FAILURE;
    try {
      status = body();
    } catch (int error) {
      status = error;
    } catch (...) {
    }
    std::exit(status);
  }
  int status = 0;
  waitpid(child, &status, 0);
  status = WIFSIGNALED(status) ? 128 + WTERMSIG(status) : WEXITSTATUS(status);
  lines printed;
  std::ifstream file(output);
  for (std::string line; std::getline(file, line);) {
    const std::size_t message = line.find(": ") + 2;
    printed.push_back(shortened(line.substr(message, line.rfind(": ") - message)));
  }
  if (status != 0) printed.push_back("status " + std::to_string(status));
  return printed;
}

lines sandbox::boot(const std::function<void()>& before) {
  return run([&before]() noexcept {
    before();
#ifdef OLMBOOT_TESTS_IN_PROCESS
    return olmboot_main();
#else
    return execl("/sbin/olmboot", "olmboot", nullptr);
#endif
  });
}
