#include "dataset/dataset.h"

#include <sys/stat.h>

#include "dataset/icu.h"
#include "dataset/zoneinfo.h"
#include "sandbox.h"

namespace {

using dataset_test = sandbox;

const std::string download = "/var/db/timezone/tz/2016b.1.0";
int has_other_schema() { return olm_icu(download).compatible_schema(olm_icu()) ? 0 : 1; }

TEST_F(dataset_test, only_a_public_file_of_the_right_name_names_the_schema) {
  const std::string data_file = download + "/icutz/icutz44l.dat";
  const lines none = {"No ICU schema found for ~/tz/2016b.1.0", "status 1"};
  put({{"/usr/share/icu/icutzformat.txt", "44l other\n"}});
  for (const auto* name :
       {"icutz44L.dat", "icutz44x.dat", "icutz.dat", "icutz44le.dat", "xicutz44l.dat",
        "icutz44l.dat.bak", "icutz44lxdat", "sub/icutz44l.dat"}) {
    put({{download, absent}, {download + "/icutz/" + name, ""}});
    EXPECT_EQ(run(has_other_schema), none) << name;
  }
  for (const auto* entry : {directory, pipe_file, "> /usr/share/icu/icutzformat.txt"}) {
    put({{download, absent}, {data_file, entry}});
    EXPECT_EQ(run(has_other_schema), none) << entry;
  }
  put({{data_file, ""}, {download + "/icutz/a/b", ""}, {download + "/icutz/z/b", ""}});
  EXPECT_EQ(run(has_other_schema), lines{});
  chmod(data_file.c_str(), 0640);
  EXPECT_EQ(run(has_other_schema), none);
  put({{"/var/elsewhere/icutz44l.dat", ""}, {download + "/icutz", "> /var/elsewhere"}});
  EXPECT_EQ(run(has_other_schema), lines{});
}

TEST_F(dataset_test, components_of_different_kinds) {
  EXPECT_TRUE(olm_zoneinfo().compatible_schema(olm_icu()));
  EXPECT_EQ(run([] { return olm_icu().compatible_schema(olm_zoneinfo()) ? 1 : 0; }),
            lines{"olm_icu::compatible_schema: could not dynamic_cast other component"});
}

TEST_F(dataset_test, the_cause_stands_behind_the_consequence_too) {
  put({{"~/icutz", directory}});
  ::testing::internal::CaptureStderr();
  olm_icu().install_link();
  EXPECT_EQ(::testing::internal::GetCapturedStderr(),
            "olmboot_tests: remove: could not remove /var/db/timezone/icutz: Is a directory\n"
            "olmboot_tests: unlink of ICU softlink failed: Is a directory\n");
}

TEST_F(dataset_test, what_a_path_stands_for) {
  for (const std::string path :
       {"~/tz/", "~/tzdata/2016b", "/usr/share/zoneinfo.default", "2016b"}) {
    EXPECT_EQ(run([&path] { return olm_dataset(spelled_out(path)), 0; }),
              (lines{"olm_dataset::create_components: bad path " + path, "status 1"}));
  }
  put({{"/usr/share/zoneinfo.default/+VERSION", "2016a\n"},
       {download + "/icutz/icutz44l.dat", ""}});
  EXPECT_TRUE(olm_dataset() == olm_dataset(""));
  EXPECT_EQ(olm_dataset().version_string(), "2016a.1.0");
  EXPECT_FALSE(olm_dataset() == olm_dataset(download));
}

}  // namespace
