#pragma once

#include <string>

#include "dataset/component.h"

// The compiled tz database tree of one data set.
class olm_zoneinfo final : public olm_dataset_component {
 public:
  // The tree that is built into the system.
  static constexpr char system_directory[] = "/usr/share/zoneinfo.default";
  // The tree's name in the directory of a download.
  static constexpr char download_directory[] = "zoneinfo";
  // The file in a tree whose first word is the tree's release.
  static constexpr char version_file[] = "+VERSION";
  // The link that names the active tree.
  static constexpr char link_path[] = "/var/db/timezone/zoneinfo";

  // The system data set's tree.
  olm_zoneinfo();
  // The tree of the data set at `path`; the system data set's where that is empty. The tree need
  // not exist. Prints nothing.
  explicit olm_zoneinfo(const std::string& path);

  // Returns the first word of the tree's version file; empty when there is none.
  std::string get_file_version() const;

  // Returns true: any tree fits any system.
  bool compatible_schema(const olm_dataset_component& other) const override;

  // Replaces the link by one to this tree. For a moment there is none.
  // Prints "Unlink of zoneinfo softlink failed" when the old one can't be removed, and goes on.
  // Raises filesystem_error when the new one can't be made.
  void install_link() const override;

 private:
  void initialize();

  const std::string directory;
  std::string file_version;
};
