// One complete set of time-zone data: the system partition's, or one
// downloaded update below /var/db/timezone/tz/.
#ifndef VELL_DATASET_DATASET_H_
#define VELL_DATASET_DATASET_H_

#include <memory>
#include <string>
#include <vector>

#include "dataset/component.h"
#include "dataset/version.h"

namespace vell {

class vell_dataset {
 public:
  /// The system dataset: version from the zone files' "+VERSION" plus ".1.0".
  vell_dataset();
  /// The dataset at `path`; "" gives the system dataset. Any other path must
  /// be longer than "/var/db/timezone/tz/" and start with it, else prints
  /// "vell_dataset::create_components: bad path %s" and throws
  /// std::invalid_argument("badpath"). The version string is the rest of the
  /// path. Component failures and an out-of-range version number pass through.
  explicit vell_dataset(const std::string& path);

  std::string version_string() const { return version_text_; }
  const vell_version& version() const { return parsed_version_; }
  const std::string& path() const { return path_; }
  /// Zoneinfo first, then ICU.
  const std::vector<std::shared_ptr<vell_dataset_component>>& components() const {
    return components_;
  }

  /// Byte-for-byte equality of the paths; nothing is normalised.
  bool same_path(const vell_dataset& other) const;
  /// True when every component of this dataset is compatible with `other`'s
  /// at the same position and both have as many components.
  bool compatible_with(const vell_dataset& other) const;
  /// Activates every component in order; the first failure leaves at once.
  void activate() const;

 private:
  void create_components();

  vell_version parsed_version_;
  std::string version_text_;
  std::string path_;
  std::vector<std::shared_ptr<vell_dataset_component>> components_;
};

/// The rule for a downloaded dataset's path: longer than
/// "/var/db/timezone/tz/" and starting with it.
bool is_dataset_path(const std::string& path);

/// Compares the parsed versions only.
bool operator>(const vell_dataset& a, const vell_dataset& b);

}  // namespace vell

#endif  // VELL_DATASET_DATASET_H_
