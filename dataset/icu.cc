#include "dataset/icu.h"

#include <err.h>
#include <fts.h>
#include <sys/stat.h>

#include <cerrno>
#include <cstring>
#include <memory>
#include <regex>

#include "util/first_word.h"
#include "util/paths.h"
#include "util/pattern.h"
#include "util/primitives.h"

namespace {

// The file in the system's directory whose first word is the system's schema.
constexpr char schema_file[] = "icutzformat.txt";
// The directory's name in a download's directory.
constexpr char subdirectory[] = "icutz";

struct walk_closer {
  void operator()(FTS* walk) const noexcept { fts_close(walk); }
};
using directory_walk = std::unique_ptr<FTS, walk_closer>;

directory_walk open_walk(std::string directory) {
  char* const roots[] = {directory.data(), nullptr};
  directory_walk walk(fts_open(roots, FTS_COMFOLLOW | FTS_PHYSICAL | FTS_XDEV, nullptr));
  if (walk) return walk;
  const filesystem_error error = errno;
  // tz_icu, not olm_icu: the message is fixed, and searched for as it stands.
  warn("tz_icu::initialize: fts_open of %s failed, %s", directory.c_str(), std::strerror(error));
  throw_filesystem_error(error);
}

// What a download's data file is named; the group is the schema.
const olm_pattern& data_file_pattern() {
  static const olm_pattern pattern = compile_pattern(R"(icutz([0-9]+[lbe])\.dat)");
  return pattern;
}

// Whether it is a regular file that others may read.
bool is_public_file(const FTSENT& entry) {
  return entry.fts_errno == 0 && entry.fts_namelen != 0 && entry.fts_info == FTS_F &&
         (entry.fts_statp->st_mode & S_IROTH) != 0;
}

}  // namespace

olm_icu::olm_icu(const std::string& path)
    : olm_dataset_component(path),
      directory(path.empty() ? paths::system_icu : path + "/" + subdirectory) {
  initialize();
}

void olm_icu::initialize() {
  if (dataset_path.empty()) {
    schema = read_first_word(directory + "/" + schema_file);
    return;
  }
  schema = schema_of_data_file();
  if (schema.empty()) warn("No ICU schema found for %s", dataset_path.c_str());
}

std::string olm_icu::schema_of_data_file() const {
  const directory_walk walk = open_walk(directory);
  // On 32 bit the C library's fts(3) reads by the narrow readdir(3), up to 2.36 at least. An entry
  // whose inode number or place in the directory needs more than 32 bits then ends the walk without
  // an error, as if there were no more.
  while (FTSENT* const entry = fts_read(walk.get())) {
    if (entry->fts_level == 0) continue;  // the directory itself
    // What lies deeper is never chosen, however much it is.
    fts_set(walk.get(), entry, FTS_SKIP);
    std::cmatch results;
    if (is_public_file(*entry) && std::regex_match(entry->fts_name, results, data_file_pattern())) {
      return results[1];
    }
  }
  return {};
}

bool olm_icu::compatible_schema(const olm_dataset_component& other) const {
  const auto* const other_icu = dynamic_cast<const olm_icu*>(&other);
  if (other_icu == nullptr) {
    warn("olm_icu::compatible_schema: could not dynamic_cast other component");
    return false;
  }
  return schema == other_icu->schema;
}

void olm_icu::install_link() const {
  try {
    primitive::remove(paths::icu_link);
    primitive::remove(paths::legacy_icu_link);
  } catch (...) {
    warn("unlink of ICU softlink failed");
  }
  if (!dataset_path.empty()) primitive::create_symlink(directory, paths::icu_link);
}
