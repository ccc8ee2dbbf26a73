#include "housekeeping/legacy_icu.h"

#include <err.h>

#include "fs/path_ops.h"
#include "fs/paths.h"

namespace vell {

void migrate_legacy_icu_link() {
  if (exists(paths::legacy_icutz_link) && !exists(paths::icutz_link)) {
    try {
      create_symlink(read_symlink(paths::legacy_icutz_link), paths::icutz_link);
    } catch (...) {
      warn("Could not migrate /var/db/icutz to /var/db/timezone/icutz");
    }
  }
  // Asked afresh: the legacy link goes whether or not the copy worked.
  if (exists(paths::legacy_icutz_link)) {
    try {
      remove(paths::legacy_icutz_link);
    } catch (...) {
      warn("Could not remove /var/db/icutz");
    }
  }
}

}  // namespace vell
