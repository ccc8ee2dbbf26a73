// The compiled zone files of a dataset, reached through /var/db/timezone/zoneinfo.
#ifndef VELL_DATASET_ZONEINFO_H_
#define VELL_DATASET_ZONEINFO_H_

#include <string>

#include "dataset/component.h"

namespace vell {

class vell_zoneinfo final : public vell_dataset_component {
 public:
  /// The directory is "/usr/share/zoneinfo.default" for the empty path, else
  /// dataset_path + "/zoneinfo". Reads the first word of its "+VERSION"
  /// (read_first_word: bounded, regular files only); a missing or blank file
  /// silently gives "".
  explicit vell_zoneinfo(const std::string& dataset_path);

  /// The release name read from "+VERSION".
  std::string version() const { return version_; }
  const std::string& directory() const { return directory_; }

  /// Always true: compatibility is decided by the ICU data.
  bool compatible_schema(const vell_dataset_component& other) const override;
  /// Replaces /var/db/timezone/zoneinfo by a link to directory(). A failed
  /// removal prints "Unlink of zoneinfo softlink failed" and goes on.
  void activate() const override;

 private:
  const std::string directory_;
  const std::string version_;
};

}  // namespace vell

#endif  // VELL_DATASET_ZONEINFO_H_
