#include "dataset/dataset.h"

#include <sys/stat.h>

#include "dataset/icu.h"
#include "dataset/zoneinfo.h"
#include "sandbox.h"

namespace {

using dataset_test = sandbox;

const std::string download = "/var/db/timezone/tz/2016b.1.0";

int has_system_schema() { return olm_icu(download).compatible_schema(olm_icu()) ? 1 : 0; }

TEST_F(dataset_test, only_a_public_file_of_the_right_name_names_the_schema) {
  const std::string data_file = download + "/icutz/icutz44l.dat";
  const lines no_schema = {"No ICU schema found for ~/tz/2016b.1.0"};
  put({{"/usr/share/icu/icutzformat.txt", "44l other\n"}});
  for (const auto* name :
       {"icutz44L.dat", "icutz44x.dat", "icutz.dat", "icutz44le.dat", "xicutz44l.dat",
        "icutz44l.dat.bak", "icutz44lxdat", "sub/icutz44l.dat"}) {
    put({{download, absent}, {download + "/icutz/" + name, ""}});
    EXPECT_TRUE(ended(run(has_system_schema), 0, no_schema)) << name;
  }
  for (const auto* entry : {directory, pipe_file, "> /usr/share/icu/icutzformat.txt"}) {
    put({{download, absent}, {data_file, entry}});
    EXPECT_TRUE(ended(run(has_system_schema), 0, no_schema)) << entry;
  }
  put({{data_file, ""}, {download + "/icutz/a/b", ""}, {download + "/icutz/z/b", ""}});
  EXPECT_TRUE(ended(run(has_system_schema), 1, {}));
  chmod(data_file.c_str(), 0640);
  EXPECT_TRUE(ended(run(has_system_schema), 0, no_schema));
  put({{"/var/elsewhere/icutz44l.dat", ""}, {download + "/icutz", "> /var/elsewhere"}});
  EXPECT_TRUE(ended(run(has_system_schema), 1, {}));
}

TEST_F(dataset_test, components_of_different_kinds) {
  EXPECT_TRUE(olm_zoneinfo().compatible_schema(olm_icu()));
  EXPECT_TRUE(ended(run([] { return olm_icu().compatible_schema(olm_zoneinfo()) ? 1 : 0; }), 0,
                    {"olm_icu::compatible_schema: could not dynamic_cast other component"}));
}

TEST_F(dataset_test, only_a_path_below_the_downloads_is_a_download) {
  for (const std::string path :
       {"~/tz/", "~/tzdata/2016b", "/usr/share/zoneinfo.default", "2016b"}) {
    EXPECT_TRUE(ended(run([&path] { return olm_dataset(spelled_out(path)), 0; }), other_error,
                      {"olm_dataset::create_components: bad path " + path}));
  }
}

TEST_F(dataset_test, both_ways_to_the_system_data_set_are_one) {
  put({{"/usr/share/zoneinfo.default/+VERSION", "2016a\n"}});
  const olm_dataset by_path("");
  EXPECT_TRUE(olm_dataset() == by_path);
  EXPECT_EQ(olm_dataset().version_string(), "2016a.1.0");
  EXPECT_EQ(by_path.version_string(), "2016a.1.0");
  put({{download + "/icutz/icutz44l.dat", ""}});
  EXPECT_FALSE(by_path == olm_dataset(download));
}

}  // namespace
