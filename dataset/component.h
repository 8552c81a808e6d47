#pragma once

#include <string>

// One kind of data in a data set, and the system-wide link for that kind. A component is complete
// when its constructor returns and never changes. Destroying it changes nothing on disk.
//
// A component is made as its own type and kept by a std::shared_ptr to this one, which remembers
// the type to destroy. The protected destructor refuses what would destroy only this part of it: a
// delete through a pointer to this type.
class olm_dataset_component {
 public:
  // Returns whether this component's data is compatible with that of `other`, the component of
  // another data set.
  virtual bool compatible_schema(const olm_dataset_component& other) const = 0;

  // Points the system-wide link at this component's files.
  // Throws filesystem_error, after the failed primitive's line, when the link can't be made.
  virtual void install_link() const = 0;

 protected:
  // A component of the data set at `path`; of the system data set if that is empty.
  explicit olm_dataset_component(const std::string& path = {}) : dataset_path(path) {}
  ~olm_dataset_component() = default;

  std::string dataset_path;  // empty for the system data set
};
