#include <sys/syscall.h>
#include <sys/xattr.h>

#include <csignal>
#include <cstdarg>
#include <stdexcept>

#include "dataset/dataset.h"
#include "dataset/icu.h"
#include "dataset/zoneinfo.h"
#include "device.h"
#include "driver/link_state.h"
#include "util/pattern.h"
#include "util/primitives.h"
#include "util/regular_file.h"
#include "util/version.h"

void set_class_d_by_fcntl(int descriptor) noexcept;

// The read(2) that libstdc++'s file streams call.
extern "C" ssize_t read(int descriptor, void* buffer, std::size_t size) {
  return fails("read") ? -1 : syscall(SYS_read, descriptor, buffer, size);
}

// The warn(3) of the whole program. It prints the message alone, and a \r that marks its lines. A
// planned fault raises what a pipe without a reader and a limit on file sizes raise.
extern "C" void warn(const char* format, ...) {
  va_list arguments;
  va_start(arguments, format);
  std::vfprintf(stderr, format, arguments);
  va_end(arguments);
  std::fputs("\r\n", stderr);
  if (fails("warn")) {
    std::raise(SIGPIPE);
    std::raise(SIGXFSZ);
  }
  errno = 0;  // as the C library's may change it
}

namespace {

using parts_test = device;

const std::string downloads = "/var/db/timezone/tz/";

TEST_F(parts_test, versions_are_strictly_ordered) {
  const std::string ascending[] = {"0a",      "2016a",     "2016a.0",   "2016a.0.5",
                                   "2016a.1", "2016a.1.0", "2016a.9.9", "2016a.10.02",
                                   "2016az",  "2016b",     "2019a",     "2147483647a"};
  for (const auto& a : ascending) {
    for (const auto& b : ascending) {
      EXPECT_EQ(olm_version(a) > olm_version(b), &a > &b) << a << " and " << b;
      EXPECT_EQ(olm_version(a) == olm_version(b), &a == &b) << a << " and " << b;
    }
  }
  EXPECT_EQ(olm_version("02016a.010"), olm_version("2016a.10"));
}

TEST_F(parts_test, other_texts_are_no_known_version) {
  ::testing::internal::CaptureStderr();
  for (const auto* text : {"", ".1.0", "2016", "a", "2016A", "2016a.", "2016a.1.", " 2016a",
                           "2016a.1.2.3", "2016a-1", "2016a.1.0/", "-2016a"}) {
    olm_version version("2016a.1.0");
    version.parse(text);
    EXPECT_EQ(version, olm_version()) << text;
  }
  const std::string lines = ::testing::internal::GetCapturedStderr();
  EXPECT_EQ(std::count(lines.begin(), lines.end(), '\n'), 24);
  EXPECT_EQ(olm_version().year, -1);
  EXPECT_THROW(olm_version("2016a.1.2147483648"), std::out_of_range);
}

TEST_F(parts_test, an_error_is_thrown_and_stays_the_error_number) {
  const auto make_each_call = [] {
    primitive::remove("/none");
    primitive::read_symlink("/none");
    const olm_icu walked("/none");
    primitive::create_symlink("/none", "");
  };
  for (const int error : {EROFS, EACCES, ELOOP, ENOTDIR}) {
    for (const auto* call : {"unlink", "readlink", "fts_open", "symlink"}) {
      planned_fault = {call, 1, error};
      EXPECT_THROW(make_each_call(), filesystem_error) << call;
      EXPECT_STREQ(strerrorname_np(errno), strerrorname_np(error)) << call;
    }
  }
}

TEST_F(parts_test, links) {
  put("/link -> " + std::string(1100, 'x') + "\n");
  EXPECT_EQ(primitive::read_symlink(outside("/link")), std::string(1024, 'x'));
  primitive::exists("/");
  EXPECT_EQ(recorded_arguments, std::vector<int>{F_OK});
  EXPECT_EQ(parse_zoneinfo_link(downloads + "x/zoneinfo"), downloads + "x");
  EXPECT_EQ(parse_zoneinfo_link(downloads + "a/b/"), downloads + "a/b");
  for (const auto* link : {"/usr", "/var/db/timezone/tz/x", "/var/db/timezone/tz//",
                           "/mnt/var/db/timezone/tz/x/", "/usr/share/zoneinfo.default/"}) {
    EXPECT_THROW(parse_zoneinfo_link(link), filesystem_error) << link;
  }
}

TEST_F(parts_test, only_a_word_that_ends_is_read) {
  put("/file = \t\v\f\r word other\n/link -> file\n/blank = \t\n/loop -> loop\n/pipe (pipe)\n");
  put("/long = " + std::string(9000, 'x') + "\n");
  EXPECT_EQ(read_first_word(outside("/link")), "word");
  for (const auto* path : {"/blank", "/none", "/loop", "/pipe", "/var"}) {
    EXPECT_EQ(read_first_word(outside(path)), "") << path;
  }
  EXPECT_FALSE(is_regular_or_absent(outside("/loop")));
  EXPECT_FALSE(is_regular_or_absent("/dev/null"));
#ifdef __GLIBCXX__
  planned_fault = {"read", 2, EIO};
  EXPECT_EQ(read_first_word(outside("/long")), "");
#endif
}

TEST_F(parts_test, a_pattern_with_a_class_is_refused) {
  EXPECT_THROW(compile_pattern("[[:alpha:]]"), std::regex_error);
  EXPECT_THROW(compile_pattern("[[=a=]]"), std::regex_error);
}

TEST_F(parts_test, the_first_public_file_of_the_right_name_names_the_schema) {
  const auto has_schema_of = [this](const std::string& other) {
    return olm_icu(outside(other)).compatible_schema(olm_icu(outside("/data")));
  };
  for (const std::string entry :
       {"icutz90B.dat = ", "icutz90x.dat = ", "icutzb.dat = ", "icutz90be.dat = ",
        "xicutz90b.dat = ", "icutz90b.dat.bak = ", "icutz90bxdat = ", "sub/icutz90b.dat = ",
        "icutz90b.dat (directory)", "icutz90b.dat (pipe)", "icutz90b.dat -> xicutz90b.dat"}) {
    put("/data/icutz/" + entry + "\n");
    EXPECT_TRUE(has_schema_of("/no_data")) << entry;
    put("/data/icutz (absent)\n");
  }
  put("/data/icutz -> ../other/icutz\n/other/icutz/icutz109e.dat = data\n");
  EXPECT_FALSE(has_schema_of("/no_data"));
  EXPECT_EQ(recorded_arguments, (std::vector<int>{FTS_COMFOLLOW | FTS_PHYSICAL | FTS_XDEV, false}));
  put("/other/icutz/icutz11b.dat = data\n");
  const fs::path first = fs::directory_iterator(outside("/other/icutz"))->path();
  put("/first/icutz/" + first.filename().string() + " = data\n");
  EXPECT_TRUE(has_schema_of("/first"));
  chmod(first.c_str(), 0640);
  EXPECT_FALSE(has_schema_of("/first"));
}

TEST_F(parts_test, no_path_means_the_system_data_set) {
  put("/usr/share/icu/icutzformat.txt = 44l\n/usr/share/zoneinfo.default/+VERSION = 2016b\n");
  put("~/tz/2016b.1.0/icutz/icutz44l.dat = data\n");
  const std::string seen = run([] {
    EXPECT_FALSE(olm_icu().compatible_schema(olm_zoneinfo()));
    EXPECT_TRUE(olm_icu().compatible_schema(olm_icu(downloads + "2016b.1.0")));
    EXPECT_FALSE(olm_dataset() == olm_dataset(downloads + "2016b.1.0"));
    EXPECT_TRUE(olm_dataset() == olm_dataset(""));
    EXPECT_EQ(olm_zoneinfo().get_file_version(), "2016b");
    return 0;
  });
  EXPECT_EQ(seen, "olm_icu::compatible_schema: could not dynamic_cast other component\n");
  EXPECT_EQ(olm_dataset(downloads + "a/b").version_string(), "a/b");
  EXPECT_THROW(olm_dataset{downloads}, std::invalid_argument);
  EXPECT_THROW(olm_dataset{"/" + downloads + "2016b"}, std::invalid_argument);
}

TEST_F(parts_test, the_directories_have_class_d) {
  set_class_d_by_fcntl(7);
  EXPECT_EQ(recorded_arguments, (std::vector<int>{7, 64, 4}));
#ifdef OLMBOOT_DATA_PROTECTION
  GTEST_SKIP() << "the kernel keeps the class";
#endif
  put("~/tz (directory)\n");
  setxattr(outside("~/").c_str(), "user.protection_class", "B", 1, 0);
  run([] {
    close(STDIN_FILENO);  // so that a directory is opened as descriptor 0
    return olmboot_main();
  });
  for (const auto* path : {"~/", "~/tz"}) {
    char value[2] = "";
    const ssize_t size = getxattr(outside(path).c_str(), "user.protection_class", value, 2);
    if (size < 0 && errno == ENOTSUP) GTEST_SKIP() << "the file system keeps no attributes";
    EXPECT_EQ(std::string(value, size == 1), "4") << path;
  }
}

}  // namespace
