// The ICU time-zone data of a dataset, reached through /var/db/timezone/icutz
// while a downloaded dataset is active. Its schema decides compatibility.
#ifndef VELL_DATASET_ICU_H_
#define VELL_DATASET_ICU_H_

#include <string>

#include "dataset/component.h"

namespace vell {

class vell_icu final : public vell_dataset_component {
 public:
  /// The directory is "/usr/share/icu" for the empty path, else
  /// dataset_path + "/icutz". The system dataset's schema is the first word
  /// of "icutzformat.txt" (read_first_word: silently "" when missing or not
  /// a regular file); a downloaded one's comes
  /// from the first file directly inside the directory named
  /// "icutz([0-9]+[lbe])\.dat", regular and readable by others (the walk
  /// lists that directory only, never one below it), else
  /// "No ICU schema found for %s" and "". When the walk cannot start, prints
  /// "tz_icu::initialize: fts_open of %s failed, %s" and throws errno as int.
  explicit vell_icu(const std::string& dataset_path);

  const std::string& schema() const { return schema_; }
  const std::string& directory() const { return directory_; }

  /// True when `other` is a vell_icu with the same schema, byte for byte.
  bool compatible_schema(const vell_dataset_component& other) const override;
  /// Removes /var/db/timezone/icutz and the legacy /var/db/icutz ("unlink of
  /// ICU softlink failed" when that fails), then, for a downloaded dataset
  /// only, links /var/db/timezone/icutz to directory().
  void activate() const override;

 private:
  void find_schema_in_directory();

  std::string schema_;
  const std::string directory_;
};

}  // namespace vell

#endif  // VELL_DATASET_ICU_H_
