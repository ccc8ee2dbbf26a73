// One kind of data in a dataset (compiled zone files, ICU data), reached by
// the rest of the system through one fixed link.
#ifndef VELL_DATASET_COMPONENT_H_
#define VELL_DATASET_COMPONENT_H_

#include <string>

namespace vell {

/// Created with its concrete type and owned through shared pointers made from
/// that type, so the destructor need not be virtual; it is protected so that
/// nothing can delete a component through this base.
class vell_dataset_component {
 public:
  vell_dataset_component() = default;
  explicit vell_dataset_component(const std::string& dataset_path) : dataset_path(dataset_path) {}

  /// True when this component's data can stand in for `other`'s, the
  /// component at the same position of another dataset. May warn; never throws.
  virtual bool compatible_schema(const vell_dataset_component& other) const = 0;

  /// Points this component's system-wide link at its data. A failed removal
  /// of the old link is reported and absorbed; a failed creation leaves as
  /// the errno thrown by create_symlink.
  virtual void activate() const = 0;

  /// The dataset's path as the dataset passed it; empty for the system dataset.
  const std::string dataset_path;

 protected:
  ~vell_dataset_component() = default;
};

}  // namespace vell

#endif  // VELL_DATASET_COMPONENT_H_
