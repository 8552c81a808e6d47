#pragma once

#include <list>
#include <memory>
#include <string>

#include "dataset/component.h"
#include "util/version.h"

// One complete copy of the time zone data, with its version: the one built into the system, or a
// download. It is complete when its constructor returns and never changes; destroying it changes
// nothing on disk.
class olm_dataset {
 public:
  // What the path of every download begins with; the rest of the path is its version string.
  static constexpr char downloads_directory[] = "/var/db/timezone/tz/";
  // What the built-in tree's release is followed by in the system data set's version string.
  static constexpr char system_version_suffix[] = ".1.0";

  // The system data set.
  olm_dataset();
  // The download at `directory`; the system data set where that is empty.
  // A version string outside the grammar gives the unknown version, after the two lines of
  // olm_version::parse. Prints besides what the components print.
  // Any other path prints "olm_dataset::create_components: bad path DIRECTORY" and raises
  // std::invalid_argument. Raises too what olm_version::parse and the components raise.
  explicit olm_dataset(const std::string& directory);

  // Returns whether this data set's version is the greater one.
  bool newer_than(const olm_dataset& other) const;

  // Returns whether each component of this data set fits its counterpart in `other`, the
  // reference. The first that doesn't decides. Prints what the components print.
  bool compatible_with(const olm_dataset& other) const;

  // Points the system-wide links at this data set: the tz database tree's, then ICU's.
  // Prints and raises what the components do; after an error the later links are as they were.
  void install_links() const;

  // Returns the text that names the version, as it stands on disk.
  std::string version_string() const;

  // Whether both are at the same path.
  bool operator==(const olm_dataset& other) const;

 private:
  void create_components();

  olm_version version;
  std::string version_text;
  std::string path;
  std::list<std::shared_ptr<const olm_dataset_component>> components;
};
