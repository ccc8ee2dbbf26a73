// The two decisions of a start between datasets, and the record a promotion
// leaves behind.
#ifndef VELL_DRIVER_SELECTION_H_
#define VELL_DRIVER_SELECTION_H_

#include <string>

#include "dataset/dataset.h"

namespace vell {

/// Keeps `current` when its components are compatible with the system's and
/// the system's version is not newer. Otherwise prints "Symlink points at data
/// incompatible with installed system", resets the links, marks clean-up and
/// returns `system`. Failures pass through.
const vell_dataset& select_active_dataset(const vell_dataset& system, const vell_dataset& current);

/// Promotes the dataset at `latest_path` (nothing when empty) if it is
/// compatible with `system` and newer than `current`: activates it, marks
/// clean-up when `active` was a downloaded dataset, and records
/// active_update. Otherwise prints "New update not compatible or older
/// version: %s vs. %s" (update, current). Failures pass through.
void promote_latest_update(const std::string& latest_path, const vell_dataset& system,
                           const vell_dataset& current, const vell_dataset& active);

/// Writes from + "_" + to into /var/db/timezone/TZVersionDiffRecord, without
/// a line end. Failures are ignored.
void write_version_diff_record(const std::string& from, const std::string& to);

}  // namespace vell

#endif  // VELL_DRIVER_SELECTION_H_
