#include "dataset/dataset.h"

#include <err.h>

#include <algorithm>
#include <stdexcept>
#include <string_view>

#include "dataset/icu.h"
#include "dataset/zoneinfo.h"
#include "util/paths.h"
#include "util/starts_with.h"

namespace {

// The end of the system data set's version string; before it stands the release of its tree.
constexpr char system_version_suffix[] = ".1.0";

}  // namespace

olm_dataset::olm_dataset(const std::string& directory) : path(directory) { create_components(); }

void olm_dataset::create_components() {
  constexpr std::string_view root = paths::downloads;
  const auto zoneinfo = std::make_shared<const olm_zoneinfo>(path);
  if (path.empty()) {
    version_text = zoneinfo->get_file_version() + system_version_suffix;
  } else if (path.size() > root.size() && starts_with(path, root)) {
    version_text = path.substr(root.size());
  } else {
    warn("olm_dataset::create_components: bad path %s", path.c_str());
    throw std::invalid_argument("badpath");
  }
  version.parse(version_text);
  components.push_back(zoneinfo);
  components.push_back(std::make_shared<const olm_icu>(path));
}

bool olm_dataset::newer_than(const olm_dataset& other) const { return version > other.version; }

bool olm_dataset::compatible_with(const olm_dataset& other) const {
  return std::equal(components.begin(), components.end(), other.components.begin(),
                    other.components.end(), [](const auto& candidate, const auto& reference) {
                      return candidate->compatible_schema(*reference);
                    });
}

void olm_dataset::install_links() const {
  for (const auto& component : components) component->install_link();
}

std::string olm_dataset::version_string() const { return version_text; }

bool olm_dataset::operator==(const olm_dataset& other) const { return path == other.path; }
