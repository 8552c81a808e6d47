#include "dataset/zoneinfo.h"

#include <err.h>

#include "util/first_word.h"
#include "util/primitives.h"

olm_zoneinfo::olm_zoneinfo() : directory(system_directory) { initialize(); }

olm_zoneinfo::olm_zoneinfo(const std::string& path)
    : olm_dataset_component(path),
      directory(path.empty() ? system_directory : path + "/" + download_directory) {
  initialize();
}

void olm_zoneinfo::initialize() { file_version = first_word(directory + "/" + version_file); }

std::string olm_zoneinfo::get_file_version() const { return file_version; }

bool olm_zoneinfo::compatible_schema(const olm_dataset_component& /*other*/) const { return true; }

void olm_zoneinfo::install_link() const {
  try {
    primitive::remove(link_path);
  } catch (...) {
    warn("Unlink of zoneinfo softlink failed");
  }
  primitive::create_symlink(directory, link_path);
}
