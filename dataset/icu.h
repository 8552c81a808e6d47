#pragma once

#include <string>

#include "dataset/component.h"

// The ICU time zone resource files of one data set. The schema names their format: a token such as
// 44l, ICU's data version and the letter of its byte order and character family. It is only ever
// compared as text.
class olm_icu final : public olm_dataset_component {
 public:
  // The files of the data set at `path`; the system data set's if that is empty. The schema stays
  // empty when none is found.
  // If a download has no schema, prints "No ICU schema found for PATH". If the walk of its
  // directory can't be started, prints "tz_icu::initialize: fts_open of DIRECTORY failed, REASON"
  // and throws filesystem_error.
  explicit olm_icu(const std::string& path = {});

  // Returns whether `other` is an ICU component too and has the same schema.
  // Prints "olm_icu::compatible_schema: could not dynamic_cast other component" for another kind.
  bool compatible_schema(const olm_dataset_component& other) const override;

  // Removes the link, then the one in its legacy place; then makes the link, for a download only.
  // Prints "unlink of ICU softlink failed" when one can't be removed, and goes on; if that is the
  // first, the legacy one is not tried.
  // Throws filesystem_error when the new one can't be made.
  void install_link() const override;

 private:
  void initialize();
  // Returns the schema in the name of the first data file that the walk of `directory` delivers: a
  // regular file directly in it that others may read. Returns the empty string when there is none.
  // Links in the walk are not followed, and nothing below its entries is looked at.
  std::string schema_of_data_file() const;

  std::string schema;
  std::string directory;
};
