#pragma once

#include <list>
#include <memory>
#include <string>

#include "dataset/component.h"
#include "util/version.h"

// A data set: time zone data with its version, either the system data set, which is built into the
// system partition, or a download. It is complete when its constructor returns and never changes.
// Destroying it changes nothing on disk.
class olm_dataset {
 public:
  // The download at `directory`; the system data set if that is empty. A version string outside the
  // grammar gives the unknown version.
  // Prints and throws what olm_version::parse and the components do. For a directory that is not
  // below paths::downloads, prints "olm_dataset::create_components: bad path DIRECTORY" and throws
  // std::invalid_argument.
  explicit olm_dataset(const std::string& directory = {});

  // Returns whether this data set's version is greater than that of `other`.
  bool newer_than(const olm_dataset& other) const;

  // Returns whether each component of this data set is compatible with its counterpart in `other`,
  // the reference. The first that is not decides. Prints what the components print.
  bool compatible_with(const olm_dataset& other) const;

  // Points the system-wide links at this data set: first the tz database tree's, then ICU's.
  // Prints and throws what the components do; an error leaves the later links as they were.
  void install_links() const;

  // Returns the version string, in the grammar or not: of a download, the rest of its path; of the
  // system data set, the first word of its version file and ".1.0".
  std::string version_string() const;

  // Returns whether both are at the same path.
  bool operator==(const olm_dataset& other) const;

 private:
  void create_components();

  olm_version version;
  std::string version_text;
  std::string path;
  std::list<std::shared_ptr<const olm_dataset_component>> components;
};
