#pragma once

#include <string>

// One kind of data in a data set, and the system-wide link for that kind. A component is complete
// when its constructor returns and never changes; destroying it changes nothing on disk.
//
// Components are made as their own type and handed at once to a shared handle of this one, which
// remembers how to destroy the former. The destructor is protected, so that nothing else can be
// written: this type is neither deleted through a plain pointer nor held by value.
class olm_dataset_component {
 public:
  // Returns whether this component's data fits that of `other`, the component of another data set.
  virtual bool compatible_schema(const olm_dataset_component& other) const = 0;

  // Points the system-wide link at this component's files.
  // Raises filesystem_error, after the failed primitive's line, when the link can't be made.
  virtual void install_link() const = 0;

 protected:
  // A component of the system data set.
  olm_dataset_component() = default;
  // A component of the data set at `path`; of the system data set where that is empty.
  explicit olm_dataset_component(const std::string& path) : dataset_path(path) {}
  ~olm_dataset_component() = default;

  const std::string dataset_path;  // empty for the system data set
};
