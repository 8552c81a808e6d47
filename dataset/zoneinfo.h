#pragma once

#include <string>

#include "dataset/component.h"

// The compiled tz database tree of one data set.
class olm_zoneinfo final : public olm_dataset_component {
 public:
  // The tree of the data set at `path`; the system data set's if that is empty. The tree need not
  // exist. Prints nothing. Throws only std::bad_alloc.
  explicit olm_zoneinfo(const std::string& path = {});

  // Returns the first word of the tree's version file; the empty string when there is none.
  std::string get_file_version() const;

  // Returns true: any tree is compatible with any system.
  bool compatible_schema(const olm_dataset_component& other) const override;

  // Replaces the link by one to this tree. The old one is removed first: symlink(2) replaces
  // nothing.
  // Prints "Unlink of zoneinfo softlink failed" when the old one can't be removed, and goes on.
  // Throws filesystem_error when the new one can't be made.
  void install_link() const override;

 private:
  void initialize();

  std::string directory;
  std::string file_version;
};
