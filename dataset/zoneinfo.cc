#include "dataset/zoneinfo.h"

#include <err.h>

#include "util/first_word.h"
#include "util/paths.h"
#include "util/primitives.h"

namespace {

// The tree's name in a download's directory.
constexpr char subdirectory[] = "zoneinfo";
// The file in a tree whose first word is the tree's release.
constexpr char version_file[] = "+VERSION";

}  // namespace

olm_zoneinfo::olm_zoneinfo(const std::string& path)
    : olm_dataset_component(path),
      directory(path.empty() ? paths::system_zoneinfo : path + "/" + subdirectory) {
  initialize();
}

void olm_zoneinfo::initialize() { file_version = read_first_word(directory + "/" + version_file); }

std::string olm_zoneinfo::get_file_version() const { return file_version; }

bool olm_zoneinfo::compatible_schema(const olm_dataset_component& /*other*/) const { return true; }

void olm_zoneinfo::install_link() const {
  try {
    primitive::remove(paths::zoneinfo_link);
  } catch (...) {
    // A capital here and none in the ICU component's message: both are searched for as they are.
    warn("Unlink of zoneinfo softlink failed");
  }
  primitive::create_symlink(directory, paths::zoneinfo_link);
}
