#include "driver/startup.h"

#include <err.h>

#include <string>

#include "dataset/dataset.h"
#include "dataset/links.h"
#include "driver/selection.h"
#include "fs/path_ops.h"
#include "fs/paths.h"
#include "housekeeping/legacy_icu.h"
#include "housekeeping/localtime.h"
#include "housekeeping/protection.h"

namespace vell {
namespace {

// An unreadable zoneinfo link sends the links back to the system partition,
// and the start goes on with the system data as current.
std::string current_path_or_reset() {
  try {
    return current_dataset_path();
  } catch (...) {
    warn("Invalid current symlinks; resetting to system partition");
    reset_to_system();
    return std::string();
  }
}

// The whole dataset work, from describing the system data to the promotion:
// any failure, of any type, abandons it and resets the links to the system
// partition.
void select_datasets() {
  try {
    const vell_dataset system;
    const std::string latest_path = read_latest_link();
    const vell_dataset current(current_path_or_reset());
    const vell_dataset& active = select_active_dataset(system, current);
    promote_latest_update(latest_path, system, current, active);
  } catch (...) {
    warn("Unable to locate data; resetting to system partition");
    reset_to_system();
  }
}

}  // namespace

int run_startup() {
  protect_data_directories();
  migrate_legacy_icu_link();
  // The marker goes before anything can set it again.
  remove_quietly(paths::cleanup_marker);
  remove_quietly(paths::legacy_icu_dir);
  select_datasets();
  check_localtime_link();
  return 0;
}

}  // namespace vell
