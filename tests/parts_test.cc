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
      EXPECT_EQ(a > b, &a > &b) << a.year << a.letters << " " << b.year << b.letters;
      EXPECT_EQ(a == b, &a == &b) << a.year << a.letters << " " << b.year << b.letters;
    }
  }
  EXPECT_EQ(olm_version("02016a.01"), olm_version("2016a.1"));
  for (const auto* text : {"2147483648a", "2016a.2147483648", "2016a.1.2147483648"}) {
    EXPECT_THROW(olm_version{text}, std::out_of_range) << text;
  }
}

TEST_F(parts_test, other_texts_are_the_unknown_version) {
  for (const std::string text : {"", ".1.0", "2016", "a", "2016A", "2016a.", "2016a.1.", " 2016a",
                                 "2016a.1.2.3", "2016a-1", "2016a.1.0/", "-2016a"}) {
    const auto parse = [&text] {
      olm_version version("2016a.1.0");
      version.parse(text);
      return version == olm_version() ? "" : "known";
    };
    const std::string line = "Cannot parse version string " + text;
    const std::string lines = line + ", results.size() = 0\n" + line + "\n";
    EXPECT_EQ(run(parse, lines), lines);
  }
  EXPECT_EQ(olm_version().year, -1);
}

TEST_F(parts_test, every_error_of_a_call_counts) {
  for (const int error : {EROFS, EACCES, ELOOP, ENOTDIR}) {
    planned_fault = {"unlink", 0, error};
    EXPECT_THROW(primitive::remove("path"), filesystem_error) << strerrorname_np(error);
    planned_fault = {"readlink", 0, error};
    EXPECT_THROW(primitive::read_symlink("path"), filesystem_error) << strerrorname_np(error);
  }
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
  planned_fault = {"read", 2, EIO};
  EXPECT_EQ(read_first_word(outside("/long")), "");
}

TEST_F(parts_test, a_pattern_with_a_class_is_refused) {
  for (const auto* pattern : {"[[:alpha:]]", "[[=a=]]", "[[.a.]]"}) {
    EXPECT_THROW(compile_pattern(pattern), std::regex_error) << pattern;
  }
}

TEST_F(parts_test, a_public_file_of_the_right_name_names_the_schema) {
  const auto has_schema = [this] {
    return !olm_icu(outside("/data")).compatible_schema(olm_icu(outside("/no_data")));
  };
  for (const std::string entry :
       {"icutz90B.dat = ", "icutz90x.dat = ", "icutzb.dat = ", "icutz90be.dat = ",
        "xicutz90b.dat = ", "icutz90b.dat.bak = ", "icutz90bxdat = ", "sub/icutz90b.dat = ",
        "icutz90b.dat (directory)", "icutz90b.dat (pipe)", "icutz90b.dat -> xicutz90b.dat"}) {
    put("/data/icutz/" + entry + "\n");
    EXPECT_FALSE(has_schema()) << entry;
    put("/data/icutz (absent)\n");
  }
  put("/data/icutz -> ../other/icutz\n/other/icutz/icutz90e.dat = data\n");
  EXPECT_TRUE(has_schema());
  EXPECT_EQ(recorded_arguments, (std::vector<int>{FTS_COMFOLLOW | FTS_PHYSICAL | FTS_XDEV}));
  chmod(outside("/other/icutz/icutz90e.dat").c_str(), 0640);
  EXPECT_FALSE(has_schema());
}

TEST_F(parts_test, the_first_file_in_the_directory_s_own_order_names_the_schema) {
  for (int i = 0; i < 40; ++i) {
    put("/data/icutz/icutz" + std::to_string(10 + (i + 20) % 40) + "b.dat = data\n");
  }
  const fs::path first = fs::directory_iterator(outside("/data/icutz"))->path().filename();
  put("/first/icutz/" + first.string() + " = data\n");
  EXPECT_TRUE(olm_icu(outside("/data")).compatible_schema(olm_icu(outside("/first"))));
}

TEST_F(parts_test, a_path_stands_for_a_data_set) {
  for (const std::string& path :
       {downloads, std::string("/usr/share/zoneinfo.default"), downloads.substr(1)}) {
    EXPECT_THROW(olm_dataset{path}, std::invalid_argument) << path;
  }
  put("/usr/share/zoneinfo.default/+VERSION = 2016b\n~/tz/2016b.1.0/icutz/icutz44l.dat = data\n");
  const auto compare = []() -> std::string {
    if (olm_dataset() == olm_dataset(downloads + "2016b.1.0")) return "one path, two data sets";
    return olm_dataset() == olm_dataset("") ? "" : "two system data sets";
  };
  EXPECT_EQ(run(compare, ""), "");
}

TEST_F(parts_test, components_without_a_path_are_the_system_s) {
  put("/usr/share/icu/icutzformat.txt = 44l\n/data/icutz/icutz44l.dat = data\n");
  put("/usr/share/zoneinfo.default/+VERSION = 2016b\n");
  const auto ask = []() -> std::string {
    if (olm_icu().compatible_schema(olm_zoneinfo())) return "wrong kind";
    if (!olm_zoneinfo().compatible_schema(olm_icu("/data"))) return "wrong tree";
    return olm_icu().compatible_schema(olm_icu("/data")) ? olm_zoneinfo().get_file_version() : "";
  };
  const std::string line = "olm_icu::compatible_schema: could not dynamic_cast other component\n";
  EXPECT_EQ(run(ask, line), line + "2016b");
}

TEST_F(parts_test, the_directories_have_the_class_attribute) {
#ifdef OLMBOOT_DATA_PROTECTION
  GTEST_SKIP() << "the kernel keeps the class";
#endif
  for (const auto* path : {"/var/db/timezone", "/var/db/timezone/tz"}) {
    const auto class_of = [path]() -> std::string {
      char value[] = "?";
      close(STDIN_FILENO);  // so that a directory is opened as descriptor 0
      if (setxattr(path, "user.protection_class", value, 1, 0) != 0) return "no attributes";
      prepare_storage();
      const ssize_t length = getxattr(path, "user.protection_class", value, sizeof value);
      return length == 1 ? value : "no class";
    };
    const std::string found = run(class_of, "");
    if (found == "no attributes") GTEST_SKIP() << found;
    EXPECT_EQ(found, "4") << path;
  }
}

TEST_F(parts_test, the_kernel_is_asked_for_class_d) {
  set_class_d_by_fcntl(7);
  EXPECT_EQ(recorded_arguments, (std::vector<int>{7, 64, 4}));
}

}  // namespace
