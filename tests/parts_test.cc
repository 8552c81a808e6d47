#include <sys/syscall.h>
#include <sys/xattr.h>

#include <stdexcept>

#include "dataset/dataset.h"
#include "dataset/icu.h"
#include "dataset/zoneinfo.h"
#include "device.h"
#include "driver/link_state.h"
#include "driver/storage.h"
#include "util/pattern.h"
#include "util/primitives.h"
#include "util/regular_file.h"
#include "util/version.h"

void set_class_d_by_fcntl(int descriptor) noexcept;

// The read that libstdc++'s file streams call.
extern "C" ssize_t read(int descriptor, void* buffer, std::size_t size) {
  return fails("read") ? -1 : syscall(SYS_read, descriptor, buffer, size);
}

namespace {

using parts_test = device;

const std::string downloads = "/var/db/timezone/tz/";

TEST_F(parts_test, versions_are_strictly_ordered) {
  std::vector<olm_version> ascending(1);
  for (const auto* text :
       {"0a", "2016a", "2016a.0", "2016a.0.5", "2016a.1", "2016a.1.0", "2016a.1.1", "2016a.9.9",
        "2016a.10.02", "2016az", "2016b", "2016z", "2016za.2", "2019a", "2147483647a"}) {
    ascending.emplace_back(text);
  }
  for (const auto& a : ascending) {
    for (const auto& b : ascending) {
      EXPECT_EQ(a > b, &a > &b) << a.letters << a.major << a.minor << b.letters;
      EXPECT_EQ(a == b, &a == &b) << a.letters << a.major << a.minor << b.letters;
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
  const int standard_error = dup(STDERR_FILENO);
  close(STDERR_FILENO);  // so that warn(3) fails and leaves another number
  for (const int error : {EROFS, EACCES, ELOOP, ENOTDIR}) {
    for (const auto* call : {"unlink", "readlink", "fts_open", "symlink"}) {
      planned_fault = {call, 1, error};
      EXPECT_THROW(make_each_call(), filesystem_error) << call;
      EXPECT_STREQ(strerrorname_np(errno), strerrorname_np(error)) << call;
    }
  }
  dup2(standard_error, STDERR_FILENO);
}

TEST_F(parts_test, links) {
  put("/link -> " + std::string(1100, 'x') + "\n");
  EXPECT_EQ(primitive::read_symlink(outside("/link")), std::string(1024, 'x'));
  primitive::exists("/");
  EXPECT_EQ(recorded_arguments, std::vector<int>{F_OK});
  for (const std::string path : {"2024a.1.0", "x", "a/b"}) {
    EXPECT_EQ(parse_zoneinfo_link(downloads + path + "/zoneinfo"), downloads + path);
    EXPECT_EQ(parse_zoneinfo_link(downloads + path + "/"), downloads + path);
  }
  for (const std::string& link :
       {downloads + "2024a.1.0", downloads + "/zoneinfo", downloads, std::string("zoneinfo"),
        std::string("/usr/share/zoneinfo.default/"), std::string("/usr/share/zoneinfo")}) {
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
  for (const auto* pattern : {"[[:alpha:]]", "[[=a=]]", "[[.a.]]"}) {
    EXPECT_THROW(compile_pattern(pattern), std::regex_error) << pattern;
  }
}

TEST_F(parts_test, the_first_public_file_of_the_right_name_names_the_schema) {
  const auto has_schema_of = [this](const std::string& other) {
    return olm_icu(outside("/data")).compatible_schema(olm_icu(outside(other)));
  };
  for (const std::string entry :
       {"icutz90B.dat = ", "icutz90x.dat = ", "icutzb.dat = ", "icutz90be.dat = ",
        "xicutz90b.dat = ", "icutz90b.dat.bak = ", "icutz90bxdat = ", "sub/icutz90b.dat = ",
        "icutz90b.dat (directory)", "icutz90b.dat (pipe)", "icutz90b.dat -> xicutz90b.dat"}) {
    put("/data/icutz/" + entry + "\n");
    EXPECT_TRUE(has_schema_of("/no_data")) << entry;
    put("/data/icutz (absent)\n");
  }
  put("/data/icutz -> ../other/icutz\n/other/icutz/icutz90e.dat = data\n");
  EXPECT_FALSE(has_schema_of("/no_data"));
  EXPECT_EQ(recorded_arguments, (std::vector<int>{FTS_COMFOLLOW | FTS_PHYSICAL | FTS_XDEV}));
  chmod(outside("/other/icutz/icutz90e.dat").c_str(), 0640);
  EXPECT_TRUE(has_schema_of("/no_data"));
  for (int i = 0; i < 40; ++i) {
    put("/other/icutz/icutz" + std::to_string(10 + (i + 20) % 40) + "b.dat = data\n");
  }
  fs::remove(outside("/other/icutz/icutz90e.dat"));
  const fs::path first = fs::directory_iterator(outside("/other/icutz"))->path().filename();
  put("/first/icutz/" + first.string() + " = data\n");
  EXPECT_FALSE(has_schema_of("/no_data"));
  EXPECT_TRUE(has_schema_of("/first"));
}

TEST_F(parts_test, no_path_means_the_system_data_set) {
  put("/usr/share/icu/icutzformat.txt = 44l\n/usr/share/zoneinfo.default/+VERSION = 2016b\n");
  put("~/tz/2016b.1.0/icutz/icutz44l.dat = data\n");
  const auto ask = []() -> std::string {
    const std::string download = downloads + "2016b.1.0";
    if (olm_icu().compatible_schema(olm_zoneinfo())) return "wrong kind";
    if (!olm_icu().compatible_schema(olm_icu(download))) return "wrong ICU directory";
    if (olm_dataset() == olm_dataset(download)) return "one path, two data sets";
    return olm_dataset() == olm_dataset("") ? olm_zoneinfo().get_file_version() : "two systems";
  };
  const std::string line = "olm_icu::compatible_schema: could not dynamic_cast other component\n";
  EXPECT_EQ(run(ask, line), line + "2016b");
  EXPECT_THROW(olm_dataset{downloads}, std::invalid_argument);
  EXPECT_THROW(olm_dataset{downloads.substr(1)}, std::invalid_argument);
}

TEST_F(parts_test, the_directories_have_the_class_attribute) {
#ifdef OLMBOOT_DATA_PROTECTION
  GTEST_SKIP() << "the kernel keeps the class";
#endif
  const auto prepare = [] {
    close(STDIN_FILENO);  // so that a directory is opened as descriptor 0
    prepare_storage();
    return std::string();
  };
  put("~/tz (directory)\n");
  for (const auto* path : {"~/", "~/tz"}) {
    char value[] = "??";
    const int given = setxattr(outside(path).c_str(), "user.protection_class", value, 1, 0);
    EXPECT_EQ(run(prepare), "");
    getxattr(outside(path).c_str(), "user.protection_class", value, 2);
    if (given != 0) GTEST_SKIP() << "the temporary directory's file system has no attributes";
    EXPECT_STREQ(value, "4?") << path;
  }
}

TEST_F(parts_test, the_kernel_is_asked_for_class_d) {
  set_class_d_by_fcntl(7);
  EXPECT_EQ(recorded_arguments, (std::vector<int>{7, 64, 4}));
}

}  // namespace
