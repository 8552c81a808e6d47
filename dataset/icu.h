#pragma once

#include <string>

#include "dataset/component.h"

// The ICU time zone resource files of one data set. Their format is named by the schema, a token
// such as 44l: ICU's data version and the letter of its byte order and character family. It is only
// ever compared as text.
class olm_icu final : public olm_dataset_component {
 public:
  // The directory that is built into the system.
  static constexpr char system_directory[] = "/usr/share/icu";
  // The file in it whose first word is the system's schema.
  static constexpr char schema_file[] = "icutzformat.txt";
  // The directory's name in the directory of a download.
  static constexpr char download_directory[] = "icutz";
  // What the name of a download's data file is; the group is the download's schema.
  static constexpr char data_file_pattern[] = R"(icutz([0-9]+[lbe])\.dat)";
  // The link that names the active download's directory.
  static constexpr char link_path[] = "/var/db/timezone/icutz";
  // Where that link was in older systems.
  static constexpr char legacy_link_path[] = "/var/db/icutz";

  // The system data set's files.
  olm_icu();
  // The files of the data set at `path`; the system data set's where that is empty. The schema
  // stays empty where none is found, for a download with
  //   "No ICU schema found for PATH"
  // For a download, prints "tz_icu::initialize: fts_open of DIRECTORY failed, REASON" and raises
  // filesystem_error when the walk of its directory can't be started.
  explicit olm_icu(const std::string& path);

  // Returns whether `other` is an ICU component too and has the same schema.
  // Prints "olm_icu::compatible_schema: could not dynamic_cast other component" for another kind.
  bool compatible_schema(const olm_dataset_component& other) const override;

  // Removes the link, at both places, and makes it anew for a download only.
  // Prints "unlink of ICU softlink failed" when one can't be removed, and goes on; a failure of the
  // first leaves the legacy one untried.
  // Raises filesystem_error when the new one can't be made.
  void install_link() const override;

 private:
  void initialize();
  // Returns the schema in the name of the first data file that the walk of `directory` comes to: a
  // regular file directly in it which others may read. Empty when there is none.
  std::string schema_of_data_file() const;

  std::string schema;
  const std::string directory;
};
