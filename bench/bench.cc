// Times whole boots of olmboot against the floor, a program that makes the same file calls and does
// nothing else. To be started by tools/bench, in whose throw-away root both lie.
#include <benchmark/benchmark.h>
#include <err.h>
#include <fcntl.h>
#include <spawn.h>
#include <sys/types.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstddef>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iomanip>
#include <iostream>
#include <sstream>
#include <string>
#include <vector>

namespace fs = std::filesystem;

namespace {

constexpr char program[] = "/sbin/olmboot";
constexpr char floor_program[] = "/sbin/floor";
enum class boot { update, again };

int null_device;  // outside the root

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
  errno = posix_spawn(&child, path, &actions, nullptr, arguments, environment);
  if (errno != 0) err(EXIT_FAILURE, "%s can't be started", path);
  waitpid(child, &status, 0);
  const std::chrono::duration<double> time = std::chrono::steady_clock::now() - start;
  posix_spawn_file_actions_destroy(&actions);
  if (status != 0) errx(EXIT_FAILURE, "%s has ended with wait status %d", path, status);
  const bool updated = fs::remove("/var/db/timezone/TZVersionDiffRecord");
  if (updated != (kind == boot::update))
    errx(EXIT_FAILURE, "%s was not the boot '%s'", path, name_of(kind));
  return time.count();
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
  constexpr double milliseconds = 1e3;
  std::ostringstream row;
  row << std::fixed << std::left << std::setw(18) << name_of(kind) << std::right << std::setw(10)
      << state.range(0) << std::setw(10) << state.range(1) << std::setprecision(2) << std::setw(8)
      << time * milliseconds << " ms" << std::setw(8) << floor_time * milliseconds << " ms"
      << std::setw(7) << time / floor_time;
  state.SetLabel(row.str());
}

// Prints a row a series. The library's own reporters print other times, too.
class table : public benchmark::BenchmarkReporter {
 public:
  bool ReportContext(const Context& /*context*/) override {
    std::cout << "boot               data sets ICU files    olmboot      floor  ratio\n";
    return true;
  }
  void ReportRuns(const std::vector<Run>& runs) override {
    for (const auto& run : runs) std::cout << run.report_label << std::endl;
  }
};

}  // namespace

// With the argument `device`, only makes the device of the first row.
int main(int argc, char** argv) {
  null_device = open("/dev/null", O_RDWR);
  benchmark::Initialize(&argc, argv);
  benchmark::CPUInfo::Get();  // reads /sys, which the root doesn't have
  const char* const root = std::getenv("OLMBOOT_ROOT");
  if (root == nullptr || chdir(root) != 0 || chroot(".") != 0 || !fs::exists("/throw-away"))
    errx(EXIT_FAILURE, "not in a throw-away root; use tools/bench");
  if (argc > 1 && std::string(argv[1]) == "device") {
    make_device(1, 1);
    rewind(boot::update);
    return EXIT_SUCCESS;
  }
  if (benchmark::ReportUnrecognizedArguments(argc, argv)) return EXIT_FAILURE;
  for (const boot kind : {boot::update, boot::again}) {
    auto* const series = benchmark::RegisterBenchmark(name_of(kind), time_boots, kind);
    series->ArgNames({"data_sets", "ICU_files"})->Iterations(500)->UseManualTime();
    series->Args({1, 1})->Args({100, 1})->Args({10000, 1})->Args({1, 100})->Args({1, 10000});
  }
  table rows;
  return benchmark::RunSpecifiedBenchmarks(&rows) > 0 ? EXIT_SUCCESS : EXIT_FAILURE;
}
