#include "driver/selection.h"

#include <err.h>

#include "dataset/links.h"
#include "fs/paths.h"
#include "fs/small_files.h"
#include "housekeeping/cleanup_marker.h"

namespace vell {

const vell_dataset& select_active_dataset(const vell_dataset& system, const vell_dataset& current) {
  // The candidate's components are asked, the system's are the measure.
  if (current.compatible_with(system) && !(system > current)) return current;
  warn("Symlink points at data incompatible with installed system");
  reset_to_system();
  mark_needs_cleanup();
  return system;
}

void promote_latest_update(const std::string& latest_path, const vell_dataset& system,
                           const vell_dataset& current, const vell_dataset& active) {
  if (latest_path.empty()) return;
  const vell_dataset update(latest_path);
  // Newer than what the zoneinfo link named, even when that was just reset.
  if (!update.compatible_with(system) || !(update > current)) {
    warn("New update not compatible or older version: %s vs. %s", update.version_string().c_str(),
         current.version_string().c_str());
    return;
  }
  update.activate();
  if (!active.same_path(system)) mark_needs_cleanup();
  write_version_diff_record(active.version_string(), update.version_string());
}

void write_version_diff_record(const std::string& from, const std::string& to) {
  // A record that cannot be written is not worth a message: nothing reads it at boot.
  replace_own_file(paths::version_diff_record, from + '_' + to);
}

}  // namespace vell
