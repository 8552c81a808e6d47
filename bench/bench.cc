// Times whole boots of olmboot against the floor, a program that makes the same file calls and does
// nothing else. To be started by tools/bench, in whose throw-away root both lie.
#include <benchmark/benchmark.h>
#include <fcntl.h>
#include <spawn.h>
#include <sys/ptrace.h>
#include <sys/types.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iomanip>
#include <limits>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

namespace fs = std::filesystem;

namespace {

constexpr char program[] = "/sbin/olmboot";
constexpr char floor_program[] = "/sbin/floor";
enum class boot { update, again };

// Of the machine outside the root.
int null_device;
int proc;

const char* name_of(boot kind) { return kind == boot::update ? "update" : "again"; }

void put_file(const fs::path& path, const std::string& text) {
  fs::create_directories(path.parent_path());
  std::ofstream(path) << text;
}

void put_link(const fs::path& path, const fs::path& target) {
  fs::remove(path);
  fs::create_symlink(target, path);
}

// Makes a device with `data_sets` downloads; the newest has `icu_files` ICU files.
void make_device(long data_sets, long icu_files) {
  for (const auto* top : {"/usr", "/var"}) fs::remove_all(top);
  put_file("/usr/share/zoneinfo.default/+VERSION", "2016b\n");
  put_file("/usr/share/icu/icutzformat.txt", "44l\n");
  const fs::path downloads = "/var/db/timezone/tz";
  const fs::path newest = downloads / "2016c.1.0";
  put_file(newest / "zoneinfo/+VERSION", "2016c\n");
  put_file(newest / "icutz/icutz44l.dat", "");
  for (long i = 1; i < icu_files; ++i)
    put_file(newest / "icutz" / ("file" + std::to_string(i)), "");
  for (long i = 1; i < data_sets; ++i) {
    put_file(downloads / ("2015a." + std::to_string(i)) / "icutz/icutz44l.dat", "");
  }
  put_link("/var/db/timezone/tz_latest", newest);
  put_link("/var/db/timezone/localtime", "/var/db/timezone/zoneinfo/America/Los_Angeles");
}

// Puts the device into the state in which a run is the boot `kind`.
void rewind(boot kind) {
  const fs::path storage = "/var/db/timezone";
  const fs::path newest = storage / "tz/2016c.1.0";
  if (kind == boot::update) {
    put_link(storage / "zoneinfo", "/usr/share/zoneinfo.default");
    fs::remove(storage / "icutz");
    fs::remove(storage / "TZVersionDiffRecord");
  } else {
    put_link(storage / "zoneinfo", newest / "zoneinfo");
    put_link(storage / "icutz", newest / "icutz");
  }
}

// Runs `path` and returns its wall time, in seconds.
double time_of(const char* path, boot kind) {
  rewind(kind);
  posix_spawn_file_actions_t actions;
  posix_spawn_file_actions_init(&actions);
  posix_spawn_file_actions_adddup2(&actions, null_device, STDERR_FILENO);
  char* arguments[] = {const_cast<char*>("olmboot"), const_cast<char*>(name_of(kind)), nullptr};
  char* environment[] = {nullptr};
  pid_t child = 0;
  int status = 0;
  const auto start = std::chrono::steady_clock::now();
  if (posix_spawn(&child, path, &actions, nullptr, arguments, environment) != 0) std::abort();
  waitpid(child, &status, 0);
  const std::chrono::duration<double> time = std::chrono::steady_clock::now() - start;
  posix_spawn_file_actions_destroy(&actions);
  if (status != 0) std::abort();
  return time.count();
}

// Runs `path` and returns the most memory that it held, in KiB, as it is about to end; not a number
// where it may not be traced. A child's resource usage would tell that of this process, which it
// was before it became `path`.
double peak_memory_of(const char* path, boot kind) {
  rewind(kind);
  const pid_t child = fork();
  if (child == 0) {
    dup2(null_device, STDERR_FILENO);
    ptrace(PTRACE_TRACEME, 0, nullptr, nullptr);
    execl(path, "olmboot", name_of(kind), nullptr);
    std::_Exit(EXIT_FAILURE);
  }
  int status = 0;
  waitpid(child, &status, 0);
  ptrace(PTRACE_SETOPTIONS, child, nullptr, PTRACE_O_TRACEEXIT);
  ptrace(PTRACE_CONT, child, nullptr, nullptr);
  waitpid(child, &status, 0);
  const int file = openat(proc, (std::to_string(child) + "/status").c_str(), O_RDONLY);
  char text[4096] = {};
  const ssize_t length = read(file, text, sizeof text - 1);
  close(file);
  ptrace(PTRACE_CONT, child, nullptr, nullptr);
  waitpid(child, &status, 0);
  const std::string seen(text, length > 0 ? static_cast<std::size_t>(length) : 0);
  const std::size_t at = seen.find("VmHWM:");
  if (at == std::string::npos) return std::numeric_limits<double>::quiet_NaN();
  return std::stod(seen.substr(at + 6));
}

double median_of(std::vector<double> values) {
  const auto middle = values.begin() + static_cast<std::ptrdiff_t>(values.size() / 2);
  std::nth_element(values.begin(), middle, values.end());
  return *middle;
}

void time_boots(benchmark::State& state, boot kind) {
  make_device(state.range(0), state.range(1));
  std::vector<double> times;
  std::vector<double> floor_times;
  for ([[maybe_unused]] auto _ : state) {
    floor_times.push_back(time_of(floor_program, kind));
    times.push_back(time_of(program, kind));
    state.SetIterationTime(times.back());
  }
  const double time = median_of(times);
  const double floor_time = median_of(floor_times);
  const double memory = peak_memory_of(program, kind) - peak_memory_of(floor_program, kind);
  constexpr double microseconds = 1e6;
  // Plain numbers: the runner writes large counters as 2.49696k.
  std::ostringstream label;
  label << std::fixed << std::setprecision(0) << "floor " << floor_time * microseconds
        << " us, olmboot " << time * microseconds << " us, ratio " << std::setprecision(2)
        << time / floor_time << ", memory over the floor " << std::setprecision(0) << memory
        << " KiB";
  state.SetLabel(label.str());
}

}  // namespace

int main(int argc, char** argv) {
  null_device = open("/dev/null", O_RDWR);
  proc = open("/proc", O_RDONLY | O_DIRECTORY);
  benchmark::Initialize(&argc, argv);
  benchmark::CPUInfo::Get();  // reads /sys, which the root doesn't have
  const char* const root = std::getenv("OLMBOOT_ROOT");
  if (root == nullptr || chdir(root) != 0 || chroot(".") != 0 || !fs::exists("/throw-away")) {
    (void)std::fputs("not in a throw-away root; use tools/bench\n", stderr);
    return EXIT_FAILURE;
  }
  const std::pair<const char*, boot> boots[] = {{"installs_an_update", boot::update},
                                                {"nothing_new", boot::again}};
  for (const auto& [name, kind] : boots) {
    auto* const series = benchmark::RegisterBenchmark(name, time_boots, kind);
    series->ArgNames({"data_sets", "ICU_files"})->Iterations(500);
    series->UseManualTime()->Unit(benchmark::kMicrosecond);
    series->Args({1, 1})->Args({100, 1})->Args({10000, 1})->Args({1, 100})->Args({1, 10000});
  }
  benchmark::RunSpecifiedBenchmarks();
  return EXIT_SUCCESS;
}
